#include "comgui/ticket/MultiParList.h"

#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include <utility>

SETMULTIPAR_LIST* MultiParListCreate() { return new SETMULTIPAR_LIST(false); }

void MultiParListDestroy(SETMULTIPAR_LIST** list)
{
    if (list)
        delete std::exchange(*list, nullptr);
}

unsigned long MultiParListSize(SETMULTIPAR_LIST* list) { return list ? list->Size() : 0; }

SETMULTIPAR* MultiParListTable(SETMULTIPAR_LIST* list, bool sort)
{
    return list ? list->Table(sort) : nullptr;
}

int MultiParListSetParameter(SETMULTIPAR_LIST* list, char const* key, PARAM_TYPE type, void const* value,
                             int pos)
{
    if (list == nullptr)
        return 0;
    // Wide text, here alone: callers of this function were written against it.
    if (type == PARAM_STRING)
        return list->SetParameter(key, wxString(static_cast<wchar_t const*>(value)), pos);
    return list->xSetParameter(key, type, value, pos);
}
