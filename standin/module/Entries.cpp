#include "standin/module/Entries.h"

#include "standin/module/Commands.h"
#include "standin/module/Guard.h"
#include "standin/module/Handles.h"
#include "standin/module/LocalTickets.h"
#include "standin/module/ModuleCodes.h"
#include "standin/module/SiteServer.h"
#include "standin/module/TicketData.h"
#include "standin/module/Transfers.h"
#include "standin/server/files/Report.h"
#include "standin/server/sessions/Password.h"
#include <cstdio>
#include <cstring>
#include <strings.h>
#include <unistd.h>

namespace standin
{
namespace
{
constexpr unsigned LoopbackAddress = 0x7F000001;

template <typename Work>
int AnyEntry(Work const& work) noexcept
{
    RefusableCall call;
    int const code = Guarded<int>(MODULE_FAILED, work);
    return call.Ended(code, code == MODULE_DONE);
}

template <typename Work>
int Entry(void* hInstance, Work const& work) noexcept
{
    return AnyEntry([&]() -> int
                    { return Handles::Get().IsInstance(hInstance) ? work() : MODULE_UNKNOWN_INSTANCE; });
}

// An entry for a session that is logged in; work gets its container.
template <typename Work>
int SessionEntry(void* hInstance, void* hSession, Work const& work) noexcept
{
    return Entry(hInstance,
                 [&]() -> int
                 {
                     Container const* const container = Handles::Get().SessionOf(hSession);
                     return container ? work(*container) : MODULE_UNKNOWN_SESSION;
                 });
}

bool IsValid(TLogin const* login) { return login && login->nSize == sizeof(TLogin); }

// A text of a record, which may fill its field to the last byte.
std::string TextOf(char const (&field)[128]) { return {field, strnlen(field, sizeof field)}; }

bool IsThisHost(char const* host)
{
    char own[256] = "";
    gethostname(own, sizeof own - 1);
    return strcasecmp(host, "localhost") == 0 || std::strcmp(host, "127.0.0.1") == 0 ||
           (*own && strcasecmp(host, own) == 0);
}

constexpr char PortKey[] = "System/MasterSOAPPort";
constexpr int PortOfANewSite = 50000;

// Whoever deletes the port, or writes what is none, locks nobody out.
int PortOf(OpenSite& site)
{
    int const port = site.server.Tickets().Int(SystemTicket, PortKey).value_or(PortOfANewSite);
    return port >= 1 && port <= 65535 ? port : PortOfANewSite;
}

// The server behind host and port, or a code that says why there is none.
int FindServer(char const* host, int port, OpenSite*& site)
{
    if (!IsThisHost(host))
        return MODULE_NO_SERVER_THERE;
    site = SiteOfThisProcess();
    if (!site)
        return MODULE_SITE_UNAVAILABLE;
    return PortOf(*site) == port ? MODULE_DONE : MODULE_NO_SERVER_THERE;
}

int Open(void** hInstance)
{
    return AnyEntry(
        [&]() -> int
        {
            if (!hInstance)
                return MODULE_INVALID_ARGUMENT;
            *hInstance = Handles::Get().NewInstance();
            return MODULE_DONE;
        });
}

int Initialize(void* hInstance, TLogin* login, int)
{
    return Entry(hInstance,
                 [&]() -> int
                 {
                     if (!IsValid(login))
                         return MODULE_INVALID_ARGUMENT;
                     if (!SiteOfThisProcess())
                         return MODULE_SITE_UNAVAILABLE;
                     Handles::Get().Initialize(hInstance, login);
                     return MODULE_DONE;
                 });
}

int Uninitialize(void* hInstance, TLogin* login)
{
    return Entry(hInstance,
                 [&]() -> int {
                     return Handles::Get().Uninitialize(hInstance, login) ? MODULE_DONE
                                                                          : MODULE_UNKNOWN_RECORD;
                 });
}

int IsAlive(void* hInstance, char const* host, int port)
{
    return Entry(hInstance,
                 [&]() -> int
                 {
                     if (!host)
                         return MODULE_INVALID_ARGUMENT;
                     OpenSite* site = nullptr;
                     int const code = FindServer(host, port, site);
                     bool const isLost = code == MODULE_DONE && !site->server.IsReachable();
                     return isLost ? MODULE_SITE_UNAVAILABLE : code;
                 });
}

unsigned int GetLocalAddress(void*, char const*, int) { return LoopbackAddress; }

void FillIn(TLogin& login, User const& user, void* hSession)
{
    login.hSession = hSession;
    login.iClientStamp = user.ticketId;
    login.iUserRole = user.role;
    std::snprintf(login.szLocalEndPoint, sizeof login.szLocalEndPoint, "127.0.0.1:%u", login.iLocalPort);
}

int LogIn(TLogin& login)
{
    OpenSite* site = nullptr;
    int const found = FindServer(TextOf(login.szServerHost).c_str(), login.iServerPort, site);
    if (found != MODULE_DONE)
        return found;
    try
    {
        Password::Secret const password(TextOf(login.szPassword));
        auto const session = site->server.Login(TextOf(login.szUser), password.Text());
        if (!session)
            return MODULE_LOGIN_REFUSED;
        FillIn(login, session->Who(), Handles::Get().NewSession(site->server, session));
        session->SetEndPoint(login.szLocalEndPoint);
        return MODULE_DONE;
    }
    catch (StoreError const& error)
    {
        Report(error.what());
        return MODULE_SITE_UNAVAILABLE;
    }
}

int Login(void* hInstance, TLogin* login)
{
    return Entry(hInstance,
                 [&]() -> int { return IsValid(login) ? LogIn(*login) : MODULE_INVALID_ARGUMENT; });
}

int Logout(void* hInstance, void* hSession)
{
    return Entry(hInstance,
                 [&]() -> int
                 { return Handles::Get().EndSession(hSession) ? MODULE_DONE : MODULE_UNKNOWN_SESSION; });
}

MTICKET_ACCESS const* GetClientContainer(void* hInstance, void* hSession)
{
    MTICKET_ACCESS const* access = nullptr;
    SessionEntry(hInstance, hSession,
                 [&](Container const& container)
                 {
                     access = container.Access();
                     return MODULE_DONE;
                 });
    return access;
}

int GetTicketData(void* hInstance, void* hSession, int type, int id, int format, int* size, void* buffer)
{
    return SessionEntry(hInstance, hSession,
                        [&](Container const& container) {
                            return CopyTicketData(container, {type, id}, format, size, buffer);
                        });
}

int SendCommand(void* hInstance, void* hSession, char const* command, int size, void* data)
{
    return Entry(hInstance,
                 [&] { return RunCommand(Handles::Get().SessionOf(hSession), command, size, data); });
}

template <int (*Work)(Container const&, char const*, char const*)>
int TransferFile(void* hInstance, void* hSession, char* source, char* target)
{
    return SessionEntry(hInstance, hSession,
                        [&](Container const& container) { return Work(container, source, target); });
}

int SendJobFile(void* hInstance, void* hSession, TJobIdentification* record, char* path, char* name)
{
    return SessionEntry(hInstance, hSession,
                        [&](Container const& container) { return SendJob(container, record, path, name); });
}

STICKET_ACCESS const* CreateTicket(char const* path)
{
    RefusableCall call;
    auto const* const ticket =
        Guarded<STICKET_ACCESS const*>(nullptr, [path] { return LocalTickets::Get().Create(path); });
    return call.Ended(ticket, ticket != nullptr);
}

void DestroyTicket(STICKET_ACCESS const** ticket)
{
    RefusableCall call;
    if (!Guarded<bool>(false, [ticket] { return LocalTickets::Get().Destroy(ticket); }))
        call.Refuse();
}

STicketFactory ticketFactory{{}, CreateTicket, DestroyTicket};
}  // namespace

void FillEntries(ComGUIModuleInterface& table)
{
    table.Open = Open;
    table.InitializeEntry = Initialize;
    table.IsAliveEntry = IsAlive;
    table.GetLocalAddressEntry = GetLocalAddress;
    table.LoginEntry = Login;
    table.LogoutEntry = Logout;
    table.UninitializeEntry = Uninitialize;
    table.GetClientContainerEntry = GetClientContainer;
    table.GetTicketDataEntry = GetTicketData;
    table.SendCommandEntry = SendCommand;
    table.PutFileEntry = TransferFile<BeginPutFile>;
    table.GetFileEntry = TransferFile<BeginGetFile>;
    table.SendJobEntry = SendJobFile;
    table.PutFileSyncEntry = TransferFile<PutFile>;
    table.STicketFactory = &ticketFactory;
    table.GetFileSyncEntry = TransferFile<GetFile>;
    table.UninitializeAsyncEntry = Uninitialize;
}
}  // namespace standin
