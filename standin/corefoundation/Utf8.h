// Whether a text is UTF-8 as Unicode has it: no overlong forms, no surrogates, nothing past U+10FFFF.
#pragma once

#include <string_view>

namespace comgui::detail
{
constexpr std::string_view ByteOrderMark = "\xEF\xBB\xBF";

bool IsUtf8(std::string_view text);
}  // namespace comgui::detail
