// Builds a SETMULTIPAR table and owns what its records point at. Records are added in any order, and Table()
// lays them out as the one array that SSETMULTIPAR, MSETMULTIPAR and the streams take. Equal keys and equal
// values are stored once, and their addresses stay valid until Clear() or the list's end. Running out of
// memory throws std::bad_alloc; there are no other errors. One thread at a time.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include <string>
#include <wx/string.h>

class PARTIAL_MODE;
namespace comgui::detail
{
struct LIST_CONTENTS;
}
struct STICKET_ACCESS;

class COMGUI_EXPORT SETMULTIPAR_LIST
{
public:
    // copyValues: whether ySetParameter copies all values, or only those that a walk does not keep in place.
    explicit SETMULTIPAR_LIST(bool copyValues);
    SETMULTIPAR_LIST(SETMULTIPAR_LIST const&) = delete;
    SETMULTIPAR_LIST& operator=(SETMULTIPAR_LIST const&) = delete;
    ~SETMULTIPAR_LIST();

    // Adds a record; key and value are copied, value being what PARAM_TYPE.h tells of a write. The words of
    // PARAM_NONE, PARAM_POINTER, PARAM_COUNT and of types unknown here are kept as they are, and so is null,
    // which PARAM_DOUBLE alone does not take. What is no number (NaN, an infinity) becomes the one address
    // MathLib::NOT_A_DOUBLE_NUMBER. Always 1.
    int xSetParameter(char const* key, PARAM_TYPE type, void const* value, int pos);

    // The same for a walk over a live ticket: position 0 becomes -1, and in a list that does not copy values
    // all but PARAM_INT and PARAM_BINSTRING stay where the walk found them, NaN included. Such a list is good
    // as long as the ticket lives and does not change. Always 1.
    int ySetParameter(char const* key, PARAM_TYPE type, void const* value, int pos);

    // xSetParameter by the type of the value. Texts are stored as UTF-8 and end at their first zero byte.
    int SetParameter(char const* key, int value, int pos);
    int SetParameter(char const* key, double value, int pos);
    int SetParameter(char const* key, std::string const& value, int pos);
    int SetParameter(char const* key, wxString const& value, int pos);
    int SetParameter(char const* key, BIN_STRING const& value, int pos);

    // Adds a record that deletes: one value, or at -1 the key as a whole. Always 1.
    int DelParameter(char const* key, int pos);

    // Number of records.
    unsigned long Size() const;

    // The table, null while the list is empty. It belongs to the list and dies at the next add, at Clear()
    // and at the next Table(true) that has to sort. sort: by key, bytewise, records of one key staying in
    // their order; the records themselves are sorted, and later tables show it.
    SETMULTIPAR* Table(bool sort);

    // Empties the list; all its addresses die.
    void Clear();

    // Frees the table alone.
    void freeTbl();

    // The action of a walk that adds each parameter with ySetParameter. list: the SETMULTIPAR_LIST. Records
    // that are no parameters, and types unknown here, are passed over. Always true: the walk goes on.
    static bool CollectAction(void* list, char const* key, PARAM_TYPE type, void const* value, int pos);

    // Add what a walk over the ticket finds; nothing for a null ticket. keys: the patterns that are wanted,
    // as PARTIAL_MODE takes them; null or an empty table wants everything.
    void Merge(STICKET_ACCESS const* ticket, char const* const* keys);
    void Merge(STICKET_ACCESS const* ticket, PARTIAL_MODE const& mode);

    // Adds what keys does not select; null or an empty table leaves nothing out.
    void FilteredMerge(STICKET_ACCESS const* ticket, char const* const* keys);

    // What the list is made of, for the library alone.
    COMGUI_LOCAL comgui::detail::LIST_CONTENTS& Contents();
    COMGUI_LOCAL comgui::detail::LIST_CONTENTS const& Contents() const;

private:
    bool const m_copyValues;
    alignas(16) unsigned char m_contents[3072];  // a LIST_CONTENTS, with room for it to grow
};
