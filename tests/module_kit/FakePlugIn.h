// A plug-in over a map, made with the kit as an author would make it, and a host's view of it: its table,
// without a bundle. What its functions throw and answer is the test's choice.
#pragma once

#include "comgui/module.h"
#include <atomic>
#include <cstdlib>
#include <functional>
#include <gtest/gtest.h>
#include <map>
#include <mutex>
#include <set>
#include <string>
#include <vector>

namespace fake
{
using comgui::plugin::Address;
using comgui::plugin::Bytes;
using comgui::plugin::Callback;
using comgui::plugin::KeySelection;
using comgui::plugin::LoggedIn;
using comgui::plugin::Parameter;
using comgui::plugin::Value;

inline constexpr int Port = 4711;
inline constexpr char Password[] = "right";

// Called at the beginning of each of the author's functions, with its name; may throw.
class Trouble
{
public:
    static void Set(std::function<void(std::string const&)> trouble);
    static void Clear() { Set({}); }
    static void Pass(char const* function);
};

// The server: tickets in a map. For any thread.
class Server
{
public:
    explicit Server(comgui::plugin::Notifications& notifications) : m_notifications(notifications) {}

    bool Exists(Address ticket) const;
    Value Read(Address ticket, std::string_view key, int pos) const;
    int Count(Address ticket, std::string_view key) const;
    bool Write(Address ticket, std::string_view key, Value const& value, int pos);
    std::vector<Parameter> All(Address ticket, std::string_view prefix) const;
    std::vector<int> Ids(int type) const;
    bool Create(Address ticket);
    std::optional<int> CreateNext(int type);
    bool Delete(Address ticket);

private:
    comgui::plugin::Notifications& m_notifications;
    mutable std::mutex m_lock;
    std::map<Address, comgui::plugin::Parameters> m_tickets{{comgui::plugin::SystemTicket, {}}};
};

class Container : public comgui::plugin::Container
{
public:
    Container(comgui::plugin::Session& session, Server& server)
        : comgui::plugin::Container(session), m_server(server)
    {
    }

    bool Exists(Address ticket) override;
    Value Read(Address ticket, std::string_view key, int pos) override;
    int Count(Address ticket, std::string_view key) override;
    bool Write(Address ticket, std::string_view key, Value const& value, int pos) override;
    std::vector<Parameter> All(Address ticket, std::string_view prefix) override;
    std::vector<int> Ids(int type) override;
    std::optional<int> CreateNext(int type) override;
    bool Create(Address ticket) override;
    bool Delete(Address ticket) override;
    bool Limit(Address ticket, KeySelection const& keys) override;
    bool OtherOperation(Address ticket, int code, void* arg) override;
    void OnException(char const* reason) noexcept override;

private:
    Server& m_server;
};

class Session : public comgui::plugin::Session
{
public:
    explicit Session(Server& server) : m_container(*this, server) {}

    comgui::plugin::ContainerSlots* GetContainer() override;
    bool End() override;
    bool HasEnded() const override { return hasEnded; }
    int TicketData(Address ticket, int format, int* size, void* buffer) override;
    int PutFile(std::string_view first, std::string_view second, comgui::plugin::Transfer wanted) override;
    int GetFile(std::string_view first, std::string_view second, comgui::plugin::Transfer wanted) override;
    int SendJob(TJobIdentification const& job, std::string_view path, std::string_view name) override;
    int IsAlive(TCommandRecord& record) override;
    int PrepareJob(TCommandRecord& record) override;
    int SetFolder(comgui::plugin::ClientFolder folder, std::string_view path) override;
    int OtherCommand(std::string_view name, int size, void* data) override;

    static inline std::atomic<bool> hasEnded{false};

private:
    Container m_container;
};

class Module : public comgui::plugin::Module
{
public:
    int IsAlive(std::string_view host, int port) override;
    std::uint32_t LocalAddress(std::string_view host, int port) override;
    int Initialize(TLogin& record) override;
    int Uninitialize(TLogin& record) override;
    LoggedIn LogIn(comgui::plugin::Credentials const& credentials) override;
    std::unique_ptr<comgui::plugin::TicketSlots> MakeTicket() override;
    std::unique_ptr<comgui::plugin::TicketSlots> OpenTicket(std::string_view path) override;
    bool CloseTicket(comgui::plugin::TicketSlots& ticket) override;
    void Around(comgui::plugin::Call const& call) override;
    void OnException(char const* reason) noexcept override;

    Server& GetServer() { return m_server; }

private:
    Server m_server{GetNotifications()};
};

// What was told by transfers and the like, in words, and the reasons of exceptions; forgotten when taken.
class Log
{
public:
    static void Add(std::string line);
    static std::vector<std::string> Take();
};
}  // namespace fake

// A record as a host fills it in.
struct RECORD : TLogin
{
    explicit RECORD(std::string const& user = "ada", std::string const& password = fake::Password);
};

// The plug-in's table, an instance of it, and a session.
class PlugInTest : public testing::Test
{
protected:
    PlugInTest();
    ~PlugInTest() override { fake::Trouble::Clear(); }

    void* LogIn() const;
    MTICKET_ACCESS const* ContainerOf(void* hSession) const
    {
        return table.GetClientContainerEntry(hInstance, hSession);
    }
    static fake::Server& GetServer() { return comgui::plugin::PlugIn<fake::Module>::GetModule().GetServer(); }

    // A ticket that no other test has.
    static fake::Address NewTicket();

    ComGUIModuleInterface& table = comgui::plugin::PlugIn<fake::Module>::Table();
    void* hInstance = nullptr;
    RECORD record;
};
