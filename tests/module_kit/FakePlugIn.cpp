#include "tests/module_kit/FakePlugIn.h"

#include <cstring>

namespace fake
{
namespace
{
std::mutex troubleLock;
std::function<void(std::string const&)> theTrouble;
std::atomic<bool> isTrouble{false};

std::mutex logLock;
std::vector<std::string> logLines;

std::string TextOf(comgui::plugin::Transfer wanted)
{
    return wanted == comgui::plugin::Transfer::Complete ? " complete" : " begun";
}
}  // namespace

void Trouble::Set(std::function<void(std::string const&)> trouble)
{
    std::lock_guard const lock(troubleLock);
    isTrouble = static_cast<bool>(trouble);
    theTrouble = std::move(trouble);
}

void Trouble::Pass(char const* function)
{
    if (!isTrouble)
        return;
    std::function<void(std::string const&)> trouble;
    {
        std::lock_guard const lock(troubleLock);
        trouble = theTrouble;
    }
    if (trouble)
        trouble(function);
}

void Log::Add(std::string line)
{
    std::lock_guard const lock(logLock);
    logLines.push_back(std::move(line));
}

std::vector<std::string> Log::Take()
{
    std::lock_guard const lock(logLock);
    return std::exchange(logLines, {});
}

bool Server::Exists(Address ticket) const
{
    std::lock_guard const lock(m_lock);
    return m_tickets.contains(ticket);
}

Value Server::Read(Address ticket, std::string_view key, int pos) const
{
    std::lock_guard const lock(m_lock);
    auto const found = m_tickets.find(ticket);
    return found == m_tickets.end() ? Value() : found->second.Read(key, pos);
}

int Server::Count(Address ticket, std::string_view key) const
{
    std::lock_guard const lock(m_lock);
    auto const found = m_tickets.find(ticket);
    return found == m_tickets.end() ? 0 : found->second.Count(key);
}

bool Server::Write(Address ticket, std::string_view key, Value const& value, int pos)
{
    std::lock_guard const lock(m_lock);
    auto const found = m_tickets.find(ticket);
    if (found == m_tickets.end() || !found->second.Write(key, value, pos))
        return false;
    m_notifications.Changed(ticket, {{std::string(key), value, pos}});
    return true;
}

std::vector<Parameter> Server::All(Address ticket, std::string_view prefix) const
{
    std::lock_guard const lock(m_lock);
    auto const found = m_tickets.find(ticket);
    return found == m_tickets.end() ? std::vector<Parameter>() : found->second.All(prefix);
}

std::vector<int> Server::Ids(int type) const
{
    std::lock_guard const lock(m_lock);
    std::vector<int> ids;
    for (auto const& [address, parameters] : m_tickets)
        if (address.type == type)
            ids.push_back(address.id);
    return ids;
}

bool Server::Create(Address ticket)
{
    std::lock_guard const lock(m_lock);
    bool const isNew = m_tickets.try_emplace(ticket).second;
    if (isNew)
        m_notifications.Created(ticket);
    return isNew;
}

std::optional<int> Server::CreateNext(int type)
{
    int id = 1;
    for (int const taken : Ids(type))
        if (taken == id)
            ++id;
    return Create({type, id}) ? std::optional(id) : std::nullopt;
}

bool Server::Delete(Address ticket)
{
    std::lock_guard const lock(m_lock);
    bool const isDeleted = ticket != comgui::plugin::SystemTicket && m_tickets.erase(ticket) != 0;
    if (isDeleted)
        m_notifications.Deleted(ticket);
    return isDeleted;
}

bool Container::Exists(Address ticket)
{
    Trouble::Pass("Exists");
    return m_server.Exists(ticket);
}

Value Container::Read(Address ticket, std::string_view key, int pos)
{
    Trouble::Pass("Read");
    return m_server.Read(ticket, key, pos);
}

int Container::Count(Address ticket, std::string_view key)
{
    Trouble::Pass("Count");
    return m_server.Count(ticket, key);
}

bool Container::Write(Address ticket, std::string_view key, Value const& value, int pos)
{
    Trouble::Pass("Write");
    return m_server.Write(ticket, key, value, pos);
}

std::vector<Parameter> Container::All(Address ticket, std::string_view prefix)
{
    Trouble::Pass("All");
    return m_server.All(ticket, prefix);
}

std::vector<int> Container::Ids(int type)
{
    Trouble::Pass("Ids");
    return m_server.Ids(type);
}

std::optional<int> Container::CreateNext(int type)
{
    Trouble::Pass("CreateNext");
    return m_server.CreateNext(type);
}

bool Container::Create(Address ticket)
{
    Trouble::Pass("Create");
    return m_server.Create(ticket);
}

bool Container::Delete(Address ticket)
{
    Trouble::Pass("Delete");
    return m_server.Delete(ticket);
}

bool Container::Limit(Address, KeySelection const& keys)
{
    Trouble::Pass("Limit");
    return !keys.SelectsAll();
}

bool Container::OtherOperation(Address, int code, void*)
{
    Trouble::Pass("OtherOperation");
    return code == 105;
}

void Container::OnException(char const* reason) noexcept { Log::Add(std::string("container: ") + reason); }

comgui::plugin::ContainerSlots* Session::GetContainer()
{
    Trouble::Pass("GetContainer");
    return &m_container;
}

bool Session::End()
{
    Log::Add("end");
    Trouble::Pass("End");
    return true;
}

int Session::TicketData(Address ticket, int format, int* size, void*)
{
    Trouble::Pass("TicketData");
    Log::Add("data of " + std::to_string(ticket.type) + "/" + std::to_string(ticket.id));
    if (size)
        *size = format;
    return 0;
}

int Session::PutFile(std::string_view first, std::string_view second, comgui::plugin::Transfer wanted)
{
    Trouble::Pass("PutFile");
    Log::Add("put " + std::string(first) + " " + std::string(second) + TextOf(wanted));
    return 0;
}

int Session::GetFile(std::string_view first, std::string_view second, comgui::plugin::Transfer wanted)
{
    Trouble::Pass("GetFile");
    Log::Add("get " + std::string(first) + " " + std::string(second) + TextOf(wanted));
    return 0;
}

int Session::SendJob(TJobIdentification const& job, std::string_view path, std::string_view name)
{
    Trouble::Pass("SendJob");
    Log::Add("job " + std::to_string(job.iJobArg1) + " " + std::string(path) + " " + std::string(name));
    return 0;
}

int Session::IsAlive(TCommandRecord& record)
{
    Trouble::Pass("IsAlive");
    record.iResult = 7;
    return 0;
}

int Session::PrepareJob(TCommandRecord& record)
{
    Trouble::Pass("PrepareJob");
    record.iResult = record.iArgA;
    return 0;
}

int Session::SetFolder(comgui::plugin::ClientFolder folder, std::string_view path)
{
    Trouble::Pass("SetFolder");
    bool const isPreview = folder == comgui::plugin::ClientFolder::Preview;
    Log::Add((isPreview ? "preview " : "thumbnail ") + std::string(path));
    return 0;
}

int Session::OtherCommand(std::string_view name, int, void*)
{
    Trouble::Pass("OtherCommand");
    return name == "known" ? 0 : int{comgui::plugin::NotOffered};
}

int Module::IsAlive(std::string_view host, int port)
{
    Trouble::Pass("Module::IsAlive");
    return host == "localhost" && port == Port ? 0 : 1;
}

std::uint32_t Module::LocalAddress(std::string_view, int)
{
    Trouble::Pass("LocalAddress");
    return 0x0A000001;
}

int Module::Initialize(TLogin&)
{
    Trouble::Pass("Initialize");
    return 0;
}

int Module::Uninitialize(TLogin&)
{
    Trouble::Pass("Uninitialize");
    return 0;
}

LoggedIn Module::LogIn(comgui::plugin::Credentials const& credentials)
{
    Trouble::Pass("LogIn");
    if (credentials.password != Password)
        return {};
    return {std::make_unique<Session>(m_server), 17, LoggedIn::Administrator,
            credentials.localAddress + ":" + std::to_string(credentials.localPort)};
}

std::unique_ptr<comgui::plugin::TicketSlots> Module::MakeTicket()
{
    Trouble::Pass("MakeTicket");
    return comgui::plugin::Module::MakeTicket();
}

std::unique_ptr<comgui::plugin::TicketSlots> Module::OpenTicket(std::string_view path)
{
    Trouble::Pass("OpenTicket");
    if (path != "file")
        return nullptr;
    auto ticket = std::make_unique<comgui::plugin::MemoryTicket>();
    ticket->Write("Path", std::string(path), -1);
    return ticket;
}

bool Module::CloseTicket(comgui::plugin::TicketSlots&)
{
    Trouble::Pass("CloseTicket");
    Log::Add("close");
    return true;
}

void Module::Around(comgui::plugin::Call const& call)
{
    Trouble::Pass("Around");
    call();
}

void Module::OnException(char const* reason) noexcept { Log::Add(std::string("module: ") + reason); }
}  // namespace fake

RECORD::RECORD(std::string const& user, std::string const& password) : TLogin{}
{
    nSize = sizeof(TLogin);
    user.copy(szUser, sizeof szUser - 1);
    password.copy(szPassword, sizeof szPassword - 1);
    std::strcpy(szServerHost, "localhost");
    std::strcpy(szLocalAddress, "10.0.0.1");
    iServerPort = fake::Port;
    iLocalPort = 50006;
    iClientStamp = 30312656;
}

PlugInTest::PlugInTest()
{
    fake::Trouble::Clear();
    fake::Log::Take();
    fake::Session::hasEnded = false;
    EXPECT_EQ(table.Open(&hInstance), 0);
}

void* PlugInTest::LogIn() const
{
    RECORD login;
    EXPECT_EQ(table.LoginEntry(hInstance, &login), 0);
    return login.hSession;
}

fake::Address PlugInTest::NewTicket()
{
    auto const id = GetServer().CreateNext(3);
    EXPECT_TRUE(id);
    return {3, id.value_or(-1)};
}
