// What the slots of a ticket promise, over a source of values: an object with the functions Read, Count,
// Write and All of Ticket.h. A ticket is its own source; a container is one for each address.
#pragma once

#include "comgui/module/Kept.h"
#include "comgui/module/Running.h"
#include "comgui/module/Words.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include "comgui/ticket/STICKET_ACCESS.h"
#include <cstring>

class clFOLDER_VARIABLES;

namespace comgui::plugin
{
// Puts a value to where a read wants it; texts are moved into kept.
inline void HandOut(Value&& value, void* out, KeptValues& kept)
{
    switch (TypeOf(value))
    {
    case PARAM_INT:
        *static_cast<int*>(out) = *std::get_if<int>(&value);
        break;
    case PARAM_DOUBLE:
        *static_cast<double*>(out) = *std::get_if<double>(&value);
        break;
    case PARAM_STRING:
        *static_cast<char const**>(out) =
            kept.texts.Keep(std::move(*std::get_if<std::string>(&value))).c_str();
        break;
    case PARAM_BINSTRING:
    {
        std::string const& bytes = kept.texts.Keep(std::move(std::get_if<Bytes>(&value)->bytes));
        *static_cast<BIN_STRING*>(out) = BIN_STRING(bytes.data(), bytes.size());
        break;
    }
    case PARAM_POINTER:
        *static_cast<void**>(out) = *std::get_if<void*>(&value);
        break;
    case PARAM_INT64:
        *static_cast<long long*>(out) = *std::get_if<long long>(&value);
        break;
    case PARAM_UNSIGNED:
        *static_cast<unsigned int*>(out) = *std::get_if<unsigned int>(&value);
        break;
    case PARAM_UNSIGNED64:
        *static_cast<unsigned long long*>(out) = *std::get_if<unsigned long long>(&value);
        break;
    case PARAM_NONE:
    case PARAM_COUNT:
        break;
    }
}

// How many values a key has, or which type.
template <typename Source>
bool AnswerQuestion(Source& source, std::string_view key, PARAM_TYPE type, void* out, int pos)
{
    int const count = pos == -1 ? source.Count(key) : 0;
    if (type == PARAM_COUNT)
    {
        if (count > 0)
            *static_cast<unsigned long*>(out) = static_cast<unsigned long>(count);
        return count > 0;
    }
    int const stored = count > 1 ? int{PARAM_COUNT} : int{TypeOf(source.Read(key, pos == -1 ? 0 : pos))};
    if (stored == PARAM_NONE)
        return false;
    *static_cast<int*>(out) = stored;
    return true;
}

template <typename Source>
bool AnswerRead(Source& source, KeptValues& kept, char const* key, PARAM_TYPE type, void* out, int pos)
{
    if (!key || !out || pos < -1)
        return false;
    if (type == PARAM_NONE || type == PARAM_COUNT)
        return AnswerQuestion(source, key, type, out, pos);
    Value value = source.Read(key, pos == -1 ? 0 : pos);  // a list's first value is read for all of it
    if (TypeOf(value) != type)
        return false;
    HandOut(std::move(value), out, kept);
    return true;
}

template <typename Source>
bool AnswerWrite(Source& source, char const* key, PARAM_TYPE type, void const* word, int pos)
{
    if (!key || pos < -2 || pos > LargestPosition)
        return false;
    std::optional<Value> const value = ValueOf(type, word);
    return value && source.Write(key, *value, pos);
}

// Each record, whatever becomes of the others.
template <typename Record, typename Work>
bool AnswerTable(Called& called, Record* table, Work const& work)
{
    if (!table)
        return false;
    for (Record* record = table; record->key; ++record)
        record->ok = RunRead(called, [&] { return work(*record); }) != 0;
    return true;
}

template <typename Source>
bool AnswerTableRead(Source& source, Called& called, KeptValues& kept, GETMULTIPAR* table)
{
    return AnswerTable(called, table,
                       [&](GETMULTIPAR const& record) {
                           return AnswerRead(source, kept, record.key, record.type, record.value, record.pos);
                       });
}

template <typename Source>
bool AnswerTableWrite(Source& source, Called& called, SETMULTIPAR* table)
{
    return AnswerTable(called, table,
                       [&](SETMULTIPAR const& record)
                       { return AnswerWrite(source, record.key, record.type, record.value, record.pos); });
}

// The word of a value that a walk hands out. Hosts gather a ticket by the addresses of its texts and numbers,
// so these outlive the walk.
inline void const* KeptWordOf(Value&& value, BIN_STRING& bytes, KeptValues& kept)
{
    if (auto* const text = std::get_if<std::string>(&value))
        return kept.texts.Keep(std::move(*text)).c_str();
    if (auto* const content = std::get_if<Bytes>(&value))
    {
        std::string const& held = kept.texts.Keep(std::move(content->bytes));
        bytes = BIN_STRING(held.data(), held.size());
        return &bytes;
    }
    void const* const word = WordOf(value, bytes);
    if (TypeOf(value) == PARAM_POINTER)
        return word;
    unsigned long long number = 0;
    bool const isShort = TypeOf(value) == PARAM_INT || TypeOf(value) == PARAM_UNSIGNED;
    std::memcpy(&number, word, isShort ? sizeof(int) : sizeof number);
    return &kept.numbers.Keep(number);
}

// Over the values of the beginning. The limit goes by: a walk that left out values would lose them for good
// where a ticket is copied by walking over it.
template <typename Source>
bool AnswerWalk(Source& source, KeptValues& kept, SWALKPARAMETERS_ACTION action, void* context,
                char const* prefix)
{
    if (!action)
        return false;
    for (Parameter& parameter : source.All(prefix ? prefix : ""))
    {
        PARAM_TYPE const type = TypeOf(parameter.value);
        if (!comgui::detail::IsParameter(type))
            continue;
        BIN_STRING bytes;
        void const* const word = KeptWordOf(std::move(parameter.value), bytes, kept);
        if (!action(context, parameter.key.c_str(), type, word, parameter.pos))
            break;
    }
    return true;
}
}  // namespace comgui::plugin
