#include "comgui/module/KeySelection.h"

#include <algorithm>

namespace comgui::plugin
{
KeySelection::KeySelection(char const* const* keys)
{
    for (; keys && *keys; ++keys)
        m_patterns.emplace_back(*keys);
}

bool KeySelection::Selects(std::string_view key) const
{
    auto const fits = [key](std::string_view pattern) {
        return pattern.ends_with('*') ? key.starts_with(pattern.substr(0, pattern.size() - 1))
                                      : key == pattern;
    };
    return SelectsAll() || std::any_of(m_patterns.begin(), m_patterns.end(), fits);
}
}  // namespace comgui::plugin
