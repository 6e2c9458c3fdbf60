#include "comgui/ticket/LIST_CONTENTS.h"

#include <algorithm>

namespace comgui::detail
{
void const* LIST_CONTENTS::Kept(PARAM_TYPE type, void const* value)
{
    if (value == nullptr)
        return nullptr;
    switch (type)
    {
    case PARAM_INT:
        return &ints.Keep(*static_cast<int const*>(value));
    case PARAM_DOUBLE:
        return Kept(*static_cast<double const*>(value));
    case PARAM_STRING:
        return texts.Keep(static_cast<char const*>(value)).text;
    case PARAM_BINSTRING:
        return &binaries.Keep(BINARY::Of(*static_cast<BIN_STRING const*>(value))).view;
    case PARAM_INT64:
        return &ints64.Keep(*static_cast<long long const*>(value));
    case PARAM_UNSIGNED:
        return &unsigneds.Keep(*static_cast<unsigned int const*>(value));
    case PARAM_UNSIGNED64:
        return &unsigneds64.Keep(*static_cast<unsigned long long const*>(value));
    default:
        return value;
    }
}

SETMULTIPAR* LIST_CONTENTS::Table(bool sort)
{
    if (sort && !isSorted)
        FreeTable();
    if (table == nullptr && records.Size() != 0)
    {
        table = new SETMULTIPAR[records.Size() + 1];
        SETMULTIPAR* const end = records.CopyTo(table);
        *end = SETMULTIPAR{};
        isSorted = sort;
        if (sort && !std::is_sorted(table, end))
        {
            std::stable_sort(table, end);
            records.CopyFrom(table);
        }
    }
    return table;
}

void LIST_CONTENTS::FreeTable()
{
    delete[] table;
    table = nullptr;
    isSorted = false;
}

void LIST_CONTENTS::Clear()
{
    FreeTable();
    records.Clear();
    keys.clear();
    ints.Clear();
    unsigneds.Clear();
    ints64.Clear();
    unsigneds64.Clear();
    doubles.Clear();
    texts.Clear();
    binaries.Clear();
    pool.Clear();
}
}  // namespace comgui::detail
