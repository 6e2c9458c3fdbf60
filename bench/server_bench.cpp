// A scalar read of the stand-in server with ever more tickets. The working set is the same 64 tickets
// whatever the number, so what grows is the look-up and not the traffic to main memory; ScalarReadOfAnyTicket
// reads all of them at random, and shows that traffic. The storage makes up its tickets, so no disk is in the
// way.
#include "standin/server/sessions/Password.h"
#include "standin/server/site/TicketServer.h"
#include <benchmark/benchmark.h>
#include <map>
#include <random>

namespace
{
constexpr int JobType = 3;
constexpr int ParametersOfATicket = 50;
constexpr int WorkingSet = 64;

std::string KeyOf(int parameter) { return "Job/Parameter/" + std::to_string(parameter); }

// Tickets of 50 ints each; the value is the ticket's id plus the parameter's number.
class MadeUpStorage : public standin::Storage
{
public:
    explicit MadeUpStorage(int tickets) : m_tickets(tickets) {}

    std::vector<standin::TicketAddress> Tickets() override
    {
        std::vector<standin::TicketAddress> addresses;
        for (int id = 0; id < m_tickets; ++id)
            addresses.push_back({JobType, id});
        return addresses;
    }

    void Load(standin::TicketAddress address,
              std::function<void(std::string_view, int, standin::StoredValue const&)> const& take) override
    {
        for (int parameter = 0; parameter < ParametersOfATicket; ++parameter)
        {
            standin::StoredValue value;
            value.type = PARAM_INT;
            value.integer = address.id + parameter;
            take(KeyOf(parameter), 0, value);
        }
    }

    // Asked for when a site opens, and there is none.
    std::vector<standin::TicketAddress> TicketsWith(int, std::string_view) override { return {}; }

    void Apply(std::vector<standin::Change> const&) override {}

    std::optional<standin::User> FindUser(std::string_view name) override
    {
        return standin::User{std::string(name), m_hash, standin::AdministratorRole, 1};
    }

private:
    int m_tickets;
    std::string m_hash = standin::Password::Hash("bench");
};

struct FILLED_SERVER
{
    explicit FILLED_SERVER(int tickets) : storage(tickets), server(storage)
    {
        session = server.Login("bench", "bench");
        int value = 0;
        for (int id = 0; id < tickets; ++id)  // all tickets are in memory before anything is measured
            server.Get(*session, {JobType, id}, "Job/Parameter/0", PARAM_INT, &value, -1);
    }

    MadeUpStorage storage;
    standin::TicketServer server;
    std::shared_ptr<standin::Session> session;
};

FILLED_SERVER& ServerWith(int tickets)
{
    static std::map<int, FILLED_SERVER> servers;
    return servers.try_emplace(tickets, tickets).first->second;
}

void Read(benchmark::State& state, FILLED_SERVER& filled, std::vector<int> const& ids)
{
    std::string const key = KeyOf(27);
    std::size_t next = 0;
    for (auto _ : state)
    {
        int const id = ids[next];
        next = next + 1 == ids.size() ? 0 : next + 1;
        int value = 0;
        bool const found =
            filled.server.Get(*filled.session, {JobType, id}, key.c_str(), PARAM_INT, &value, -1);
        if (!found || value != id + 27)
            return state.SkipWithError("the read does not give what it should");
    }
}

void ScalarRead(benchmark::State& state)
{
    int const tickets = static_cast<int>(state.range(0));
    std::vector<int> ids;
    for (int i = 0; i < WorkingSet; ++i)
        ids.push_back(static_cast<int>(static_cast<long long>(i) * tickets / WorkingSet));
    Read(state, ServerWith(tickets), ids);
}

void ScalarReadOfAnyTicket(benchmark::State& state)
{
    int const tickets = static_cast<int>(state.range(0));
    std::mt19937 random(1);
    std::uniform_int_distribution<int> any(0, tickets - 1);
    std::vector<int> ids(1 << 16);
    for (int& id : ids)
        id = any(random);
    Read(state, ServerWith(tickets), ids);
}
}  // namespace

BENCHMARK(ScalarRead)->Arg(1)->Arg(1000)->Arg(100000);
BENCHMARK(ScalarReadOfAnyTicket)->Arg(1)->Arg(1000)->Arg(100000);

BENCHMARK_MAIN();
