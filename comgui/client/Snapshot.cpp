#include "comgui/client/Snapshot.h"

#include <algorithm>
#include <utility>

namespace comgui
{
namespace
{
// Of the first entry whose key is not less.
template <typename Entries>
auto PlaceOf(Entries& entries, std::string_view key)
{
    return std::lower_bound(entries.begin(), entries.end(), key,
                            [](auto const& entry, auto name) { return entry.key < name; });
}
}  // namespace

Snapshot::Snapshot(std::vector<SnapshotEntry> entries) : m_entries(std::move(entries))
{
    auto const byKey = [](auto const& left, auto const& right) { return left.key < right.key; };
    if (!std::is_sorted(m_entries.begin(), m_entries.end(), byKey))
        std::sort(m_entries.begin(), m_entries.end(), byKey);
}

Value const* Snapshot::Find(std::string_view key) const
{
    auto const place = PlaceOf(m_entries, key);
    return place != m_entries.end() && place->key == key ? &place->value : nullptr;
}

std::optional<SnapshotDifference> Snapshot::Set(std::string key, Value value)
{
    auto const place = PlaceOf(m_entries, key);
    bool const isNew = place == m_entries.end() || place->key != key;
    if (isNew ? value.IsNone() : value == place->value)
        return std::nullopt;
    SnapshotDifference difference{key, std::nullopt, std::nullopt};
    if (!value.IsNone())
        difference.after = value;
    if (isNew)
        m_entries.insert(place, {std::move(key), std::move(value)});
    else
    {
        difference.before = std::exchange(place->value, std::move(value));
        if (!difference.after)
            m_entries.erase(place);
    }
    return difference;
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
