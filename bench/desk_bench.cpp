// What the window's models cost when there is much to show, beside the plainest thing that holds as much, and
// beside a hundredth of it where the amount should not matter.
#include "bench/ratio_report.h"
#include "desk/model/DisplayText.h"
#include "desk/model/EventLog.h"
#include "desk/model/SortedIds.h"
#include "desk/model/TicketComparison.h"
#include "desk/model/TicketContent.h"

#include <algorithm>
#include <benchmark/benchmark.h>
#include <deque>
#include <map>
#include <numeric>
#include <random>
#include <set>
#include <string>
#include <vector>

namespace
{
using namespace desk;

constexpr int Many = 100'000;
constexpr int Few = 1'000;

std::vector<int> Shuffled(int count)
{
    std::vector<int> numbers(static_cast<std::size_t>(count));
    std::iota(numbers.begin(), numbers.end(), 0);
    std::shuffle(numbers.begin(), numbers.end(), std::mt19937(5));
    return numbers;
}

std::string Key(int number) { return "Job/Layout/Page/" + std::to_string(1'000'000 + number); }

comgui::Snapshot Ticket(int keys)
{
    std::vector<comgui::SnapshotEntry> entries;
    for (int i = 0; i < keys; ++i)
        entries.push_back({Key(i), i});
    return comgui::Snapshot(std::move(entries));
}

void InsertIds(benchmark::State& state)
{
    auto const ids = Shuffled(Many);
    for (auto _ : state)
    {
        SortedIds sorted;
        for (int const id : ids)
            sorted.Insert(id);
        benchmark::DoNotOptimize(sorted.At(Many / 2));
    }
}

// It knows no places.
void InsertInSet(benchmark::State& state)
{
    auto const ids = Shuffled(Many);
    for (auto _ : state)
    {
        std::set<int> sorted(ids.begin(), ids.end());
        benchmark::DoNotOptimize(sorted);
    }
}

void CutText(benchmark::State& state)
{
    std::string const text(static_cast<std::size_t>(state.range(0)), 'x');
    for (auto _ : state)
        benchmark::DoNotOptimize(DisplayText(text));
}

void AppendEvents(benchmark::State& state)
{
    std::vector<comgui::Event> events;
    for (int i = 0; i < 2 * Many; ++i)
        events.emplace_back(comgui::TicketChanged{{comgui::JobTickets, 5}, {{Key(i), i}}, false});
    for (auto _ : state)
    {
        EventLog log;
        for (auto const& event : events)
            log.Append(event, {});
        benchmark::DoNotOptimize(log.RowCount());
    }
}

// Rows of the same texts, of which the oldest go.
void AppendRows(benchmark::State& state)
{
    for (auto _ : state)
    {
        std::deque<EventRow> rows;
        for (int i = 0; i < 2 * Many; ++i)
        {
            EventRow row;
            row.key = Key(i);
            row.text = std::to_string(i);
            rows.push_back(std::move(row));
            if (rows.size() > Many)
                rows.pop_front();
        }
        benchmark::DoNotOptimize(rows);
    }
}

void ApplyChanges(benchmark::State& state)
{
    TicketContent content;
    content.Show(Ticket(Many), {});
    auto const order = Shuffled(Many);
    int value = 0;
    for (auto _ : state)
    {
        ++value;
        for (int const number : order)
            content.Apply({Key(number), value}, {});
    }
}

void AssignInMap(benchmark::State& state)
{
    std::map<std::string, comgui::Value, std::less<>> content;
    for (int i = 0; i < Many; ++i)
        content.emplace(Key(i), i);
    auto const order = Shuffled(Many);
    int value = 0;
    for (auto _ : state)
    {
        ++value;
        for (int const number : order)
            content.find(Key(number))->second = value;
    }
}

// One key flashes.
void Fade(benchmark::State& state)
{
    TicketContent content;
    content.Show(Ticket(static_cast<int>(state.range(0))), {});
    content.Apply({Key(7), 1'000'000}, {});
    for (auto _ : state)
        benchmark::DoNotOptimize(content.Fading({}));
}

void CompareChangingTickets(benchmark::State& state)
{
    auto const ticket = Ticket(Many);
    TicketComparison comparison(ticket, ticket);
    auto const order = Shuffled(Many);
    int value = Many;
    for (auto _ : state)
    {
        ++value;
        for (int const number : order)
            comparison.Update(Side::Right, Key(number), value);
    }
}
}  // namespace

int main(int argc, char** argv)
{
    benchmark::RegisterBenchmark("SortedIds/insert", InsertIds);
    benchmark::RegisterBenchmark("SortedIds/set", InsertInSet);
    benchmark::RegisterBenchmark("DisplayText", CutText)->Arg(10'000)->Arg(1'000'000);
    benchmark::RegisterBenchmark("EventLog/append", AppendEvents);
    benchmark::RegisterBenchmark("EventLog/deque", AppendRows);
    benchmark::RegisterBenchmark("TicketContent/apply", ApplyChanges);
    benchmark::RegisterBenchmark("TicketContent/map", AssignInMap);
    benchmark::RegisterBenchmark("TicketContent/fade", Fade)->Arg(Few)->Arg(Many);
    benchmark::RegisterBenchmark("TicketComparison/update", CompareChangingTickets);
    return RunAndReport(
        argc, argv,
        {{"100,000 ids with their places", "SortedIds/insert", "SortedIds/set", 1},
         {"a long text in a cell", "DisplayText/1000000", "DisplayText/10000", 1.5},
         {"200,000 events in a ring of half as many", "EventLog/append", "EventLog/deque", 4},
         {"100,000 changes of shown keys", "TicketContent/apply", "TicketContent/map", 2},
         {"one key that flashes among many", "TicketContent/fade/100000", "TicketContent/fade/1000", 1.5},
         {"100,000 changes of compared tickets", "TicketComparison/update", "TicketContent/map", 3}});
}
