// A SETMULTIPAR_LIST by plain functions, for callers that do not know the class: those that find them by
// name. A null list is put up with everywhere. Nothing is thrown but std::bad_alloc.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/ticket/SETMULTIPAR.h"

class SETMULTIPAR_LIST;

extern "C"
{
    // A new list that does not copy what a walk keeps in place. The caller destroys it.
    COMGUI_EXPORT SETMULTIPAR_LIST* MultiParListCreate();

    // Destroys the list and sets the caller's pointer to null.
    COMGUI_EXPORT void MultiParListDestroy(SETMULTIPAR_LIST** list);

    // As Size() of the list; 0 for null.
    COMGUI_EXPORT unsigned long MultiParListSize(SETMULTIPAR_LIST* list);

    // As Table(sort) of the list; null for null.
    COMGUI_EXPORT SETMULTIPAR* MultiParListTable(SETMULTIPAR_LIST* list, bool sort);

    // As xSetParameter of the list, but for PARAM_STRING value is a wchar_t const*, null counting as the
    // empty text. 1; 0 for a null list.
    COMGUI_EXPORT int MultiParListSetParameter(SETMULTIPAR_LIST* list, char const* key, PARAM_TYPE type,
                                               void const* value, int pos);
}
