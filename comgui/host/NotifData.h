// One notification on its way to the host's event handlers. Declared here, supplied by the host's event
// library, or by libcomgui_host. The fields and their order are shared with that library; the record has 128
// bytes where wxString has 40, and grows with it elsewhere.
#pragma once

#include "comgui/foundation/export.h"
#include <cstddef>
#include <type_traits>
#include <wx/string.h>

class NotifData
{
public:
    // The texts are empty and the number 0 at first, the position -1. key: UTF-8, or null for none.
    COMGUI_EXPORT NotifData(void* user, int kind, int argA, int argB, int code, int valueType,
                            char const* key);
    COMGUI_EXPORT NotifData(NotifData const& other);
    NotifData& operator=(NotifData const&) = default;

    void* pUser;         // what the host gave to ComGUIManager::SetCallback
    int NotifKind;       // 1: a parameter changed; what the others are is between server and host
    int NotifArgA;       // carried, not looked at
    int NotifArgB;       // carried, not looked at
    int NotifCode;       // with the kind it makes the event's id
    int NotifValueType;  // PARAM_TYPE of the value; PARAM_COUNT: several values changed, none is here
    wxString NotifKey;   // the parameter's key; for kinds other than 1 and 7 a text value stands here
    wxString NotifText;  // a text value, for kind 1
    double NotifNumber;  // a number, for kind 1; ints are here too
    int NotifPos;        // position of the value under its key
};
static_assert(std::is_standard_layout_v<NotifData> && sizeof(NotifData) == 48 + 2 * sizeof(wxString));
static_assert(offsetof(NotifData, pUser) == 0);
static_assert(offsetof(NotifData, NotifKind) == 8);
static_assert(offsetof(NotifData, NotifArgA) == 12);
static_assert(offsetof(NotifData, NotifArgB) == 16);
static_assert(offsetof(NotifData, NotifCode) == 20);
static_assert(offsetof(NotifData, NotifValueType) == 24);
static_assert(offsetof(NotifData, NotifKey) == 32);
static_assert(offsetof(NotifData, NotifText) == 32 + sizeof(wxString));        // 72 of 128 bytes
static_assert(offsetof(NotifData, NotifNumber) == 32 + 2 * sizeof(wxString));  // 112
static_assert(offsetof(NotifData, NotifPos) == 40 + 2 * sizeof(wxString));     // 120
