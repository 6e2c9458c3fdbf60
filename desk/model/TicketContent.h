// What one ticket holds now, and when each key last changed, so that a list can make changed rows flash. For
// one thread at a time. Times are passed in; they should not go backwards.
#pragma once

#include "comgui/client/Event.h"
#include "comgui/client/Snapshot.h"
#include <chrono>
#include <list>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace desk
{
constexpr std::chrono::milliseconds FlashTime{1000};

class TicketContent
{
public:
    using Time = std::chrono::steady_clock::time_point;

    struct Flashes
    {
        std::vector<std::string> flashing;  // in the order of their changes
        std::vector<std::string> ended;     // since the last call; to be drawn without a flash
    };

    TicketContent() = default;
    TicketContent(TicketContent const&) = delete;  // its entries know each other by address
    TicketContent& operator=(TicketContent const&) = delete;

    // Forgets everything, for another ticket.
    void Clear();

    // All that the ticket holds; gives what differs from before, by key. The first one is no change, so that
    // nothing flashes.
    std::vector<comgui::SnapshotDifference> Show(comgui::Snapshot const& snapshot, Time now);

    // What an event tells of a key; gives what differs. Without a value in the change nothing is done: the
    // key must be read, and comes again with its value. O(log n).
    std::optional<comgui::SnapshotDifference> Apply(comgui::KeyChange const& change, Time now);

    std::size_t Size() const { return m_entries.size(); }
    std::vector<std::string_view> Keys() const;             // by key, bytewise; until the next change
    comgui::Value const* Find(std::string_view key) const;  // null: not there; O(log n)

    // When the key last got another value; nothing if it has not since it was first shown.
    std::optional<Time> Changed(std::string_view key) const;

    // How much of its flash is left: 1 at the change, 0 when it is over.
    double Glow(std::string_view key, Time now) const;

    // Costs only what flashes. A key that is gone flashes no more.
    Flashes Fading(Time now);
    bool IsAnyFlashing() const { return !m_flashing.empty(); }

private:
    struct ENTRY;
    using FLASHING = std::list<std::pair<std::string const, ENTRY>*>;
    struct ENTRY
    {
        comgui::Value value;
        std::optional<Time> changed;
        std::optional<FLASHING::iterator> flash;  // if it flashes
    };
    using ENTRIES = std::map<std::string, ENTRY, std::less<>>;

    comgui::SnapshotDifference Set(ENTRIES::value_type& entry, comgui::Value const& value, Time now);
    ENTRIES::iterator Add(ENTRIES::iterator before, std::string const& key, comgui::Value const& value);
    comgui::SnapshotDifference Remove(ENTRIES::iterator place);
    void Flash(ENTRIES::value_type& entry, Time now);

    ENTRIES m_entries;
    FLASHING m_flashing;  // oldest change first
    bool m_isShown = false;
};
}  // namespace desk
