// Values of tickets, each as what it is, and which ticket they belong to. Plain values.
//
// The alternatives of Value lie in the order of PARAM_TYPE, so that a value's index is its type.
#pragma once

#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include <string>
#include <variant>

namespace comgui::plugin
{
struct Address
{
    int type = -1;
    int id = -1;
};
inline bool operator==(Address left, Address right) { return left.type == right.type && left.id == right.id; }
inline bool operator!=(Address left, Address right) { return !(left == right); }
inline bool operator<(Address left, Address right)
{
    return left.type != right.type ? left.type < right.type : left.id < right.id;
}

// Types from 0 to 99, ids of 24 bits. Whatever else a host asks for is no ticket.
inline bool IsTicket(Address address)
{
    return address.type >= 0 && address.type <= 99 && address.id >= 0 && address.id <= 0xFFFFFF;
}
inline constexpr Address SystemTicket{0, 0};
inline constexpr int LargestPosition = 0xFFFFFF;

// Bytes of any kind, zeros included.
struct Bytes
{
    std::string bytes;
};
inline bool operator==(Bytes const& left, Bytes const& right) { return left.bytes == right.bytes; }

// The place of PARAM_COUNT, which no value has.
struct NeverStored
{
};
inline bool operator==(NeverStored, NeverStored) { return true; }

// std::monostate: no value.
using Value = std::variant<std::monostate, void*, int, double, std::string, Bytes, NeverStored, long long,
                           unsigned int, unsigned long long>;
static_assert(std::variant_size_v<Value> == PARAM_UNSIGNED64 + 1);

inline bool IsNone(Value const& value) { return value.index() == PARAM_NONE; }
inline PARAM_TYPE TypeOf(Value const& value) { return static_cast<PARAM_TYPE>(value.index()); }

// One value of a ticket. pos: 0 and above, in what a client writes -1 or -2 too.
struct Parameter
{
    std::string key;
    Value value{};
    int pos = 0;
};
}  // namespace comgui::plugin
