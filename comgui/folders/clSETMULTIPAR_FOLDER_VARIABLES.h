// Translates the folders in a whole table of parameters for one write. The write gets current instead of the
// caller's table, and ResultCpy() then takes home what became of each record. Not a word of the caller's
// table changes but for that. current points into this object and into the caller's data, so both must
// outlive the write. One thread at a time.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/SETMULTIPAR.h"

class STRINGCACHE;
class clFOLDER_VARIABLES;

class COMGUI_EXPORT clSETMULTIPAR_FOLDER_VARIABLES
{
public:
    // encode: texts to their variable form; else to paths, with slashes. Null folders translate nothing; only
    // then may the table be null.
    clSETMULTIPAR_FOLDER_VARIABLES(clFOLDER_VARIABLES* folders, SETMULTIPAR* table, bool encode);
    virtual ~clSETMULTIPAR_FOLDER_VARIABLES();
    clSETMULTIPAR_FOLDER_VARIABLES(clSETMULTIPAR_FOLDER_VARIABLES const&) = delete;
    clSETMULTIPAR_FOLDER_VARIABLES& operator=(clSETMULTIPAR_FOLDER_VARIABLES const&) = delete;

    // Puts the ok of each record written into the caller's table.
    void ResultCpy();

    // Whether there is a text in the table that could be translated: one that is not empty.
    static bool TableNeedsEncodeDecode(SETMULTIPAR const* table);

    // In bytes, with the terminator.
    static unsigned long TableSize(SETMULTIPAR const* table);

    SETMULTIPAR* source;  // the caller's table
    SETMULTIPAR* copy;    // a table that shares keys and all other values with it; null if there are no texts
    SETMULTIPAR* current;  // the copy if any text of it has changed, else the source
    STRINGCACHE* cache;    // the changed texts; null if there is no copy
};
