// What a client pays for a change of a site: the slots of a container, over the server and its SQLite store,
// beside the same rows through plain SQLite with the same settings. And what it pays for opening a site,
// beside reading which tickets there are. No disk is in the way: it would hide the difference.
#include "bench/PlainSite.h"
#include "comgui/ticket/TICKET_ID.h"
#include "comgui/ticket/TICKET_OP.h"
#include "standin/module/Container.h"
#include "standin/server/sessions/Password.h"
#include <benchmark/benchmark.h>
#include <map>

using comgui::test::TemporaryFolder;

namespace
{
using namespace bench;

StoreContent Jobs(int count)
{
    StoreContent content = OneJob();
    content.users.push_back({"bench", Password::Hash("bench"), AdministratorRole, 1});
    for (int id = 2; id <= count; ++id)
    {
        TicketChange& creation = content.tickets.emplace_back();
        creation.kind = TicketChange::Create;
        creation.address = {JobType, id};
        creation.parameters = Table();
    }
    return content;
}

struct OPEN_SITE
{
    explicit OPEN_SITE(std::filesystem::path const& folder, int tickets = 1)
        : store(folder, [tickets] { return Jobs(tickets); }), server(store, folder)
    {
    }
    ~OPEN_SITE()
    {
        server.Stop(std::chrono::seconds(1));
        store.Leave();
    }

    SqliteStore store;
    standin::Server server;
};

struct LOGGED_IN
{
    LOGGED_IN()
        : folder(Memory()), site(folder.Path()), container(site.server, site.server.Login("bench", "bench"))
    {
    }

    TemporaryFolder folder;
    OPEN_SITE site;
    Container container;
    MTICKET_ACCESS const& access = *container.Access();
};

void OneValue(benchmark::State& state)
{
    LOGGED_IN client;
    int value = 0;
    for (auto _ : state)
    {
        ++value;
        if (!client.access.MSETPARAMETER(client.access.Instance, JobType, Job.id, "Job/Parameter/27",
                                         PARAM_INT, &value, -1))
            return state.SkipWithError("not written");
    }
}

// A ticket, and then its table: two changes, as two calls of a client are.
void NewTicketPlain(benchmark::State& state)
{
    PLAIN plain;
    TicketChange const creation;
    TicketChange table;
    table.parameters = Table();
    std::string created;
    std::string written;
    AppendChangeRecord(created, creation);
    AppendChangeRecord(written, table);
    long long sequence = 1;
    for (auto _ : state)
    {
        plain.Run(plain.begin);
        int const id = plain.NextId();
        ++sequence;
        plain.Integers(plain.create, {JobType, id, sequence, sequence, 0});
        plain.Run(plain.create);
        plain.Record(sequence, TicketChange::Create, id, created);
        plain.Run(plain.commit);

        plain.Run(plain.begin);
        ++sequence;
        plain.Integers(plain.write, {JobType, id, sequence - 1, sequence - 1, sequence});
        plain.Run(plain.write);
        for (ParameterChange const& parameter : table.parameters)
            plain.Put(id, parameter);
        plain.Record(sequence, TicketChange::Write, id, written);
        plain.Run(plain.commit);
    }
}

void NewTicket(benchmark::State& state)
{
    LOGGED_IN client;
    auto const table = Table();
    std::vector<SETMULTIPAR> records;
    for (ParameterChange const& parameter : table)
        records.push_back({parameter.key.c_str(), PARAM_INT, 0, &parameter.value.word, -1, false, {}});
    records.emplace_back();
    for (auto _ : state)
    {
        int id = 0;
        bool const isMade = client.access.MOPERATION(client.access.Instance, JobType, TICKET_ID_NEXT,
                                                     TICKET_OP(MTICKET_OP_CREATE_NEXT), &id);
        if (!isMade || !client.access.MSETMULTIPAR(client.access.Instance, JobType, id, records.data()))
            return state.SkipWithError("not made");
    }
}

std::filesystem::path FolderWith(int tickets)
{
    static auto& folders = *new std::map<int, TemporaryFolder>;
    auto const [place, isNew] = folders.try_emplace(tickets, Memory());
    if (isNew)
        OPEN_SITE{place->second.Path(), tickets};
    return place->second.Path();
}

void Opening(benchmark::State& state)
{
    int const tickets = static_cast<int>(state.range(0));
    auto const folder = FolderWith(tickets);
    for (auto _ : state)
    {
        OPEN_SITE site(folder, tickets);
        state.PauseTiming();
        if (site.server.Tickets().LargestId(JobType) != tickets)
            return state.SkipWithError("not all tickets are known");
        state.ResumeTiming();
    }
}

// The floor of what an opening must read.
void SelectOfTickets(benchmark::State& state)
{
    auto const folder = FolderWith(static_cast<int>(state.range(0)));
    sqlite3* database = nullptr;
    sqlite3_stmt* statement = nullptr;
    Must(sqlite3_open_v2((folder / "site.db").c_str(), &database, SQLITE_OPEN_READWRITE, nullptr) ==
         SQLITE_OK);
    Must(sqlite3_prepare_v2(database, "SELECT type, id FROM ticket", -1, &statement, nullptr) == SQLITE_OK);
    long long sum = 0;
    for (auto _ : state)
    {
        while (sqlite3_step(statement) == SQLITE_ROW)
            sum += sqlite3_column_int(statement, 0) + sqlite3_column_int(statement, 1);
        sqlite3_reset(statement);
    }
    benchmark::DoNotOptimize(sum);
    sqlite3_finalize(statement);
    sqlite3_close(database);
}
}  // namespace

BENCHMARK(OneValuePlain);
BENCHMARK(OneValue);
BENCHMARK(NewTicketPlain);
BENCHMARK(NewTicket);
BENCHMARK(SelectOfTickets)->Arg(20000)->Unit(benchmark::kMillisecond);
BENCHMARK(Opening)->Arg(1)->Arg(20000)->Unit(benchmark::kMillisecond);

BENCHMARK_MAIN();
