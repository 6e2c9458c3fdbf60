// The rules of list_templates.h over either family of tickets, for what goes through them inside the library.
#pragma once

#include "comgui/access/TICKET_SLOTS.h"
#include <cstdlib>

namespace comgui::detail
{
// Gives a block of malloc or calloc back.
struct FREE
{
    void operator()(void* block) const { std::free(block); }
};

// List: a std::vector<T>, or for int a wxArrayInt.
template <typename T, typename Slots, typename List>
bool ReadList(Slots const& ticket, char const* key, List& out);

template <typename T, typename Slots>
bool ReadArray(Slots const& ticket, char const* key, T* out, unsigned long count);

// Vector or array, number or pointer.
template <typename T, typename Slots>
bool WriteList(Slots const& ticket, char const* key, T const* in, unsigned long count);
}  // namespace comgui::detail
