// What a SETMULTIPAR_LIST is made of, for the list and for the readers that fill it without its checks.
#pragma once

#include "comgui/foundation/MathLib.h"
#include "comgui/foundation/number_bits.h"
#include "comgui/ticket/KEYCACHE.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include "comgui/ticket/POOL.h"
#include "comgui/ticket/RECORD_BLOCKS.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include "comgui/ticket/value_kinds.h"

namespace comgui::detail
{
struct LIST_CONTENTS
{
    LIST_CONTENTS() = default;
    LIST_CONTENTS(LIST_CONTENTS const&) = delete;
    LIST_CONTENTS& operator=(LIST_CONTENTS const&) = delete;
    ~LIST_CONTENTS() { FreeTable(); }

    // The list's own copy of a value as PARAM_TYPE.h describes it; of types without one, value itself.
    void const* Kept(PARAM_TYPE type, void const* value);

    // All that is no number is one value: a NaN could not be found again.
    void const* Kept(double value)
    {
        return IsNotANumber(value) ? &MathLib::NOT_A_DOUBLE_NUMBER : &doubles.Keep(value);
    }

    // key, value: addresses that are kept. Always 1.
    int Add(char const* key, PARAM_TYPE type, void const* value, int pos)
    {
        records.Append(key, type, value, pos);
        if (table)
            FreeTable();
        return 1;
    }

    SETMULTIPAR* Table(bool sort);
    void FreeTable();
    void Clear();

    POOL pool;  // of all that follows, and freed as a whole
    KEYCACHE keys{pool};
    VALUE_INDEX<NUMBER<int>> ints{pool};
    VALUE_INDEX<NUMBER<unsigned int>> unsigneds{pool};
    VALUE_INDEX<NUMBER<long long>> ints64{pool};
    VALUE_INDEX<NUMBER<unsigned long long>> unsigneds64{pool};
    VALUE_INDEX<NUMBER<double>> doubles{pool};
    VALUE_INDEX<TEXT> texts{pool};
    VALUE_INDEX<BINARY> binaries{pool};
    RECORD_BLOCKS records{pool};
    SETMULTIPAR* table = nullptr;
    bool isSorted = false;  // the table was built after sorting
};
}  // namespace comgui::detail
