#include "standin/trace/TracedEntries.h"

#include "comgui/session/TCommandRecord.h"
#include "comgui/session/TJobIdentification.h"
#include "standin/trace/RealModule.h"
#include "standin/trace/Trace.h"
#include "standin/trace/TracedTables.h"
#include <cstring>
#include <mutex>
#include <set>
#include <string>
#include <string_view>
#include <utility>

namespace trace
{
namespace
{
ComGUIModuleInterface const& Real() { return RealModule::Get()->Table(); }

void const* At(void const* place) { return place; }

// A text of a record, which may fill its field to the last byte.
std::string TextOf(char const (&field)[128]) { return {field, strnlen(field, sizeof field)}; }

int OnOpen(void** hInstance)
{
    TracedCall const call(Call::Open);
    call.Began();
    int const code = Real().Open(hInstance);
    call.Ended(code, At(hInstance ? *hInstance : nullptr));
    return code;
}

void BeganWithRecord(TracedCall const& call, TLogin const* login)
{
    if (!call.IsTraced())
        return;
    if (login)
        call.Began(At(login), TextOf(login->szUser).c_str(), TextOf(login->szServerHost).c_str(),
                   login->iServerPort);
    else
        call.Began(At(login));
}

int OnInitialize(void* hInstance, TLogin* login, int stamp)
{
    TracedCall const call(Call::Initialize);
    BeganWithRecord(call, login);
    int const code = Real().InitializeEntry(hInstance, login, stamp);
    call.Ended(code);
    return code;
}

int OnIsAlive(void* hInstance, char const* host, int port)
{
    TracedCall const call(Call::IsAlive);
    call.Began(host, port);
    int const code = Real().IsAliveEntry(hInstance, host, port);
    call.Ended(code);
    return code;
}

unsigned int OnGetLocalAddress(void* hInstance, char const* host, int port)
{
    TracedCall const call(Call::GetLocalAddress);
    call.Began(host, port);
    unsigned int const address = Real().GetLocalAddressEntry(hInstance, host, port);
    call.Ended(address);
    return address;
}

int OnLogin(void* hInstance, TLogin* login)
{
    TracedCall const call(Call::Login);
    BeganWithRecord(call, login);
    int const code = Real().LoginEntry(hInstance, login);
    if (call.IsTraced() && code == 0 && login)
        call.Ended(code, At(login->hSession), login->iClientStamp, login->iUserRole,
                   TextOf(login->szLocalEndPoint).c_str());
    else
        call.Ended(code);
    return code;
}

int OnLogout(void* hInstance, void* hSession)
{
    TracedCall const call(Call::Logout);
    call.Began(At(hSession));
    int const code = Real().LogoutEntry(hInstance, hSession);
    call.Ended(code);
    return code;
}

int OnUninitialize(void* hInstance, TLogin* login)
{
    TracedCall const call(Call::Uninitialize);
    call.Began(At(login));
    int const code = Real().UninitializeEntry(hInstance, login);
    call.Ended(code);
    return code;
}

int OnUninitializeAsync(void* hInstance, TLogin* login)
{
    TracedCall const call(Call::UninitializeAsync);
    call.Began(At(login));
    int const code = Real().UninitializeAsyncEntry(hInstance, login);
    call.Ended(code);
    return code;
}

MTICKET_ACCESS const* OnGetClientContainer(void* hInstance, void* hSession)
{
    TracedCall const call(Call::GetClientContainer);
    call.Began(At(hSession));
    MTICKET_ACCESS const* const container = Real().GetClientContainerEntry(hInstance, hSession);
    call.Ended(At(container));
    return CopyOf(container, hSession);
}

int OnGetTicketData(void* hInstance, void* hSession, int type, int id, int format, int* size, void* buffer)
{
    TracedCall const call(Call::GetTicketData);
    call.Began(At(hSession), type, id, format, size ? *size : -1);
    int const code = Real().GetTicketDataEntry(hInstance, hSession, type, id, format, size, buffer);
    call.Ended(code, size ? *size : -1);
    return code;
}

using ClientCallback = void (*)(void* user, int kind, int argA, int argB, int code, void* data);

// Stands for a client's callback, for good: the plug-in may call it until the process ends.
struct TracedCallback
{
    ClientCallback function;
    void* user;

    bool operator<(TracedCallback const& other) const
    {
        return std::pair(function, user) < std::pair(other.function, other.user);
    }
};

TracedCallback const& Kept(TracedCallback const& callback)
{
    static auto& lock = *new std::mutex;
    static auto& all = *new std::set<TracedCallback>;
    std::lock_guard const guard(lock);
    return *all.insert(callback).first;
}

void OnCallback(void* context, int kind, int argA, int argB, int code, void* data)
{
    auto const& callback = *static_cast<TracedCallback const*>(context);
    TracedCall const call(Call::Callback);
    constexpr int ParametersChanged = 1;
    auto const* const table = kind == ParametersChanged ? static_cast<SETMULTIPAR const*>(data) : nullptr;
    if (call.IsTraced())
    {
        int records = 0;
        while (table && table[records].key)
            ++records;
        call.Began(At(callback.user), kind, argA, argB, code, records);
        for (SETMULTIPAR const* record = table; record && record->key; ++record)
            call.Make(Kind::Detail)
                .Add(record->key)
                .Add(int{record->type})
                .Add(record->pos)
                .Add(record->ok ? 1 : 0)
                .AddWritten(record->key, record->type, record->value)
                .Put();
    }
    callback.function(callback.user, kind, argA, argB, code, data);
    call.Ended();
}

void PutPointer(STICKET_ACCESS const& ticket, char const* key, void* pointer)
{
    ticket.SSETPARAMETER(ticket.Instance, key, PARAM_POINTER, pointer, -1);
}

void* PointerIn(STICKET_ACCESS const& ticket, char const* key)
{
    void* pointer = nullptr;
    ticket.SGETPARAMETER(ticket.Instance, key, PARAM_POINTER, &pointer, -1);
    return pointer;
}

// While the command runs, the ticket names the traced callback.
class Exchanged
{
public:
    explicit Exchanged(STICKET_ACCESS const* ticket) : m_ticket(ticket)
    {
        if (!ticket)
            return;
        m_function = PointerIn(*ticket, FunctionKey);
        m_user = PointerIn(*ticket, UserKey);
        if (!m_function)
            return;
        TracedCallback const& traced = Kept({reinterpret_cast<ClientCallback>(m_function), m_user});
        PutPointer(*ticket, FunctionKey, reinterpret_cast<void*>(OnCallback));
        PutPointer(*ticket, UserKey, const_cast<TracedCallback*>(&traced));
    }
    ~Exchanged()
    {
        if (!m_function)
            return;
        PutPointer(*m_ticket, FunctionKey, m_function);
        PutPointer(*m_ticket, UserKey, m_user);
    }
    Exchanged(Exchanged const&) = delete;
    Exchanged& operator=(Exchanged const&) = delete;

private:
    static constexpr char FunctionKey[] = "pGUI2Notification";
    static constexpr char UserKey[] = "pUser";

    STICKET_ACCESS const* const m_ticket;
    void* m_function = nullptr;
    void* m_user = nullptr;
};

// The commands whose data is a ticket's table.
bool HasTicket(std::string_view command)
{
    return command == "local.set.callback" || command == "local.get.reason" ||
           command == "local.get.progress";
}

int OnSendCommand(void* hInstance, void* hSession, char const* command, int size, void* data)
{
    std::string_view const name = command ? command : "";
    TracedCall const call(Call::SendCommand);
    call.Began(At(hSession), command, size, At(data));
    if (HasTicket(name))
    {
        STICKET_ACCESS const* const ticket = RealOf(static_cast<STICKET_ACCESS const*>(data));
        Exchanged const exchanged(name == "local.set.callback" ? ticket : nullptr);
        int const code =
            Real().SendCommandEntry(hInstance, hSession, command, size, const_cast<STICKET_ACCESS*>(ticket));
        call.Ended(code);
        return code;
    }
    int const code = Real().SendCommandEntry(hInstance, hSession, command, size, data);
    bool const isRecord = data && size == sizeof(TCommandRecord) && name.substr(0, 7) == "remote.";
    if (isRecord)
        call.Ended(code, static_cast<TCommandRecord const*>(data)->iResult);
    else
        call.Ended(code);
    return code;
}

using FileEntry = int (*ComGUIModuleInterface::*)(void*, void*, char*, char*);

template <Call Which, FileEntry Entry>
int OnFile(void* hInstance, void* hSession, char* first, char* second)
{
    TracedCall const call(Which);
    call.Began(At(hSession), static_cast<char const*>(first), static_cast<char const*>(second));
    int const code = (Real().*Entry)(hInstance, hSession, first, second);
    call.Ended(code);
    return code;
}

int OnSendJob(void* hInstance, void* hSession, TJobIdentification* job, char* path, char* name)
{
    TracedCall const call(Call::SendJob);
    call.Began(At(hSession), static_cast<char const*>(job ? job->pszUploadFolder : nullptr),
               static_cast<char const*>(path), static_cast<char const*>(name));
    int const code = Real().SendJobEntry(hInstance, hSession, job, path, name);
    call.Ended(code);
    return code;
}

STICKET_ACCESS const* OnCreateTicket(char const* path)
{
    TracedCall const call(Call::CreateTicket);
    call.Began(path);
    STICKET_ACCESS const* const ticket = Real().STicketFactory->CreateTicket(path);
    call.Ended(At(ticket));
    return CopyOf(ticket, nullptr);
}

void OnDestroyTicket(STICKET_ACCESS const** ticket)
{
    TracedCall const call(Call::DestroyTicket);
    STICKET_ACCESS const* real = ticket ? RealOf(*ticket) : nullptr;
    call.Began(At(real));
    Real().STicketFactory->DestroyTicket(ticket ? &real : nullptr);
    if (ticket && !real)
        *ticket = nullptr;
    call.Ended();
}

template <typename Entry>
void Put(Entry& entry, Entry traced)
{
    if (entry)
        entry = traced;
}
}  // namespace

void TraceEntries(ComGUIModuleInterface& table)
{
    Put(table.Open, OnOpen);
    Put(table.InitializeEntry, OnInitialize);
    Put(table.IsAliveEntry, OnIsAlive);
    Put(table.GetLocalAddressEntry, OnGetLocalAddress);
    Put(table.LoginEntry, OnLogin);
    Put(table.LogoutEntry, OnLogout);
    Put(table.UninitializeEntry, OnUninitialize);
    Put(table.GetClientContainerEntry, OnGetClientContainer);
    Put(table.GetTicketDataEntry, OnGetTicketData);
    Put(table.SendCommandEntry, OnSendCommand);
    Put(table.PutFileEntry, OnFile<Call::PutFile, &ComGUIModuleInterface::PutFileEntry>);
    Put(table.GetFileEntry, OnFile<Call::GetFile, &ComGUIModuleInterface::GetFileEntry>);
    Put(table.SendJobEntry, OnSendJob);
    Put(table.PutFileSyncEntry, OnFile<Call::PutFileSync, &ComGUIModuleInterface::PutFileSyncEntry>);
    Put(table.GetFileSyncEntry, OnFile<Call::GetFileSync, &ComGUIModuleInterface::GetFileSyncEntry>);
    Put(table.UninitializeAsyncEntry, OnUninitializeAsync);
    if (!table.STicketFactory)
        return;
    static ::STicketFactory factory = *table.STicketFactory;
    Put(factory.CreateTicket, OnCreateTicket);
    Put(factory.DestroyTicket, OnDestroyTicket);
    table.STicketFactory = &factory;
}
}  // namespace trace
