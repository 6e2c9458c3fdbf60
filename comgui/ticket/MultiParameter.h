// What can be done with a whole table of records, with no list behind it. A table ends at a record with a
// null key. Tables made here come from malloc: give them back with free().
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/SETMULTIPAR.h"

extern "C"
{
    // A table for reading count values of one key: positions 0, 1, 2 ... The key is not copied; each value is
    // null, for the caller to fill in. Null if out of memory.
    COMGUI_EXPORT GETMULTIPAR* NewGetMultipar(unsigned long count, char const* key, PARAM_TYPE type);

    // The same for writing: positions -1, 1, 2 ..., as it is at -1 that a write begins a key anew.
    COMGUI_EXPORT SETMULTIPAR* NewSetMultipar(unsigned long count, char const* key, PARAM_TYPE type);

    // A copy of the table; its keys and values are still those of the original. Null for null, or if out of
    // memory.
    COMGUI_EXPORT SETMULTIPAR* MultiParameterDup(SETMULTIPAR const* table);

    // Copies the results record by record, to the end of the shorter table. Keys are not compared. Null on
    // either side does nothing.
    COMGUI_EXPORT void MultiParameterResultCpy(SETMULTIPAR* target, SETMULTIPAR const* source);
}

// Whether no record of the table has failed: so it is with an empty one, but not with null.
COMGUI_EXPORT bool AllMultiParameterOk(SETMULTIPAR const* table);
COMGUI_EXPORT bool AllMultiParameterOk(GETMULTIPAR const* table);

// Whether some record of the table was carried out. False for null.
COMGUI_EXPORT bool AnyMultiParameterOk(SETMULTIPAR const* table);
COMGUI_EXPORT bool AnyMultiParameterOk(GETMULTIPAR const* table);
