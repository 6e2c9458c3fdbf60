#include "comgui/module/Entries.h"

#include "comgui/module/Handles.h"
#include "comgui/module/Running.h"
#include <CoreFoundation/CoreFoundation.h>
#include <algorithm>
#include <atomic>
#include <cstring>
#include <map>
#include <mutex>
#include <new>
#include <set>
#include <type_traits>

namespace comgui::plugin::detail
{
namespace
{
// What Open gives out, for good: there is no entry that gives it back.
class Instance
{
public:
    explicit Instance(Module& module) : m_module(module) {}

    Module& GetModule() const { return m_module; }

    void Add(TLogin const* record)
    {
        std::lock_guard const lock(m_lock);
        m_records.insert(record);
    }
    bool Remove(TLogin const* record)
    {
        std::lock_guard const lock(m_lock);
        return m_records.erase(record) != 0;
    }

private:
    Module& m_module;
    std::mutex m_lock;
    std::set<TLogin const*> m_records;  // those that are initialised; never followed
};

constinit Handles<Instance, 3> instances;
constinit Handles<Session, 4> sessions;

// A clean end for checks of leaks: sessions whose handles have gone stay where they can be found.
void KeepForGood(Session& session)
{
    static auto& lock = *new std::mutex;
    static auto& ended = *new std::vector<Session*>;
    std::lock_guard const guard(lock);
    ended.push_back(&session);
}

template <typename Work>
int Entry(void* hInstance, Work const& work) noexcept
{
    if (Instance* const instance = instances.Find(hInstance))
        return RunForCode(instance->GetModule(), [&]() -> int { return work(*instance); });
    return RunStray(UnknownInstance);
}

Session* Living(void* hSession)
{
    Session* const session = sessions.Find(hSession);
    return session && !session->HasEnded() ? session : nullptr;
}

// An entry for a session that is logged in.
template <typename Work>
int SessionEntry(void* hInstance, void* hSession, Work const& work) noexcept
{
    return Entry(hInstance,
                 [&](Instance&) -> int
                 {
                     Session* const session = Living(hSession);
                     return session ? work(*session) : UnknownSession;
                 });
}

bool IsValid(TLogin const* login) { return login && login->nSize == sizeof(TLogin); }

int Initialize(void* hInstance, TLogin* login, int)
{
    return Entry(hInstance,
                 [&](Instance& instance) -> int
                 {
                     if (!IsValid(login))
                         return InvalidArgument;
                     int const code = instance.GetModule().Initialize(*login);
                     if (code == Done)
                         instance.Add(login);
                     return code;
                 });
}

int Uninitialize(void* hInstance, TLogin* login)
{
    return Entry(hInstance,
                 [&](Instance& instance) -> int
                 {
                     bool const isKnown = instance.Remove(login);
                     return isKnown ? instance.GetModule().Uninitialize(*login) : UnknownRecord;
                 });
}

int IsAlive(void* hInstance, char const* host, int port)
{
    return Entry(hInstance,
                 [&](Instance& instance) -> int
                 { return host ? instance.GetModule().IsAlive(host, port) : int{InvalidArgument}; });
}

unsigned int GetLocalAddress(void* hInstance, char const* host, int port)
{
    std::uint32_t address = 0x7F000001;  // this machine knows itself under that one
    Entry(hInstance,
          [&](Instance& instance)
          {
              address = instance.GetModule().LocalAddress(host ? host : "", port);
              return Done;
          });
    return address;
}

// A text of a record, which may fill its field to the last byte.
std::string TextOf(char const (&field)[128]) { return {field, strnlen(field, sizeof field)}; }

void Put(std::string const& text, char (&field)[128])
{
    std::size_t const size = std::min(text.size(), sizeof field - 1);
    std::memcpy(field, text.data(), size);
    field[size] = 0;
}

// With its password overwritten when it goes.
struct WipedCredentials : Credentials
{
    explicit WipedCredentials(TLogin const& login)
    {
        user = TextOf(login.szUser);
        // No other text has held it.
        password.assign(login.szPassword, strnlen(login.szPassword, sizeof login.szPassword));
        host = TextOf(login.szServerHost);
        port = login.iServerPort;
        stamp = login.iClientStamp;
        localAddress = TextOf(login.szLocalAddress);
        localPort = login.iLocalPort;
    }
    ~WipedCredentials()
    {
        for (std::size_t i = 0; i < password.size(); ++i)
            const_cast<char volatile&>(password[i]) = 0;
    }
    WipedCredentials(WipedCredentials const&) = delete;
    WipedCredentials& operator=(WipedCredentials const&) = delete;
};

int LogIn(Module& module, TLogin& login)
{
    LoggedIn answer = module.LogIn(WipedCredentials(login));
    if (!answer.session)
        return LoginRefused;
    answer.session->Begin(module.GetNotifications());
    login.hSession = sessions.Add(*answer.session);
    static_cast<void>(answer.session.release());  // the table's from here on
    login.iClientStamp = answer.userTicket;
    login.iUserRole = answer.role;
    Put(answer.endPoint, login.szLocalEndPoint);
    return Done;
}

int Login(void* hInstance, TLogin* login)
{
    return Entry(hInstance,
                 [&](Instance& instance) -> int
                 { return IsValid(login) ? LogIn(instance.GetModule(), *login) : InvalidArgument; });
}

// The handle goes first: of two threads that log the session out, one finds it.
int LogOut(void* hSession)
{
    Session* const session = sessions.Remove(hSession);
    if (!session)
        return UnknownSession;
    KeepForGood(*session);
    if (ContainerSlots* const container = session->GetContainer())
        container->Withdraw();
    struct Silencer
    {
        Session& session;
        ~Silencer() { session.Silence(); }
    } const atLast{*session};  // also if the author's function throws
    bool const hadEnded = session->HasEnded();
    return session->End() && !hadEnded ? Done : UnknownSession;
}

int Logout(void* hInstance, void* hSession)
{
    return Entry(hInstance, [&](Instance&) { return LogOut(hSession); });
}

MTICKET_ACCESS const* GetClientContainer(void* hInstance, void* hSession)
{
    MTICKET_ACCESS const* access = nullptr;
    SessionEntry(hInstance, hSession,
                 [&](Session& session) -> int
                 {
                     ContainerSlots* const container = session.GetContainer();
                     access = container ? container->Access() : nullptr;
                     return container ? Done : NotOffered;
                 });
    return access;
}

int GetTicketData(void* hInstance, void* hSession, int type, int id, int format, int* size, void* buffer)
{
    return SessionEntry(hInstance, hSession,
                        [&](Session& session) {
                            return session.TicketData({type, id}, format, size, buffer);
                        });
}

int SendCommand(void* hInstance, void* hSession, char const* command, int size, void* data)
{
    return Entry(hInstance, [&](Instance& instance)
                 { return instance.GetModule().Command(Living(hSession), command, size, data); });
}

using TransferFunction = int (Session::*)(std::string_view, std::string_view, Transfer);

template <TransferFunction Work, Transfer Wanted>
int TransferFile(void* hInstance, void* hSession, char* first, char* second)
{
    return SessionEntry(hInstance, hSession,
                        [&](Session& session) -> int {
                            return first && second ? (session.*Work)(first, second, Wanted) : InvalidArgument;
                        });
}

int SendJob(void* hInstance, void* hSession, TJobIdentification* job, char* path, char* name)
{
    return SessionEntry(hInstance, hSession,
                        [&](Session& session) -> int
                        {
                            bool const isJob = job && job->nSize == sizeof *job && job->pszUploadFolder;
                            return isJob && path && name ? session.SendJob(*job, path, name)
                                                         : InvalidArgument;
                        });
}

// The tickets that were made for hosts and not yet destroyed. A pointer is looked up here before it is
// followed.
class LocalTickets
{
public:
    static LocalTickets& Get()  // never destroyed
    {
        static auto& tickets = *new LocalTickets;
        return tickets;
    }

    STICKET_ACCESS const* Add(std::unique_ptr<TicketSlots> ticket)
    {
        STICKET_ACCESS const* const access = ticket->Access();
        std::lock_guard const lock(m_lock);
        m_tickets.emplace(access, std::move(ticket));
        return access;
    }

    std::unique_ptr<TicketSlots> Remove(STICKET_ACCESS const* access)
    {
        std::lock_guard const lock(m_lock);
        auto const node = m_tickets.extract(access);
        return node ? std::move(node.mapped()) : nullptr;
    }

private:
    std::mutex m_lock;
    std::map<STICKET_ACCESS const*, std::unique_ptr<TicketSlots>> m_tickets;
};

// COM style: the first word is the table. A host that keeps one for good need not keep it where checks of
// leaks look.
class Object
{
public:
    explicit Object(ComGUIModuleInterface& table) : m_table(&table) { All().Add(this); }
    ~Object() { All().Remove(this); }
    Object(Object const&) = delete;
    Object& operator=(Object const&) = delete;

    std::atomic<unsigned>& References() { return m_references; }

private:
    class Register
    {
    public:
        void Add(Object* object)
        {
            std::lock_guard const lock(m_lock);
            m_objects.insert(object);
        }
        void Remove(Object* object)
        {
            std::lock_guard const lock(m_lock);
            m_objects.erase(object);
        }

    private:
        std::mutex m_lock;
        std::set<Object*> m_objects;
    };
    static Register& All()  // never destroyed
    {
        static auto& all = *new Register;
        return all;
    }

    [[maybe_unused]] ComGUIModuleInterface* const m_table;
    std::atomic<unsigned> m_references{1};
};
static_assert(std::is_standard_layout_v<Object>);

// The bytes of a UUID's text, either letter case; false for any other text.
constexpr bool IsSameUuid(unsigned char const* bytes, char const* text)
{
    auto const digit = [](char c) { return c <= '9' ? c - '0' : (c | 32) - 'a' + 10; };
    for (int i = 0; i < 16; ++i, text += 2)
    {
        if (*text == '-')
            ++text;
        if (bytes[i] != digit(text[0]) * 16 + digit(text[1]))
            return false;
    }
    return true;
}

unsigned int AddRef(void* object) { return ++static_cast<Object*>(object)->References(); }

unsigned int Release(void* object)
{
    auto* const ours = static_cast<Object*>(object);
    unsigned const left = --ours->References();
    if (!left)
        delete ours;
    return left;
}

int QueryInterface(void* object, COMGUI_UUID interfaceId, void** out)
{
    constexpr int NoInterface = static_cast<int>(0x80000004);  // what COM answers for one that it lacks
    if (!out || !IsSameUuid(interfaceId.bytes, COMGUI_INTERFACE_UUID))
        return NoInterface;
    AddRef(object);
    *out = object;
    return 0;
}
}  // namespace

int Open(GetModule module, void** hInstance) noexcept
{
    try
    {
        Module& made = module();
        strays = &made;
        return RunForCode(made,
                          [&]() -> int
                          {
                              if (!hInstance)
                                  return InvalidArgument;
                              auto instance = std::make_unique<Instance>(made);
                              *hInstance = instances.Add(*instance);
                              static_cast<void>(instance.release());  // the table's from here on
                              return Done;
                          });
    }
    catch (...)  // there is no module to report it
    {
        Called unmade;
        return CodeOfException(unmade);
    }
}

STICKET_ACCESS const* CreateTicket(GetModule module, char const* path) noexcept
{
    STICKET_ACCESS const* access = nullptr;
    try
    {
        Module& made = module();
        RunSlot(made,
                [&]
                {
                    auto ticket = path ? made.OpenTicket(path) : made.MakeTicket();
                    access = ticket ? LocalTickets::Get().Add(std::move(ticket)) : nullptr;
                    return access != nullptr;
                });
    }
    catch (...)
    {
        Called unmade;
        CodeOfException(unmade);
    }
    return access;
}

void DestroyTicket(GetModule module, STICKET_ACCESS const** ticket) noexcept
{
    if (!ticket)
        return;
    try
    {
        Module& made = module();
        RunSlot(made,
                [&]
                {
                    auto const going = LocalTickets::Get().Remove(*ticket);
                    if (!going)
                        return true;
                    *ticket = nullptr;
                    return made.CloseTicket(*going);
                });
    }
    catch (...)
    {
        Called unmade;
        CodeOfException(unmade);
    }
}

void FillEntries(ComGUIModuleInterface& table)
{
    table.QueryInterface = QueryInterface;
    table.AddRef = AddRef;
    table.Release = Release;
    table.InitializeEntry = Initialize;
    table.IsAliveEntry = IsAlive;
    table.GetLocalAddressEntry = GetLocalAddress;
    table.LoginEntry = Login;
    table.LogoutEntry = Logout;
    table.UninitializeEntry = Uninitialize;
    table.GetClientContainerEntry = GetClientContainer;
    table.GetTicketDataEntry = GetTicketData;
    table.SendCommandEntry = SendCommand;
    table.PutFileEntry = TransferFile<&Session::PutFile, Transfer::Begun>;
    table.GetFileEntry = TransferFile<&Session::GetFile, Transfer::Begun>;
    table.SendJobEntry = SendJob;
    table.PutFileSyncEntry = TransferFile<&Session::PutFile, Transfer::Complete>;
    table.GetFileSyncEntry = TransferFile<&Session::GetFile, Transfer::Complete>;
    table.UninitializeAsyncEntry = Uninitialize;
}

void* MakeObject(ComGUIModuleInterface& table, void const* type) noexcept
{
    CFUUIDBytes const bytes = CFUUIDGetUUIDBytes(static_cast<CFUUIDRef>(type));
    if (!IsSameUuid(&bytes.byte0, COMGUI_PLUGIN_TYPE_UUID))
        return nullptr;
    try
    {
        return new Object(table);
    }
    catch (std::bad_alloc const&)
    {
        return nullptr;
    }
}

StopAtExit::~StopAtExit() { m_module.GetNotifications().Stop(std::chrono::seconds(1)); }
}  // namespace comgui::plugin::detail
