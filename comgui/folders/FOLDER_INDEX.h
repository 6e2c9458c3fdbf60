// Finds the folder that a path lies in, and the mapping of a variable, by hash: the time does not depend on
// how many folders there are. It looks at mappings that stay as they are as long as it lives.
#pragma once

#include "comgui/folders/FOLDER_MAPPING.h"
#include "comgui/foundation/TEXT_TABLE.h"
#include <span>
#include <string_view>
#include <vector>

namespace comgui::detail
{
class FOLDER_INDEX
{
public:
    // Of equal variables, and of equal folders, the first counts. Throws std::bad_alloc.
    explicit FOLDER_INDEX(std::span<FOLDER_MAPPING const> mappings);

    // The mapping with the longest folder that is the path or that it lies in; null for none. Case counts,
    // and so does every slash: an empty folder holds nothing. A backslash of the path counts as a slash, one
    // of the folder as itself.
    FOLDER_MAPPING const* Holding(std::string_view path) const;

    // Null for none.
    FOLDER_MAPPING const* Of(std::string_view variable) const;

private:
    FOLDER_MAPPING const* HoldingSlashed(std::string_view path) const;

    std::span<FOLDER_MAPPING const> m_mappings;
    TEXT_TABLE m_folders;
    TEXT_TABLE m_variables;
    std::vector<std::size_t> m_sizes;  // of the folders, each once, the smallest first
};
}  // namespace comgui::detail
