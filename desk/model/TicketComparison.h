// Two tickets side by side, a row a key, all rows or only those that differ. Both sides may change while they
// are looked at. For one thread at a time.
#pragma once

#include "comgui/client/Snapshot.h"
#include "comgui/client/Tickets.h"
#include <array>
#include <cstddef>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace desk
{
enum class Side
{
    Left,
    Right,
};

enum class RowState
{
    OnlyLeft,
    OnlyRight,
    Equal,
    Different,
};

enum class RowFilter
{
    All,
    Differences,
};

// Lives until that key or the comparison changes.
struct ComparedRow
{
    std::string const& key;
    comgui::Value const* left;  // null: not on that side
    comgui::Value const* right;
    RowState state;
};

// What a change does to the rows that are shown.
struct RowChange
{
    enum Kind
    {
        None,
        Inserted,
        Removed,
        Changed,
    };
    Kind kind = None;
    std::size_t row = 0;  // where it is from now on, or was
};

class TicketComparison
{
public:
    TicketComparison(comgui::Snapshot const& left, comgui::Snapshot const& right);
    TicketComparison(TicketComparison const&) = delete;
    TicketComparison& operator=(TicketComparison const&) = delete;

    // All rows at first.
    void Show(RowFilter filter) { m_filter = filter; }

    // By key, bytewise; of those that the filter shows. Row and the counts take constant time.
    std::size_t Rows() const { return Shown().size(); }
    ComparedRow Row(std::size_t index) const;  // throws std::out_of_range
    std::optional<std::size_t> RowOf(std::string_view key) const;

    std::size_t Count(RowState state) const { return m_counts[static_cast<std::size_t>(state)]; }

    // One side has changed; none: it lacks the key from now on. Found in O(log n); where a row comes or
    // goes, the pointers to those behind it move.
    RowChange Update(Side side, std::string_view key, std::optional<comgui::Value> value);

    // Many changes of one side at once; std::monostate: it lacks the key. All rows that are shown may change.
    void UpdateAll(Side side, std::vector<comgui::KeyValue> const& changes);

private:
    struct Pair
    {
        std::array<std::optional<comgui::Value>, 2> values;  // by Side, never both empty
        RowState state = RowState::Equal;
    };
    using Pairs = std::map<std::string, Pair, std::less<>>;
    using PairRows = std::vector<Pairs::value_type const*>;

    // What a key was before and is after a change; none: neither side has it.
    struct Step
    {
        std::optional<RowState> before;
        std::optional<RowState> after;
        Pairs::iterator pair;  // the end if it neither was nor is
        bool isSame = false;
    };

    PairRows const& Shown() const { return m_filter == RowFilter::All ? m_all : m_differences; }
    void Fill(Side side, comgui::Snapshot const& ticket);
    Step Change(Side side, std::string_view key, std::optional<comgui::Value> value);
    void Count(Step const& step);
    void MakeRows();
    static RowChange ChangeRows(PairRows& rows, Step const& step, bool wasShown, bool isShown);

    Pairs m_pairs;
    PairRows m_all;
    PairRows m_differences;
    std::array<std::size_t, 4> m_counts{};  // by RowState
    RowFilter m_filter = RowFilter::All;
};
}  // namespace desk
