// What the client kit costs above the bare contract: a read, a snapshot, and 100,000 events for a subscriber
// who does not get to them.
#include "bench/ratio_report.h"
#include "comgui/client.h"
#include "comgui/comgui.h"
#include "comgui/testing/TemporaryFolder.h"
#include <benchmark/benchmark.h>
#include <cstdio>
#include <cstdlib>
#include <malloc.h>

using comgui::test::TemporaryFolder;

namespace
{
using namespace comgui;

constexpr TicketAddress Job{JobTickets, 1};
constexpr char Key[] = "Job/Copies";
constexpr int Keys = 1000;

// A site of this run alone, and both ways into it.
struct Clients
{
    Clients()
    {
        setenv("COMGUI_SITE", (folder / "site").c_str(), 1);
        if (!connection.LogIn({}, {"admin", "admin"}) ||
            manager.Initialize("admin", "admin", "localhost", 50000) != 0 ||
            manager.Login("admin", "admin", "localhost", 50000) != 0)
        {
            std::fputs("client_bench: cannot log in to the stand-in server\n", stderr);
            std::exit(1);
        }
        container = manager.GetClientContainer();
        large = *tickets.Create(JobTickets);
        busy = *tickets.Create(JobTickets);
        std::vector<KeyValue> values;
        for (int i = 0; i < Keys; ++i)
            values.push_back(
                {"Bench/Parameter/Number" + std::to_string(i),
                 i % 2 == 0 ? Value(i) : Value("a text of some length, number " + std::to_string(i))});
        for (Outcome const& outcome : tickets.WriteAll(large, values))
            if (!outcome)
                std::exit(1);
    }

    static Clients& Instance()
    {
        static Clients clients;
        return clients;
    }

    TemporaryFolder folder;
    Connection connection;
    Tickets tickets = connection.GetTickets();
    ComGUIManager& manager = *ComGUIManager::GetInstance();
    MTICKET_ACCESS const* container = nullptr;
    TicketAddress large{};
    TicketAddress busy{};
};

void BareRead(benchmark::State& state)
{
    Clients& clients = Clients::Instance();
    for (auto _ : state)
    {
        int value = 0;
        benchmark::DoNotOptimize(
            clients.manager.GetParameter(clients.container, Job.type, Job.id, Key, PARAM_INT, &value, -1));
        benchmark::DoNotOptimize(value);
    }
}

void KitRead(benchmark::State& state)
{
    Clients const& clients = Clients::Instance();
    if (!clients.tickets.ReadAs<int>(Job, Key))
        return state.SkipWithError("the read fails");
    for (auto _ : state)
    {
        auto const value = clients.tickets.ReadAs<int>(Job, Key);
        benchmark::DoNotOptimize(*value);
    }
}

// What a program without the kit does to keep all that a ticket holds.
bool Keep(void* context, char const* key, PARAM_TYPE type, void const* word, int)
{
    auto& kept = *static_cast<std::vector<std::pair<std::string, std::variant<int, std::string>>>*>(context);
    if (type == PARAM_INT)
        kept.emplace_back(key, *static_cast<int const*>(word));
    else if (type == PARAM_STRING)
        kept.emplace_back(key, static_cast<char const*>(word));
    return true;
}

void BareSnapshot(benchmark::State& state)
{
    Clients& clients = Clients::Instance();
    auto const [type, id] = clients.large;
    for (auto _ : state)
    {
        std::vector<std::pair<std::string, std::variant<int, std::string>>> kept;
        STICKET_ACCESS const* const ticket = MTICKET_READ::Of(clients.container)->OpenTicket(type, id);
        ticket->SWALKPARAMETERS(ticket->Instance, Keep, &kept, "", 8000);
        clients.manager.CloseTicket(clients.container, type, id);
        if (kept.size() != Keys)
            return state.SkipWithError("the walk gives something else");
    }
}

void KitSnapshot(benchmark::State& state)
{
    Clients const& clients = Clients::Instance();
    for (auto _ : state)
        if (clients.tickets.ReadAll(clients.large)->Entries().size() != Keys)
            return state.SkipWithError("the snapshot holds something else");
}

// All of them are changes of the same 50 keys, as a running job makes them.
void EventsForABusySubscriber(benchmark::State& state)
{
    constexpr int Events = 100000;
    Clients& clients = Clients::Instance();
    auto const never = clients.connection.Subscribe(
        Interest::InTickets({clients.busy}), [](std::function<void()> const&) {}, [](Event const&) {});
    for (auto _ : state)
    {
        std::size_t const before = mallinfo2().uordblks;
        for (int i = 0; i < Events; ++i)
            if (!clients.tickets.Write(clients.busy, "Event/" + std::to_string(i % 50), i))
                return state.SkipWithError("a write fails");
        state.counters["kept_bytes_an_event"] =
            static_cast<double>(mallinfo2().uordblks - before) / static_cast<double>(Events);
    }
    state.SetItemsProcessed(state.iterations() * Events);
}
}  // namespace

BENCHMARK(BareRead);
BENCHMARK(KitRead);
BENCHMARK(BareSnapshot);
BENCHMARK(KitSnapshot);
BENCHMARK(EventsForABusySubscriber)->Iterations(1)->Unit(benchmark::kMillisecond);

int main(int argc, char** argv)
{
    return RunAndReport(
        argc, argv,
        {{"a read of an int, above the bare call", "KitRead", "BareRead", 10, GOAL::ADDED_TIME},
         {"a snapshot of 1,000 keys, of the slots", "KitSnapshot", "BareSnapshot", 1.3}});
}
