// The folders of the site by variable: what $(JOB) and its kind stand for. The system ticket has a key for
// each, whose value may itself begin with the variable of a folder farther up in the list, never of one
// below. A value that keeps a variable which cannot be resolved would hold up clients for good: they go on
// replacing as long as a value begins with one. So such a value is kept out of the ticket.
#pragma once

#include "comgui/ticket/folder_variables.h"
#include "standin/server/tickets/StoredValue.h"
#include <array>
#include <iterator>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace standin
{
// The library's, without the end mark, in the order in which clients read them.
inline constexpr std::span<comgui::detail::FOLDER_VARIABLE const, std::size(comgui::detail::Variables) - 1>
    FolderRows{comgui::detail::Variables, std::size(comgui::detail::Variables) - 1};
using FolderRow = comgui::detail::FOLDER_VARIABLE;

inline constexpr char UseFolderVariablesKey[] = "System/UseFolderVariables";

// The folders, resolved: variables are compared byte by byte.
class FolderTable
{
public:
    FolderTable() = default;

    // values: row by row as the ticket has them; empty: no such folder.
    explicit FolderTable(std::array<std::string, FolderRows.size()> const& values);

    // The next row, which may not be empty, behind those above. False if it cannot be resolved.
    bool Add(std::size_t row, std::string_view value);

    // With slashes and without one at the end; nothing for a variable that is unknown, has no value, or
    // cannot be resolved.
    std::optional<std::string> FolderOf(std::string_view variable) const;

    // The rows that cannot be resolved, ascending; a row that leans on one of them is one of them.
    std::vector<std::size_t> Unresolved() const { return m_unresolved; }

private:
    std::array<std::string, FolderRows.size()> m_folders;
    std::array<bool, FolderRows.size()> m_known{};
    std::vector<std::size_t> m_unresolved;
};

// What of the system ticket has to do with folders.
struct FolderSettings
{
    int use = 0;  // "System/UseFolderVariables" as it stands: of its two lowest bits, 1 lets clients resolve
    std::array<std::string, FolderRows.size()> values;

    static bool Concern(std::string_view key, int pos);  // position 0 is what clients read

    // Takes over the value at position 0 of a key that concerns folders. What has another type than the one
    // due counts as none, and so does PARAM_NONE.
    void Put(std::string_view key, StoredValue const& value);

    // Do clients come to an end when they read this?
    bool CanBeRead() const;

    // With bit 1 clear and bit 2 set clients take the values as they are, so none may have a variable.
    bool MustBePlain() const { return (use & 3) == 2; }
};

using comgui::detail::NeedsDecode;  // clients look no further before they replace a variable
}  // namespace standin
