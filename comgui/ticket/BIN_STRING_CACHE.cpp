#include "comgui/ticket/BIN_STRING_CACHE.h"

#include "comgui/ticket/value_kinds.h"

using comgui::detail::BINARY;

struct BIN_STRING_CACHE::VALUES : comgui::detail::OWN_VALUES<BINARY>
{
};

BIN_STRING_CACHE::BIN_STRING_CACHE() noexcept = default;
BIN_STRING_CACHE::~BIN_STRING_CACHE() = default;

BIN_STRING const* BIN_STRING_CACHE::Keep(BIN_STRING value)
{
    if (!m_values)
        m_values = std::make_unique<VALUES>();
    return &m_values->index.Keep(BINARY::Of(value)).view;
}

void BIN_STRING_CACHE::clear()
{
    if (m_values)
        m_values->Clear();
}
