#include "comgui/testing/ModuleFake.h"

#include "comgui/module.h"
#include "comgui/session/TCommandRecord.h"
#include "comgui/testing/Records.h"
#include "comgui/testing/TemporaryFolder.h"
#include <algorithm>
#include <dlfcn.h>
#include <map>
#include <mutex>
#include <stdexcept>

namespace comgui::test
{
using plugin::Parameters;

namespace
{
constexpr Address UserTicket{17, 1};
constexpr int JobTicketType = 3;
constexpr int NobodyThere = 105;

constexpr std::string_view Names[] = {
    "IsAliveEntry",     "InitializeEntry", "LoginEntry",       "LogoutEntry",   "GetTicketDataEntry",
    "SendCommandEntry", "PutFileEntry",    "PutFileSyncEntry", "GetFileEntry",  "GetFileSyncEntry",
    "SendJobEntry",     "MGETPARAMETER",   "MGETMULTIPAR",     "MWALKTICKETS",  "MSETPARAMETER",
    "MSETMULTIPAR",     "MOPERATION",      "MENDISNOTIF",      "MCREATETICKET", "SWALKPARAMETERS",
};

char const* NameOf(int operation)
{
    switch (operation)
    {
    case MTICKET_OP_OPEN:
        return " open";
    case MTICKET_OP_CLOSE:
        return " close";
    case MTICKET_OP_CREATE_NEXT:
        return " create";
    case MTICKET_OP_DELETE:
        return " delete";
    case MTICKET_OP_FOLDER_VARIABLES:
        return " folders";
    case STICKET_OP_SET_PARTIAL:
        return " partial";
    default:
        return " other";
    }
}

std::string TextOf(Address ticket) { return std::to_string(ticket.type) + "/" + std::to_string(ticket.id); }

std::string TextOf(std::string_view key, int pos)
{
    return std::string(key) + "[" + std::to_string(pos) + "]";
}

// " KEY[POS]=VALUE" of each record.
std::string TextOf(SETMULTIPAR const* table)
{
    std::string text;
    for (Parameter const& record : RecordsOf(table))
        text += " " + TextOf(record.key, record.pos) + "=" + test::TextOf(record.value);
    return text;
}

// Where the bundle's executable is a link to: the library with this code.
std::filesystem::path OwnFile()
{
    Dl_info library{};
    if (dladdr(reinterpret_cast<void const*>(&OwnFile), &library) == 0)
        throw std::runtime_error("libcomgui_testing cannot be found");
    return std::filesystem::absolute(library.dli_fname);
}

constexpr char Info[] = R"(<?xml version="1.0" encoding="UTF-8"?>
<plist version="1.0">
<dict>
    <key>CFBundleExecutable</key><string>Testing</string>
    <key>CFPlugInFactories</key>
    <dict><key>0F5D3C1B-2D64-4F0D-9E0C-6B7B2B6B6D11</key><string>ComGUITestingFactory</string></dict>
    <key>CFPlugInTypes</key>
    <dict>
        <key>5CDEF0B8-6CFC-11D8-A365-003065B1346E</key>
        <array><string>0F5D3C1B-2D64-4F0D-9E0C-6B7B2B6B6D11</string></array>
    </dict>
</dict>
</plist>
)";

// A folder with the bundle, for the whole process: the library never lets go of a plug-in.
std::filesystem::path FolderWithBundle()
{
    static TemporaryFolder const folder;
    static bool const isMade = []
    {
#ifdef __APPLE__
        auto const system = "MacOS";
#else
        auto const system = "Linux";
#endif
        folder.Write("ComGUI.Bundle/Contents/Info.plist", Info);
        auto const place = folder / "ComGUI.Bundle" / "Contents" / system;
        std::filesystem::create_directories(place);
        std::filesystem::create_symlink(OwnFile(), place / "Testing");
        return true;
    }();
    static_cast<void>(isMade);
    return folder.Path();
}

plugin::Notifications& NotificationsOfThePlugIn();
}  // namespace

// The tickets, what was called, and what is to be answered. It outlives the fake where a session still has
// it.
class ModuleFake::Inside
{
public:
    Inside()
    {
        m_tickets[plugin::SystemTicket].Write("System/Name", std::string("a fake"), -1);
        m_tickets[UserTicket].Write("User/Name", std::string("anybody"), -1);
    }

    // Writes a call down; throws Refused if it is to fail.
    void Note(std::string const& name, std::string const& rest, std::string const& command = {})
    {
        std::string const line = rest.empty() ? name : name + " " + rest;
        std::function<void(std::string const&)> work;
        int code = 0;
        {
            std::lock_guard const lock(m_lock);
            if (m_isClosed)
                throw plugin::Refused(NobodyThere);
            m_calls.push_back(line);
            for (std::string const& each : {name, command})
                if (auto const order = m_codes.find(each); order != m_codes.end())
                    code = order->second;
            work = m_work;
        }
        if (work)
            work(line);
        if (code != 0)
            throw plugin::Refused(code);
    }

    template <typename Work>
    auto Look(Address ticket, Work const& work) const
    {
        std::lock_guard const lock(m_lock);
        static Parameters const nothing;
        auto const found = m_tickets.find(ticket);
        return work(found == m_tickets.end() ? nothing : found->second);
    }
    bool Exists(Address ticket) const
    {
        std::lock_guard const lock(m_lock);
        return m_tickets.count(ticket) != 0;
    }
    std::vector<int> Ids(int type) const
    {
        std::lock_guard const lock(m_lock);
        std::vector<int> ids;
        for (auto const& [ticket, parameters] : m_tickets)
            if (ticket.type == type)
                ids.push_back(ticket.id);
        return ids;
    }
    bool Write(Address ticket, std::string_view key, Value const& value, int pos)
    {
        std::lock_guard const lock(m_lock);
        auto const found = m_tickets.find(ticket);
        if (found == m_tickets.end() || !found->second.Write(key, value, pos))
            return false;
        NotificationsOfThePlugIn().Changed(ticket, {{std::string(key), value, pos}});
        return true;
    }
    bool Create(Address ticket)
    {
        std::lock_guard const lock(m_lock);
        if (!plugin::IsTicket(ticket) || !m_tickets.try_emplace(ticket).second)
            return false;
        m_newest[ticket.type] = std::max(m_newest[ticket.type], ticket.id);
        NotificationsOfThePlugIn().Created(ticket);
        return true;
    }
    std::optional<int> CreateNext(int type)
    {
        for (;;)
        {
            int id = 0;
            {
                std::lock_guard const lock(m_lock);
                id = m_newest[type] + 1;
            }
            if (!plugin::IsTicket({type, id}))
                return std::nullopt;
            if (Create({type, id}))
                return id;
        }
    }
    bool Delete(Address ticket)
    {
        std::lock_guard const lock(m_lock);
        if (ticket == plugin::SystemTicket || m_tickets.erase(ticket) == 0)
            return false;
        NotificationsOfThePlugIn().Deleted(ticket);
        return true;
    }

    std::vector<std::string> Calls() const
    {
        std::lock_guard const lock(m_lock);
        return m_calls;
    }
    void ForgetCalls()
    {
        std::lock_guard const lock(m_lock);
        m_calls.clear();
    }
    void Answer(std::string const& call, int code)
    {
        bool const isKnown = std::find(std::begin(Names), std::end(Names), call) != std::end(Names);
        if (!isKnown && call.find('.') == std::string::npos)
            throw std::invalid_argument(call + ": no call that a fake can answer for");
        std::lock_guard const lock(m_lock);
        if (code == 0)
            m_codes.erase(call);
        else
            m_codes[call] = code;
    }
    void Close()
    {
        std::lock_guard const lock(m_lock);
        m_isClosed = true;
        m_tickets.clear();
        m_work = nullptr;
    }
    void OnCall(std::function<void(std::string const&)> work)
    {
        std::lock_guard const lock(m_lock);
        m_work = std::move(work);
    }

private:
    mutable std::mutex m_lock;  // of all below
    bool m_isClosed = false;
    std::map<Address, Parameters> m_tickets;
    std::map<int, int> m_newest;  // ids by type
    std::vector<std::string> m_calls;
    std::map<std::string, int> m_codes;  // by call or command
    std::function<void(std::string const&)> m_work;
};

// What the library talks to: one in the process, whichever fake there is at the moment.
class FakePlugIn : public plugin::Module
{
public:
    using Inside = ModuleFake::Inside;

    static FakePlugIn& Get() { return plugin::PlugIn<FakePlugIn>::GetModule(); }

    void Serve(std::shared_ptr<Inside> inside)
    {
        std::lock_guard const lock(m_lock);
        m_inside = std::move(inside);
    }

    int IsAlive(std::string_view host, int port) override
    {
        Current()->Note("IsAliveEntry", std::string(host) + ":" + std::to_string(port));
        return plugin::Done;
    }
    int Initialize(TLogin&) override
    {
        Current()->Note("InitializeEntry", "");
        return plugin::Done;
    }
    plugin::LoggedIn LogIn(plugin::Credentials const& credentials) override;

private:
    class Container;
    class Session;

    std::shared_ptr<Inside> Current()
    {
        std::lock_guard const lock(m_lock);
        if (!m_inside)
            throw plugin::Refused(NobodyThere);
        return m_inside;
    }

    std::mutex m_lock;
    std::shared_ptr<Inside> m_inside;
};

namespace
{
plugin::Notifications& NotificationsOfThePlugIn() { return FakePlugIn::Get().GetNotifications(); }
}  // namespace

class FakePlugIn::Container : public plugin::Container
{
public:
    Container(plugin::Session& session, std::shared_ptr<Inside> inside)
        : plugin::Container(session), m_inside(std::move(inside))
    {
    }

    bool Get(Address ticket, char const* key, PARAM_TYPE type, void* value, int pos) override
    {
        m_inside->Note("MGETPARAMETER", TextOf(ticket) + " " + TextOf(key ? key : "(null)", pos));
        return plugin::Container::Get(ticket, key, type, value, pos);
    }
    bool GetTable(Address ticket, GETMULTIPAR* table) override
    {
        std::string keys;
        for (Parameter const& record : RecordsOf(table))
            keys += " " + TextOf(record.key, record.pos);
        m_inside->Note("MGETMULTIPAR", TextOf(ticket) + keys);
        return plugin::Container::GetTable(ticket, table);
    }
    bool Set(Address ticket, char const* key, PARAM_TYPE type, void const* value, int pos) override
    {
        SETMULTIPAR table[2]{};
        table[0].key = key;
        table[0].type = type;
        table[0].value = value;
        table[0].pos = pos;
        m_inside->Note("MSETPARAMETER", TextOf(ticket) + TextOf(table));
        return plugin::Container::Set(ticket, key, type, value, pos);
    }
    bool SetTable(Address ticket, SETMULTIPAR* table) override
    {
        m_inside->Note("MSETMULTIPAR", TextOf(ticket) + TextOf(table));
        return plugin::Container::SetTable(ticket, table);
    }
    bool WalkTickets(MWALKTICKETS_ACTION action, void* context, int type) override
    {
        m_inside->Note("MWALKTICKETS", std::to_string(type));
        return plugin::Container::WalkTickets(action, context, type);
    }
    bool Operation(Address ticket, TICKET_OP op, void* arg) override
    {
        m_inside->Note("MOPERATION", TextOf(ticket) + NameOf(op.GetInt()));
        return plugin::Container::Operation(ticket, op, arg);
    }
    bool Switch(Address tickets, int notification, bool enable, char const* const* keys) override
    {
        m_inside->Note("MENDISNOTIF", TextOf(tickets) + (enable ? " on" : " off"));
        return plugin::Container::Switch(tickets, notification, enable, keys);
    }
    STICKET_ACCESS const* CreateTicket(Address ticket, char const* const* keys) override
    {
        m_inside->Note("MCREATETICKET", TextOf(ticket));
        return plugin::Container::CreateTicket(ticket, keys);
    }

    bool Exists(Address ticket) override { return m_inside->Exists(ticket); }
    Value Read(Address ticket, std::string_view key, int pos) override
    {
        return m_inside->Look(ticket, [&](Parameters const& values) { return values.Read(key, pos); });
    }
    int Count(Address ticket, std::string_view key) override
    {
        return m_inside->Look(ticket, [&](Parameters const& values) { return values.Count(key); });
    }
    bool Write(Address ticket, std::string_view key, Value const& value, int pos) override
    {
        return m_inside->Write(ticket, key, value, pos);
    }
    std::vector<Parameter> All(Address ticket, std::string_view prefix) override
    {
        m_inside->Note("SWALKPARAMETERS", TextOf(ticket) + (prefix.empty() ? "" : " " + std::string(prefix)));
        return m_inside->Look(ticket, [&](Parameters const& values) { return values.All(prefix); });
    }
    std::vector<int> Ids(int type) override { return m_inside->Ids(type); }
    std::optional<int> CreateNext(int type) override { return m_inside->CreateNext(type); }
    bool Create(Address ticket) override { return m_inside->Create(ticket); }
    bool Delete(Address ticket) override { return m_inside->Delete(ticket); }

private:
    std::shared_ptr<Inside> const m_inside;
};

class FakePlugIn::Session : public plugin::Session
{
public:
    explicit Session(std::shared_ptr<Inside> inside)
        : m_inside(std::move(inside)), m_container(*this, m_inside)
    {
    }

    plugin::ContainerSlots* GetContainer() override { return &m_container; }
    bool End() override
    {
        m_inside->Note("LogoutEntry", "");
        return true;
    }
    int PutFile(std::string_view local, std::string_view server, plugin::Transfer wanted) override
    {
        return Carry(wanted == plugin::Transfer::Complete ? "PutFileSyncEntry" : "PutFileEntry", local,
                     server);
    }
    int GetFile(std::string_view server, std::string_view local, plugin::Transfer wanted) override
    {
        return Carry(wanted == plugin::Transfer::Complete ? "GetFileSyncEntry" : "GetFileEntry", server,
                     local);
    }
    int SendJob(TJobIdentification const&, std::string_view path, std::string_view name) override
    {
        return Carry("SendJobEntry", path, name);
    }
    int Command(std::string_view name, int size, void* data) override
    {
        std::string const command(name);
        m_inside->Note("SendCommandEntry", command, command);
        return plugin::Session::Command(name, size, data);
    }
    int IsAlive(TCommandRecord& record) override { return record.iResult = plugin::Done; }
    int PrepareJob(TCommandRecord& record) override
    {
        record.iResult = m_inside->CreateNext(JobTicketType).value_or(-1);
        return plugin::Done;
    }
    int SetFolder(plugin::ClientFolder, std::string_view) override { return plugin::Done; }
    int TicketData(Address ticket, int, int*, void*) override
    {
        m_inside->Note("GetTicketDataEntry", TextOf(ticket));
        return plugin::NotOffered;
    }

private:
    int Carry(char const* entry, std::string_view from, std::string_view to)
    {
        m_inside->Note(entry, std::string(from) + " " + std::string(to));
        return plugin::Done;
    }

    std::shared_ptr<Inside> const m_inside;
    Container m_container;
};

plugin::LoggedIn FakePlugIn::LogIn(plugin::Credentials const& credentials)
{
    auto inside = Current();
    inside->Note("LoginEntry", credentials.user);
    return {std::make_unique<Session>(std::move(inside)), UserTicket.id, plugin::LoggedIn::Administrator,
            "127.0.0.1:" + std::to_string(credentials.localPort)};
}

ModuleFake::ModuleFake() : m_inside(std::make_shared<Inside>()) { FakePlugIn::Get().Serve(m_inside); }

ModuleFake::~ModuleFake()
{
    FakePlugIn::Get().Serve(nullptr);
    m_inside->Close();
}

std::filesystem::path ModuleFake::PlugIns() const { return FolderWithBundle(); }

Address ModuleFake::Create(int type, std::vector<Parameter> const& parameters)
{
    auto const id = m_inside->CreateNext(type);
    if (!id)
        throw std::runtime_error("no ticket of type " + std::to_string(type) + " can be made");
    Address const ticket{type, *id};
    for (Parameter const& parameter : parameters)
        Put(ticket, parameter.key, parameter.value, parameter.pos);
    return ticket;
}

void ModuleFake::Put(Address ticket, std::string const& key, Value const& value, int pos)
{
    if (!m_inside->Write(ticket, key, value, pos))
        throw std::runtime_error(TextOf(ticket) + ": " + key + " cannot be written");
}

void ModuleFake::Delete(Address ticket)
{
    if (!m_inside->Delete(ticket))
        throw std::runtime_error(TextOf(ticket) + ": cannot be deleted");
}

Value ModuleFake::Read(Address ticket, std::string const& key, int pos) const
{
    return m_inside->Look(ticket, [&](Parameters const& values) { return values.Read(key, pos); });
}

bool ModuleFake::Exists(Address ticket) const { return m_inside->Exists(ticket); }

std::vector<std::string> ModuleFake::Calls() const { return m_inside->Calls(); }

void ModuleFake::ForgetCalls() { m_inside->ForgetCalls(); }

void ModuleFake::Answer(std::string const& call, int code) { m_inside->Answer(call, code); }

void ModuleFake::OnCall(std::function<void(std::string const&)> work) { m_inside->OnCall(std::move(work)); }
}  // namespace comgui::test

COMGUI_PLUGIN(ComGUITestingFactory, comgui::test::FakePlugIn)
