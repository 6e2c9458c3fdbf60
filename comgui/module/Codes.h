// What the kit itself answers where an entry gives a code, and the exception by which an author gives one of
// his own from anywhere. Clients show these codes as texts, so an author who fails for the same reason may
// use them too.
#pragma once

#include <exception>

namespace comgui::plugin
{
enum Code : int
{
    Done = 0,
    InvalidArgument = 101,  // a null pointer, or a record that is not what its first words should say
    UnknownInstance = 102,  // hInstance is nothing that Open gave out
    UnknownSession = 103,   // hSession was never given out, or has been logged out
    UnknownRecord = 104,    // Uninitialize of a record that is not initialised
    LoginRefused = 107,     // LogIn gave no session
    UnknownTicket = 108,
    NotOffered = 111,  // the author has not overridden what would answer
    Failed = 112,      // an exception, other than Refused, left the author's function
};

// Thrown by an author's function: the entry under way answers that code, and nothing is reported. A slot,
// which has no codes, answers 0.
class Refused : public std::exception
{
public:
    explicit Refused(int code) noexcept : m_code(code) {}

    int GetCode() const noexcept { return m_code; }
    char const* what() const noexcept override { return "refused"; }

private:
    int m_code;
};
}  // namespace comgui::plugin
