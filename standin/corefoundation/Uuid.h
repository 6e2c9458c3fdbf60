// A UUID: its sixteen bytes, in the order in which their text writes them.
#pragma once

#include <CoreFoundation/CoreFoundation.h>
#include <array>
#include <optional>
#include <string_view>

namespace comgui::detail
{
using Uuid = std::array<UInt8, 16>;

// Nothing for a text that is not of the form 01234567-89AB-CDEF-0123-456789ABCDEF, in either letter case.
std::optional<Uuid> ParseUuid(std::string_view text);
}  // namespace comgui::detail
