#include "desk/model/TicketEditor.h"

#include <optional>
#include <utility>

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
    Edit const* const next = isUndo ? m_history.NextUndo() : m_history.NextRedo();
    if (!next)
        return EndStep();
    OnWorker([tickets = m_tickets, ticket = next->ticket, key = next->key]
             { return ValueOf(tickets, ticket, key); },
             [this, isUndo, recorded = m_recorded, ticket = next->ticket,
              key = next->key](comgui::Result<comgui::Value> const& present)
             {
                 // A write that was under way has made another edit the next one.
                 if (recorded != m_recorded)
                     return StepAsPresent(isUndo);
                 if (!present)
                 {
                     EndStep();
                     return onRefused(ticket, key, present.GetError());
                 }
                 auto const isThere = [&present](auto const&...) { return *present; };
                 auto const write = isUndo ? m_history.Undo(isThere) : m_history.Redo(isThere);
                 write ? WriteStep(*write) : EndStep();
             });
}

void TicketEditor::WriteStep(EditWrite const& write)
{
    if (write.isForeign && !onForeign(write))
    {
        m_history.Reject();
        return EndStep();
    }
    OnWorker(
        [tickets = m_tickets, write] {
            return tickets.Write(write.ticket, write.key, write.value, comgui::WholeKey,
                                 comgui::Paths::AsStored);
        },
        [this, write](comgui::Outcome const& outcome)
        {
            m_history.Settle(outcome.IsGood());
            EndStep();
            if (outcome)
                onWritten(write.ticket, write.key);
            else
                onRefused(write.ticket, write.key, outcome.GetError());
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
