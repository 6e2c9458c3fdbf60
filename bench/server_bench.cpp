// Reads of the stand-in server, through the slots of a container as a client makes them. The store makes up
// its tickets, so no disk is in the way, and all of them are in memory before anything is measured.
//
// ScalarRead goes over the same 64 tickets whatever their number, so what grows is the look-up; of
// ScalarReadOfAnyTicket, which goes over all at random, the traffic to main memory. Threads are readers;
// beside a writer they read while another thread changes a ticket 100 times a second. SharedSequence is the
// look at whether another program has changed anything, which is a part of every read.
#include "standin/module/Container.h"
#include "standin/server/sessions/Password.h"
#include <benchmark/benchmark.h>
#include <malloc.h>
#include <map>
#include <random>

namespace
{
constexpr int JobType = 3;
constexpr int ParametersOfATicket = 50;
constexpr int WorkingSet = 64;

std::size_t HeapBytes()
{
    auto const heap = mallinfo2();
    return heap.uordblks + heap.hblkhd;
}

std::string KeyOf(int parameter) { return "Job/Parameter/" + std::to_string(parameter); }

// Tickets of 50 ints each; the value is the ticket's id plus the parameter's number. Changes are forgotten,
// but for their numbers.
class MadeUpStore final : public standin::Store
{
public:
    explicit MadeUpStore(int tickets) : m_tickets(tickets) {}

    standin::CommitOutcome Commit(standin::TicketChange const& change, std::uint64_t) override
    {
        return {standin::CommitOutcome::Committed, ++m_committed, change.address};
    }
    std::optional<standin::CommitOutcome> FindCommit(std::uint64_t) override { return std::nullopt; }
    void Sync() override {}
    std::atomic<standin::Sequence> const& Committed() const noexcept override { return m_committed; }

    standin::Sequence
    Tickets(std::function<void(standin::TicketAddress, standin::TicketState const&)> const& take) override
    {
        for (int id = 0; id < m_tickets; ++id)
            take({JobType, id}, {1, 1});
        return m_committed;
    }

    std::optional<Loaded>
    Load(standin::TicketAddress address,
         std::function<void(std::string_view, int, standin::StoredValue const&)> const& take) override
    {
        if (address.type != JobType)
            return std::nullopt;
        for (int parameter = 0; parameter < ParametersOfATicket; ++parameter)
        {
            standin::StoredValue value;
            value.type = PARAM_INT;
            value.integer = address.id + parameter;
            take(KeyOf(parameter), 0, value);
        }
        return Loaded{{1, 1}, m_committed};
    }

    bool ChangesSince(standin::Sequence, std::function<void(standin::CommittedChange&&)> const&) override
    {
        return true;
    }
    void WaitForChanges(standin::Sequence, std::chrono::milliseconds time) override
    {
        std::unique_lock lock(m_lock);
        m_end.wait_for(lock, time, [this] { return m_isInterrupted; });
    }
    void Interrupt() noexcept override
    {
        std::lock_guard const lock(m_lock);
        m_isInterrupted = true;
        m_end.notify_all();
    }
    void Maintain(standin::Sequence) override {}
    standin::ProgramId Self() const noexcept override { return 1; }
    std::vector<standin::ProgramInfo> Programs() override { return {}; }
    int Bury(std::function<void(standin::Estate const&)> const&) override { return 0; }
    void Leave() override {}
    long long OpenSession(std::string_view) override { return 1; }
    void CloseSession(long long) override {}
    std::vector<standin::SessionInfo> Sessions() override { return {}; }
    bool AddPartFile(std::string_view) override { return true; }
    void RemovePartFile(std::string_view) override {}
    std::optional<standin::User> FindUser(std::string_view name) override
    {
        return standin::User{std::string(name), m_hash, standin::AdministratorRole, 1};
    }
    std::vector<standin::User> Users() override { return {}; }
    void PutUser(standin::User const&) override {}
    bool RemoveUser(std::string_view) override { return false; }

private:
    int const m_tickets;
    std::string const m_hash = standin::Password::Hash("bench");
    std::atomic<standin::Sequence> m_committed{1};
    std::mutex m_lock;
    std::condition_variable m_end;
    bool m_isInterrupted = false;
};

struct FILLED_SERVER
{
    explicit FILLED_SERVER(int tickets)
        : store(tickets), server(store, "/nowhere"), container(server, server.Login("bench", "bench"))
    {
        std::size_t const before = HeapBytes();
        int value = 0;
        for (int id = 0; id < tickets; ++id)
            access().MGETPARAMETER(&container, JobType, id, "Job/Parameter/0", PARAM_INT, &value, -1);
        bytes = HeapBytes() - before;
    }
    MTICKET_ACCESS const& access() const { return *container.Access(); }

    MadeUpStore store;
    standin::Server server;
    standin::Container container;
    std::size_t bytes = 0;  // that the tickets take
};

FILLED_SERVER& ServerWith(int tickets)
{
    static std::mutex lock;
    static auto& servers = *new std::map<int, FILLED_SERVER>;
    std::lock_guard const guard(lock);
    return servers.try_emplace(tickets, tickets).first->second;
}

void Read(benchmark::State& state, FILLED_SERVER& filled, std::vector<int> const& ids)
{
    MTICKET_ACCESS const& access = filled.access();
    std::string const key = KeyOf(27);
    std::size_t next = 0;
    for (auto _ : state)
    {
        int const id = ids[next];
        next = next + 1 == ids.size() ? 0 : next + 1;
        int value = 0;
        int const found =
            access.MGETPARAMETER(access.Instance, JobType, id, key.c_str(), PARAM_INT, &value, -1);
        if (!found || value != id + 27)
            return state.SkipWithError("the read does not give what it should");
    }
}

std::vector<int> SpreadOver(int tickets)
{
    std::vector<int> ids;
    for (int i = 0; i < WorkingSet; ++i)
        ids.push_back(static_cast<int>(static_cast<long long>(i) * tickets / WorkingSet));
    return ids;
}

void ScalarRead(benchmark::State& state)
{
    int const tickets = static_cast<int>(state.range(0));
    Read(state, ServerWith(tickets), SpreadOver(tickets));
}

void ScalarReadBesideAWriter(benchmark::State& state)
{
    FILLED_SERVER& filled = ServerWith(1000);
    std::atomic<bool> isOver = false;
    std::thread writer;
    if (state.thread_index() == 0)
        writer = std::thread(
            [&]
            {
                MTICKET_ACCESS const& access = filled.access();
                for (int value = 0; !isOver; ++value)
                {
                    access.MSETPARAMETER(access.Instance, JobType, 500, "Job/Copies", PARAM_INT, &value, -1);
                    std::this_thread::sleep_for(std::chrono::milliseconds(10));
                }
            });
    Read(state, filled, SpreadOver(1000));
    isOver = true;
    if (writer.joinable())
        writer.join();
}

void ScalarReadOfAnyTicket(benchmark::State& state)
{
    int const tickets = static_cast<int>(state.range(0));
    std::mt19937 random(1);
    std::uniform_int_distribution<int> any(0, tickets - 1);
    std::vector<int> ids(1 << 16);
    for (int& id : ids)
        id = any(random);
    FILLED_SERVER& filled = ServerWith(tickets);
    Read(state, filled, ids);
    state.counters["bytes_a_ticket"] = static_cast<double>(filled.bytes) / tickets;
}

void SharedSequence(benchmark::State& state)
{
    FILLED_SERVER& filled = ServerWith(1);
    for (auto _ : state)
        filled.server.Tickets().CatchUp();
}
}  // namespace

BENCHMARK(SharedSequence);
BENCHMARK(ScalarRead)->Arg(1)->Arg(1000)->Arg(100000);
BENCHMARK(ScalarRead)->Arg(1000)->Threads(1)->Threads(2)->UseRealTime();
BENCHMARK(ScalarReadBesideAWriter)->Threads(1)->Threads(2)->UseRealTime();
BENCHMARK(ScalarReadOfAnyTicket)->Arg(1)->Arg(5000)->Arg(100000);

BENCHMARK_MAIN();
