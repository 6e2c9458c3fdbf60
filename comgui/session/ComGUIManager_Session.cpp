// The life of the sessions: preparing, logging in, testing the server, logging out.
#include "comgui/session/ComGUIManager.h"

#include "comgui/foundation/stracpy.h"
#include <cstdio>
#include <wx/utils.h>

namespace
{
constexpr int ClientStamp = 30312656;  // of every session that is prepared from plain texts
constexpr int ServerNotReachable = -2005;
constexpr int PauseAfterUninitialize = 4;  // seconds

template <unsigned long Size>
void Assign(char (&field)[Size], char const* text)
{
    stracpy(field, text, Size);
}

template <unsigned long Size>
void AssignIfGiven(char (&field)[Size], char const* text)
{
    if (text)
        Assign(field, text);
}

int AfterPause(int result)
{
    wxSleep(PauseAfterUninitialize);
    return result;
}
}  // namespace

int ComGUIManager::Initialize(char const* user, char const* password, char const* host, int port)
{
    static unsigned int localPort = 50006;  // a counter of its own: no logout and no failure takes it back

    if (m_bInitialized)
        return 0;
    Assign(m_pLogin->szUser, user);
    Assign(m_pLogin->szPassword, password);
    Assign(m_pLogin->szServerHost, host);
    m_pLogin->iServerPort = port;
    m_pLogin->iLocalPort = localPort++;
    m_pLogin->iClientStamp = ClientStamp;

    int const result = m_interface.InitializeEntry(m_hModuleInstance, m_pLogin, ClientStamp);
    if (result == 0)
        m_bInitialized = true;
    return result;
}

int ComGUIManager::Initialize(TLogin* login, int stamp)
{
    return InitializeRecord(login, stamp, m_bInitialized, m_iLocalPort);
}

int ComGUIManager::InitializeBackward(TLogin* login, int stamp)
{
    return InitializeRecord(login, stamp, m_bBackwardInitialized, m_iBackwardPort);
}

int ComGUIManager::InitializeRecord(TLogin* login, int stamp, bool& initialized, unsigned int& portCounter)
{
    login->iClientStamp = stamp;  // also when the family is initialised already
    if (initialized)
        return 0;
    login->iLocalPort = portCounter++;

    int const result = m_interface.InitializeEntry(m_hModuleInstance, login, stamp);
    if (result == 0)
        initialized = true;
    return result;
}

int ComGUIManager::Login(char const* user, char const* password, char const* host, int port)
{
    AssignIfGiven(m_pLogin->szUser, user);
    AssignIfGiven(m_pLogin->szPassword, password);
    AssignIfGiven(m_pLogin->szServerHost, host);
    if (port != -1)
        m_pLogin->iServerPort = port;

    int const result = MacLogin();
    if (result == 0)
        m_serverName = m_serverName.AfterLast('.');  // nothing sets the name, so it stays empty
    m_bLoggedIn = result == 0;
    return result;
}

int ComGUIManager::MacLogin()
{
    // The one call that goes through the plug-in's live table; all others use the copy.
    ComGUIModuleInterface const& live = **m_pModule;
    int const result = live.LoginEntry(m_hModuleInstance, m_pLogin);
    if (result != 0)
        return result;
    m_pClientContainer = live.GetClientContainerEntry(m_hModuleInstance, m_pLogin->hSession);
    return 0;
}

int ComGUIManager::Login(TLogin* login)
{
    m_pLogin = login;  // before the outcome is known, and without freeing the record of before
    return LoginRecord(m_pLogin, m_bLoggedIn);
}

int ComGUIManager::LoginBackward(TLogin* login)
{
    m_pBackwardLogin = login;
    return LoginRecord(m_pBackwardLogin, m_bBackwardLoggedIn);
}

int ComGUIManager::LoginRecord(TLogin* login, bool& loggedIn)
{
    int const result = m_interface.LoginEntry(m_hModuleInstance, login);
    loggedIn = result == 0;
    return result;
}

int ComGUIManager::Logout() { return Logout(m_pLogin); }

int ComGUIManager::Logout(TLogin* login)
{
    // The counter also goes down for a session whose Initialize had not raised it.
    return LogoutRecord(login, m_bLoggedIn, m_bInitialized, m_iLocalPort);
}

int ComGUIManager::LogoutBackward(TLogin* login)
{
    return LogoutRecord(login, m_bBackwardLoggedIn, m_bBackwardInitialized, m_iBackwardPort);
}

int ComGUIManager::LogoutRecord(TLogin* login, bool& loggedIn, bool& initialized, unsigned int& portCounter)
{
    loggedIn = false;
    initialized = false;
    --portCounter;
    return m_interface.LogoutEntry(m_hModuleInstance, login->hSession);
}

int ComGUIManager::Uninitialize() { return Uninitialize(m_pLogin); }

int ComGUIManager::Uninitialize(TLogin* login)
{
    return AfterPause(m_interface.UninitializeEntry(m_hModuleInstance, login));
}

int ComGUIManager::UninitializeAsync() { return UninitializeAsync(m_pLogin); }

int ComGUIManager::UninitializeAsync(TLogin* login)
{
    return AfterPause(m_interface.UninitializeAsyncEntry(m_hModuleInstance, login));
}

int ComGUIManager::IsAlive(TLogin* login)
{
    int const answer = m_interface.IsAliveEntry(m_hModuleInstance, login->szServerHost, login->iServerPort);
    unsigned int const address =
        m_interface.GetLocalAddressEntry(m_hModuleInstance, login->szServerHost, login->iServerPort);
    if (answer != 0)
        return ServerNotReachable;

    char text[16];  // "255.255.255.255"
    std::snprintf(text, sizeof text, "%d.%d.%d.%d", static_cast<int>(address >> 24),
                  static_cast<int>(address >> 16 & 0xFF), static_cast<int>(address >> 8 & 0xFF),
                  static_cast<int>(address & 0xFF));
    Assign(login->szLocalAddress, text);
    return 0;
}

bool ComGUIManager::IsServerOnline(TLogin* login) { return IsAlive(login) != ServerNotReachable; }

MTICKET_ACCESS const* ComGUIManager::GetClientContainer()
{
    MTICKET_ACCESS const* const container = GetHandleToClientContainer(m_pLogin);
    if (container)
        m_pClientContainer = container;
    return container;
}

MTICKET_ACCESS const* ComGUIManager::GetBackwardContainer()
{
    return GetHandleToClientContainer(m_pBackwardLogin);
}

MTICKET_ACCESS const* ComGUIManager::GetHandleToClientContainer(TLogin* login)
{
    return m_interface.GetClientContainerEntry(m_hModuleInstance, login->hSession);
}
