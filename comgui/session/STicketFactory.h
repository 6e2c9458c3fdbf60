// The plug-in's block of pointer-sized slots that makes single tickets outside any container: from a ticket
// file, or in memory. Its slots take no instance.
#pragma once

#include "comgui/ticket/STICKET_ACCESS.h"
#include <cstddef>
#include <type_traits>

struct STicketFactory
{
    void* reserved0[2];

    // Opens the ticket file of that path (UTF-8), or for null makes a ticket in memory. The module owns the
    // result, which goes back through DestroyTicket; null if there is no such ticket.
    STICKET_ACCESS const* (*CreateTicket)(char const* path);

    // Destroys *ticket and may clear the caller's pointer; its changes are in its file then.
    void (*DestroyTicket)(STICKET_ACCESS const** ticket);
};
static_assert(std::is_standard_layout_v<STicketFactory>);
static_assert(offsetof(STicketFactory, CreateTicket) == 16);
static_assert(offsetof(STicketFactory, DestroyTicket) == 24);
