#include "standin/server/store/postgres/Connection.h"

#include <algorithm>
#include <cerrno>
#include <libpq-fe.h>
#include <poll.h>
#include <system_error>
#include <tuple>
#include <utility>

namespace standin::postgres
{
namespace
{
// The types of parameters, which are the same in every database.
constexpr unsigned Bytea = 17;
constexpr unsigned Int8 = 20;
constexpr unsigned Int4 = 23;
constexpr unsigned ByteaArray = 1001;
constexpr unsigned Int4Array = 1007;
constexpr unsigned Int8Array = 1016;

constexpr int Binary = 1;
constexpr int NullSize = -1;  // of an array's element
constexpr std::size_t LargestParameter = 0x3FFFFFFF;

// How often is asked whether a wait is still worth while.
constexpr std::chrono::milliseconds Step(100);

// A line on which bytes flow may rest so long.
constexpr std::chrono::seconds LongestRest(5);

Clock::time_point MovedOn(Clock::time_point deadline)
{
    return std::max(deadline, Clock::now() + LongestRest);
}

constexpr char const* LostRemedy = "check the server and the network; the program connects again by itself";

void Put(std::string& out, unsigned long long number, int size)
{
    for (int shift = 8 * (size - 1); shift >= 0; shift -= 8)
        out.push_back(static_cast<char>(number >> shift));
}

void Put(std::string& out, int number) { Put(out, static_cast<unsigned>(number), 4); }

// An array of one dimension, whose elements put themselves with their sizes.
template <typename Elements, typename PutElement>
std::string ArrayOf(unsigned type, Elements const& elements, PutElement const& putElement)
{
    std::string out;
    Put(out, elements.empty() ? 0 : 1);  // dimensions
    Put(out, 1);                         // there may be NULLs
    Put(out, static_cast<int>(type));
    if (elements.empty())
        return out;
    Put(out, static_cast<int>(elements.size()));
    Put(out, 1);  // the first index
    for (auto const& element : elements)
        putElement(out, element);
    return out;
}

// libpq's texts have several lines.
std::string OneLine(char const* text)
{
    std::string line;
    for (char const* next = text; *next != '\0'; ++next)
        if (*next != '\n' && *next != '\t')
            line.push_back(*next);
        else if (!line.empty() && line.back() != ' ')
            line.push_back(' ');
    while (!line.empty() && line.back() == ' ')
        line.pop_back();
    return line;
}

bool EndsConnection(std::string_view code)
{
    return code.starts_with("08") || code == "57P01" || code == "57P02" || code == "57P03" || code == "57P05";
}

std::string_view CodeOf(pg_result const* result)
{
    char const* const field = PQresultErrorField(result, PG_DIAG_SQLSTATE);
    return field == nullptr ? "" : field;
}

char const* RemedyOf(std::string_view code)
{
    struct REMEDY
    {
        std::string_view code;  // or its beginning
        char const* remedy;
    };
    static constexpr REMEDY Remedies[] = {
        {"53100", "free some space on the server's disk, then try again"},
        {"53200", "give the server more memory, then try again"},
        {"53300", "raise max_connections, or end other programs"},
        {"42501", "grant this user what the schema's owner may do"},
        {"25006", "connect to the primary server: name it too, or promote this one"},
        {"57P03", "wait until the server is up, or promote its standby"},
        {"55P03", "see in pg_stat_activity who keeps it waiting, then try again"},
        {"57014", "see in pg_stat_activity who keeps it waiting, then try again"},
        {"40", "try again"},
        {"54", "keep a value below 1 GB"},
        {"58", "check the server's disk and its log, then try again"},
        {"XX", "check the server's disk and its log; bring a backup back if data is damaged"},
        {"42", "somebody has changed the site's schema: bring a backup back"},
        {"3F000", "somebody has removed the site's schema: bring a backup back"},
    };
    for (REMEDY const& known : Remedies)
        if (code.starts_with(known.code))
            return known.remedy;
    return "see the server's log, then try again";
}

struct FreeOptions
{
    void operator()(PQconninfoOption* options) const noexcept { PQconninfoFree(options); }
};
using Options = std::unique_ptr<PQconninfoOption, FreeOptions>;

// libpq's own reason could repeat the text, with the password in it.
Options Parsed(std::string const& uri)
{
    char* reason = nullptr;
    Options options(PQconninfoParse(uri.c_str(), &reason));
    PQfreemem(reason);
    if (!options)
        throw BrokenConnection("the name of the database cannot be read; write it as "
                               "postgresql://user@host/database");
    return options;
}

std::map<std::string, std::string> ValuesOf(Options const& options)
{
    std::map<std::string, std::string> values;
    for (PQconninfoOption const* option = options.get(); option && option->keyword; ++option)
        if (option->val)
            values[option->keyword] = option->val;
    return values;
}

// With what a service file, the environment and libpq itself add to it, without a word to any host: libpq
// looks at all values before it connects, and refuses that of sslmode.
Options Resolved(std::string const& uri)
{
    Parsed(uri);
    char const* const keywords[] = {"dbname", "sslmode", nullptr};
    char const* const values[] = {uri.c_str(), "none of them", nullptr};
    std::unique_ptr<PGconn, decltype(&PQfinish)> const refused(PQconnectStartParams(keywords, values, 1),
                                                               PQfinish);
    return Options(PQconninfo(refused.get()));
}

// Of a host for which a list of ports names none.
std::string DefaultPort()
{
    Options const options(PQconndefaults());
    for (PQconninfoOption const* option = options.get(); option && option->keyword; ++option)
        if (option->keyword == std::string_view("port") && option->compiled)
            return option->compiled;
    return "5432";
}

std::vector<std::string> Split(std::string const& list)
{
    std::vector<std::string> parts(1);
    for (char const letter : list)
        if (letter == ',')
            parts.emplace_back();
        else
            parts.back() += letter;
    return parts;
}

// hosts: empty if they are libpq's choice.
std::string DatabaseOf(PGconn* connection, std::string const& hosts)
{
    auto values = ValuesOf(Options(PQconninfo(connection)));
    std::string const host = PQhost(connection) && *PQhost(connection) ? PQhost(connection) : values["host"];
    return "database " + values["dbname"] + " at " + (hosts.empty() ? host + ":" + values["port"] : hosts) +
           " as " + values["user"];
}

// The SQLSTATE of a server that has not let a connection in, which libpq gives in a verbose text alone:
// "FATAL:  53300: sorry, ...". Takes it out of the text, and what follows about the server's source; empty
// if the server has not said anything.
std::string TakeCode(std::string& text)
{
    static constexpr char Mark[] = ":  ";
    for (auto at = text.find(Mark); at != text.npos; at = text.find(Mark, at + 1))
    {
        std::string code = text.substr(at + 3, 5);
        bool const isCode =
            code.size() == 5 && code.find_first_not_of("0123456789ABCDEFGHIJKLMNOPQRSTUVWXYZ") == code.npos;
        if (!isCode || text.compare(at + 8, 2, ": ") != 0)
            continue;
        text.erase(at + 3, 7);
        text.resize(std::min(text.find('\n', at), text.size()));
        return code;
    }
    return {};
}
}  // namespace

Parameters::Value& Parameters::Add(unsigned type) { return m_values.emplace_back(Value{type, false, true}); }

Parameters& Parameters::AddNumber(unsigned long long number, std::size_t size)
{
    Put(Add(size == 4 ? Int4 : Int8).own, number, static_cast<int>(size));
    return *this;
}

Parameters& Parameters::operator<<(std::string_view bytes)
{
    Value& value = Add(Bytea);
    value.isOurs = false;
    value.bytes = bytes;
    return *this;
}

Parameters& Parameters::operator<<(std::vector<int> const& numbers)
{
    Add(Int4Array).own = ArrayOf(Int4, numbers,
                                 [](std::string& out, int number)
                                 {
                                     Put(out, 4);
                                     Put(out, number);
                                 });
    return *this;
}

Parameters& Parameters::operator<<(std::vector<long long> const& numbers)
{
    Add(Int8Array).own = ArrayOf(Int8, numbers,
                                 [](std::string& out, long long number)
                                 {
                                     Put(out, 8);
                                     Put(out, static_cast<unsigned long long>(number), 8);
                                 });
    return *this;
}

Parameters& Parameters::operator<<(std::vector<std::string_view> const& bytes)
{
    Add(ByteaArray).own = ArrayOf(Bytea, bytes,
                                  [](std::string& out, std::string_view element)
                                  {
                                      bool const isNull = element.data() == nullptr;
                                      Put(out, isNull ? NullSize : static_cast<int>(element.size()));
                                      out.append(element);
                                  });
    return *this;
}

Parameters& Parameters::Keep(std::string bytes)
{
    Add(Bytea).own = std::move(bytes);
    return *this;
}

Parameters& Parameters::Null()
{
    Add(Int8).isNull = true;
    return *this;
}

void Result::Clear::operator()(pg_result* result) const noexcept { PQclear(result); }

int Result::Rows() const { return PQntuples(m_result.get()); }

bool Result::IsNull(int row, int column) const { return PQgetisnull(m_result.get(), row, column) != 0; }

long long Result::Integer(int row, int column) const
{
    std::string_view const bytes = Bytes(row, column);
    unsigned long long word = 0;
    for (char const byte : bytes.substr(0, sizeof word))
        word = word << 8 | static_cast<unsigned char>(byte);
    return bytes.size() == 4 ? static_cast<int>(word) : static_cast<long long>(word);
}

std::string_view Result::Bytes(int row, int column) const
{
    return {PQgetvalue(m_result.get(), row, column),
            static_cast<std::size_t>(PQgetlength(m_result.get(), row, column))};
}

long long Result::Changes() const
{
    char const* const count = PQcmdTuples(m_result.get());
    return *count == '\0' ? 0 : std::stoll(count);
}

void Connection::Close::operator()(pg_conn* connection) const noexcept { PQfinish(connection); }

// What is a host's own; nothing for libpq's choice.
struct Connection::Host
{
    std::string name, address, port;

    std::string Place() const { return (name.empty() ? address : name) + ":" + port; }
};

Connection::Connection(Target const& target, std::chrono::milliseconds lockLimit, Clock::time_point deadline,
                       Hurry const* hurry)
    : m_hurry(hurry),
      m_socket([](void const* connection) { return PQsocket(static_cast<PGconn const*>(connection)); })
{
    Open(target, lockLimit, deadline);
}

Connection::~Connection() = default;

// libpq tries several hosts, too, but would wait for the first silent one until the end. What it is to leave
// out of a list cannot be said to it: a list that has addresses or names for some hosts alone is its own.
std::vector<Connection::Host> Connection::HostsOf(std::string const& uri)
{
    auto values = ValuesOf(Resolved(uri));
    auto const names = Split(values["host"]), addresses = Split(values["hostaddr"]);
    auto const ports = Split(values["port"]);
    std::size_t const count = std::max(names.size(), addresses.size());
    std::vector<Host> hosts;
    auto const part = [&](std::vector<std::string> const& list, std::size_t i) {
        return list.size() == 1 ? list[0] : i < list.size() ? list[i] : "";
    };
    for (std::size_t i = 0; i < count; ++i)
        hosts.push_back({part(names, i), part(addresses, i), part(ports, i)});
    for (Host& host : hosts)
        host.port = host.port.empty() ? DefaultPort() : host.port;
    bool const isWhole = std::all_of(hosts.begin(), hosts.end(),
                                     [&](Host const& host) {
                                         return (names.size() == 1 || !host.name.empty()) &&
                                                (addresses.size() == 1 || !host.address.empty());
                                     });
    return count > 1 && isWhole ? hosts : std::vector<Host>(1);
}

void Connection::Open(Target const& target, std::chrono::milliseconds lockLimit, Clock::time_point deadline)
{
    std::vector<Host> const hosts = HostsOf(target.uri);
    std::string places, reasons, remedy;
    for (Host const& host : hosts)
        places += hosts.size() == 1 ? "" : (places.empty() ? "" : ",") + host.Place();
    bool isRefused = false;
    std::size_t const first = *target.lastHost;
    for (std::size_t i = 0; i < hosts.size(); ++i)
    {
        std::size_t const which = (first + i) % hosts.size();
        auto const now = Clock::now();
        auto const end = now + (deadline - now) / static_cast<int>(hosts.size() - i);
        try
        {
            Connect(target, hosts[which], places, end);
            SetUp(target, lockLimit, end);
            *target.lastHost = which;
            return;
        }
        catch (BrokenConnection const& error)
        {
            if (hosts.size() == 1)
                throw;
            reasons += (reasons.empty() ? "" : ", ") + hosts[which].Place() + ": " + m_reason;
            if (!isRefused)
                remedy = m_remedy;
            isRefused = isRefused || error.IsRefusal();
        }
    }
    FailAsBroken(reasons, remedy, isRefused);
}

void Connection::Connect(Target const& target, Host const& host, std::string const& places,
                         Clock::time_point deadline)
{
    // What stands before the URI is a default for it, and what stands behind it goes before it. A network
    // that swallows packets is noticed in some twenty seconds, also by a connection that only listens.
    char const* const keywords[] = {"keepalives_idle",
                                    "keepalives_interval",
                                    "keepalives_count",
                                    "tcp_user_timeout",
                                    "dbname",
                                    "host",
                                    "hostaddr",
                                    "port",
                                    "fallback_application_name",
                                    "client_encoding",
                                    nullptr};
    char const* const values[] = {"5",
                                  "5",
                                  "3",
                                  "20000",
                                  target.uri.c_str(),
                                  host.name.c_str(),
                                  host.address.c_str(),
                                  host.port.c_str(),
                                  "comgui",
                                  "UTF8",
                                  nullptr};
    m_isConnected = m_isBroken = false;
    m_prepared.clear();
    m_socket.Set(nullptr);
    m_connection.reset(PQconnectStartParams(keywords, values, 1));
    m_socket.Set(m_connection.get());
    if (!m_connection)
        throw BrokenConnection("no memory for a connection; end other programs, then try again");
    PQsetNoticeReceiver(
        m_connection.get(), [](void*, PGresult const*) {}, nullptr);  // not to stderr
    PQsetErrorVerbosity(m_connection.get(), PQERRORS_VERBOSE);
    m_name = DatabaseOf(m_connection.get(), places);
    if (PQstatus(m_connection.get()) == CONNECTION_BAD)
        FailAsUnconnected();
    for (PostgresPollingStatusType state = PGRES_POLLING_WRITING; state != PGRES_POLLING_OK;
         state = PQconnectPoll(m_connection.get()))
    {
        if (state == PGRES_POLLING_FAILED)
            FailAsUnconnected();
        Wait(state == PGRES_POLLING_READING ? POLLIN : POLLOUT, deadline);
    }
    m_isConnected = true;
    PQsetErrorVerbosity(m_connection.get(), PQERRORS_DEFAULT);
    if (PQsetnonblocking(m_connection.get(), 1) != 0)
        FailAsBroken();
}

// The schema alone is searched beside PostgreSQL's own, so that nobody's table gets between. A transaction
// sees what others have committed meanwhile, whatever the database's default is: commits rely on that. The
// server, too, is to notice soon when the other machine is gone: the program's death shows by that. A server
// that does not let it write is of no use, whatever the URI asks for.
// Every statement here is short and comes often: to compile it, or to plan it anew, costs more than it saves.
void Connection::SetUp(Target const& target, std::chrono::milliseconds lockLimit, Clock::time_point deadline)
{
    std::string const limit = std::to_string(lockLimit.count());
    Result const row = Run(
        "SELECT pg_is_in_recovery(), current_setting('transaction_read_only')::boolean, "
        "set_config('search_path', quote_ident(convert_from($1, 'UTF8')) || ', pg_temp', false), "
        "set_config('lock_timeout', convert_from($2, 'UTF8'), false), "
        "set_config('statement_timeout', '0', false), "
        "set_config('default_transaction_isolation', 'read committed', false), "
        "set_config('tcp_keepalives_idle', '5', false), set_config('tcp_keepalives_interval', '5', false), "
        "set_config('tcp_keepalives_count', '3', false), set_config('tcp_user_timeout', '20000', false), "
        "set_config('client_min_messages', 'error', false), "
        "set_config('jit', 'off', false), set_config('plan_cache_mode', 'force_generic_plan', false)",
        Parameters() << std::string_view(target.schema) << std::string_view(limit), deadline);
    if (row.Bool(0, 1))
        FailAsBroken(row.Bool(0, 0) ? "the server is a standby, which cannot be written to"
                                    : "the server lets this user only read",
                     RemedyOf("25006"));
}

// Of a statement that is sent.
struct Connection::Arguments
{
    std::vector<unsigned> types;
    std::vector<char const*> values;
    std::vector<int> sizes, formats;
};

Connection::Arguments Connection::ArgumentsOf(Parameters const& parameters) const
{
    Arguments arguments;
    for (Parameters::Value const& value : parameters.m_values)
    {
        std::string_view const bytes = value.isOurs ? std::string_view(value.own) : value.bytes;
        if (bytes.size() > LargestParameter)
            throw StoreError(m_name + ": a value is too large for it; " + RemedyOf("54"));
        arguments.types.push_back(value.type);
        arguments.values.push_back(value.isNull ? nullptr : bytes.data() == nullptr ? "" : bytes.data());
        arguments.sizes.push_back(static_cast<int>(bytes.size()));
        arguments.formats.push_back(Binary);
    }
    return arguments;
}

Result Connection::Run(char const* sql, Parameters const& parameters, Clock::time_point deadline)
{
    Arguments const arguments = ArgumentsOf(parameters);
    auto const known = m_prepared.find(sql);
    if (known == m_prepared.end())
        return PrepareAndRun(sql, arguments, deadline);
    Send(known->second, arguments);
    Flush(deadline);
    Result result = LastResult(deadline);
    Check(result.m_result.get());
    return result;
}

// Both on one way to the server: else the first use of a statement takes two round trips.
Result Connection::PrepareAndRun(char const* sql, Arguments const& arguments, Clock::time_point deadline)
{
    std::string const name = "s" + std::to_string(m_prepared.size());
    MustSend(PQenterPipelineMode(m_connection.get()));
    MustSend(PQsendPrepare(m_connection.get(), name.c_str(), sql, static_cast<int>(arguments.types.size()),
                           arguments.types.data()));
    Send(name, arguments);
    MustSend(PQpipelineSync(m_connection.get()));
    Flush(deadline);
    Result const prepared = LastResult(deadline);
    CheckIsConnected(prepared.m_result.get());
    Result result = LastResult(deadline);
    CheckIsConnected(result.m_result.get());
    AwaitResult(deadline);
    Result const end(PQgetResult(m_connection.get()));
    if (PQresultStatus(end.m_result.get()) != PGRES_PIPELINE_SYNC)
        FailAsBroken();
    MustSend(PQexitPipelineMode(m_connection.get()));
    Check(prepared.m_result.get());
    m_prepared[sql] = name;
    Check(result.m_result.get());
    return result;
}

void Connection::Send(std::string const& statement, Arguments const& arguments)
{
    MustSend(PQsendQueryPrepared(m_connection.get(), statement.c_str(),
                                 static_cast<int>(arguments.values.size()), arguments.values.data(),
                                 arguments.sizes.data(), arguments.formats.data(), Binary));
}

void Connection::Execute(std::string const& sql, Clock::time_point deadline)
{
    MustSend(PQsendQuery(m_connection.get(), sql.c_str()));
    Flush(deadline);
    Check(LastResult(deadline).m_result.get());
}

bool Connection::IsSound()
{
    try
    {
        pollfd unasked{Socket(), POLLIN, 0};
        while (!m_isBroken && poll(&unasked, 1, 0) > 0)
            TakeIn();
    }
    catch (BrokenConnection const&)
    {
    }
    return !m_isBroken;
}

void Connection::TakeIn()
{
    if (PQconsumeInput(m_connection.get()) == 0)
        FailAsBroken();
}

int Connection::Socket() const { return PQsocket(m_connection.get()); }

bool Connection::TakeNotification(std::string& payload)
{
    std::unique_ptr<PGnotify, decltype(&PQfreemem)> const notification(PQnotifies(m_connection.get()),
                                                                       PQfreemem);
    if (!notification)
        return false;
    payload = notification->extra;
    return true;
}

bool Connection::IsInTransaction() const { return PQtransactionStatus(m_connection.get()) != PQTRANS_IDLE; }

std::string Connection::Quoted(std::string const& name) const
{
    std::unique_ptr<char, decltype(&PQfreemem)> const quoted(
        PQescapeIdentifier(m_connection.get(), name.data(), name.size()), PQfreemem);
    if (!quoted)
        throw StoreError(m_name + ": " + OneLine(PQerrorMessage(m_connection.get())) +
                         "; choose another name");
    return quoted.get();
}

void Connection::Abandon() noexcept { std::ignore = m_connection.release(); }

void Connection::OnSilence(std::chrono::milliseconds time, std::function<void()> report)
{
    m_silence = time;
    m_reportSilence = std::move(report);
}

void Connection::Wait(short events, Clock::time_point deadline)
{
    auto const silent = m_reportSilence ? Clock::now() + m_silence : deadline;
    if (m_isLost ? WaitInSteps(deadline, events) : WaitUntil(std::min(silent, deadline), events))
        return;
    if (silent < deadline)
    {
        m_reportSilence();
        if (WaitUntil(deadline, events))
            return;
    }
    while (m_isWorthWaiting && m_isWorthWaiting())
        if (WaitUntil(Clock::now() + Step, events))
            return;
    FailAsBroken("has not answered in time", LostRemedy);
}

bool Connection::WaitInSteps(Clock::time_point end, short events)
{
    while (Clock::now() < std::min(end, m_lastMoment))
    {
        if (WaitUntil(std::min(end, Clock::now() + Step), events))
            return true;
        if (m_isLost())
            FailAsBroken("the server does not answer", LostRemedy);
    }
    return WaitUntil(end, events);
}

bool Connection::WaitUntil(Clock::time_point end, short events)
{
    for (;;)
    {
        bool const isHurried = !m_hurry || m_lastMoment != Clock::time_point::max();
        auto const left =
            std::chrono::ceil<std::chrono::milliseconds>(std::min(end, m_lastMoment) - Clock::now());
        pollfd waiting[] = {{Socket(), events, 0}, {isHurried ? -1 : m_hurry->Begun(), POLLIN, 0}};
        int const ready = poll(waiting, 2, static_cast<int>(std::max<std::int64_t>(left.count(), 0)));
        if (ready < 0 && errno != EINTR)
            FailAsBroken(std::generic_category().message(errno), LostRemedy);
        if (ready == 0)
            return false;
        if (ready > 0 && waiting[0].revents != 0)
            return true;
        if (ready > 0)
            m_lastMoment = Clock::now() + Hurry::Limit;
    }
}

// Reads meanwhile, lest server and client wait for each other with full buffers.
void Connection::Flush(Clock::time_point& deadline)
{
    for (int left = PQflush(m_connection.get()); left != 0; left = PQflush(m_connection.get()))
    {
        if (left < 0)
            FailAsBroken();
        Wait(POLLIN | POLLOUT, deadline);
        deadline = MovedOn(deadline);
        TakeIn();
    }
}

// Of the statement that is answered next, after all that comes before it.
Result Connection::LastResult(Clock::time_point& deadline)
{
    Result last(nullptr);
    for (;;)
    {
        AwaitResult(deadline);
        Result next(PQgetResult(m_connection.get()));
        if (!next.m_result)
            return last;
        last = std::move(next);
    }
}

void Connection::AwaitResult(Clock::time_point& deadline)
{
    while (PQisBusy(m_connection.get()) != 0)
    {
        Wait(POLLIN, deadline);
        deadline = MovedOn(deadline);
        TakeIn();
    }
}

void Connection::MustSend(int isSent)
{
    if (isSent == 0)
        FailAsBroken();
}

void Connection::Check(pg_result const* result)
{
    CheckIsConnected(result);
    ExecStatusType const status = PQresultStatus(result);
    if (status == PGRES_COMMAND_OK || status == PGRES_TUPLES_OK)
        return;
    char const* const reason = PQresultErrorField(result, PG_DIAG_MESSAGE_PRIMARY);
    std::string_view const code = CodeOf(result);
    throw RefusedStatement(
        m_name + ": " + OneLine(reason == nullptr ? "no reason" : reason) + "; " + RemedyOf(code), code);
}

// A result may be the server's last word.
void Connection::CheckIsConnected(pg_result const* result)
{
    if (PQstatus(m_connection.get()) == CONNECTION_BAD || result == nullptr || EndsConnection(CodeOf(result)))
        FailAsBroken();
}

void Connection::FailAsBroken() { FailAsBroken(OneLine(PQerrorMessage(m_connection.get())), LostRemedy); }

void Connection::FailAsUnconnected()
{
    std::string text = PQerrorMessage(m_connection.get());
    std::string const code = TakeCode(text);
    char const* const remedy = PQconnectionNeedsPassword(m_connection.get())
                                   ? "name a password, best in a password file"
                               : code.starts_with("53") || code == "57P03"
                                   ? RemedyOf(code)
                                   : "check that the server runs there, and that host, database, user and "
                                     "password are right";
    FailAsBroken(OneLine(text.c_str()), remedy, !code.empty() && !EndsConnection(code));
}

void Connection::FailAsBroken(std::string const& reason, std::string const& remedy, bool isRefusal)
{
    m_isBroken = true;
    m_reason = reason;
    m_remedy = remedy;
    throw BrokenConnection(m_name + ": " + reason + "; " + remedy, isRefusal);
}
}  // namespace standin::postgres
