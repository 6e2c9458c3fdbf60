// Undo and redo of the user's own edits. It writes nothing itself: Undo() and Redo() give what to write, and
// are settled once the outcome is known, so that a refused undo can be tried again. For one thread at a time.
#pragma once

#include "comgui/client/TicketAddress.h"
#include "comgui/client/Value.h"
#include <cstddef>
#include <deque>
#include <functional>
#include <optional>
#include <string>

namespace desk
{
// One key as it was and became; std::monostate: not there.
struct Edit
{
    comgui::TicketAddress ticket;
    std::string key;
    comgui::Value before;
    comgui::Value after;
};

// A step back or forth of one key.
struct EditWrite
{
    comgui::TicketAddress ticket;
    std::string key;
    comgui::Value value;     // to write; std::monostate: delete the key
    comgui::Value present;   // what the write replaces
    bool isForeign = false;  // present is neither what the user left there nor value: somebody else's work
};

class EditHistory
{
public:
    // The value that the key has now; std::monostate: not there.
    using Present = std::function<comgui::Value(comgui::TicketAddress ticket, std::string const& key)>;

    struct Limits
    {
        std::size_t edits = 1000;
        std::size_t bytes = 64U << 20;  // of keys and values; the last edit stays even if it alone has more
    };

    EditHistory() = default;
    explicit EditHistory(Limits limits) : m_limits(limits) {}

    // An edit that the server has taken. Not for what Undo() and Redo() gave. There is nothing to redo then.
    void Record(comgui::TicketAddress ticket, std::string key, comgui::Value before, comgui::Value after);

    bool CanUndo() const { return !m_taken && !m_undo.empty(); }
    bool CanRedo() const { return !m_taken && !m_redo.empty(); }
    Edit const* NextUndo() const { return m_undo.empty() ? nullptr : &m_undo.back(); }  // until the next call
    Edit const* NextRedo() const { return m_redo.empty() ? nullptr : &m_redo.back(); }

    // What to write; nothing if there is nothing, or if an edit is still to be settled. Until it is settled
    // the edit is in neither direction.
    std::optional<EditWrite> Undo(Present const& present) { return Take(DIRECTION::Back, present); }
    std::optional<EditWrite> Redo(Present const& present) { return Take(DIRECTION::Forth, present); }

    // Settles what Undo() or Redo() gave last: was it written? What was not stays where it came from. No
    // effect if nothing is to be settled.
    void Settle(bool isWritten);
    void Confirm() { Settle(true); }
    void Reject() { Settle(false); }
    bool IsUnsettled() const { return m_taken.has_value(); }

    void Clear();

private:
    enum class DIRECTION
    {
        Back,
        Forth,
    };
    struct TAKEN
    {
        DIRECTION direction = DIRECTION::Back;
        Edit edit;
        std::size_t place = 0;    // in m_undo, for it comes back below what was recorded meanwhile
        bool isRedoVoid = false;  // something was recorded meanwhile
    };

    std::optional<EditWrite> Take(DIRECTION direction, Present const& present);
    void Trim();

    Limits m_limits;
    std::deque<Edit> m_undo;
    std::deque<Edit> m_redo;
    std::optional<TAKEN> m_taken;
    std::size_t m_bytes = 0;  // of both
};
}  // namespace desk
