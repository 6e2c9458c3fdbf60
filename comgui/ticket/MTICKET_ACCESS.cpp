#include "comgui/ticket/MTICKET_ACCESS.h"

int MSETMULTIPAR_TO_MSETPARAMETER(void* Instance, int ticketType, int ticketId, SETMULTIPAR* table,
                                  MSETPARAMETER set)
{
    if (!table)
        return 0;
    for (SETMULTIPAR* record = table; record->key; ++record)
    {
        int const result =
            set(Instance, ticketType, ticketId, record->key, record->type, record->value, record->pos);
        record->ok = (result & 0xFF) != 0;  // the lowest byte is what crosses: 256 is a failure here
    }
    return 1;
}

int MSETPARAMETER_TO_MSETMULTIPAR(void* Instance, int ticketType, int ticketId, char const* key,
                                  PARAM_TYPE type, void const* value, int pos, MSETMULTIPAR set)
{
    SETMULTIPAR table[2] = {};
    table[0].key = key;
    table[0].type = type;
    table[0].value = value;
    table[0].pos = pos;
    return set(Instance, ticketType, ticketId, table) != 0 && comgui::detail::IsOk(table[0]) ? 1 : 0;
}
