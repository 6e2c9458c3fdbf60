// The sixteen bytes behind a CFUUIDRef, in the order in which their text writes them.
#pragma once

#include "standin/corefoundation/CountedObject.h"
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

struct __CFUUID final : comgui::detail::CountedObject
{
    explicit __CFUUID(comgui::detail::Uuid const& value) : bytes(value) {}

    comgui::detail::Uuid const bytes;
};
