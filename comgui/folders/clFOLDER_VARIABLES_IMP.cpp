#include "comgui/folders/clFOLDER_VARIABLES_IMP.h"

#include "comgui/access/MTICKET_READ.h"
#include "comgui/access/STICKET_READ.h"
#include "comgui/folders/clSETMULTIPAR_FOLDER_VARIABLES.h"
#include "comgui/folders/folder_paths.h"
#include "comgui/foundation/CharSets.h"
#include "comgui/ticket/folder_variables.h"
#include <algorithm>
#include <string_view>

using SysLib::MUTEX_LOCK;

namespace
{
// "$(variable)" with room for more behind it.
std::string VariableForm(std::string_view variable, std::size_t room)
{
    std::string form;
    form.reserve(variable.size() + 3 + room);
    form += "$(";
    form += variable;
    form += ')';
    return form;
}

std::string Below(std::string_view variable, std::string relative)
{
    comgui::detail::MakeSlash(relative);
    std::string form = VariableForm(variable, 1 + relative.size());
    if (!relative.empty() && relative[0] != '/')
        form += '/';
    form += relative;
    return form;
}

std::string Separated(std::string path, bool backslashes)
{
    backslashes ? comgui::detail::MakeBackslash(path) : comgui::detail::MakeSlash(path);
    return path;
}

// A folder as the system ticket holds it, with one slash at the end less.
void TrimFolder(std::string& folder)
{
    comgui::detail::MakeSlash(folder);
    std::size_t const last = CharSets::DBCS::LastAsciiPos(folder);
    if (last != std::string::npos && folder[last] == '/')
        folder.erase(last);
}
}  // namespace

comgui::detail::clFOLDER_VARIABLES_IMP::clFOLDER_VARIABLES_IMP(MTICKET_ACCESS const* container)
    : access(container), flags(container ? 0 : DECODES | ENCODES)
{
    if (access)
        clFOLDER_VARIABLES_IMP::Load();
}

bool comgui::detail::clFOLDER_VARIABLES_IMP::IsEnabled() const
{
    MUTEX_LOCK const lock(mutex);
    return flags != 0;
}

void comgui::detail::clFOLDER_VARIABLES_IMP::Load()
{
    MUTEX_LOCK const lock(mutex);
    index.reset();
    mappings.clear();
    flags = 0;
    if (access == nullptr)
        return;
    STICKET_READ const* const ticket = STICKET_READ::Of(MTICKET_READ::Of(access)->OpenTicket(0, 0));
    if (ticket == nullptr)
        return;
    flags =
        static_cast<unsigned>(ticket->GetIntParameter("System/UseFolderVariables", 0)) & (DECODES | ENCODES);
    if (flags == 0)
        return;
    for (FOLDER_VARIABLE const* row = Variables; row->key; ++row)
    {
        std::string folder = ticket->GetStringParameter(row->key, std::string());
        if (folder.empty())
            continue;
        TrimFolder(folder);
        // No bound, by design: a folder that leans on one further down, or on any while nothing is decoded,
        // is the server's error, and stays here with the lock held.
        while (NeedsDecode(folder))
            folder = Decode(folder, false);  // NOLINT(clang-analyzer-optin*): this class's own, at first
        index.reset();                       // Decode may have asked for it
        mappings.emplace_back(row->key, row->variable, std::move(folder));
    }
    Index();
}

comgui::detail::FOLDER_INDEX const& comgui::detail::clFOLDER_VARIABLES_IMP::Index() const
{
    return index ? *index : index.emplace(mappings);
}

std::string comgui::detail::clFOLDER_VARIABLES_IMP::Encode(std::string const& path) const
{
    MUTEX_LOCK const lock(mutex);
    if ((flags & ENCODES) == 0)
        return path;
    FOLDER_MAPPING const* const mapping = Index().Holding(path);
    if (mapping == nullptr)
        return path;
    std::size_t const covered = mapping->folder.size();
    std::string form = VariableForm(mapping->variable, path.size() - covered);
    auto const rest = static_cast<std::ptrdiff_t>(form.size());
    form.append(path, covered);
    std::replace(form.begin() + rest, form.end(), '\\', '/');  // not in the variable, which is taken as it is
    return form;
}

std::string comgui::detail::clFOLDER_VARIABLES_IMP::Encode(char const* key, std::string relative) const
{
    MUTEX_LOCK const lock(mutex);
    if (key == nullptr || (flags & ENCODES) == 0)
        return relative;
    auto const mapping = std::ranges::find(mappings, std::string_view(key), &FOLDER_MAPPING::key);
    if (mapping == mappings.end())
        return relative;
    return Below(mapping->variable, std::move(relative));
}

std::string comgui::detail::clFOLDER_VARIABLES_IMP::EncodeV(char const* variable, std::string relative) const
{
    MUTEX_LOCK const lock(mutex);
    if (variable == nullptr || (flags & ENCODES) == 0)
        return relative;
    return Below(variable, std::move(relative));
}

std::string comgui::detail::clFOLDER_VARIABLES_IMP::Decode(std::string const& path, bool backslashes) const
{
    MUTEX_LOCK const lock(mutex);
    if ((flags & DECODES) == 0)
        return path;
    if (!NeedsDecode(path))
        return Separated(path, backslashes);
    std::size_t const end = path.find(')', 2);
    if (end == std::string::npos || end == 2)
        return path;
    std::string_view const variable = std::string_view(path).substr(2, end - 2);
    FOLDER_MAPPING const* const mapping = Index().Of(variable);
    if (mapping == nullptr)
        return path;
    std::string decoded;
    decoded.reserve(mapping->folder.size() + path.size() - end - 1);
    decoded += mapping->folder;
    decoded.append(path, end + 1);
    return Separated(std::move(decoded), backslashes);
}

void comgui::detail::clFOLDER_VARIABLES_IMP::SetFolderVariable(char const* variable, char const* folder)
{
    if (variable == nullptr)
        return;
    MUTEX_LOCK const lock(mutex);
    index.reset();
    auto const mapping = std::ranges::find(mappings, std::string_view(variable), &FOLDER_MAPPING::variable);
    if (mapping == mappings.end())
    {
        if (folder)
            mappings.emplace_back(std::string(), variable, folder);
    }
    else if (folder)
        mapping->folder = folder;
    else
        mappings.erase(mapping);
}

clSETMULTIPAR_FOLDER_VARIABLES*
comgui::detail::clFOLDER_VARIABLES_IMP::New_clSETMULTIPAR_FOLDER_VARIABLES(clFOLDER_VARIABLES* folders,
                                                                           SETMULTIPAR* table, bool encode)
{
    return new clSETMULTIPAR_FOLDER_VARIABLES(folders, table, encode);
}
