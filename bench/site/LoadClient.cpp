#include "bench/site/LoadClient.h"

#include "bench/site/LatencyHistogram.h"
#include "tests/support/SiteClient.h"
#include <chrono>
#include <condition_variable>
#include <iostream>
#include <mutex>
#include <random>
#include <sstream>
#include <thread>

namespace
{
using Clock = std::chrono::steady_clock;
using nlohmann::json;

constexpr int TimedType = 90;  // ticket WRITER + 1: the value that a writer sets most of the time
constexpr int ListType = 93;
constexpr TicketName TableTicket{91, 1};
constexpr char TimeKey[] = "Time";
constexpr auto HeardWithin = std::chrono::seconds(10);

std::int64_t Now() { return std::chrono::nanoseconds(Clock::now().time_since_epoch()).count(); }

// A number in the list consists of run, writer and the writer's own count.
constexpr int WriterShift = 36;
constexpr int RunShift = 42;

void Print(std::string const& line) { std::cout << line << std::endl; }

// When to do the next of so many things a second on average. They come independently of each other, as those
// of people do: at equal distances all clients would do theirs in the same moment, every time.
class Pace
{
public:
    Pace(double perSecond, int client)
        : m_isPaced(perSecond > 0), m_distance(m_isPaced ? perSecond / 1e9 : 1),
          m_random(static_cast<unsigned>(client)), m_next(Now())
    {
        Done();
    }

    bool IsDue() { return !m_isPaced || Now() >= m_next; }
    void Done() { m_next += static_cast<std::int64_t>(m_distance(m_random)); }
    std::int64_t Next() const { return m_isPaced ? m_next : 0; }

private:
    bool const m_isPaced;
    std::exponential_distribution<> m_distance;  // nanoseconds
    std::mt19937_64 m_random;
    std::int64_t m_next;
};

// Receives the timed values in the callback, on the server's thread.
class Ear
{
public:
    void Hear(Heard const& heard)
    {
        std::int64_t const now = Now();
        if (heard.kind != Heard::Changed || heard.ticket.type != TimedType)
            return;
        std::lock_guard const lock(m_lock);
        for (SETMULTIPAR const* record = heard.records; record->key; ++record)
            if (record->type == PARAM_INT64 && record->key == std::string_view(TimeKey))
                Take(heard.ticket.id, *static_cast<long long const*>(record->value), now);
        m_came.notify_all();
    }

    json Figures(std::uint64_t expected)
    {
        std::unique_lock lock(m_lock);
        // Waits as long as more arrives, however far behind this client is.
        auto const isComplete = [&] { return m_latency.Count() >= expected; };
        for (std::uint64_t before = expected; !isComplete() && m_latency.Count() != before;)
        {
            before = m_latency.Count();
            m_came.wait_for(lock, HeardWithin, isComplete);
        }
        return {{"latency", m_latency.Form()},
                {"missed", static_cast<std::int64_t>(expected - m_latency.Count())},
                {"doubled", m_doubled},
                {"disordered", m_disordered},
                {"order", m_order}};
    }

private:
    // The times of one writer ascend.
    void Take(int writer, std::int64_t time, std::int64_t now)
    {
        std::int64_t& last = m_last[writer];
        m_doubled += time == last ? 1 : 0;
        m_disordered += time < last ? 1 : 0;
        if (time <= last)
            return;
        last = time;
        m_latency.Add(now - time);
        m_order = m_order * 1099511628211u + static_cast<std::uint64_t>(time);
    }

    std::mutex m_lock;
    std::condition_variable m_came;
    std::map<int, std::int64_t> m_last;
    LatencyHistogram m_latency;
    std::uint64_t m_order = 0;  // the same in all programs that heard the same in the same order
    int m_doubled = 0;
    int m_disordered = 0;
};

class LoadClient
{
public:
    explicit LoadClient(LoadTask const& task) : m_task(task), m_list(m_client, ListType) {}

    bool Start()
    {
        if (int const code = m_client.LogIn(m_task.user.c_str(), m_task.password.c_str()); code != 0)
        {
            Print("refused " + std::to_string(code));
            return false;
        }
        MakeTickets();
        if (m_task.watches && !(m_client.Listen([this](Heard const& heard) { m_ear.Hear(heard); }) &&
                                m_client.Enable(TimedType)))
        {
            Print("refused a callback");
            return false;
        }
        Print("ready");
        return true;
    }

    void Work(std::int64_t end)
    {
        Pace writing(m_task.changesPerSecond, 2 * m_task.number);
        Pace reading(m_task.readsPerSecond, 2 * m_task.number + 1);
        while (Now() < end)
        {
            if (m_task.writes && writing.IsDue())
            {
                Write();
                writing.Done();
            }
            if (m_task.reads && reading.IsDue())
            {
                Read();
                reading.Done();
            }
            Rest(writing, reading, end);
        }
    }

    std::uint64_t TimedWrites() const { return m_timed; }

    json Figures(std::uint64_t expected)
    {
        json figures{{"reads", m_reads.Form()}, {"writes", m_writes.Form()},
                     {"appended", m_appended},  {"refused", m_refused},
                     {"torn", m_torn},          {"last", m_last},
                     {"number", m_task.number}};
        if (m_task.watches)
            figures["heard"] = m_ear.Figures(expected);
        return figures;
    }

    // How far each writer's numbers are in the list one after another, and how many are out of turn.
    json Verify() const
    {
        std::vector<std::int64_t> appended(64);
        int disordered = 0;
        m_list.Walk(1,
                    [&](std::int64_t value)
                    {
                        if (value >> RunShift != m_task.run)
                            return;  // of an earlier run
                        auto& next =
                            appended[static_cast<std::size_t>(value >> WriterShift) % appended.size()];
                        disordered += (value & ((std::int64_t{1} << WriterShift) - 1)) == next ? 0 : 1;
                        ++next;
                    });
        json last = json::object();
        for (int const writer : m_task.writers)
            last[std::to_string(writer)] = m_client.Get({TimedType, writer + 1}, TimeKey).value_or(0);
        return {{"appended", appended}, {"disordered", disordered}, {"last", last}};
    }

private:
    // Several clients need the table; the first one creates it. Without writers the readers need values.
    void MakeTickets() const
    {
        m_client.Create(TableTicket);
        if (m_task.writes)
            m_client.Create({TimedType, m_task.number + 1});
        if (!m_task.writers.empty() || m_task.verifies)
            return;
        m_client.Create({TimedType, 1});
        m_client.Set({TimedType, 1}, TimeKey, 1);
        m_client.SetTable(TableTicket, 1);
    }

    // Sleeps until the next thing is due; never without a pace.
    void Rest(Pace const& writing, Pace const& reading, std::int64_t end) const
    {
        std::int64_t until = end;
        if (m_task.writes)
            until = std::min(until, writing.Next());
        if (m_task.reads)
            until = std::min(until, reading.Next());
        if (until > Now())
            std::this_thread::sleep_until(Clock::time_point(std::chrono::nanoseconds(until)));
    }

    void Write()
    {
        std::int64_t const before = std::max(Now(), m_last + 1);
        bool isDone = false;
        switch (m_writeRound++ % 16)
        {
        case 3:
        case 11:
            isDone = m_list.Append(m_task.run << RunShift | std::int64_t{m_task.number} << WriterShift |
                                   m_appended);
            m_appended += isDone ? 1 : 0;
            break;
        case 7:
            isDone = m_client.SetTable(TableTicket, before);
            break;
        default:
            isDone = m_client.Set({TimedType, m_task.number + 1}, TimeKey, before);
            m_timed += isDone ? 1 : 0;
            m_last = isDone ? before : m_last;
        }
        m_refused += isDone ? 0 : 1;
        m_writes.Add(Now() - before);
    }

    void Read()
    {
        std::int64_t const before = Now();
        std::size_t const round = m_readRound++;
        auto const& writers = m_task.writers;
        if (round % 16 == 15)
            m_torn += SiteClient::IsWhole(m_client.Table(TableTicket)) ? 0 : 1;
        else
            m_client.Get({TimedType, writers.empty() ? 1 : writers[round % writers.size()] + 1}, TimeKey);
        m_reads.Add(Now() - before);
    }

    LoadTask const& m_task;
    Ear m_ear;
    SiteClient m_client;  // does not outlive what its handler uses
    SharedList m_list;
    LatencyHistogram m_reads;
    LatencyHistogram m_writes;
    std::size_t m_writeRound = 0;
    std::size_t m_readRound = 0;
    std::int64_t m_appended = 0;
    std::int64_t m_last = 0;  // the newest timed value
    std::uint64_t m_timed = 0;
    int m_refused = 0;
    int m_torn = 0;
};

// The number behind that word on the next line of the input.
std::int64_t Await(std::string const& word)
{
    std::string line;
    std::getline(std::cin, line);
    std::istringstream words(line);
    std::string first;
    std::int64_t number = 0;
    if (!(words >> first >> number) || first != word)
        throw std::runtime_error("no \"" + word + "\"");
    return number;
}
}  // namespace

int RunLoadClient(LoadTask const& task)
{
    LoadClient client(task);
    if (!client.Start())
        return 1;
    if (task.verifies)
    {
        Print(client.Verify().dump());
        return 0;
    }
    client.Work(Await("go"));
    Print("written " + std::to_string(client.TimedWrites()));
    Print(client.Figures(static_cast<std::uint64_t>(Await("expect"))).dump());
    return 0;
}
