#include "desk/model/TicketEditor.h"

#include <map>
#include <optional>
#include <utility>
#include <variant>

namespace desk
{
namespace
{
// std::monostate: not there. A value that could not be read is not that: an undo would delete the key.
comgui::Result<comgui::Value> ValueOf(comgui::Tickets const& tickets, comgui::TicketAddress ticket,
                                      std::string const& key)
{
    comgui::Result<comgui::Value> value =
        tickets.Read(ticket, key, comgui::WholeKey, comgui::Paths::AsStored);
    return !value && value.GetError().code == comgui::NoSuchKey ? comgui::Value() : value;
}
using Presents = std::map<std::pair<comgui::TicketAddress, std::string>, comgui::Value>;

struct Unread
{
    comgui::TicketAddress ticket;
    std::string key;
    comgui::Error error;
};

// Of all keys of the step, or of none.
std::variant<Presents, Unread> PresentsOf(comgui::Tickets const& tickets, EditHistory::Step const& step)
{
    Presents presents;
    for (Edit const& edit : step)
    {
        auto const value = ValueOf(tickets, edit.ticket, edit.key);
        if (!value)
            return Unread{edit.ticket, edit.key, value.GetError()};
        presents[{edit.ticket, edit.key}] = *value;
    }
    return presents;
}
}  // namespace

struct TicketEditor::Written
{
    comgui::Outcome outcome;
    comgui::Value before;
    std::optional<comgui::Value> after;  // unknown if it could not be read
};

TicketEditor::TicketEditor(comgui::Tickets const& tickets, comgui::Worker const& worker)
    : m_tickets(tickets), m_worker(worker)
{
}

TicketEditor::~TicketEditor() = default;

void TicketEditor::WriteText(comgui::TicketAddress ticket, std::string const& key, std::string const& text)
{
    Do(ticket, key, [=](comgui::Tickets const& tickets) { return tickets.WriteText(ticket, key, text); });
}

void TicketEditor::Write(comgui::TicketAddress ticket, std::string const& key, comgui::Value const& value)
{
    Do(ticket, key,
       [=](comgui::Tickets const& tickets)
       { return tickets.Write(ticket, key, value, comgui::WholeKey, comgui::Paths::AsStored); });
}

void TicketEditor::Do(comgui::TicketAddress ticket, std::string const& key, Writing writing)
{
    auto const work = [tickets = m_tickets, ticket, key, writing = std::move(writing)]
    {
        auto const before = ValueOf(tickets, ticket, key);
        if (!before)
            return Written{before.GetError(), {}, {}};
        if (comgui::Outcome const outcome = writing(tickets); !outcome)
            return Written{outcome, {}, {}};
        auto const after = ValueOf(tickets, ticket, key);
        return Written{{}, *before, after ? std::optional(*after) : std::nullopt};
    };
    OnWorker(work,
             [this, ticket, key](Written const& written)
             {
                 if (!written.outcome)
                     return onRefused(ticket, key, written.outcome.GetError());
                 if (written.after)
                     m_history.Record(ticket, key, written.before, *written.after);
                 ++m_recorded;
                 onHistory();
                 onWritten(ticket, key);
             });
}

void TicketEditor::Undo()
{
    if (CanUndo())
        StepAsPresent(true);
}

void TicketEditor::Redo()
{
    if (CanRedo())
        StepAsPresent(false);
}

// First what is there now, so that nobody's work is overwritten unasked.
void TicketEditor::StepAsPresent(bool isUndo)
{
    m_isStepping = true;
    onHistory();
    EditHistory::Step const* const step = isUndo ? m_history.NextUndo() : m_history.NextRedo();
    if (!step)
        return EndStep();
    OnWorker([tickets = m_tickets, edits = *step] { return PresentsOf(tickets, edits); },
             [this, isUndo, recorded = m_recorded](auto const& presents)
             {
                 // A write that was under way has made another step the next one.
                 if (recorded != m_recorded)
                     return StepAsPresent(isUndo);
                 if (auto const* const unread = std::get_if<Unread>(&presents))
                 {
                     EndStep();
                     return onRefused(unread->ticket, unread->key, unread->error);
                 }
                 auto const present = [&there = std::get<Presents>(presents)](auto ticket, auto const& key) {
                     return there.at({ticket, key});
                 };
                 WriteStep(isUndo ? m_history.Undo(present) : m_history.Redo(present));
             });
}

void TicketEditor::WriteStep(std::vector<EditWrite> const& writes)
{
    std::vector<EditWrite> foreign;
    for (EditWrite const& write : writes)
        if (write.isForeign)
            foreign.push_back(write);
    if (!foreign.empty() && !onForeign(foreign))
    {
        m_history.Reject();
        return EndStep();
    }
    auto const write = [tickets = m_tickets, writes]
    {
        std::vector<comgui::Outcome> outcomes;
        outcomes.reserve(writes.size());
        for (EditWrite const& each : writes)
            outcomes.push_back(
                tickets.Write(each.ticket, each.key, each.value, comgui::WholeKey, comgui::Paths::AsStored));
        return outcomes;
    };
    OnWorker(write,
             [this, writes](std::vector<comgui::Outcome> const& outcomes)
             {
                 std::vector<bool> written;
                 written.reserve(outcomes.size());
                 for (comgui::Outcome const& outcome : outcomes)
                     written.push_back(outcome.IsGood());
                 m_history.Settle(written);
                 EndStep();
                 for (std::size_t i = 0; i < writes.size(); ++i)
                     if (outcomes[i])
                         onWritten(writes[i].ticket, writes[i].key);
                     else
                         onRefused(writes[i].ticket, writes[i].key, outcomes[i].GetError());
             });
}

void TicketEditor::EndStep()
{
    m_isStepping = false;
    onHistory();
}

void TicketEditor::Clear()
{
    m_history.Clear();
    m_alive = std::make_shared<Alive>();
    EndStep();
}
}  // namespace desk
