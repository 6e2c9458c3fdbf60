#include "tests/support/SiteClient.h"

#include <algorithm>
#include <charconv>
#include <fstream>

namespace
{
constexpr char ListKey[] = "List";

constexpr char Seed[] = R"(<?xml version="1.0" encoding="UTF-8"?>
<!-- Of passwords that cost next to nothing to verify: for tests and measurements alone. -->
<site version="1">
    <users>
        <user name="admin" role="16" ticket="1"
            hash="$y$j75$7rZBcwzpbEouIqNPGZuJm/$WJhdkDuxf1qM0qICvcS.ZjHHTU1Cf63C7XnC8mIneE3"/>
        <user name="operator" role="1" ticket="2"
            hash="$y$j75$i8lkUJSX9wGJ78fnCsp.R1$kKwaSHQeS6sCCSmsmYtwzps0c/JMdgE0HHfPWiqV/f."/>
    </users>
    <ticket type="0" id="0">
        <parameter key="System/Name" type="string">Print Server</parameter>
        <parameter key="System/MasterSOAPPort" type="int">50000</parameter>
        <parameter key="System/UseFolderVariables" type="int">3</parameter>
        <parameter key="System/InstallFolder" type="string">/</parameter>
        <parameter key="System/Folders/Temp" type="string">$(INSTALL)/temp</parameter>
        <parameter key="System/Folders/Job" type="string">$(INSTALL)/job</parameter>
    </ticket>
    <ticket type="17" id="1"/>
    <ticket type="17" id="2"/>
</site>
)";

std::vector<std::string> const& TableKeys()
{
    static std::vector<std::string> const keys = []
    {
        std::vector<std::string> made;
        for (std::size_t i = 0; i < SiteClient::TableSize; ++i)
            made.push_back("Table/" + std::to_string(i));
        return made;
    }();
    return keys;
}

bool AddId(void* ids, int, int id, STICKET_ACCESS const*)
{
    static_cast<std::vector<int>*>(ids)->push_back(id);
    return true;
}

// The ticket as XML, empty if there is none. It may grow between the question for its size and the copy.
std::string XmlOf(TicketName ticket)
{
    std::string xml;
    for (;;)
    {
        int size = static_cast<int>(xml.size());
        int const code = SiteClient::Manager().GetTicketData(ticket.type, ticket.id, 0, &size,
                                                             size ? xml.data() : nullptr);
        std::size_t const needed = static_cast<std::size_t>(std::max(size, 0));
        if (code == 0 || needed <= xml.size())
        {
            xml.resize(code == 0 ? needed : 0);
            return xml;
        }
        xml.resize(needed);
    }
}
}  // namespace

void SiteClient::MakeSite(std::filesystem::path const& folder)
{
    std::filesystem::create_directories(folder);
    if (std::filesystem::exists(folder / "seed.xml") || std::filesystem::exists(folder / "site.db"))
        return;
    std::ofstream seed;
    seed.exceptions(std::ios::failbit | std::ios::badbit);
    seed.open(folder / "seed.xml", std::ios::binary);
    seed << Seed;
    seed.close();
}

SiteClient::~SiteClient()
{
    if (m_tickets)
        Manager().Logout();
}

int SiteClient::LogIn(char const* user, char const* password)
{
    constexpr int NoPlugIn = -1;
    ComGUIManager& manager = Manager();
    if (!hSTicketInstance)
        return NoPlugIn;
    if (int const code = manager.Initialize(user, password, "localhost", 50000); code != 0)
        return code;
    int const code = manager.Login(user, password, "localhost", 50000);
    m_tickets = manager.GetClientContainer();
    return code;
}

bool SiteClient::Set(TicketName ticket, char const* key, std::int64_t value, int pos) const
{
    long long const number = value;
    return m_tickets->MSETPARAMETER(m_tickets->Instance, ticket.type, ticket.id, key, PARAM_INT64, &number,
                                    pos);
}

bool SiteClient::Remove(TicketName ticket, char const* key, int pos) const
{
    return m_tickets->MSETPARAMETER(m_tickets->Instance, ticket.type, ticket.id, key, PARAM_NONE, nullptr,
                                    pos);
}

std::optional<std::int64_t> SiteClient::Get(TicketName ticket, char const* key, int pos) const
{
    long long value = 0;
    if (!m_tickets->MGETPARAMETER(m_tickets->Instance, ticket.type, ticket.id, key, PARAM_INT64, &value, pos))
        return std::nullopt;
    return value;
}

std::size_t SiteClient::Count(TicketName ticket, char const* key) const
{
    std::uint64_t count = 0;
    m_tickets->MGETPARAMETER(m_tickets->Instance, ticket.type, ticket.id, key, PARAM_COUNT, &count, -1);
    return count;
}

std::vector<std::int64_t> SiteClient::List(TicketName ticket, char const* key) const
{
    std::vector<std::int64_t> values;
    std::size_t const count = Count(ticket, key);
    for (std::size_t pos = 0; pos < count; ++pos)
        if (auto const value = Get(ticket, key, static_cast<int>(pos)))
            values.push_back(*value);
    return values;
}

bool SiteClient::SetTable(TicketName ticket, std::int64_t value) const
{
    long long const number = value;
    std::vector<SETMULTIPAR> table;
    for (std::string const& key : TableKeys())
        table.push_back({key.c_str(), PARAM_INT64, 0, &number, -1, false, {}});
    table.push_back({});
    bool const isDone =
        m_tickets->MSETMULTIPAR(m_tickets->Instance, ticket.type, ticket.id, table.data()) != 0;
    return isDone &&
           std::all_of(table.begin(), table.end() - 1, [](auto const& record) { return record.ok; });
}

std::vector<std::int64_t> SiteClient::Table(TicketName ticket) const
{
    std::vector<long long> numbers(TableSize);
    std::vector<GETMULTIPAR> table;
    for (std::size_t i = 0; i < TableSize; ++i)
        table.push_back({TableKeys()[i].c_str(), PARAM_INT64, 0, &numbers[i], -1, false, {}});
    table.push_back({});
    m_tickets->MGETMULTIPAR(m_tickets->Instance, ticket.type, ticket.id, table.data());
    std::vector<std::int64_t> values;
    for (std::size_t i = 0; i < TableSize; ++i)
        if (table[i].ok)
            values.push_back(numbers[i]);
    return values;
}

std::vector<std::int64_t> SiteClient::TableOfXml(TicketName ticket) const
{
    constexpr std::string_view KeyOfTable = "key=\"Table/";
    std::string const xml = XmlOf(ticket);
    std::vector<std::int64_t> values;
    for (std::size_t at = xml.find(KeyOfTable); at != xml.npos; at = xml.find(KeyOfTable, at + 1))
    {
        std::size_t const text = xml.find('>', at);
        std::int64_t value = 0;
        if (text != xml.npos &&
            std::from_chars(xml.data() + text + 1, xml.data() + xml.size(), value).ec == std::errc())
            values.push_back(value);
    }
    return values;
}

bool SiteClient::IsWhole(std::vector<std::int64_t> const& table)
{
    return table.empty() || (table.size() == TableSize &&
                             std::all_of(table.begin(), table.end(),
                                         [&](std::int64_t value) { return value == table.front(); }));
}

int SiteClient::Operate(TicketName ticket, MTICKET_OP op, void* arg) const
{
    return m_tickets->MOPERATION(m_tickets->Instance, ticket.type, ticket.id, op, arg);
}

bool SiteClient::Create(TicketName ticket) const
{
    char const* const everyKey[] = {nullptr};
    if (!m_tickets->MCREATETICKET(m_tickets->Instance, ticket.type, ticket.id, everyKey))
        return false;
    bool flag = false;
    Operate(ticket, MTICKET_OP_CLOSE, &flag);
    return true;
}

std::optional<int> SiteClient::CreateNext(int type) const
{
    int id = TICKET_ID_NONE;
    if (!Operate({type, TICKET_ID_NEXT}, MTICKET_OP_CREATE_NEXT, &id))
        return std::nullopt;
    return id;
}

bool SiteClient::Delete(TicketName ticket) const { return Operate(ticket, MTICKET_OP_DELETE, nullptr); }

std::vector<int> SiteClient::Ids(int type) const
{
    std::vector<int> ids;
    m_tickets->MWALKTICKETS(m_tickets->Instance, AddId, &ids, type);
    return ids;
}

STICKET_ACCESS const* SiteClient::Open(TicketName ticket) const
{
    STICKET_ACCESS const* table = nullptr;
    return Operate(ticket, MTICKET_OP_OPEN, &table) ? table : nullptr;
}

int SiteClient::PrepareJob(std::string const& name) { return Manager().PrepareJob(name, 0, 0, -1, 1, 0); }

int SiteClient::SendJob(std::string path, std::string name)
{
    char folder[] = "$(UPLOADJOB)";
    TJobIdentification job = {};
    job.nSize = sizeof job;
    job.pszUploadFolder = folder;
    return Manager().SendJob(&job, path.data(), name.data());
}

std::optional<int> SiteClient::StateOfJob(int id)
{
    constexpr int JobType = 3;
    int state = -1;
    if (!Manager().GetParameter(JobType, id, "Job/State", PARAM_INT, &state, -1))
        return std::nullopt;
    return state;
}

int SiteClient::PutFile(std::string source, std::string serverPath, Sync sync)
{
    return sync == Sync::Now ? Manager().PutFileSync(source.data(), serverPath.data())
                             : Manager().PutFile(source.data(), serverPath.data());
}

int SiteClient::GetFile(std::string serverPath, std::string target)
{
    return Manager().GetFileSync(serverPath.data(), target.data());
}

bool SiteClient::Listen(std::function<void(Heard const&)> handler)
{
    m_handler = std::move(handler);
    STICKET_ACCESS const* ticket = hSTicketInstance->CreateTicket(nullptr);
    if (!ticket)
        return false;
    ticket->SSETPARAMETER(ticket->Instance, "pGUI2Notification", PARAM_POINTER,
                          reinterpret_cast<void*>(&Call), -1);
    ticket->SSETPARAMETER(ticket->Instance, "pUser", PARAM_POINTER, this, -1);
    char command[] = "local.set.callback";
    int const code = Manager().SendCommand(command, 0, const_cast<STICKET_ACCESS*>(ticket));
    ticket->SGETPARAMETER(ticket->Instance, "iGUINotificationID", PARAM_INT, &m_notification, -1);
    hSTicketInstance->DestroyTicket(&ticket);
    return code == 0;
}

bool SiteClient::Enable(int type) const
{
    char const* const everyKey[] = {nullptr};
    return m_tickets->MENDISNOTIF(m_tickets->Instance, type, TICKET_ID_ALL, m_notification, true, everyKey);
}

void SiteClient::Call(void* user, int kind, int argA, int, int code, void* data)
{
    auto const& handler = static_cast<SiteClient*>(user)->m_handler;
    handler({kind, {code, argA}, static_cast<SETMULTIPAR const*>(data)});
}

bool SharedList::Append(std::int64_t value)
{
    while (m_client.Count({m_type, m_block}, ListKey) >= BlockSize)
        ++m_block;
    TicketName const block{m_type, m_block};
    // Of several programs that meet a missing block one creates it.
    return m_client.Set(block, ListKey, value, -2) ||
           (m_client.Create(block), m_client.Set(block, ListKey, value, -2));
}

void SharedList::Walk(int block, std::function<void(std::int64_t value)> const& action) const
{
    for (;; ++block)
    {
        std::vector<std::int64_t> const values = m_client.List({m_type, block}, ListKey);
        if (values.empty())
            return;
        for (std::int64_t const value : values)
            action(value);
    }
}
