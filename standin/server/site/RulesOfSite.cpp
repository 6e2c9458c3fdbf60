#include "standin/server/site/RulesOfSite.h"

#include "standin/server/store/Outcome.h"
#include "standin/server/trouble/Troubles.h"
#include <atomic>
#include <sstream>

namespace standin
{
namespace
{
struct Loaded
{
    TicketState state;
    std::string text;
};

Loaded Load(Store& store)
{
    Loaded loaded;
    auto const found = store.Load(SystemTicket,
                                  [&](std::string_view key, int pos, StoredValue const& value)
                                  {
                                      if (key == TroubleKey && pos == 0 && value.type == PARAM_STRING)
                                          loaded.text = value.bytes;
                                  });
    if (!found)
        throw StoreError("the site has no system ticket, which would keep the rules of trouble");
    loaded.state = found->state;
    return loaded;
}

std::vector<std::string> LinesOf(std::string const& text)
{
    std::vector<std::string> lines;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);)
        if (!line.empty())
            lines.push_back(line);
    return lines;
}

TicketChange ChangeTo(std::vector<std::string> const& rules, TicketState const& before)
{
    std::string text;
    for (std::string const& rule : rules)
        text += rule + '\n';
    TicketChange change;
    change.address = SystemTicket;
    change.incarnation = before.incarnation;
    change.revision = before.revision;
    change.parameters.push_back({TroubleKey, -1, text.empty() ? TicketValue() : TicketValue::String(text)});
    return change;
}
}  // namespace

std::vector<std::string> RulesOf(Store& store) { return LinesOf(Load(store).text); }

void ChangeRules(Store& store, std::function<void(std::vector<std::string>& rules)> const& change)
{
    static std::atomic<std::uint64_t> newest{std::uint64_t{1} << 32};  // others count from 1
    for (bool isDone = false; !isDone;)
    {
        Loaded const loaded = Load(store);
        auto rules = LinesOf(loaded.text);
        auto const before = rules;
        change(rules);
        if (rules == before)
            return;
        std::uint64_t const number = ++newest;
        CommitOutcome outcome = store.Commit(ChangeTo(rules, loaded.state), number);
        if (outcome.kind == CommitOutcome::Unknown)
            outcome =
                AwaitOutcome(store, number, SystemTicket).value_or(CommitOutcome{CommitOutcome::Conflict});
        isDone = outcome.kind == CommitOutcome::Committed;
    }
}
}  // namespace standin
