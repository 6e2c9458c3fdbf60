// One connection to a PostgreSQL database, with what every use of it needs: a deadline for every call, which
// moves on as long as bytes come and go, since a large answer over a slow line is no sign of trouble,
// statements that are prepared once, parameters apart from the SQL, and failures that throw one line. For one
// thread at a time.
//
// Over libpq itself: a deadline needs its asynchronous calls, and a listener needs its socket and its
// notifications one by one; libpqxx 6.4 hides the first two and has no pipeline mode, to which a commit of
// several statements could still be moved.
#pragma once

#include "standin/server/files/ForkedChild.h"
#include "standin/server/store/Store.h"
#include "standin/server/store/postgres/Wakeup.h"
#include <array>
#include <atomic>
#include <chrono>
#include <concepts>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

struct pg_conn;
struct pg_result;

namespace standin::postgres
{
using Clock = std::chrono::steady_clock;

// The connection is of no more use. Nobody knows whether the statement that it was lost over has taken
// effect.
class BrokenConnection : public LostStore
{
public:
    explicit BrokenConnection(std::string const& line, bool isRefusal = false)
        : LostStore(line), m_isRefusal(isRefusal)
    {
    }

    // The server works, but has a reason not to let this program in.
    bool IsRefusal() const { return m_isRefusal; }

private:
    bool m_isRefusal;
};

// The server has refused a statement, which has had no effect. The connection is sound.
class RefusedStatement : public StoreError
{
public:
    RefusedStatement(std::string const& line, std::string_view code) : StoreError(line)
    {
        code.copy(m_code.data(), m_code.size());
    }

    std::string_view Code() const { return {m_code.data(), m_code.size()}; }  // SQLSTATE

private:
    std::array<char, 5> m_code{};
};

// What a statement is given, in the order of $1, $2 ... Texts live until the statement has run; numbers and
// arrays are copied.
class Parameters
{
public:
    template <std::integral Number>
    Parameters& operator<<(Number number)
    {
        static_assert(sizeof number == 4 || sizeof number == 8);
        return AddNumber(static_cast<unsigned long long>(number), sizeof number);
    }
    Parameters& operator<<(std::string_view bytes);
    Parameters& operator<<(TicketAddress address) { return *this << address.type << address.id; }
    Parameters& operator<<(std::vector<int> const& numbers);
    Parameters& operator<<(std::vector<long long> const& numbers);
    Parameters& operator<<(std::vector<std::string_view> const& bytes);  // a null address stands for NULL
    Parameters& Keep(std::string bytes);
    Parameters& Null();  // of bigint

private:
    friend class Connection;

    struct Value
    {
        unsigned type;
        bool isNull;
        bool isOurs;
        std::string own{};
        std::string_view bytes{};
    };
    Value& Add(unsigned type);
    Parameters& AddNumber(unsigned long long number, std::size_t size);

    std::vector<Value> m_values;
};

// Rows, held in memory until the object goes.
class Result
{
public:
    explicit Result(pg_result* result) : m_result(result) {}

    int Rows() const;
    bool IsNull(int row, int column) const;
    long long Integer(int row, int column) const;
    int Int(int row, int column) const { return static_cast<int>(Integer(row, column)); }
    Sequence Number(int row, int column) const { return static_cast<Sequence>(Integer(row, column)); }
    bool Bool(int row, int column) const { return Integer(row, column) != 0; }
    std::string_view Bytes(int row, int column) const;  // as long as the result
    std::string Text(int row, int column) const { return std::string(Bytes(row, column)); }
    long long Changes() const;  // rows that the statement has changed

    // What make makes of each row.
    template <typename Make>
    auto Each(Make const& make) const
    {
        std::vector<decltype(make(0))> all;
        all.reserve(static_cast<std::size_t>(Rows()));
        for (int row = 0; row < Rows(); ++row)
            all.push_back(make(row));
        return all;
    }

private:
    friend class Connection;

    struct Clear
    {
        void operator()(pg_result* result) const noexcept;
    };
    std::unique_ptr<pg_result, Clear> m_result;
};

struct Target
{
    std::string uri;     // or keywords and values, as libpq takes them
    std::string schema;  // in which the site is

    // Which of the hosts has let a program in last; shared by all copies.
    std::shared_ptr<std::atomic<std::size_t>> lastHost = std::make_shared<std::atomic<std::size_t>>(0);
};

// Lets a thread that is about to end cut short what connections wait for in other threads.
class Hurry
{
public:
    static constexpr std::chrono::milliseconds Limit{300};

    // From now on no wait takes longer than the limit. Once and for all.
    void Begin() noexcept { m_beginning.Wake(); }
    int Begun() const { return m_beginning.Number(); }  // a descriptor, readable from then on

private:
    Wakeup m_beginning;
};

class Connection
{
public:
    // Connects to the first of the hosts that lets it write, beginning with the last that did; each gets its
    // share of the time. Statements find what they name in the schema, and the server ends one that waits for
    // others for lockLimit; 0: never. Throws BrokenConnection, at the deadline at the latest, but for the
    // time that the system takes to look up the name of a host. hurry lives longer.
    Connection(Target const& target, std::chrono::milliseconds lockLimit, Clock::time_point deadline,
               Hurry const* hurry = nullptr);
    ~Connection();
    Connection(Connection const&) = delete;
    Connection& operator=(Connection const&) = delete;

    // One statement, in one round trip; it is prepared at its first use; sql is a literal. Throws
    // RefusedStatement, or BrokenConnection: also at the deadline, since what the server does then is
    // unknown.
    Result Run(char const* sql, Parameters const& parameters, Clock::time_point deadline);

    // Statements without parameters or results.
    void Execute(std::string const& sql, Clock::time_point deadline);

    // report is called when the server has been silent for so long while it is waited for; the wait goes on.
    void OnSilence(std::chrono::milliseconds time, std::function<void()> report);

    // A deadline does not count as long as that holds: for who counts all that there is.
    void WaitAsLongAs(std::function<bool()> isWorthIt) { m_isWorthWaiting = std::move(isWorthIt); }

    // Once that holds nobody waits any more, whatever the deadline.
    void GiveUpWhen(std::function<bool()> isLost) { m_isLost = std::move(isLost); }

    // Whether the server has not ended it, as far as it has said so. For a connection that only works.
    bool IsSound();

    // Takes in what the server has sent, for who polls the socket. Throws BrokenConnection.
    void TakeIn();
    int Socket() const;

    // The payload of the next notification that was taken in; false if there is none.
    bool TakeNotification(std::string& payload);

    bool IsBroken() const { return m_isBroken; }
    bool IsInTransaction() const;
    std::string Quoted(std::string const& name) const;  // as an identifier

    // The database, its server and the user: what a message begins with. Never the password.
    std::string const& Name() const { return m_name; }

    // Gives the connection up without a word to the server, for a child that has inherited it: it is the
    // parent's.
    void Abandon() noexcept;

private:
    struct Host;
    struct Arguments;
    struct Close
    {
        void operator()(pg_conn* connection) const noexcept;
    };

    static std::vector<Host> HostsOf(std::string const& uri);
    void Open(Target const& target, std::chrono::milliseconds lockLimit, Clock::time_point deadline);
    void Connect(Target const& target, Host const& host, std::string const& places,
                 Clock::time_point deadline);
    void SetUp(Target const& target, std::chrono::milliseconds lockLimit, Clock::time_point deadline);
    void Wait(short events, Clock::time_point deadline);
    bool WaitUntil(Clock::time_point end, short events);
    bool WaitInSteps(Clock::time_point end, short events);
    void Flush(Clock::time_point& deadline);
    Arguments ArgumentsOf(Parameters const& parameters) const;
    Result PrepareAndRun(char const* sql, Arguments const& arguments, Clock::time_point deadline);
    void Send(std::string const& statement, Arguments const& arguments);
    Result LastResult(Clock::time_point& deadline);
    void AwaitResult(Clock::time_point& deadline);
    void MustSend(int isSent);
    void Check(pg_result const* result);
    void CheckIsConnected(pg_result const* result);
    [[noreturn]] void FailAsBroken(std::string const& reason, std::string const& remedy,
                                   bool isRefusal = false);
    [[noreturn]] void FailAsUnconnected();
    [[noreturn]] void FailAsBroken();

    Hurry const* const m_hurry;
    Clock::time_point m_lastMoment = Clock::time_point::max();  // once there is hurry
    std::chrono::milliseconds m_silence{};
    std::function<void()> m_reportSilence;  // null: nobody asks for it
    std::function<bool()> m_isWorthWaiting;
    std::function<bool()> m_isLost;  // null: nobody says so
    std::unique_ptr<pg_conn, Close> m_connection;
    KeptFromChildren m_socket;  // a program lives as long as the server sees it connected
    std::string m_name;
    std::string m_reason, m_remedy;  // of a failure
    bool m_isConnected = false;      // once
    bool m_isBroken = false;
    std::map<char const*, std::string> m_prepared;
};
}  // namespace standin::postgres
