// What a slot costs that the plug-in kit stands behind: the same read by an author's virtual function, and by
// a bare function in the slot, both through the tables that a host gets.
#include "bench/ratio_report.h"
#include "comgui/module.h"
#include <benchmark/benchmark.h>

namespace
{
constexpr int Number = 25;
constexpr comgui::plugin::Address Job{3, 1};

bool Answer(char const* key, PARAM_TYPE type, void* value)
{
    if (!key || type != PARAM_INT)
        return false;
    *static_cast<int*>(value) = Number;
    return true;
}

// Nothing of it is to be seen where it is called, as of a plug-in.
[[gnu::noinline]] int BareTicketGet(void* instance, char const* key, PARAM_TYPE type, void* value, int)
{
    return instance && Answer(key, type, value) ? 1 : 0;
}

[[gnu::noinline]] int BareContainerGet(void* instance, int, int, char const* key, PARAM_TYPE type,
                                       void* value, int)
{
    return instance && Answer(key, type, value) ? 1 : 0;
}

class Ticket : public comgui::plugin::TicketSlots
{
public:
    bool Get(char const* key, PARAM_TYPE type, void* value, int) override { return Answer(key, type, value); }
    bool GetTable(GETMULTIPAR*) override { return false; }
    bool Set(char const*, PARAM_TYPE, void const*, int) override { return true; }
    bool SetTable(SETMULTIPAR*) override { return false; }
    bool Walk(SWALKPARAMETERS_ACTION, void*, char const*, int) override { return false; }
    bool Option(int, void*) override { return false; }
};

using comgui::plugin::Address;

class Container : public comgui::plugin::ContainerSlots
{
public:
    bool Get(Address, char const* key, PARAM_TYPE type, void* value, int) override
    {
        return Answer(key, type, value);
    }
    bool GetTable(Address, GETMULTIPAR*) override { return false; }
    bool WalkTickets(MWALKTICKETS_ACTION, void*, int) override { return false; }
    bool Set(Address, char const*, PARAM_TYPE, void const*, int) override { return true; }
    bool SetTable(Address, SETMULTIPAR*) override { return false; }
    bool Operation(Address, TICKET_OP, void*) override { return false; }
    bool Switch(Address, int, bool, char const* const*) override { return false; }
    STICKET_ACCESS const* CreateTicket(Address, char const* const*) override { return nullptr; }
};

void Read(benchmark::State& state, STICKET_ACCESS const* ticket)
{
    for (auto _ : state)
    {
        int value = 0;
        benchmark::DoNotOptimize(ticket);
        benchmark::DoNotOptimize(
            ticket->SGETPARAMETER(ticket->Instance, "Job/Copies", PARAM_INT, &value, -1));
        benchmark::DoNotOptimize(value);
    }
}

void Read(benchmark::State& state, MTICKET_ACCESS const* container)
{
    for (auto _ : state)
    {
        int value = 0;
        benchmark::DoNotOptimize(container);
        benchmark::DoNotOptimize(container->MGETPARAMETER(container->Instance, Job.type, Job.id, "Job/Copies",
                                                          PARAM_INT, &value, -1));
        benchmark::DoNotOptimize(value);
    }
}

void BareTicket(benchmark::State& state)
{
    STICKET_ACCESS table{};
    table.Instance = &table;
    table.SGETPARAMETER = BareTicketGet;
    Read(state, &table);
}

void KitTicket(benchmark::State& state)
{
    Ticket const ticket;
    Read(state, ticket.Access());
}

void BareContainer(benchmark::State& state)
{
    MTICKET_ACCESS table{};
    table.Instance = &table;
    table.MGETPARAMETER = BareContainerGet;
    Read(state, &table);
}

void KitContainer(benchmark::State& state)
{
    Container const container;
    Read(state, container.Access());
}

BENCHMARK(BareTicket);
BENCHMARK(KitTicket);
BENCHMARK(BareContainer);
BENCHMARK(KitContainer);
}  // namespace

int main(int argc, char** argv)
{
    return RunAndReport(argc, argv,
                        {{"a ticket's slot through the kit", "KitTicket", "BareTicket", 3, GOAL::ADDED_TIME},
                         {"a container's", "KitContainer", "BareContainer", 3, GOAL::ADDED_TIME}});
}
