// One ticket as the rules of typed access see it: four slots and a translator, whether the ticket stands
// alone or is addressed inside a container. Each rule is written once, over either of the two.
// What a table slot returns does not count: success stands in each record's ok.
#pragma once

#include "comgui/ticket/MTICKET_ACCESS.h"
#include "comgui/ticket/STICKET_ACCESS.h"
#include "comgui/ticket/TICKET_ID.h"
#include "comgui/ticket/clFOLDER_VARIABLES.h"

namespace comgui::detail
{
struct STICKET_SLOTS
{
    STICKET_ACCESS const* access;

    int Get(char const* key, PARAM_TYPE type, void* value, int pos) const
    {
        return access->SGETPARAMETER(access->Instance, key, type, value, pos);
    }
    int Set(char const* key, PARAM_TYPE type, void const* value, int pos) const
    {
        return access->SSETPARAMETER(access->Instance, key, type, value, pos);
    }
    void GetTable(GETMULTIPAR* table) const { access->SGETMULTIPAR(access->Instance, table); }
    void SetTable(SETMULTIPAR* table) const { access->SSETMULTIPAR(access->Instance, table); }
    // The ticket's own translator; null if it has none.
    clFOLDER_VARIABLES* GetFolderVariables() const
    {
        clFOLDER_VARIABLES* folders = nullptr;
        return access->SOPTION(access->Instance, STICKET_OP_FOLDER_VARIABLES, &folders) ? folders : nullptr;
    }
};

struct MTICKET_SLOTS
{
    MTICKET_ACCESS const* access;
    int ticketType;
    int ticketId;

    int Get(char const* key, PARAM_TYPE type, void* value, int pos) const
    {
        return access->MGETPARAMETER(access->Instance, ticketType, ticketId, key, type, value, pos);
    }
    int Set(char const* key, PARAM_TYPE type, void const* value, int pos) const
    {
        return access->MSETPARAMETER(access->Instance, ticketType, ticketId, key, type, value, pos);
    }
    void GetTable(GETMULTIPAR* table) const
    {
        access->MGETMULTIPAR(access->Instance, ticketType, ticketId, table);
    }
    void SetTable(SETMULTIPAR* table) const
    {
        access->MSETMULTIPAR(access->Instance, ticketType, ticketId, table);
    }
    // The container's translator, whatever ticket it is asked for.
    clFOLDER_VARIABLES* GetFolderVariables() const
    {
        clFOLDER_VARIABLES* folders = nullptr;
        return access->MOPERATION(access->Instance, TICKET_ID_NONE, TICKET_ID_NONE,
                                  MTICKET_OP_FOLDER_VARIABLES, &folders)
                   ? folders
                   : nullptr;
    }
};

// A read of one value. A slot that fails gives the default, whatever it did to the variable; one that
// succeeds without writing gives zero.
template <typename Value, typename Slots>
Value Read(Slots const& ticket, PARAM_TYPE type, int pos, char const* key, Value def)
{
    Value value{};
    return ticket.Get(key, type, &value, pos) ? value : def;
}

// Tickets know no bool: 0 and any other int stand for it.
template <typename Slots>
bool ReadBool(Slots const& ticket, int pos, char const* key, bool def)
{
    return Read<int>(ticket, PARAM_INT, pos, key, def ? 1 : 0) != 0;
}

// The stored type; PARAM_NONE (0) also where nothing is stored.
template <typename Slots>
int ReadType(Slots const& ticket, char const* key, int pos)
{
    return Read<int>(ticket, PARAM_NONE, pos, key, PARAM_NONE);
}

// How many values the key holds; 0 where there is no such key.
template <typename Slots>
unsigned long ReadCount(Slots const& ticket, char const* key)
{
    return Read(ticket, PARAM_COUNT, -1, key, 0ul);
}

// A write of one number, by address.
template <typename Slots, typename Value>
int Write(Slots const& ticket, char const* key, PARAM_TYPE type, Value value, int pos)
{
    return ticket.Set(key, type, &value, pos);
}
}  // namespace comgui::detail
