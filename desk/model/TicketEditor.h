// Writes what the user has edited, on the worker's thread, and keeps what is needed to undo it. Everything is
// called, and calls back, on the thread of the worker's results.
#pragma once

#include "desk/model/EditHistory.h"
#include <comgui/client.h>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace desk
{
class TicketEditor
{
public:
    // The worker outlives the editor.
    TicketEditor(comgui::Tickets const& tickets, comgui::Worker const& worker);
    ~TicketEditor();  // what is under way is written, but no call comes back any more
    TicketEditor(TicketEditor const&) = delete;
    TicketEditor& operator=(TicketEditor const&) = delete;

    // The server has refused it, or it cannot be what the key holds, or what the key holds cannot be read:
    // without that there would be no way back.
    std::function<void(comgui::TicketAddress, std::string const& key, comgui::Error const&)> onRefused =
        [](auto, auto const&, auto const&) {};
    // There is something to undo then, unless what the server has made of it cannot be read.
    std::function<void(comgui::TicketAddress, std::string const& key)> onWritten = [](auto, auto const&) {};

    // Whether to undo or redo although others have changed these keys since.
    std::function<bool(EditWrite const& foreign)> onForeign = [](auto const&) { return false; };

    // Whether there is something to undo or redo may have changed.
    std::function<void()> onHistory = [] {};

    void WriteText(comgui::TicketAddress ticket, std::string const& key, std::string const& text);
    void Write(comgui::TicketAddress ticket, std::string const& key, comgui::Value const& value);
    void Undo();
    void Redo();

    bool CanUndo() const { return m_history.CanUndo() && !m_isStepping; }
    bool CanRedo() const { return m_history.CanRedo() && !m_isStepping; }
    void Clear();  // another session

private:
    struct Written;
    struct Alive
    {
    };
    using Writing = std::function<comgui::Outcome(comgui::Tickets const&)>;

    void Do(comgui::TicketAddress ticket, std::string const& key, Writing writing);
    void StepAsPresent(bool isUndo);
    void WriteStep(EditWrite const& write);
    void EndStep();

    template <typename Work, typename Then>
    void OnWorker(Work work, Then then)
    {
        m_worker.Do(std::move(work),
                    [alive = std::weak_ptr(m_alive), then = std::move(then)](auto const& result)
                    {
                        if (alive.lock())
                            then(result);
                    });
    }

    comgui::Tickets const m_tickets;
    comgui::Worker const& m_worker;
    EditHistory m_history;
    unsigned long m_recorded = 0;  // edits so far
    bool m_isStepping = false;     // an undo or redo is under way
    std::shared_ptr<Alive> m_alive = std::make_shared<Alive>();
};
}  // namespace desk
