// All that a ticket held at one moment. A plain value.
#pragma once

#include "comgui/client/Value.h"
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace comgui
{
struct SnapshotEntry
{
    std::string key;
    Value value;
};

inline bool operator==(SnapshotEntry const& left, SnapshotEntry const& right)
{
    return left.key == right.key && left.value == right.value;
}

// What differs: before is empty where the key is new, after where it is gone.
struct SnapshotDifference
{
    std::string key;
    std::optional<Value> before;
    std::optional<Value> after;
};

class COMGUI_EXPORT Snapshot
{
public:
    Snapshot() = default;
    explicit Snapshot(std::vector<SnapshotEntry> entries);  // in any order, each key once

    // By key, bytewise.
    std::vector<SnapshotEntry> const& Entries() const noexcept { return m_entries; }

    Value const* Find(std::string_view key) const;  // null: not there

    // std::monostate: it goes. What differs now; nothing if it was so before.
    std::optional<SnapshotDifference> Set(std::string key, Value value);

private:
    std::vector<SnapshotEntry> m_entries;
};

inline bool operator==(Snapshot const& left, Snapshot const& right)
{
    return left.Entries() == right.Entries();
}
inline bool operator!=(Snapshot const& left, Snapshot const& right) { return !(left == right); }

// By key, bytewise.
COMGUI_EXPORT std::vector<SnapshotDifference> Difference(Snapshot const& before, Snapshot const& after);
}  // namespace comgui
