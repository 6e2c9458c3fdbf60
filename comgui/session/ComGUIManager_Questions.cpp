// Questions that the records answer.
#include "comgui/session/ComGUIManager.h"

#include "comgui/access/FromUtf8.h"
#include <cstring>
#include <wx/filefn.h>
#include <wx/utils.h>

using comgui::detail::FromUtf8;

namespace
{
constexpr int Administrator = 16;  // a role, not a bit: 17 and 48 are no administrators

// Whether the host text names this machine, the local address apart.
bool NamesThisMachine(char const* host)
{
    return wxGetHostName().IsSameAs(FromUtf8(host), false) || FromUtf8(host).IsSameAs("localhost", false) ||
           std::strcmp(host, "127.0.0.1") == 0;
}
}  // namespace

wxString ComGUIManager::GetServerName() { return m_serverName; }

int ComGUIManager::GetServerName(TLogin*) { return -9999; }

wxString ComGUIManager::GetLocalEndPoint() { return FromUtf8(m_pLogin->szLocalEndPoint); }

wxString ComGUIManager::GetCurrentlyLoggedUser() { return FromUtf8(m_pLogin->szUser); }

wxString ComGUIManager::GetCurrentlyLoggedUser(TLogin* login) { return FromUtf8(login->szUser); }

int ComGUIManager::GetCurrentlyLoggedUserTicketID() { return m_pLogin->iClientStamp; }

bool ComGUIManager::IsCurrentUserAdmin() { return IsCurrentUserAdmin(m_pLogin); }

bool ComGUIManager::IsCurrentUserAdmin(TLogin* login) { return login->iUserRole == Administrator; }

wxString ComGUIManager::GetUserLockInfo() { return GetUserLockInfo(m_pLogin); }

wxString ComGUIManager::GetUserLockInfo(TLogin* login)
{
    return wxString("http://") << FromUtf8(login->szLocalAddress) << ":" << login->iLocalPort;
}

bool ComGUIManager::IsServerLocal()
{
    return std::strcmp(m_pLogin->szServerHost, m_pLogin->szLocalAddress) == 0 ||
           NamesThisMachine(m_pLogin->szServerHost);
}

bool ComGUIManager::IsServerLocal(TLogin* login)
{
    // Unlike the form above, and on purpose, the letter case of the address does not count here.
    return FromUtf8(login->szLocalAddress).IsSameAs(FromUtf8(login->szServerHost), false) ||
           NamesThisMachine(login->szServerHost);
}

bool ComGUIManager::IsTernServerLocal() { return wxFileExists("ComGUISrv.Dll"); }

int ComGUIManager::GetEndian() { return 0x49494949; }
