#include "standin/server/sessions/Password.h"

#include <algorithm>
#include <cerrno>
#include <crypt.h>
#include <memory>
#include <stdexcept>
#include <system_error>

namespace standin::Password
{
namespace
{
// The work space of one crypt call: 32 KiB, and traces of the password in it, so it is wiped.
class WorkSpace
{
public:
    WorkSpace() : m_data(std::make_unique<crypt_data>()) {}
    ~WorkSpace() { explicit_bzero(m_data.get(), sizeof(crypt_data)); }
    WorkSpace(WorkSpace const&) = delete;
    WorkSpace& operator=(WorkSpace const&) = delete;

    // Empty if the library refuses the password or the setting.
    std::string Crypt(std::string const& password, char const* setting)
    {
        if (password.find('\0') != std::string::npos)
            return {};
        // Not crypt_r: the sanitizers take that one over, and jump to null where the program itself does not
        // link the library that has it, as hosts of a plug-in do not.
        char const* const hash =
            crypt_rn(password.c_str(), setting, m_data.get(), static_cast<int>(sizeof(crypt_data)));
        return hash ? std::string(hash) : std::string();
    }

private:
    std::unique_ptr<crypt_data> m_data;
};

// Looks at every byte, whatever the first difference, so that the time tells nothing of the hash.
bool SameBytes(std::string const& left, std::string const& right)
{
    if (left.size() != right.size())
        return false;
    unsigned difference = 0;
    for (std::size_t i = 0; i < left.size(); ++i)
        difference |= static_cast<unsigned char>(left[i]) ^ static_cast<unsigned char>(right[i]);
    return difference == 0;
}
}  // namespace

std::string Hash(std::string const& password)
{
    char setting[CRYPT_GENSALT_OUTPUT_SIZE];
    if (crypt_gensalt_rn("$y$", 0, nullptr, 0, setting, sizeof(setting)) == nullptr)
        throw std::runtime_error("no yescrypt in this system's libcrypt: " +
                                 std::generic_category().message(errno));
    std::string hash = WorkSpace().Crypt(password, setting);
    if (hash.empty())
        throw std::runtime_error("a password must be shorter than 512 bytes and hold no zero byte");
    return hash;
}

bool Verify(std::string const& password, std::string const& hash)
{
    std::string const again = WorkSpace().Crypt(password, hash.c_str());
    return !again.empty() && SameBytes(again, hash);
}

std::chrono::milliseconds Failures::Note(Time now)
{
    using namespace std::chrono_literals;
    constexpr int Free = 5;
    constexpr int Doublings = 5;
    std::lock_guard const lock(m_lock);
    if (now - m_last > 1min)
        m_count = 0;
    m_last = now;
    int const beyond = ++m_count - Free;
    return beyond <= 0 ? 0ms : 100ms * (1 << std::min(beyond - 1, Doublings));
}

void VerifyNobody(std::string const& password)
{
    // A password that is refused costs no time in Verify either.
    char setting[CRYPT_GENSALT_OUTPUT_SIZE];
    if (crypt_gensalt_rn("$y$", 0, nullptr, 0, setting, sizeof(setting)) != nullptr)
        WorkSpace().Crypt(password, setting);
}
}  // namespace standin::Password
