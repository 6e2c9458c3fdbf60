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

std::string TextOf(Address ticket) { return std::to_string(ticket.type) + "/" + std::to_string(ticket.id); }

std::string TextOf(std::string_view key, int pos)
{
    return std::string(key) + "[" + std::to_string(pos) + "]";
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
        std::lock_guard const lock(m_lock);
        m_codes[call] = code;
    }
    void OnCall(std::function<void(std::string const&)> work)
    {
        std::lock_guard const lock(m_lock);
        m_work = std::move(work);
    }

private:
    mutable std::mutex m_lock;  // of all below
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

    static constexpr int NobodyThere = 105;

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

    bool Exists(Address ticket) override { return m_inside->Exists(ticket); }
    Value Read(Address ticket, std::string_view key, int pos) override
    {
        m_inside->Note("MGETPARAMETER", TextOf(ticket) + " " + TextOf(key, pos));
        return m_inside->Look(ticket, [&](Parameters const& values) { return values.Read(key, pos); });
    }
    int Count(Address ticket, std::string_view key) override
    {
        return m_inside->Look(ticket, [&](Parameters const& values) { return values.Count(key); });
    }
    bool Write(Address ticket, std::string_view key, Value const& value, int pos) override
    {
        m_inside->Note("MSETPARAMETER", TextOf(ticket) + " " + TextOf(key, pos) + "=" + TextOf(value));
        return m_inside->Write(ticket, key, value, pos);
    }
    std::vector<Parameter> All(Address ticket, std::string_view prefix) override
    {
        m_inside->Note("SWALKPARAMETERS", TextOf(ticket) + (prefix.empty() ? "" : " " + std::string(prefix)));
        return m_inside->Look(ticket, [&](Parameters const& values) { return values.All(prefix); });
    }
    std::vector<int> Ids(int type) override
    {
        m_inside->Note("MWALKTICKETS", std::to_string(type));
        return m_inside->Ids(type);
    }
    std::optional<int> CreateNext(int type) override
    {
        m_inside->Note("MOPERATION", "create " + std::to_string(type));
        return m_inside->CreateNext(type);
    }
    bool Create(Address ticket) override
    {
        m_inside->Note("MCREATETICKET", TextOf(ticket));
        return m_inside->Create(ticket);
    }
    bool Delete(Address ticket) override
    {
        m_inside->Note("MOPERATION", "delete " + TextOf(ticket));
        return m_inside->Delete(ticket);
    }
    bool Switch(Address tickets, int notification, bool enable, char const* const* keys) override
    {
        m_inside->Note("MENDISNOTIF", TextOf(tickets) + (enable ? " on" : " off"));
        return plugin::Container::Switch(tickets, notification, enable, keys);
    }

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

ModuleFake::~ModuleFake() { FakePlugIn::Get().Serve(nullptr); }

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
