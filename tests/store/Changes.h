// Changes as tests of the stores write them down.
#pragma once

#include "standin/server/store/Store.h"
#include "tests/server/StoredValues.h"
#include <string_view>
#include <utility>

inline standin::StoredValue Pointer(void* pointer)
{
    standin::StoredValue value;
    value.type = PARAM_POINTER;
    value.pointer = pointer;
    return value;
}

// A change that is put together in one expression.
struct CHANGE : standin::TicketChange
{
    CHANGE(Kind kindOfChange, standin::TicketAddress at, standin::TicketState const& planned = {})
    {
        kind = kindOfChange;
        address = at;
        incarnation = planned.incarnation;
        revision = planned.revision;
    }

    // pos -1: the whole key.
    CHANGE&& Put(std::string_view key, int pos, standin::StoredValue const& value, bool hadOthers = true) &&
    {
        parameters.push_back({std::string(key), pos, standin::TicketValue::FromStored(value), hadOthers});
        return std::move(*this);
    }
    CHANGE&& Put(std::string_view key, int pos, int value) &&
    {
        return std::move(*this).Put(key, pos, Integer(PARAM_INT, value));
    }
    CHANGE&& Drop(std::string_view key, int pos = -1) &&
    {
        return std::move(*this).Put(key, pos, standin::StoredValue());
    }
    CHANGE&& Own(Owner newOwner) &&
    {
        owner = newOwner;
        return std::move(*this);
    }
    CHANGE&& On(standin::TicketAddress other, standin::TicketState const& planned) &&
    {
        others.push_back({other, planned.incarnation, planned.revision});
        return std::move(*this);
    }
    CHANGE&& Above(int id) &&
    {
        aboveId = id;
        return std::move(*this);
    }
};

inline CHANGE Creation(standin::TicketAddress address) { return {CHANGE::Create, address}; }
inline CHANGE CreationOfNext(int type) { return {CHANGE::Create, {type, CHANGE::NextId}}; }
inline CHANGE WriteTo(standin::TicketAddress address, standin::TicketState const& planned)
{
    return {CHANGE::Write, address, planned};
}
inline CHANGE DeletionOf(standin::TicketAddress address, standin::TicketState const& planned)
{
    return {CHANGE::Delete, address, planned};
}

// Equal as bits; the kinds, addresses and parameters of two changes.
inline bool SameValue(standin::TicketValue const& left, standin::TicketValue const& right)
{
    return SameValue(left.ToStored(), right.ToStored());
}
inline bool SameParameter(standin::ParameterChange const& left, standin::ParameterChange const& right)
{
    return left.key == right.key && left.pos == right.pos && left.hadOthers == right.hadOthers &&
           SameValue(left.value, right.value);
}
