// A whole communication plug-in. Its server is a std::map in the host's process, so what clients write is
// gone when that process ends. It offers tickets and notifications; whatever else the contract has, files and
// jobs for instance, the kit answers as not offered.
//
// Log in as "demo" with the password "demo" at localhost:50000.
#include <comgui/module.h>

#include <algorithm>
#include <map>
#include <mutex>
#include <optional>
#include <utility>

namespace
{
using comgui::plugin::Address;
using comgui::plugin::Parameter;
using comgui::plugin::Parameters;
using comgui::plugin::Value;

constexpr int Port = 50000;
constexpr Address UserTicket{1, 1};

// All tickets by their addresses. Clients of all sessions call from any thread.
class Server
{
public:
    explicit Server(comgui::plugin::Notifications& notifications) : m_notifications(notifications)
    {
        Parameters& system = m_tickets[comgui::plugin::SystemTicket];
        system.Write("System/Name", std::string("A server in a map"), -1);
        system.Write("System/MasterSOAPPort", Port, -1);
        m_tickets[UserTicket].Write("User/Name", std::string("demo"), -1);
    }

    template <typename Work>
    auto Look(Address ticket, Work const& work) const
    {
        std::lock_guard<std::mutex> const lock(m_lock);
        static Parameters const nothing;
        auto const found = m_tickets.find(ticket);
        return work(found == m_tickets.end() ? nothing : found->second);
    }

    bool Exists(Address ticket) const
    {
        std::lock_guard<std::mutex> const lock(m_lock);
        return m_tickets.count(ticket) != 0;
    }

    std::vector<int> Ids(int type) const
    {
        std::lock_guard<std::mutex> const lock(m_lock);
        std::vector<int> ids;
        for (auto it = m_tickets.lower_bound({type, 0}); it != m_tickets.end() && it->first.type == type;
             ++it)
            ids.push_back(it->first.id);
        return ids;
    }

    // Posted under the lock, so that clients hear of changes in the order in which they were made.
    bool Write(Address ticket, std::string_view key, Value const& value, int pos)
    {
        std::lock_guard<std::mutex> const lock(m_lock);
        auto const found = m_tickets.find(ticket);
        if (found == m_tickets.end() || !found->second.Write(key, value, pos))
            return false;
        m_notifications.Changed(ticket, {{std::string(key), value, pos}});
        return true;
    }

    bool Create(Address ticket)
    {
        std::lock_guard<std::mutex> const lock(m_lock);
        if (!m_tickets.try_emplace(ticket).second)
            return false;
        m_newest[ticket.type] = std::max(m_newest[ticket.type], ticket.id);
        m_notifications.Created(ticket);
        return true;
    }

    // Ids are not used twice, so that nobody takes a new ticket for an old one.
    std::optional<int> CreateNext(int type)
    {
        int id;
        do
        {
            std::lock_guard<std::mutex> const lock(m_lock);
            id = m_newest[type] + 1;
            if (!comgui::plugin::IsTicket({type, id}))
                return std::nullopt;
        } while (!Create({type, id}));
        return id;
    }

    bool Delete(Address ticket)
    {
        std::lock_guard<std::mutex> const lock(m_lock);
        if (ticket == comgui::plugin::SystemTicket || m_tickets.erase(ticket) == 0)
            return false;
        m_notifications.Deleted(ticket);
        return true;
    }

private:
    comgui::plugin::Notifications& m_notifications;
    mutable std::mutex m_lock;
    std::map<Address, Parameters> m_tickets;
    std::map<int, int> m_newest;  // ids by type
};

// What a session sees of the server: here, everything.
class Container : public comgui::plugin::Container
{
public:
    Container(comgui::plugin::Session& session, Server& server)
        : comgui::plugin::Container(session), m_server(server)
    {
    }

    bool Exists(Address ticket) override { return m_server.Exists(ticket); }
    Value Read(Address ticket, std::string_view key, int pos) override
    {
        return m_server.Look(ticket, [&](Parameters const& values) { return values.Read(key, pos); });
    }
    int Count(Address ticket, std::string_view key) override
    {
        return m_server.Look(ticket, [&](Parameters const& values) { return values.Count(key); });
    }
    bool Write(Address ticket, std::string_view key, Value const& value, int pos) override
    {
        return m_server.Write(ticket, key, value, pos);
    }
    std::vector<Parameter> All(Address ticket, std::string_view prefix) override
    {
        return m_server.Look(ticket, [&](Parameters const& values) { return values.All(prefix); });
    }
    std::vector<int> Ids(int type) override { return m_server.Ids(type); }
    std::optional<int> CreateNext(int type) override { return m_server.CreateNext(type); }
    bool Create(Address ticket) override { return m_server.Create(ticket); }
    bool Delete(Address ticket) override { return m_server.Delete(ticket); }

private:
    Server& m_server;
};

class Session : public comgui::plugin::Session
{
public:
    explicit Session(Server& server) : m_container(*this, server) {}

    comgui::plugin::ContainerSlots* GetContainer() override { return &m_container; }
    int IsAlive(TCommandRecord& record) override
    {
        record.iResult = 1;
        return comgui::plugin::Done;
    }
    int SetFolder(comgui::plugin::ClientFolder, std::string_view) override
    {
        return comgui::plugin::Done;  // a server with pictures would put them there
    }

private:
    Container m_container;
};

class Module : public comgui::plugin::Module
{
public:
    int IsAlive(std::string_view host, int port) override
    {
        return IsHere(host, port) ? int{comgui::plugin::Done} : NobodyThere;
    }

    comgui::plugin::LoggedIn LogIn(comgui::plugin::Credentials const& credentials) override
    {
        if (!IsHere(credentials.host, credentials.port))
            throw comgui::plugin::Refused(NobodyThere);
        if (credentials.user != "demo" || credentials.password != "demo")
            return {};
        return {std::make_unique<Session>(m_server), UserTicket.id, comgui::plugin::LoggedIn::Administrator,
                "127.0.0.1:" + std::to_string(credentials.localPort)};
    }

private:
    static constexpr int NobodyThere = 1;

    static bool IsHere(std::string_view host, int port)
    {
        return (host == "localhost" || host == "127.0.0.1") && port == Port;
    }

    Server m_server{GetNotifications()};
};
}  // namespace

COMGUI_PLUGIN(MinimalModuleFactory, Module)
