#include "comgui/client/Snapshot.h"

#include <algorithm>

namespace comgui
{
Snapshot::Snapshot(std::vector<SnapshotEntry> entries) : m_entries(std::move(entries))
{
    auto const byKey = [](auto const& left, auto const& right) { return left.key < right.key; };
    if (!std::is_sorted(m_entries.begin(), m_entries.end(), byKey))
        std::sort(m_entries.begin(), m_entries.end(), byKey);
}

Value const* Snapshot::Find(std::string_view key) const
{
    auto const found = std::lower_bound(m_entries.begin(), m_entries.end(), key,
                                        [](auto const& entry, auto name) { return entry.key < name; });
    return found != m_entries.end() && found->key == key ? &found->value : nullptr;
}

std::vector<SnapshotDifference> Difference(Snapshot const& before, Snapshot const& after)
{
    std::vector<SnapshotDifference> all;
    auto left = before.Entries().begin();
    auto right = after.Entries().begin();
    while (left != before.Entries().end() || right != after.Entries().end())
    {
        int const order = left == before.Entries().end()   ? 1
                          : right == after.Entries().end() ? -1
                                                           : left->key.compare(right->key);
        if (order < 0)
            all.push_back({left->key, left->value, std::nullopt});
        else if (order > 0)
            all.push_back({right->key, std::nullopt, right->value});
        else if (left->value != right->value)
            all.push_back({left->key, left->value, right->value});
        left += order <= 0 ? 1 : 0;
        right += order >= 0 ? 1 : 0;
    }
    return all;
}
}  // namespace comgui
