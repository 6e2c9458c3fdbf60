#include "desk/model/TicketEditor.h"

#include <utility>

namespace desk
{
namespace
{
// std::monostate: not there.
comgui::Value ValueOf(comgui::Tickets const& tickets, comgui::TicketAddress ticket, std::string const& key)
{
    return tickets.Read(ticket, key, comgui::WholeKey, comgui::Paths::AsStored).ValueOr({});
}
}  // namespace

struct TicketEditor::Written
{
    comgui::Outcome outcome;
    comgui::Value before;
    comgui::Value after;
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
        comgui::Value before = ValueOf(tickets, ticket, key);
        comgui::Outcome outcome = writing(tickets);
        comgui::Value after = outcome ? ValueOf(tickets, ticket, key) : comgui::Value();
        return Written{std::move(outcome), std::move(before), std::move(after)};
    };
    OnWorker(work,
             [this, ticket, key](Written const& written)
             {
                 if (!written.outcome)
                     return onRefused(ticket, key, written.outcome.GetError());
                 m_history.Record(ticket, key, written.before, written.after);
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
    auto const read = [tickets = m_tickets, edits = *step]
    {
        Presents presents;
        for (Edit const& edit : edits)
            presents[{edit.ticket, edit.key}] = ValueOf(tickets, edit.ticket, edit.key);
        return presents;
    };
    OnWorker(read,
             [this, isUndo, recorded = m_recorded](Presents const& presents)
             {
                 // A write that was under way has made another step the next one.
                 if (recorded != m_recorded)
                     return StepAsPresent(isUndo);
                 auto const present = [&presents](comgui::TicketAddress ticket, std::string const& key) {
                     return presents.at({ticket, key});
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
