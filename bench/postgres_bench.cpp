// Writes of the PostgreSQL store beside pgbench, which runs the same statement with the same content on the
// same server: the difference is what the store adds. The server is this program's own and does not wait for
// the disk, so that the disk's noise is in neither.
#include "bench/ratio_report.h"
#include "comgui/testing/TemporaryFolder.h"
#include "standin/server/store/ChangeRecord.h"
#include "standin/server/store/postgres/PostgresStore.h"
#include "tests/support/PostgresCluster.h"
#include <atomic>
#include <benchmark/benchmark.h>
#include <cstdio>
#include <fstream>
#include <thread>

using comgui::test::TemporaryFolder;

namespace
{
using namespace standin;
using Clock = std::chrono::steady_clock;

constexpr std::chrono::milliseconds Length(1500);
constexpr int JobType = 3;

StoreContent NoContent() { return {}; }

TicketChange ValueOf(TicketAddress address, TicketState const& planned, int value)
{
    TicketChange change;
    change.kind = TicketChange::Write;
    change.address = address;
    change.incarnation = planned.incarnation;
    change.revision = planned.revision;
    change.parameters.push_back({"Job/Copies", 0, TicketValue::Int(value), false});
    return change;
}

std::string Uri() { return PostgresCluster::Instance().Uri(); }

TicketState MakeTicket(TicketAddress address)
{
    PostgresStore store(Uri(), NoContent);
    TicketChange creation;
    creation.kind = TicketChange::Create;
    creation.address = address;
    store.Commit(creation, 1);
    auto const state = store.Load(address, [](auto, int, auto const&) {})->state;
    store.Leave();
    return state;
}

// Commits a second of so many programs, each with a ticket of its own.
double RateOfStores(int programs)
{
    std::vector<std::unique_ptr<PostgresStore>> stores;
    for (int i = 0; i < programs; ++i)
        stores.push_back(std::make_unique<PostgresStore>(Uri(), NoContent));
    std::atomic<long> commits{0};
    auto const begun = Clock::now();
    std::vector<std::thread> threads;
    for (int i = 0; i < programs; ++i)
        threads.emplace_back(
            [&, i, planned = MakeTicket({JobType, i + 1})]() mutable
            {
                for (std::uint64_t number = 1; Clock::now() < begun + Length; ++number, ++commits)
                    planned.revision =
                        stores[static_cast<std::size_t>(i)]
                            ->Commit(ValueOf({JobType, i + 1}, planned, static_cast<int>(number)), number)
                            .sequence;
            });
    for (std::thread& thread : threads)
        thread.join();
    return static_cast<double>(commits) / std::chrono::duration<double>(Clock::now() - begun).count();
}

std::string Hex(std::string const& bytes)
{
    std::string text;
    char digits[3];
    for (char const byte : bytes)
    {
        std::snprintf(digits, sizeof digits, "%02x", static_cast<unsigned char>(byte));
        text += digits;
    }
    return text;
}

// What the store sends, with the ticket's revision from the answer before. firstProgram: no run before had
// the numbers of its clients.
std::string Script(int firstProgram)
{
    std::string record;
    AppendChangeRecord(record, ValueOf({JobType, 1}, {}, 1));
    return "\\set id :client_id + 1\n"
           "\\if :number = 0\n"
           "SELECT incarnation, revision FROM ticket WHERE type = 3 AND id = :id \\gset\n"
           "\\endif\n"
           "\\set number :number + 1\n"
           "SELECT answer, last AS revision FROM commit_change(1, 3, :id, 0, 16777215, NULL, " +
           std::to_string(firstProgram) + " + :client_id, :number, '\\x" + Hex(record) +
           "', ARRAY[3], ARRAY[:id]::integer[], ARRAY[:incarnation]::bigint[], ARRAY[:revision]::bigint[], "
           "1, '{}', '{}', '{}', ARRAY['Job/Copies'::bytea], ARRAY[0], ARRAY[" +
           std::to_string(PARAM_INT) + "], ARRAY[:number]::bigint[], ARRAY[NULL]::bytea[]) \\gset\n";
}

double RateOfPgbench(int clients)
{
    for (int i = 0; i < clients; ++i)
        MakeTicket({JobType, i + 1});
    TemporaryFolder const folder;
    folder.Write("script", Script(1'000'000 + 100 * clients));
    std::string const number = std::to_string(clients);
    std::string const uri = Uri() + "?options=-csearch_path%3Dcomgui";
    std::string const command =
        std::string(COMGUI_POSTGRESQL_PROGRAMS) + "/pgbench -n -M prepared -D number=0 -c " + number +
        " -j " + number + " -T 2 -f '" + (folder.Path() / "script").string() + "' '" + uri + "' 2>/dev/null";
    std::FILE* const output = popen(command.c_str(), "r");
    double rate = 0;
    for (char line[256]; output && std::fgets(line, sizeof line, output);)
        std::sscanf(line, "tps = %lf", &rate);
    return output && pclose(output) == 0 ? rate : 0;
}

void Report(benchmark::State& state, double rate)
{
    for (auto _ : state)
        state.SetIterationTime(rate > 0 ? 1 / rate : 1);
    if (rate <= 0)
        return state.SkipWithError("nothing was committed");
    state.counters["commits_a_second"] = rate;
}

void Stores(benchmark::State& state) { Report(state, RateOfStores(static_cast<int>(state.range(0)))); }
void Pgbench(benchmark::State& state) { Report(state, RateOfPgbench(static_cast<int>(state.range(0)))); }
}  // namespace

BENCHMARK(Stores)->Arg(1)->Arg(8)->Iterations(1)->UseManualTime();
BENCHMARK(Pgbench)->Arg(1)->Arg(8)->Iterations(1)->UseManualTime();

int main(int argc, char** argv)
{
    constexpr double MostBesidePgbench = 1 / 0.7;
    return RunAndReport(argc, argv,
                        {{"a value written, one program", "Stores/1/iterations:1/manual_time",
                          "Pgbench/1/iterations:1/manual_time", MostBesidePgbench, GOAL::ELAPSED_TIME},
                         {"the same, eight programs", "Stores/8/iterations:1/manual_time",
                          "Pgbench/8/iterations:1/manual_time", MostBesidePgbench, GOAL::ELAPSED_TIME}});
}
