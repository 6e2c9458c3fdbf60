// Walks over the parameters of a ticket that was opened in a container, and what opened tickets share with
// it.
#include "tools/comgui_validate/Memory.h"
#include "tools/comgui_validate/Opened.h"
#include "tools/comgui_validate/checks/values.h"

#include <map>
#include <thread>

namespace validate
{
namespace
{
using Place = std::pair<std::string, int>;
using Content = std::map<Place, Value>;

std::string WordsOf(Place const& place)
{
    return Quoted(place.first) + " at " + std::to_string(place.second);
}

// Of keys that checks use. A single value may be delivered at -1 or at 0: both mean it.
Content Walked(WithTable& ticket)
{
    Content content;
    ticket.Walk(
        [&](std::string const& key, PARAM_TYPE type, void const* word, int position)
        {
            if (key.rfind(Key(""), 0) != 0 || !comgui::detail::IsParameter(type))
                return true;
            auto const value = ValueOfWord(type, word);
            Place const place{key, std::max(position, 0)};
            ticket.GetTrial().Expect("W1", value.has_value(), "null as the value of " + WordsOf(place),
                                     "a value");
            bool const isNew = content.emplace(place, *value).second;
            ticket.GetTrial().Expect("W1", isNew, WordsOf(place) + " twice", "each value once");
            return true;
        });
    return content;
}

Content Fill(Subject& ticket)
{
    Content content;
    for (Value const& value : OneOfEachType())
        if (value.type != PARAM_POINTER)
        {
            ticket.ExpectWrite("V2", Key(NameOf(value.type)), value);
            content[{Key(NameOf(value.type)), 0}] = value;
        }
    for (int i = 0; i < 5; ++i)
    {
        ticket.ExpectWrite("V5", Key("List"), Int(i), i == 0 ? -1 : i);
        content[{Key("List"), i}] = Int(i);
    }
    ticket.ExpectWrite("V2", Key("Empty"), Text(""));
    content[{Key("Empty"), 0}] = Text("");
    return content;
}

void ExpectSame(Trial& trial, char const* rule, Content const& came, Content const& due)
{
    for (auto const& [place, value] : due)
    {
        auto const found = came.find(place);
        trial.Expect(rule, found != came.end(), "no " + WordsOf(place), Shown(value));
        trial.Expect(rule, found->second == value, Shown(found->second) + " under " + WordsOf(place),
                     Shown(value));
    }
    for (auto const& [place, value] : came)
        trial.Expect(rule, due.count(place) != 0, Shown(value) + " under " + WordsOf(place),
                     "nothing that is not there");
}

template <typename Run>
auto InAnOpenedTicket(Run run)
{
    return [run](Trial& trial)
    {
        Session session(trial);
        ScratchTicket const ticket(session);
        Opened const opened(session, ticket.Type(), ticket.Id());
        WithTable subject(trial, opened.Table());
        run(subject);
    };
}

void EachValue(WithTable& ticket) { WalkGivesEachValue(ticket); }

void Copy(WithTable& ticket)
{
    MemoryTicket const other(ticket.GetTrial());
    WithTable copy(ticket.GetTrial(), other.Table());
    WalkCanBeCopied(ticket, copy);
}

void Stop(WithTable& ticket)
{
    Fill(ticket);
    int calls = 0;
    ticket.Walk([&calls](std::string const&, PARAM_TYPE, void const*, int) { return ++calls < 2; });
    ticket.GetTrial().Expect("W3", calls == 2,
                             std::to_string(calls) + " calls of an action that ended it at 2", "2");
}

void OnThisThread(WithTable& ticket)
{
    Fill(ticket);
    auto const self = std::this_thread::get_id();
    bool isHere = true;
    bool isOver = false;
    ticket.Walk(
        [&](std::string const&, PARAM_TYPE, void const*, int)
        {
            isHere = isHere && !isOver && std::this_thread::get_id() == self;
            return true;
        });
    isOver = true;
    ticket.GetTrial().Expect("W4", isHere, "a call of the action on another thread", "calls on this one");
}

// The same checks as in the container, one after another, each over what the one before has left.
void All(WithTable& ticket, std::vector<NamedSubjectCheck> const& checks)
{
    for (NamedSubjectCheck const& check : checks)
    {
        check.run(ticket);
        ticket.Forget();
    }
}

void OpenedValues(WithTable& ticket) { All(ticket, SubjectChecksOfValues()); }
void OpenedTables(WithTable& ticket) { All(ticket, SubjectChecksOfTables()); }
}  // namespace

void WalkGivesEachValue(WithTable& ticket)
{
    Content const due = Fill(ticket);
    ExpectSame(ticket.GetTrial(), "W1", Walked(ticket), due);
}

void WalkCanBeCopied(WithTable& ticket, WithTable& other)
{
    Content const due = Fill(ticket);
    ticket.Walk(
        [&](std::string const& key, PARAM_TYPE type, void const* word, int position)
        {
            if (key.rfind(Key(""), 0) == 0 && comgui::detail::IsParameter(type))
                if (auto const value = ValueOfWord(type, word))
                    other.ExpectWrite("W2", key, *value, position);
            return true;
        });
    for (auto const& [place, value] : due)
        other.ExpectValue("W2", place.first, value, place.second);
}

std::vector<Check> WalkChecks()
{
    return {
        {"opened.values", InAnOpenedTicket(OpenedValues)},
        {"opened.tables", InAnOpenedTicket(OpenedTables)},
        {"walks.each-value", InAnOpenedTicket(EachValue)},
        {"walks.copy", InAnOpenedTicket(Copy)},
        {"walks.stop", InAnOpenedTicket(Stop)},
        {"walks.on-this-thread", InAnOpenedTicket(OnThisThread)},
    };
}
}  // namespace validate
