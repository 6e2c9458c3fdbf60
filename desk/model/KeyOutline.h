// The keys of one ticket as a tree by their "/", flattened into the rows that a virtual list shows. A part of
// a key may be empty: "/a" is "a" below a branch without a name, and the empty key is a row without a name.
// For one thread at a time.
//
// Below is told what an operation costs: rows are those shown, depth is the number of slashes in a key.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace desk
{
struct OutlineRow
{
    std::string name;                // the last part of its path
    std::size_t depth = 0;           // 0: at the left edge
    bool isBranch = false;           // rows lie below it, shown or not
    bool isOpen = false;             // a branch whose rows are shown
    std::optional<std::string> key;  // if it is a key; it may be a branch at the same time
};

// What a list must be told: from that row on, so many went, then so many came in their place.
struct OutlineChange
{
    std::size_t row = 0;
    std::size_t removed = 0;
    std::size_t added = 0;

    bool IsNone() const { return removed == 0 && added == 0; }
};

class KeyOutline
{
public:
    // Whether a key is wanted; it may look at the key's value.
    using Filter = std::function<bool(std::string const& key)>;

    KeyOutline();

    // These keys in place of all others; fastest if they are sorted. Branches that were open are open again,
    // even if they had no keys for a while.
    void Show(std::vector<std::string_view> const& keys);

    // One key comes or goes; O(rows), and O(keys beside it). No change of rows if it only makes a branch a
    // key, or a key that is a branch no key any more.
    OutlineChange Insert(std::string_view key);
    OutlineChange Remove(std::string_view key);

    // Only keys that the filter wants, with the branches above them; an empty function: all. While a filter
    // is there, branches are open until they are closed; without it they are as they were before.
    void SetFilter(Filter filter);
    bool IsFiltered() const { return static_cast<bool>(m_filter); }

    // Asks the filter about that key once more, since its value has changed.
    OutlineChange Recheck(std::string_view key);

    std::size_t RowCount() const { return m_rows.size(); }
    std::size_t KeyCount() const { return m_keyCount; }

    // row: below RowCount(); O(depth).
    OutlineRow RowAt(std::size_t row) const;
    std::string PathAt(std::size_t row) const;  // the key, or what the keys below it begin with

    // Of a key or branch; nothing if it is not shown. O(depth * log rows).
    std::optional<std::size_t> RowOf(std::string_view path) const;
    std::optional<std::size_t> ParentRow(std::size_t row) const;  // nothing at the left edge

    // O(rows). Nothing changes in a row that is no branch.
    OutlineChange Open(std::size_t row);
    OutlineChange Close(std::size_t row);
    OutlineChange Toggle(std::size_t row);
    OutlineChange Reveal(std::string_view path);  // opens every branch above it

    void OpenAll();
    void CloseAll();

private:
    // Nodes lie in one vector and know each other by index, so that a key of a million slashes needs no
    // recursion, not even to be destroyed.
    using INDEX = std::uint32_t;
    static constexpr INDEX Root = 0;
    static constexpr INDEX None = ~INDEX(0);

    struct NODE
    {
        std::string name;
        std::vector<INDEX> children;  // by name, bytewise
        INDEX parent = None;
        INDEX depth = 0;    // of the root's children: 0
        INDEX matches = 0;  // keys in it and below it that are wanted; without one it is not shown
        bool isKey = false;
        bool isWanted = false;  // a key, and the filter wants it
        bool isOpen = false;
        bool isShut = false;  // closed while there is a filter
    };

    bool IsWanted(std::string const& key) const { return !m_filter || m_filter(key); }
    bool IsOpen(INDEX node) const;
    bool IsBranch(INDEX node) const;
    void SetOpen(INDEX node, bool isOpen);
    void SetAllOpen(bool isOpen);
    std::string PathOf(INDEX node) const;

    std::vector<INDEX>::const_iterator PlaceBelow(INDEX parent, std::string_view name) const;
    INDEX ChildOf(INDEX parent, std::string_view name) const;  // None: not there
    INDEX MakeChild(INDEX parent, std::string_view name);
    INDEX Find(std::string_view path) const;  // None: not there
    INDEX FindOrMake(std::string_view path);
    bool IsUnused(INDEX node) const;
    void Free(INDEX node);
    void DropUnused(INDEX node);

    // Nodes below it, parents first, in the order of rows: all, or those that are shown if it is.
    std::vector<INDEX> AllBelow(INDEX node) const;
    std::vector<INDEX> ShownBelow(INDEX node) const;
    bool IsBefore(INDEX left, INDEX right) const;
    bool IsReached(INDEX node) const;       // every branch above it is open
    std::size_t PlaceOf(INDEX node) const;  // of its row, or where that would be
    std::size_t EndOf(std::size_t row) const;

    OutlineChange SetWanted(INDEX node, bool isWanted);
    OutlineChange AddRowsOf(INDEX top);
    OutlineChange AddRowsBelow(INDEX node, std::size_t row);
    OutlineChange RemoveRows(std::size_t first, std::size_t end);
    void CountMatches();
    void Prune();

    std::vector<NODE> m_nodes;
    std::vector<INDEX> m_free;
    std::vector<INDEX> m_rows;
    std::size_t m_keyCount = 0;
    Filter m_filter;
};
}  // namespace desk
