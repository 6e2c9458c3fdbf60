// Bytes of a given length that somebody else owns: the value of a PARAM_BINSTRING.
#pragma once

#include "comgui/foundation/export.h"
#include <cstddef>
#include <string>
#include <type_traits>

struct COMGUI_EXPORT BIN_STRING
{
    void const* data = nullptr;  // first byte; lives as long as its owner says
    unsigned long size = 0;      // bytes

    BIN_STRING() = default;
    BIN_STRING(void const* first, unsigned long length) : data(first), size(length) {}
    explicit BIN_STRING(std::string const& bytes) { assign(bytes); }

    // Points at the bytes of that string, which must outlive the view.
    void assign(std::string const& bytes);

    // Null or empty bytes are no value: an empty one counts as missing.
    bool valid() const;

    unsigned char const* begin() const;
    unsigned char const* end() const;
};
static_assert(std::is_standard_layout_v<BIN_STRING> && sizeof(BIN_STRING) == 16);
static_assert(offsetof(BIN_STRING, data) == 0 && offsetof(BIN_STRING, size) == 8);
