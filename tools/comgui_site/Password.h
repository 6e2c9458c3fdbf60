// A new password as a person gives it: typed twice at a terminal that does not show it, or as one line of a
// pipe.
#pragma once

#include <string>

namespace comgui_site
{
// A text of which no trace is left when it goes.
class Secret
{
public:
    Secret() { m_text.reserve(Room); }
    ~Secret();
    Secret(Secret const&) = delete;
    Secret& operator=(Secret const&) = delete;

    // Longer ones are of use to nobody: a password has less than 512 bytes.
    static constexpr std::size_t Room = 4096;

    bool IsFull() const { return m_text.size() == Room; }
    void Add(char byte) { m_text += byte; }  // unless it is full
    std::string const& Text() const { return m_text; }

private:
    std::string m_text;
};

// The hash of a new password, asked for with the name of its user. Throws Trouble for one that is empty, has
// control characters or is too long, for two that differ, and where there is no input; Interrupted after
// Ctrl-C, with the terminal as it was.
std::string HashOfNewPassword(std::string const& user);
}  // namespace comgui_site
