// Plain exported pointers that belong to the library's interface. Only hSTicketInstance is alive; the
// others stand for the sake of programs that link against them.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/session/STicketFactory.h"
#include "comgui/session/TLogin.h"

extern "C"
{
    // The plug-in's factory of single tickets. Null until a ComGUIManager has opened the plug-in, and the
    // only way to ask whether it could. A later manager that fails leaves it as it is.
    COMGUI_EXPORT extern STicketFactory* hSTicketInstance;

    COMGUI_EXPORT extern void* hMTicketInstance;      // always null
    COMGUI_EXPORT extern TLogin* tLogin;              // always null
    COMGUI_EXPORT extern void* pTicketContainer;      // always null
    COMGUI_EXPORT extern wchar_t const* pszFuncName;  // "ComGetInterface"
}
