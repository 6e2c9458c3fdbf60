#include "bench/site/CrashWriter.h"

#include "tests/support/SiteClient.h"
#include <map>
#include <random>
#include <sstream>
#include <unistd.h>

namespace
{
constexpr int CounterType = 60;  // ticket LANE + 1
constexpr int TableType = 61;    // the same, and one that all lanes write
constexpr int CreatedType = 62;
constexpr int ListType = 63;
constexpr TicketName SharedTable{TableType, 100};
constexpr char CounterKey[] = "Counter";
constexpr char LaneKey[] = "Lane";
constexpr int LaneShift = 40;  // in the numbers of the list

// A line leaves at once and whole, so that it is there even if the program dies behind it.
void Print(std::string line)
{
    line += '\n';
    if (write(STDOUT_FILENO, line.data(), line.size()) != static_cast<ssize_t>(line.size()))
        _exit(1);
}

// What a program finds of a lane. block: where to begin to look for the lane's last number in the list.
std::string Found(SiteClient const& client, int lane, int block)
{
    std::int64_t appended = 0;
    SharedList(client, ListType)
        .Walk(block,
              [&](std::int64_t value)
              {
                  if (value >> LaneShift == lane)
                      appended = value & ((std::int64_t{1} << LaneShift) - 1);
              });
    auto const table = client.Table({TableType, lane + 1});
    std::ostringstream line;
    line << "found " << client.Get({CounterType, lane + 1}, CounterKey).value_or(0) << ' '
         << (table.empty() ? 0 : table.front()) << ' ' << appended;
    for (int const id : client.Ids(CreatedType))
        if (client.Get({CreatedType, id}, LaneKey) == lane)
            line << ' ' << id;
    return line.str();
}

class Writer
{
public:
    explicit Writer(CrashTask const& task)
        : m_lane(task.lane), m_lanes(task.lanes), m_list(m_client, ListType, task.block), m_random(task.seed)
    {
    }

    int Work()
    {
        if (int const code = m_client.LogIn(); code != 0)
        {
            Print("refused login " + std::to_string(code));
            return 1;
        }
        Begin();
        for (;;)
            Step();
    }

private:
    void Begin()
    {
        std::string const found = Found(m_client, m_lane, m_list.Block());
        std::istringstream numbers(found.substr(found.find(' ')));
        numbers >> m_counter >> m_table >> m_appended;
        m_tickets.assign(std::istream_iterator<int>(numbers), {});
        Print(found);
        m_client.Create({CounterType, m_lane + 1});
        m_client.Create({TableType, m_lane + 1});
        m_client.Create(SharedTable);
        if (!m_client.Listen([this](Heard const& heard) { Hear(heard); }) || !m_client.Enable(CounterType))
            Print("refused callback");
    }

    void Step()
    {
        switch (m_random() % 8)
        {
        case 0:
            return WriteTable();
        case 1:
            return Report("", m_client.SetTable(SharedTable, static_cast<std::int64_t>(m_random() >> 1)));
        case 2:
            return Append();
        case 3:
            return m_tickets.size() < MostTickets ? CreateTicket() : DeleteTicket();
        case 4:
            return LookAt({TableType, static_cast<int>(m_random() % static_cast<unsigned>(m_lanes)) + 1});
        case 5:
            return LookAt(SharedTable);
        default:
            return Count();
        }
    }

    // what: the report of a change that was done, nothing for one that is nobody's
    static void Report(std::string const& what, bool isDone)
    {
        if (!isDone)
            Print("refused " + what);
        else if (!what.empty())
            Print(what);
    }

    void Count()
    {
        bool const isDone = m_client.Set({CounterType, m_lane + 1}, CounterKey, m_counter + 1);
        Report("counter " + std::to_string(++m_counter), isDone);
    }

    void WriteTable()
    {
        bool const isDone = m_client.SetTable({TableType, m_lane + 1}, m_table + 1);
        Report("table " + std::to_string(++m_table), isDone);
    }

    void Append()
    {
        bool const isDone = m_list.Append((std::int64_t{m_lane} << LaneShift) + m_appended + 1);
        Report("append " + std::to_string(++m_appended) + " " + std::to_string(m_list.Block()), isDone);
    }

    void CreateTicket()
    {
        auto const id = m_client.CreateNext(CreatedType);
        bool const isDone = id && m_client.Set({CreatedType, *id}, LaneKey, m_lane);
        m_tickets.push_back(id.value_or(0));
        Report("create " + std::to_string(m_tickets.back()), isDone);
    }

    void DeleteTicket()
    {
        bool const isDone = m_client.Delete({CreatedType, m_tickets.front()});
        Report("delete " + std::to_string(m_tickets.front()), isDone);
        m_tickets.erase(m_tickets.begin());
    }

    void LookAt(TicketName ticket) const
    {
        auto const table = m_random() % 2 == 0 ? m_client.Table(ticket) : m_client.TableOfXml(ticket);
        if (!SiteClient::IsWhole(table))
            Print("torn table " + std::to_string(ticket.id));
    }

    // On the server's thread. A counter increases by one; its first value is unknown.
    void Hear(Heard const& heard)
    {
        if (heard.kind != Heard::Changed)
            return;
        std::int64_t const value = *static_cast<long long const*>(heard.records->value);
        auto const [last, isFirst] = m_heard.try_emplace(heard.ticket.id, value);
        if (!isFirst && value != last->second + 1)
            Print("misheard " + std::to_string(value) + " of lane " + std::to_string(heard.ticket.id - 1) +
                  " behind " + std::to_string(last->second));
        last->second = value;
    }

    int const m_lane;
    int const m_lanes;
    SiteClient m_client;
    SharedList m_list;
    std::mt19937 mutable m_random;
    std::int64_t m_counter = 0;
    std::int64_t m_table = 0;
    std::int64_t m_appended = 0;
    std::vector<int> m_tickets;  // the oldest first
    std::map<int, std::int64_t> m_heard;
};
}  // namespace

int WriteUntilKilled(CrashTask const& task) { return Writer(task).Work(); }

int CheckLanes(int lanes)
{
    SiteClient client;
    if (int const code = client.LogIn(); code != 0)
    {
        Print("refused login " + std::to_string(code));
        return 1;
    }
    for (int lane = 0; lane < lanes; ++lane)
        Print(Found(client, lane, 1));
    std::map<std::int64_t, std::int64_t> last;
    SharedList(client, ListType)
        .Walk(1,
              [&](std::int64_t value)
              {
                  std::int64_t const number = value & ((std::int64_t{1} << LaneShift) - 1);
                  std::int64_t& before = last[value >> LaneShift];
                  if (number != before + 1)
                      Print("disordered " + std::to_string(number) + " of lane " +
                            std::to_string(value >> LaneShift) + " behind " + std::to_string(before));
                  before = number;
              });
    Print("done");
    return 0;
}
