#include "desk/model/KeyOutline.h"

#include <algorithm>
#include <utility>

namespace desk
{
namespace
{
// So many nodes without keys are kept for what was open in them; with more, none is.
constexpr std::size_t MostRemembered = 100'000;

// Takes the first part off the path; false at its last one.
bool NextPart(std::string_view& path, std::string_view& part)
{
    auto const slash = path.find('/');
    part = path.substr(0, slash);
    if (slash == std::string_view::npos)
        return false;
    path.remove_prefix(slash + 1);
    return true;
}
}  // namespace

KeyOutline::KeyOutline()
{
    m_nodes.emplace_back();
    m_nodes[Root].isOpen = true;
    m_nodes[Root].depth = None;  // so that its children's is 0
}

void KeyOutline::Show(std::vector<std::string_view> const& keys)
{
    for (NODE& node : m_nodes)
        node.isKey = false;
    m_keyCount = 0;
    for (std::string_view const key : keys)
    {
        NODE& node = m_nodes[FindOrMake(key)];
        m_keyCount += node.isKey ? 0 : 1;
        node.isKey = true;
    }
    Prune();
    CountMatches();
    m_rows = ShownBelow(Root);
}

OutlineChange KeyOutline::Insert(std::string_view key)
{
    bool const isWanted = IsWanted(std::string(key));
    INDEX const node = FindOrMake(key);
    if (std::exchange(m_nodes[node].isKey, true))
        return {};
    ++m_keyCount;
    return SetWanted(node, isWanted);
}

OutlineChange KeyOutline::Remove(std::string_view key)
{
    INDEX const node = Find(key);
    if (node == None || !m_nodes[node].isKey)
        return {};
    OutlineChange const change = SetWanted(node, false);
    m_nodes[node].isKey = false;
    --m_keyCount;
    DropUnused(node);
    return change;
}

void KeyOutline::SetFilter(Filter filter)
{
    m_filter = std::move(filter);
    for (NODE& node : m_nodes)
        node.isShut = false;
    CountMatches();
    m_rows = ShownBelow(Root);
}

OutlineChange KeyOutline::Recheck(std::string_view key)
{
    INDEX const node = Find(key);
    if (node == None || !m_nodes[node].isKey)
        return {};
    return SetWanted(node, IsWanted(std::string(key)));
}

OutlineRow KeyOutline::RowAt(std::size_t row) const
{
    INDEX const index = m_rows[row];
    NODE const& node = m_nodes[index];
    bool const isBranch = IsBranch(index);
    return {node.name, node.depth, isBranch, isBranch && IsOpen(index),
            node.isKey ? std::optional(PathOf(index)) : std::nullopt};
}

std::string KeyOutline::PathAt(std::size_t row) const { return PathOf(m_rows[row]); }

std::optional<std::size_t> KeyOutline::RowOf(std::string_view path) const
{
    INDEX const node = Find(path);
    bool const isShown = node != None && m_nodes[node].matches > 0 && IsReached(node);
    return isShown ? std::optional(PlaceOf(node)) : std::nullopt;
}

std::optional<std::size_t> KeyOutline::ParentRow(std::size_t row) const
{
    INDEX const parent = m_nodes[m_rows[row]].parent;
    return parent == Root ? std::nullopt : std::optional(PlaceOf(parent));
}

OutlineChange KeyOutline::Open(std::size_t row)
{
    INDEX const node = m_rows[row];
    if (!IsBranch(node) || IsOpen(node))
        return {};
    SetOpen(node, true);
    return AddRowsBelow(node, row);
}

OutlineChange KeyOutline::Close(std::size_t row)
{
    INDEX const node = m_rows[row];
    if (!IsBranch(node) || !IsOpen(node))
        return {};
    SetOpen(node, false);
    return RemoveRows(row + 1, EndOf(row));
}

OutlineChange KeyOutline::Toggle(std::size_t row) { return IsOpen(m_rows[row]) ? Close(row) : Open(row); }

OutlineChange KeyOutline::Reveal(std::string_view path)
{
    INDEX const node = Find(path);
    if (node == None || m_nodes[node].matches == 0)
        return {};
    INDEX top = None;
    for (INDEX above = m_nodes[node].parent; above != Root; above = m_nodes[above].parent)
        if (!IsOpen(above))
        {
            SetOpen(above, true);
            top = above;
        }
    return top == None ? OutlineChange{} : AddRowsBelow(top, PlaceOf(top));
}

void KeyOutline::OpenAll() { SetAllOpen(true); }

void KeyOutline::CloseAll() { SetAllOpen(false); }

void KeyOutline::SetAllOpen(bool isOpen)
{
    for (INDEX const node : AllBelow(Root))
        SetOpen(node, isOpen && (m_filter || !m_nodes[node].children.empty()));
    Prune();
    m_rows = ShownBelow(Root);
}

bool KeyOutline::IsOpen(INDEX node) const { return m_filter ? !m_nodes[node].isShut : m_nodes[node].isOpen; }

bool KeyOutline::IsBranch(INDEX node) const
{
    return m_nodes[node].matches > (m_nodes[node].isWanted ? 1U : 0U);
}

void KeyOutline::SetOpen(INDEX node, bool isOpen)
{
    if (m_filter)
        m_nodes[node].isShut = !isOpen;
    else
        m_nodes[node].isOpen = isOpen;
}

std::string KeyOutline::PathOf(INDEX node) const
{
    std::vector<INDEX> parts;
    for (INDEX part = node; part != Root; part = m_nodes[part].parent)
        parts.push_back(part);
    std::string path = m_nodes[parts.back()].name;
    for (auto part = parts.rbegin() + 1; part != parts.rend(); ++part)
        path.append(1, '/').append(m_nodes[*part].name);
    return path;
}

std::vector<KeyOutline::INDEX>::const_iterator KeyOutline::PlaceBelow(INDEX parent,
                                                                      std::string_view name) const
{
    auto const& children = m_nodes[parent].children;
    if (children.empty() || m_nodes[children.back()].name < name)  // keys mostly come in their order
        return children.end();
    return std::lower_bound(children.begin(), children.end(), name,
                            [this](INDEX child, std::string_view wanted)
                            { return m_nodes[child].name < wanted; });
}

KeyOutline::INDEX KeyOutline::ChildOf(INDEX parent, std::string_view name) const
{
    auto const place = PlaceBelow(parent, name);
    return place != m_nodes[parent].children.end() && m_nodes[*place].name == name ? *place : None;
}

KeyOutline::INDEX KeyOutline::MakeChild(INDEX parent, std::string_view name)
{
    if (m_free.empty())
    {
        m_free.push_back(static_cast<INDEX>(m_nodes.size()));
        m_nodes.emplace_back();
    }
    INDEX const child = m_free.back();
    m_nodes[parent].children.insert(PlaceBelow(parent, name), child);
    m_free.pop_back();
    m_nodes[child].name = name;
    m_nodes[child].parent = parent;
    m_nodes[child].depth = m_nodes[parent].depth + 1;
    return child;
}

KeyOutline::INDEX KeyOutline::Find(std::string_view path) const
{
    INDEX node = Root;
    std::string_view part;
    for (bool isMore = true; isMore && node != None;)
    {
        isMore = NextPart(path, part);
        node = ChildOf(node, part);
    }
    return node;
}

KeyOutline::INDEX KeyOutline::FindOrMake(std::string_view path)
{
    INDEX node = Root;
    std::string_view part;
    for (bool isMore = true; isMore;)
    {
        isMore = NextPart(path, part);
        INDEX const child = ChildOf(node, part);
        node = child == None ? MakeChild(node, part) : child;
    }
    return node;
}

// Not if it was open: its keys may come back.
bool KeyOutline::IsUnused(INDEX node) const
{
    return !m_nodes[node].isKey && !m_nodes[node].isOpen && m_nodes[node].children.empty();
}

void KeyOutline::Free(INDEX node)
{
    m_nodes[node] = {};
    m_free.push_back(node);
}

void KeyOutline::DropUnused(INDEX node)
{
    while (node != Root && IsUnused(node))
    {
        INDEX const parent = m_nodes[node].parent;
        m_nodes[parent].children.erase(PlaceBelow(parent, m_nodes[node].name));
        Free(std::exchange(node, parent));
    }
}

std::vector<KeyOutline::INDEX> KeyOutline::AllBelow(INDEX node) const
{
    std::vector<INDEX> all;
    std::vector<INDEX> rest(m_nodes[node].children.rbegin(), m_nodes[node].children.rend());
    while (!rest.empty())
    {
        all.push_back(rest.back());
        rest.pop_back();
        auto const& children = m_nodes[all.back()].children;
        rest.insert(rest.end(), children.rbegin(), children.rend());
    }
    return all;
}

std::vector<KeyOutline::INDEX> KeyOutline::ShownBelow(INDEX node) const
{
    std::vector<INDEX> shown;
    std::vector<INDEX> rest(m_nodes[node].children.rbegin(), m_nodes[node].children.rend());
    while (!rest.empty())
    {
        INDEX const next = rest.back();
        rest.pop_back();
        if (m_nodes[next].matches == 0)
            continue;
        shown.push_back(next);
        if (IsOpen(next))
            rest.insert(rest.end(), m_nodes[next].children.rbegin(), m_nodes[next].children.rend());
    }
    return shown;
}

// In the order of rows: a branch before what lies below it, else by the first name that differs.
bool KeyOutline::IsBefore(INDEX left, INDEX right) const
{
    bool const isLeftHigher = m_nodes[left].depth < m_nodes[right].depth;
    while (m_nodes[left].depth > m_nodes[right].depth)
        left = m_nodes[left].parent;
    while (m_nodes[right].depth > m_nodes[left].depth)
        right = m_nodes[right].parent;
    if (left == right)
        return isLeftHigher;
    while (m_nodes[left].parent != m_nodes[right].parent)
    {
        left = m_nodes[left].parent;
        right = m_nodes[right].parent;
    }
    return m_nodes[left].name < m_nodes[right].name;
}

bool KeyOutline::IsReached(INDEX node) const
{
    INDEX above = m_nodes[node].parent;
    while (above != Root && IsOpen(above))
        above = m_nodes[above].parent;
    return above == Root;
}

std::size_t KeyOutline::PlaceOf(INDEX node) const
{
    auto const place = std::lower_bound(m_rows.begin(), m_rows.end(), node,
                                        [this](INDEX left, INDEX right) { return IsBefore(left, right); });
    return static_cast<std::size_t>(place - m_rows.begin());
}

// Of what is shown below that row.
std::size_t KeyOutline::EndOf(std::size_t row) const
{
    INDEX const depth = m_nodes[m_rows[row]].depth;
    do
        ++row;
    while (row < m_rows.size() && m_nodes[m_rows[row]].depth > depth);
    return row;
}

OutlineChange KeyOutline::SetWanted(INDEX node, bool isWanted)
{
    if (std::exchange(m_nodes[node].isWanted, isWanted) == isWanted)
        return {};
    INDEX top = None;  // the highest that appears or disappears
    for (INDEX above = node; above != Root; above = m_nodes[above].parent)
    {
        m_nodes[above].matches += isWanted ? 1U : ~0U;
        if (m_nodes[above].matches == (isWanted ? 1U : 0U))
            top = above;
    }
    if (top == None || !IsReached(top))
        return {};
    std::size_t const place = PlaceOf(top);
    return isWanted ? AddRowsOf(top) : RemoveRows(place, EndOf(place));
}

OutlineChange KeyOutline::AddRowsOf(INDEX top)
{
    std::size_t const row = PlaceOf(top);
    m_rows.insert(m_rows.begin() + static_cast<std::ptrdiff_t>(row), top);
    OutlineChange const below = IsOpen(top) ? AddRowsBelow(top, row) : OutlineChange{};
    return {row, 0, below.added + 1};
}

OutlineChange KeyOutline::AddRowsBelow(INDEX node, std::size_t row)
{
    auto const rows = ShownBelow(node);
    m_rows.insert(m_rows.begin() + static_cast<std::ptrdiff_t>(row) + 1, rows.begin(), rows.end());
    return {row + 1, 0, rows.size()};
}

OutlineChange KeyOutline::RemoveRows(std::size_t first, std::size_t end)
{
    m_rows.erase(m_rows.begin() + static_cast<std::ptrdiff_t>(first),
                 m_rows.begin() + static_cast<std::ptrdiff_t>(end));
    return {first, end - first, 0};
}

void KeyOutline::CountMatches()
{
    auto const all = AllBelow(Root);
    for (INDEX const node : all)
    {
        m_nodes[node].isWanted = m_nodes[node].isKey && (!m_filter || m_filter(PathOf(node)));
        m_nodes[node].matches = m_nodes[node].isWanted ? 1 : 0;
    }
    for (auto node = all.rbegin(); node != all.rend(); ++node)
        m_nodes[m_nodes[*node].parent].matches += m_nodes[*node].matches;
}

// Drops what is unused, and what is only remembered if that is too much.
void KeyOutline::Prune()
{
    auto const all = AllBelow(Root);
    std::vector<bool> hasKeys(m_nodes.size());
    for (auto node = all.rbegin(); node != all.rend(); ++node)
        if (m_nodes[*node].isKey || hasKeys[*node])
            hasKeys[*node] = hasKeys[m_nodes[*node].parent] = true;
    std::size_t remembered = 0;
    auto const drop = [&](INDEX parent, bool isEvenRemembered)
    {
        std::erase_if(m_nodes[parent].children,
                      [&](INDEX child)
                      {
                          bool const isDropped = !hasKeys[child] && (isEvenRemembered || IsUnused(child));
                          remembered += hasKeys[child] || isDropped ? 0 : 1;
                          if (isDropped)
                              Free(child);
                          return isDropped;
                      });
    };
    auto const dropAll = [&](bool isEvenRemembered)
    {
        for (auto node = all.rbegin(); node != all.rend(); ++node)
            drop(*node, isEvenRemembered);
        drop(Root, isEvenRemembered);
    };
    dropAll(false);
    if (remembered > MostRemembered)
        dropAll(true);
}
}  // namespace desk
