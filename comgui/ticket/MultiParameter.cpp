#include "comgui/ticket/MultiParameter.h"

#include <cstdlib>

namespace
{
template <typename Record>
unsigned long Length(Record const* table)
{
    unsigned long length = 0;
    while (table[length].key)
        ++length;
    return length;
}

template <typename Record>
Record* NewTable(unsigned long count, char const* key, PARAM_TYPE type)
{
    if (count + 1 == 0)
        return nullptr;
    auto* const table = static_cast<Record*>(std::calloc(count + 1, sizeof(Record)));
    for (unsigned long i = 0; table && i < count; ++i)
    {
        table[i].key = key;
        table[i].type = type;
        table[i].pos = static_cast<int>(i);
    }
    return table;
}

template <typename Record>
bool AllOk(Record const* table)
{
    if (table == nullptr)
        return false;
    while (table->key && comgui::detail::IsOk(*table))
        ++table;
    return table->key == nullptr;
}

template <typename Record>
bool AnyOk(Record const* table)
{
    if (table == nullptr)
        return false;
    while (table->key && !comgui::detail::IsOk(*table))
        ++table;
    return table->key != nullptr;
}
}  // namespace

GETMULTIPAR* NewGetMultipar(unsigned long count, char const* key, PARAM_TYPE type)
{
    return NewTable<GETMULTIPAR>(count, key, type);
}

SETMULTIPAR* NewSetMultipar(unsigned long count, char const* key, PARAM_TYPE type)
{
    SETMULTIPAR* const table = NewTable<SETMULTIPAR>(count, key, type);
    // Unlike a read, which begins at 0: a write at -1 drops what the key held before.
    if (table && count != 0)
        table->pos = -1;
    return table;
}

SETMULTIPAR* MultiParameterDup(SETMULTIPAR const* table)
{
    if (table == nullptr)
        return nullptr;
    unsigned long const bytes = (Length(table) + 1) * sizeof(SETMULTIPAR);
    void* const copy = std::malloc(bytes);
    return copy ? static_cast<SETMULTIPAR*>(std::memcpy(copy, table, bytes)) : nullptr;
}

void MultiParameterResultCpy(SETMULTIPAR* target, SETMULTIPAR const* source)
{
    if (target == nullptr || source == nullptr)
        return;
    for (; target->key && source->key; ++target, ++source)
        target->ok = comgui::detail::IsOk(*source);
}

bool AllMultiParameterOk(SETMULTIPAR const* table) { return AllOk(table); }
bool AllMultiParameterOk(GETMULTIPAR const* table) { return AllOk(table); }
bool AnyMultiParameterOk(SETMULTIPAR const* table) { return AnyOk(table); }
bool AnyMultiParameterOk(GETMULTIPAR const* table) { return AnyOk(table); }
