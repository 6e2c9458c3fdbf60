// All values of one key at once: one call of the module, however long the list is. The views offer these
// templates as members; the templates themselves take the record that a view stands on. No state, so any
// thread may call that may call the record's slots.
//
// key is UTF-8 and not null. The positions of a read are 0, 1, 2 ..., those of a write -1, 1, 2 ...: at -1
// the key begins anew, so that nothing of a longer list stays behind. A list of one value is what a single
// value is, and an empty list is no key. Lists of 2^31 values and more are beyond these functions.
//
// Each template exists for the element types named with it; any other does not link. Where a comment does
// not say otherwise, running out of memory for the table ends the process.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include "comgui/ticket/STICKET_ACCESS.h"
#include <vector>

// Makes out the values of the key. What cannot be read is left out, and what stands behind it moves up;
// false if that leaves nothing. If there is no such key out stays as it was, and so it does if there is no
// memory for the table of a single ticket: false. The texts of char const* are the module's, and may be null.
// T: void*, int, unsigned int, long long, unsigned long long, double, char const*
template <typename T>
COMGUI_EXPORT bool xGetVectorParameter(STICKET_ACCESS const& access, char const* key, std::vector<T>& out);
template <typename T>
COMGUI_EXPORT bool xGetVectorParameter(MTICKET_ACCESS const& access, int type, int id, char const* key,
                                       std::vector<T>& out);

// Reads the first count values to where out points. True if all of them could be read; if not, the places of
// those that could not are as they were. False for a count of 0.
// T: void*, int, unsigned int, long long, unsigned long long, double
template <typename T>
COMGUI_EXPORT bool xGetArrayParameter(STICKET_ACCESS const& access, char const* key, T* out,
                                      unsigned long count);
template <typename T>
COMGUI_EXPORT bool xGetArrayParameter(MTICKET_ACCESS const& access, int type, int id, char const* key, T* out,
                                      unsigned long count);

// Writes numbers as the values of the key, instead of those it had. True if all of them were written; if not,
// those that were stay written. No values delete the key, which is true whatever the slot says.
// T: int, unsigned int, long long, unsigned long long, double
template <typename T>
COMGUI_EXPORT bool xSetVectorParameter(STICKET_ACCESS const& access, char const* key,
                                       std::vector<T> const& in);
template <typename T>
COMGUI_EXPORT bool xSetVectorParameter(MTICKET_ACCESS const& access, int type, int id, char const* key,
                                       std::vector<T> const& in);
template <typename T>
COMGUI_EXPORT bool xSetArrayParameter(STICKET_ACCESS const& access, char const* key, T const* in,
                                      unsigned long count);
template <typename T>
COMGUI_EXPORT bool xSetArrayParameter(MTICKET_ACCESS const& access, int type, int id, char const* key,
                                      T const* in, unsigned long count);

// The same for elements that are pointers already: they go to the slot themselves, where a number goes by
// its address. Texts are UTF-8. T: void*; of a vector char const* too
template <typename T>
COMGUI_EXPORT bool xpSetVectorParameter(STICKET_ACCESS const& access, char const* key,
                                        std::vector<T> const& in);
template <typename T>
COMGUI_EXPORT bool xpSetVectorParameter(MTICKET_ACCESS const& access, int type, int id, char const* key,
                                        std::vector<T> const& in);
template <typename T>
COMGUI_EXPORT bool xpSetArrayParameter(STICKET_ACCESS const& access, char const* key, T const* in,
                                       unsigned long count);
template <typename T>
COMGUI_EXPORT bool xpSetArrayParameter(MTICKET_ACCESS const& access, int type, int id, char const* key,
                                       T const* in, unsigned long count);
