#include "comgui/folders/FOLDER_INDEX.h"

#include <algorithm>
#include <array>
#include <string>

namespace comgui::detail
{
namespace
{
// A path with slashes only, on the stack unless it is very long.
class SLASHED
{
public:
    explicit SLASHED(std::string_view path) : m_size(path.size())
    {
        if (m_size > m_short.size())
            m_long.resize(m_size);
        std::replace_copy(path.begin(), path.end(), Begin(), '\\', '/');
    }

    std::string_view Text() { return {Begin(), m_size}; }

private:
    char* Begin() { return m_long.empty() ? m_short.data() : m_long.data(); }

    std::size_t m_size;
    std::array<char, 512> m_short;
    std::string m_long;
};

HASH HashOf(std::string_view text, HASH seed) { return HashOfBytes(text.data(), text.size(), seed); }
}  // namespace

FOLDER_INDEX::FOLDER_INDEX(std::span<FOLDER_MAPPING const> mappings)
    : m_mappings(mappings), m_folders(mappings.size()), m_variables(mappings.size())
{
    for (std::size_t i = 0; i < mappings.size(); ++i)
    {
        auto const& [key, variable, folder] = mappings[i];
        m_variables.Add(variable, HashOf(variable, m_variables.Seed()), i);
        if (folder.empty())
            continue;
        m_folders.Add(folder, BEGINNINGS(folder, m_folders.Seed()).HashOf(folder.size()), i);
        m_sizes.push_back(folder.size());
    }
    std::ranges::sort(m_sizes);
    m_sizes.erase(std::unique(m_sizes.begin(), m_sizes.end()), m_sizes.end());
}

FOLDER_MAPPING const* FOLDER_INDEX::Holding(std::string_view path) const
{
    if (path.find('\\') == std::string_view::npos)
        return HoldingSlashed(path);
    return HoldingSlashed(SLASHED(path).Text());
}

FOLDER_MAPPING const* FOLDER_INDEX::HoldingSlashed(std::string_view path) const
{
    BEGINNINGS beginnings(path, m_folders.Seed());
    std::size_t longest = TEXT_TABLE::None;
    for (std::size_t const size : m_sizes)
    {
        if (size > path.size())
            break;
        if (size < path.size() && path[size] != '/')
            continue;
        std::size_t const found = m_folders.Find(path.substr(0, size), beginnings.HashOf(size));
        longest = found != TEXT_TABLE::None ? found : longest;
    }
    return longest != TEXT_TABLE::None ? &m_mappings[longest] : nullptr;
}

FOLDER_MAPPING const* FOLDER_INDEX::Of(std::string_view variable) const
{
    std::size_t const found = m_variables.Find(variable, HashOf(variable, m_variables.Seed()));
    return found != TEXT_TABLE::None ? &m_mappings[found] : nullptr;
}
}  // namespace comgui::detail
