// What the desk remembers from one run to the next, in the user's configuration: servers, never passwords.
#pragma once

#include <string>
#include <vector>

class wxTopLevelWindow;

namespace desk
{
class Settings
{
public:
    std::vector<std::string> Servers() const;  // the newest first
    std::string User() const;
    void Remember(std::string const& server, std::string const& user);

    // Size and place of a window, under a name.
    void Restore(wxTopLevelWindow& window, char const* name) const;
    void Keep(wxTopLevelWindow const& window, char const* name);
};
}  // namespace desk
