// Lists of what a ticket does not know by itself: bools are stored as ints, wide texts as UTF-8. Over either
// family of tickets; what is said of lists in list_templates.h holds here too.
#pragma once

#include "comgui/access/TICKET_SLOTS.h"
#include <vector>
#include <wx/arrstr.h>
#include <wx/dynarray.h>
#include <wx/string.h>

namespace comgui::detail
{
// An int that is not 0 is true. If nothing can be read out stays as it was.
template <typename Slots>
bool ReadBools(Slots const& ticket, char const* key, std::vector<bool>& out);

// Each text with its folder variable resolved; null texts are left out. If no record can be read out stays as
// it was.
template <typename Slots>
bool ReadTexts(Slots const& ticket, char const* key, std::vector<wxString>& out);

// Out stays as it was unless all values can be read. False if out of memory.
template <typename Slots>
bool ReadBoolArray(Slots const& ticket, char const* key, bool* out, unsigned long count);

// Puts the texts behind those that out holds; the ints instead of those. False if out of memory for a table.
template <typename Slots>
bool ReadWxArray(Slots const& ticket, char const* key, wxArrayString& out);
template <typename Slots>
bool ReadWxArray(Slots const& ticket, char const* key, wxArrayInt& out);

template <typename Slots>
bool WriteBools(Slots const& ticket, char const* key, std::vector<bool> const& in);

// The slot gets pointers into the texts.
template <typename Slots>
bool WriteTexts(Slots const& ticket, char const* key, std::vector<wxString> const& in);

// Deletes the key instead of writing it, unless count is 0: then nothing happens. True; false if out of
// memory.
template <typename Slots>
bool WriteBoolArray(Slots const& ticket, char const* key, bool const* in, unsigned long count);

// In a ticket of a container the texts stand behind as many empty ones.
template <typename Slots>
bool WriteWxArray(Slots const& ticket, char const* key, wxArrayString const& in);
template <typename Slots>
bool WriteWxArray(Slots const& ticket, char const* key, wxArrayInt const& in);
}  // namespace comgui::detail
