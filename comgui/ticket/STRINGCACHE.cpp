#include "comgui/ticket/STRINGCACHE.h"

#include "comgui/ticket/value_kinds.h"

struct STRINGCACHE::VALUES : comgui::detail::OWN_VALUES<comgui::detail::TEXT>
{
};

STRINGCACHE::STRINGCACHE() noexcept = default;
STRINGCACHE::~STRINGCACHE() = default;

char const* STRINGCACHE::Keep(std::string_view text)
{
    if (!m_values)
        m_values = std::make_unique<VALUES>();
    return m_values->index.Keep(text).text;
}

void STRINGCACHE::clear()
{
    if (m_values)
        m_values->Clear();
}
