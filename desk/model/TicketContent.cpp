#include "desk/model/TicketContent.h"

#include <algorithm>
#include <utility>

namespace desk
{
void TicketContent::Clear()
{
    m_flashing.clear();
    m_entries.clear();
    m_isShown = false;
}

std::vector<comgui::SnapshotDifference> TicketContent::Show(comgui::Snapshot const& snapshot, Time now)
{
    bool const isFirst = !std::exchange(m_isShown, true);
    std::vector<comgui::SnapshotDifference> differences;
    auto place = m_entries.begin();
    for (auto const& [key, value] : snapshot.Entries())
    {
        while (place != m_entries.end() && place->first < key)
            differences.push_back(Remove(place++));
        if (place == m_entries.end() || key < place->first)
        {
            auto const added = Add(place, key, value);
            if (!isFirst)
                Flash(*added, now);
            differences.push_back({key, std::nullopt, value});
            continue;
        }
        if (place->second.value != value)
            differences.push_back(Set(*place, value, now));
        ++place;
    }
    while (place != m_entries.end())
        differences.push_back(Remove(place++));
    return differences;
}

std::optional<comgui::SnapshotDifference> TicketContent::Apply(comgui::KeyChange const& change, Time now)
{
    if (!change.value)
        return std::nullopt;
    auto const place = m_entries.lower_bound(change.key);
    bool const isThere = place != m_entries.end() && place->first == change.key;
    if (change.value->IsNone())
        return isThere ? std::optional(Remove(place)) : std::nullopt;
    if (!isThere)
    {
        Flash(*Add(place, change.key, *change.value), now);
        return comgui::SnapshotDifference{change.key, std::nullopt, *change.value};
    }
    return place->second.value == *change.value ? std::nullopt
                                                : std::optional(Set(*place, *change.value, now));
}

std::vector<std::string_view> TicketContent::Keys() const
{
    std::vector<std::string_view> keys;
    keys.reserve(m_entries.size());
    for (auto const& [key, entry] : m_entries)
        keys.emplace_back(key);
    return keys;
}

comgui::Value const* TicketContent::Find(std::string_view key) const
{
    auto const place = m_entries.find(key);
    return place == m_entries.end() ? nullptr : &place->second.value;
}

std::optional<TicketContent::Time> TicketContent::Changed(std::string_view key) const
{
    auto const place = m_entries.find(key);
    return place == m_entries.end() ? std::nullopt : place->second.changed;
}

double TicketContent::Glow(std::string_view key, Time now) const
{
    auto const changed = Changed(key);
    if (!changed)
        return 0;
    std::chrono::duration<double> const left = *changed + FlashTime - now;
    return std::clamp(left / std::chrono::duration<double>(FlashTime), 0.0, 1.0);
}

TicketContent::Flashes TicketContent::Fading(Time now)
{
    Flashes flashes;
    while (!m_flashing.empty() && *m_flashing.front()->second.changed + FlashTime <= now)
    {
        flashes.ended.push_back(m_flashing.front()->first);
        m_flashing.front()->second.flash.reset();
        m_flashing.pop_front();
    }
    for (auto const* const entry : m_flashing)
        flashes.flashing.push_back(entry->first);
    return flashes;
}

comgui::SnapshotDifference TicketContent::Set(ENTRIES::value_type& entry, comgui::Value const& value,
                                              Time now)
{
    Flash(entry, now);
    return {entry.first, std::exchange(entry.second.value, value), value};
}

TicketContent::ENTRIES::iterator TicketContent::Add(ENTRIES::iterator before, std::string const& key,
                                                    comgui::Value const& value)
{
    return m_entries.emplace_hint(before, key, ENTRY{value, std::nullopt, std::nullopt});
}

comgui::SnapshotDifference TicketContent::Remove(ENTRIES::iterator place)
{
    auto node = m_entries.extract(place);
    ENTRY& entry = node.mapped();
    if (entry.flash)
        m_flashing.erase(*entry.flash);
    return {std::move(node.key()), std::move(entry.value), std::nullopt};
}

// A key has one place among those that flash, however often it changes.
void TicketContent::Flash(ENTRIES::value_type& entry, Time now)
{
    ENTRY& state = entry.second;
    if (state.flash)
        m_flashing.splice(m_flashing.end(), m_flashing, *state.flash);
    else
        state.flash = m_flashing.insert(m_flashing.end(), &entry);
    state.changed = now;
}
}  // namespace desk
