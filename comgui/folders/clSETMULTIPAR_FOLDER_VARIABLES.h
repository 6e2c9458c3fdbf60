// Translates the folders in a whole table of parameters for one write: construct it, hand current to the
// write, call ResultCpy(), destroy it. The caller's table is left as it is, and must live as long as this,
// with all it points at; the translated texts die with this. One thread at a time.
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
