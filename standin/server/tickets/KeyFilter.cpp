#include "standin/server/tickets/KeyFilter.h"

namespace standin
{
KeyFilter::KeyFilter(char const* const* keys)
{
    for (; keys && *keys; ++keys)
    {
        std::string_view const pattern(*keys);
        if (pattern.ends_with('*'))
            AddBeginning(pattern.substr(0, pattern.size() - 1));
        else
            m_keys.emplace(pattern);
    }
}

void KeyFilter::AddBeginning(std::string_view text)
{
    if (HasBeginningOf(text))
        return;
    auto longer = m_beginnings.lower_bound(text);
    while (longer != m_beginnings.end() && longer->starts_with(text))
        longer = m_beginnings.erase(longer);
    m_beginnings.emplace_hint(longer, text);
}

// Since no beginning is part of another, only the last one in order before the key can be its own.
bool KeyFilter::HasBeginningOf(std::string_view key) const
{
    auto const behind = m_beginnings.upper_bound(key);
    return behind != m_beginnings.begin() && key.starts_with(*std::prev(behind));
}

bool KeyFilter::Selects(std::string_view key) const
{
    return SelectsAll() || m_keys.contains(key) || HasBeginningOf(key);
}
}  // namespace standin
