// Writes of the SQLite store beside the same row statements through plain SQLite with the same settings,
// journal record included: the difference is what the store adds. What is flushed lies on a real disk, see
// Disk().
#include "bench/PlainSite.h"
#include <atomic>
#include <benchmark/benchmark.h>
#include <chrono>
#include <memory>
#include <sys/syscall.h>
#include <thread>
#include <unistd.h>

using comgui::test::TemporaryFolder;

namespace
{
using namespace bench;

struct SITE
{
    explicit SITE(std::filesystem::path const& place, SqliteOptions const& options = {})
        : folder(place), store(folder.Path(), OneJob, options)
    {
    }
    TemporaryFolder folder;
    SqliteStore store;
};

void OneValue(benchmark::State& state)
{
    SITE site(Memory());
    TicketChange change;
    change.address = Job;
    change.incarnation = change.revision = 1;
    change.parameters.push_back(IntParameter("Job/Parameter/27", 0));
    std::uint64_t number = 0;
    for (auto _ : state)
    {
        ++change.parameters[0].value.word;
        auto const outcome = site.store.Commit(change, ++number);
        if (outcome.kind != CommitOutcome::Committed)
            return state.SkipWithError("not committed");
        change.revision = outcome.sequence;
    }
}

void NewTicketPlain(benchmark::State& state)
{
    PLAIN plain;
    TicketChange change;
    change.parameters = Table();
    std::string bytes;
    AppendChangeRecord(bytes, change);
    long long sequence = 1;
    for (auto _ : state)
    {
        plain.Run(plain.begin);
        int const id = plain.NextId();
        ++sequence;
        plain.Integers(plain.create, {JobType, id, sequence, sequence, 0});
        plain.Run(plain.create);
        for (ParameterChange const& parameter : change.parameters)
            plain.Put(id, parameter);
        plain.Record(sequence, TicketChange::Create, id, bytes);
        plain.Run(plain.commit);
    }
}

void NewTicket(benchmark::State& state)
{
    SITE site(Memory());
    TicketChange change;
    change.kind = TicketChange::Create;
    change.address = {JobType, TicketChange::NextId};
    change.parameters = Table();
    std::uint64_t number = 0;
    for (auto _ : state)
        if (site.store.Commit(change, ++number).kind != CommitOutcome::Committed)
            return state.SkipWithError("not committed");
}

// --- what is read

void Load(benchmark::State& state)
{
    SITE site(Memory());
    long long sum = 0;
    for (auto _ : state)
        site.store.Load(Job,
                        [&sum](std::string_view, int, StoredValue const& value) { sum += value.integer; });
    benchmark::DoNotOptimize(sum);
}

// Opening and leaving a site in order, with so many tickets: must not depend on them.
void OpenAndLeave(benchmark::State& state)
{
    TemporaryFolder const folder(Memory());
    auto const content = [&state]
    {
        StoreContent many;
        for (int id = 1; id <= state.range(0); ++id)
        {
            TicketChange creation;
            creation.kind = TicketChange::Create;
            creation.address = {JobType, id};
            creation.parameters = Table();
            many.tickets.push_back(std::move(creation));
        }
        return many;
    };
    SqliteStore(folder.Path(), content).Leave();
    for (auto _ : state)
    {
        SqliteStore store(folder.Path(), content);
        if (!store.EndedInOrder())
            return state.SkipWithError("not left in order");
        store.Leave();
    }
}

// --- the disk

std::unique_ptr<SITE> flushedSite;
std::atomic<std::uint64_t> flushedNumber{0};
std::atomic<std::chrono::microseconds> flushTime{};

// Every thread writes a ticket of its own, and every commit waits until it is on the disk: the real one, or
// one in memory that takes so many microseconds for a flush.
void FlushedValue(benchmark::State& state)
{
    if (state.thread_index() == 0)
    {
        SqliteOptions options;
        options.durability = Durability::Full;
        flushedSite = std::make_unique<SITE>(state.range(0) == 0 ? Disk() : Memory(), options);
        flushTime = std::chrono::microseconds(state.range(0));
        flushedNumber = 0;
    }
    TicketChange creation;
    TicketChange change;
    for (auto _ : state)
    {
        if (change.incarnation == 0)  // behind the barrier at which the site is made
        {
            creation.kind = TicketChange::Create;
            creation.address = {JobType, TicketChange::NextId};
            auto const made = flushedSite->store.Commit(creation, ++flushedNumber);
            change.address = made.address;
            change.incarnation = change.revision = made.sequence;
            change.parameters.push_back(IntParameter("Job/Parameter/27", 0));
        }
        ++change.parameters[0].value.word;
        auto const outcome = flushedSite->store.Commit(change, ++flushedNumber);
        if (outcome.kind != CommitOutcome::Committed)
        {
            state.SkipWithError("not committed");
            break;
        }
        change.revision = outcome.sequence;
    }
    state.SetItemsProcessed(state.iterations());
    if (state.thread_index() == 0)
    {
        flushTime = std::chrono::microseconds(0);
        flushedSite.reset();
    }
}
}  // namespace

// In the place of the system's: SQLite flushes its journal by this one.
extern "C" __attribute__((visibility("default"))) int fdatasync(int file)
{
    auto const begin = std::chrono::steady_clock::now();
    int const result = static_cast<int>(syscall(SYS_fdatasync, file));
    std::this_thread::sleep_until(begin + flushTime.load());
    return result;
}

BENCHMARK(OneValuePlain);
BENCHMARK(OneValue);
BENCHMARK(NewTicketPlain);
BENCHMARK(NewTicket);
BENCHMARK(Load);
BENCHMARK(OpenAndLeave)->Arg(1)->Arg(20000);
BENCHMARK(FlushedValue)->Arg(0)->Arg(1000)->Arg(4000)->Threads(1)->Threads(8)->UseRealTime();

BENCHMARK_MAIN();
