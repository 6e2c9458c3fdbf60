#include "standin/server/tickets/FolderTable.h"

#include <algorithm>

namespace standin
{
namespace
{
std::string Cleaned(std::string value)
{
    std::replace(value.begin(), value.end(), '\\', '/');
    if (value.ends_with('/'))
        value.pop_back();  // one only, as clients do
    return value;
}

// The row of a key, the number of rows if it is none.
std::size_t RowOf(std::string_view key)
{
    auto const found = std::find_if(FolderRows.begin(), FolderRows.end(),
                                    [key](FolderRow const& row) { return row.key == key; });
    return static_cast<std::size_t>(found - FolderRows.begin());
}
}  // namespace

FolderTable::FolderTable(std::array<std::string, FolderRows.size()> const& values)
{
    for (std::size_t row = 0; row < FolderRows.size(); ++row)
        if (!values[row].empty() && !Add(row, values[row]))
            m_unresolved.push_back(row);
}

bool FolderTable::Add(std::size_t row, std::string_view value)
{
    std::string folder = Cleaned(std::string(value));
    // Comes to an end: the shortest variable takes six bytes, and a folder that begins with "$(" three.
    while (NeedsDecode(folder))
    {
        auto const end = folder.find(')', 2);
        auto const above =
            end == std::string::npos ? std::nullopt : FolderOf(std::string_view(folder).substr(2, end - 2));
        if (!above)
            return false;
        folder = *above + folder.substr(end + 1);
    }
    m_known[row] = true;
    m_folders[row] = std::move(folder);
    return true;
}

std::optional<std::string> FolderTable::FolderOf(std::string_view variable) const
{
    for (std::size_t row = 0; row < FolderRows.size(); ++row)
        if (m_known[row] && FolderRows[row].variable == variable)
            return m_folders[row];
    return std::nullopt;
}

bool FolderSettings::Concern(std::string_view key, int pos)
{
    return pos == 0 && (key == UseFolderVariablesKey || RowOf(key) < FolderRows.size());
}

void FolderSettings::Put(std::string_view key, StoredValue const& value)
{
    if (key == UseFolderVariablesKey)
        use = value.type == PARAM_INT ? static_cast<int>(value.integer) : 0;
    else if (auto const row = RowOf(key); row < FolderRows.size())
        values[row] = value.type == PARAM_STRING ? value.bytes : std::string_view();
}

bool FolderSettings::CanBeRead() const
{
    if ((use & 3) == 0)
        return true;  // then clients do not look at the folders
    if (MustBePlain())
        return std::none_of(values.begin(), values.end(),
                            [](std::string const& value) { return NeedsDecode(Cleaned(value)); });
    return FolderTable(values).Unresolved().empty();
}
}  // namespace standin
