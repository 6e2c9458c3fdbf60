#include "desk/view/Settings.h"

#include "desk/model/ServerName.h"
#include <comgui/client/Text.h>
#include <wx/config.h>
#include <wx/tokenzr.h>
#include <wx/toplevel.h>

namespace desk
{
namespace
{
constexpr char ServersKey[] = "/Login/Servers";
constexpr char UserKey[] = "/Login/User";
}  // namespace

std::vector<std::string> Settings::Servers() const
{
    std::vector<std::string> servers;
    wxStringTokenizer names(wxConfigBase::Get()->Read(ServersKey, wxString()), " ");
    while (names.HasMoreTokens())
        servers.push_back(comgui::ToUtf8(names.GetNextToken()));
    return servers;
}

std::string Settings::User() const { return comgui::ToUtf8(wxConfigBase::Get()->Read(UserKey, wxString())); }

void Settings::Remember(std::string const& server, std::string const& user)
{
    auto servers = Servers();
    desk::Remember(servers, server);
    wxString names;
    for (std::string const& each : servers)
        names << (names.empty() ? "" : " ") << comgui::ToWx(each);
    auto* const config = wxConfigBase::Get();
    config->Write(ServersKey, names);
    config->Write(UserKey, comgui::ToWx(user));
    config->Flush();
}

void Settings::Restore(wxTopLevelWindow& window, char const* name) const
{
    auto const* const config = wxConfigBase::Get();
    wxString const path = wxString("/") + name + "/";
    wxSize const size(static_cast<int>(config->ReadLong(path + "Width", -1)),
                      static_cast<int>(config->ReadLong(path + "Height", -1)));
    if (size.GetWidth() > 0 && size.GetHeight() > 0)
        window.SetSize(size);
    if (config->ReadBool(path + "Maximized", false))
        window.Maximize();
}

void Settings::Keep(wxTopLevelWindow const& window, char const* name)
{
    auto* const config = wxConfigBase::Get();
    wxString const path = wxString("/") + name + "/";
    config->Write(path + "Maximized", window.IsMaximized());
    if (window.IsMaximized() || window.IsIconized())
        return;
    config->Write(path + "Width", window.GetSize().GetWidth());
    config->Write(path + "Height", window.GetSize().GetHeight());
}
}  // namespace desk
