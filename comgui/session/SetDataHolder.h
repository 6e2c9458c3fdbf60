// One value of a write of many, as ComGUIManager::SetMultiParameter takes them in a vector: key, kind, a copy
// of the value, position. From new, since SetMultiParameter deletes what it is given.
//
// Texts: a holder copies a narrow text, but SetMultiParameter takes what is there for a wchar_t text, with no
// conversion, and so writes something else. Texts go out right through SETMULTIPAR_LIST::SetParameter, a
// wxList or SetArrayParameter.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include <cstddef>
#include <type_traits>
#include <wx/string.h>

class COMGUI_EXPORT SetDataHolder
{
public:
    // keyText: less than 256 bytes of UTF-8; more runs over the field's end, since nothing looks. value,
    // which is copied: of PARAM_INT the address of an int, of PARAM_DOUBLE of a double, of PARAM_STRING a
    // char const*; none of them null. Of any other type it is not looked at, and the holder has none. Without
    // memory for the copy a failed assertion ends the process, in every kind of build.
    SetDataHolder(wxString keyText, PARAM_TYPE type, void* value, int pos);
    SetDataHolder(SetDataHolder const&) = delete;
    SetDataHolder& operator=(SetDataHolder const&) = delete;
    ~SetDataHolder();

    char key[256];  // UTF-8, with its zero byte
    PARAM_TYPE m_type;
    void* m_value;  // the holder's own, from malloc or calloc; may be null
    int m_pos;      // -1 the key as a whole, 0 and up one of its values
};
static_assert(std::is_standard_layout_v<SetDataHolder> && sizeof(SetDataHolder) == 280);
static_assert(offsetof(SetDataHolder, key) == 0);
static_assert(offsetof(SetDataHolder, m_type) == 256);
static_assert(offsetof(SetDataHolder, m_value) == 264);
static_assert(offsetof(SetDataHolder, m_pos) == 272);
