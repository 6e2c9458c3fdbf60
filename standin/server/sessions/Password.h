// Passwords are kept only as yescrypt hashes, in the form of crypt(3), so that mkpasswd makes them too.
// Safe from any thread. A password ends at its first zero byte for the algorithm behind these functions,
// so one that holds a zero byte is refused; so is one of 512 bytes and more.
#pragma once

#include <chrono>
#include <mutex>
#include <string.h>
#include <string>

namespace standin::Password
{
// A password of which nothing is left in memory when it goes. Longer ones than there is room for are of use
// to nobody.
class Secret
{
public:
    static constexpr std::size_t Room = 4096;

    Secret() { m_text.reserve(Room); }  // a text that has to move leaves itself behind
    // Nothing is left of it in text, either; moving would leave a short one behind.
    explicit Secret(std::string&& text) : m_text(text) { explicit_bzero(text.data(), text.capacity()); }
    ~Secret() { explicit_bzero(m_text.data(), m_text.capacity()); }
    Secret(Secret const&) = delete;
    Secret& operator=(Secret const&) = delete;

    bool IsFull() const { return m_text.size() >= Room; }
    void Add(char byte) { m_text += byte; }  // of one made empty, unless it is full
    std::string const& Text() const { return m_text; }

private:
    std::string m_text;
};

// Slows down who guesses: after a few failures without a quiet minute between them each further one is
// answered later and later. A right password never waits, so that nobody can keep another out. For any
// thread.
class Failures
{
public:
    using Time = std::chrono::steady_clock::time_point;

    // One more; how long its answer is to wait.
    std::chrono::milliseconds Note(Time now);

private:
    std::mutex m_lock;
    int m_count = 0;  // since the last quiet minute
    Time m_last{};
};

// A new hash with a salt of its own, at the cost that the system's library takes for granted. Throws
// std::runtime_error when the password is refused or the system offers no yescrypt.
std::string Hash(std::string const& password);

// Whether that password made that hash, with the method and cost that stand in the hash. An empty or
// malformed hash belongs to no password.
bool Verify(std::string const& password, std::string const& hash);

// Takes as long as Verify does with a hash made by Hash: call it for an unknown user, so that the time of
// the answer does not tell who exists.
void VerifyNobody(std::string const& password);
}  // namespace standin::Password
