#include "desk/model/TicketComparison.h"

#include <algorithm>
#include <utility>

namespace desk
{
namespace
{
bool IsDifference(std::optional<RowState> state) { return state && *state != RowState::Equal; }

template <typename Rows>
auto PlaceOf(Rows& rows, std::string_view key)
{
    return std::lower_bound(rows.begin(), rows.end(), key,
                            [](auto const* row, std::string_view name) { return row->first < name; });
}
}  // namespace

TicketComparison::TicketComparison(comgui::Snapshot const& left, comgui::Snapshot const& right)
{
    Fill(Side::Left, left);
    Fill(Side::Right, right);
    MakeRows();
}

ComparedRow TicketComparison::Row(std::size_t index) const
{
    auto const& [key, pair] = *Shown().at(index);
    auto const valueOf = [&pair = pair](Side side) -> comgui::Value const*
    {
        auto const& value = pair.values[static_cast<std::size_t>(side)];
        return value ? &*value : nullptr;
    };
    return {key, valueOf(Side::Left), valueOf(Side::Right), pair.state};
}

std::optional<std::size_t> TicketComparison::RowOf(std::string_view key) const
{
    PairRows const& rows = Shown();
    auto const found = PlaceOf(rows, key);
    if (found == rows.end() || (*found)->first != key)
        return std::nullopt;
    return static_cast<std::size_t>(found - rows.begin());
}

RowChange TicketComparison::Update(Side side, std::string_view key, std::optional<comgui::Value> value)
{
    Step const step = Change(side, key, std::move(value));
    if (step.isSame)
        return {};
    Count(step);
    RowChange const all = ChangeRows(m_all, step, step.before.has_value(), step.after.has_value());
    RowChange const differences =
        ChangeRows(m_differences, step, IsDifference(step.before), IsDifference(step.after));
    if (!step.after)
        m_pairs.erase(step.pair);  // the last, as the rows are found by its key
    return m_filter == RowFilter::All ? all : differences;
}

void TicketComparison::UpdateAll(Side side, std::vector<comgui::KeyValue> const& changes)
{
    for (auto const& [key, value] : changes)
    {
        Step const step = Change(side, key, value.IsNone() ? std::nullopt : std::optional(value));
        if (step.isSame)
            continue;
        Count(step);
        if (!step.after)
            m_pairs.erase(step.pair);
    }
    MakeRows();
}

void TicketComparison::Fill(Side side, comgui::Snapshot const& ticket)
{
    for (auto const& [key, value] : ticket.Entries())
        Count(Change(side, key, value));
}

TicketComparison::Step TicketComparison::Change(Side side, std::string_view key,
                                                std::optional<comgui::Value> value)
{
    auto pair = m_pairs.find(key);
    bool const wasThere = pair != m_pairs.end();
    if (!wasThere && !value)
        return {{}, {}, pair, true};
    if (!wasThere)
        pair = m_pairs.try_emplace(std::string(key)).first;
    std::optional<RowState> const before = wasThere ? std::optional(pair->second.state) : std::nullopt;
    auto& [left, right] = pair->second.values;
    auto& changed = side == Side::Left ? left : right;
    if (changed == value)
        return {before, before, pair, true};
    changed = std::move(value);
    if (!left && !right)
        return {before, std::nullopt, pair, false};
    pair->second.state = !right            ? RowState::OnlyLeft
                         : !left           ? RowState::OnlyRight
                         : *left == *right ? RowState::Equal
                                           : RowState::Different;
    return {before, pair->second.state, pair, false};
}

void TicketComparison::Count(Step const& step)
{
    if (step.before)
        --m_counts[static_cast<std::size_t>(*step.before)];
    if (step.after)
        ++m_counts[static_cast<std::size_t>(*step.after)];
}

void TicketComparison::MakeRows()
{
    m_all.clear();
    m_differences.clear();
    for (auto const& pair : m_pairs)
    {
        m_all.push_back(&pair);
        if (IsDifference(pair.second.state))
            m_differences.push_back(&pair);
    }
}

RowChange TicketComparison::ChangeRows(PairRows& rows, Step const& step, bool wasShown, bool isShown)
{
    if (!wasShown && !isShown)
        return {};
    auto const place = PlaceOf(rows, step.pair->first);
    auto const row = static_cast<std::size_t>(place - rows.begin());
    if (wasShown && isShown)
        return {RowChange::Changed, row};
    if (isShown)
    {
        rows.insert(place, &*step.pair);
        return {RowChange::Inserted, row};
    }
    rows.erase(place);
    return {RowChange::Removed, row};
}
}  // namespace desk
