// The value word of a slot or a record, as PARAM_TYPE.h defines it, and Value.
#pragma once

#include "comgui/module/Value.h"
#include <optional>

namespace comgui::plugin
{
// What the word of a write holds; none for a deletion. Nothing for what cannot be written: an unknown type,
// PARAM_COUNT, a null word of a type that needs an address, a deletion with a word, a BIN_STRING without
// bytes.
std::optional<Value> ValueOf(PARAM_TYPE type, void const* word);

// The word of a write. It, and what it points at, lives as long as both arguments.
void const* WordOf(Value const& value, BIN_STRING& bytes);
}  // namespace comgui::plugin
