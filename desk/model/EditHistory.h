// Undo and redo of the user's own edits. It writes nothing itself: Undo() and Redo() give what to write, and
// are settled once the outcome is known, so that a refused undo can be tried again. For one thread at a time.
#pragma once

#include "comgui/client/TicketAddress.h"
#include "comgui/client/Value.h"
#include <cstddef>
#include <deque>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <utility>
#include <vector>

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
    using Step = std::vector<Edit>;  // edits undone as one, each key once

    struct Limits
    {
        std::size_t steps = 1000;
        std::size_t bytes = 64U << 20;  // of keys and values; the last step stays even if it alone has more
    };

    EditHistory() = default;
    explicit EditHistory(Limits limits) : m_limits(limits) {}

    // An edit that the server has taken. Not for what Undo() and Redo() gave. There is nothing to redo then.
    void Record(comgui::TicketAddress ticket, std::string key, comgui::Value before, comgui::Value after);

    // What is recorded between the two is one step. They may be nested.
    void BeginGroup() { ++m_groups; }
    void EndGroup();

    bool CanUndo() const { return !m_taken && !m_undo.empty(); }
    bool CanRedo() const { return !m_taken && !m_redo.empty(); }
    Step const* NextUndo() const { return m_undo.empty() ? nullptr : &m_undo.back(); }  // until the next call
    Step const* NextRedo() const { return m_redo.empty() ? nullptr : &m_redo.back(); }

    // What to write; empty if there is nothing, or if a step is still to be settled. Until it is settled the
    // step is in neither direction.
    std::vector<EditWrite> Undo(Present const& present) { return Take(DIRECTION::Back, present); }
    std::vector<EditWrite> Redo(Present const& present) { return Take(DIRECTION::Forth, present); }

    // Settles what Undo() or Redo() gave last: which of the writes were done, in their order; those that
    // `written` does not reach were not. What was not written stays where it came from. No effect if nothing
    // is to be settled.
    void Settle(std::vector<bool> const& written);
    void Confirm();  // all were written
    void Reject() { Settle({}); }
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
        Step step;
        std::size_t place = 0;    // in m_undo, for it comes back below what was recorded meanwhile
        bool isRedoVoid = false;  // something was recorded meanwhile
    };

    std::vector<EditWrite> Take(DIRECTION direction, Present const& present);
    void PutBack(DIRECTION direction, Step step);
    void AddToGroup(Edit edit);
    void Trim();

    Limits m_limits;
    std::deque<Step> m_undo;
    std::deque<Step> m_redo;
    std::optional<TAKEN> m_taken;
    std::size_t m_bytes = 0;  // of both
    int m_groups = 0;
    bool m_isGroupBegun = false;  // the last step of m_undo is the group's
    std::map<std::pair<comgui::TicketAddress, std::string>, std::size_t> m_placesInGroup;
};
}  // namespace desk
