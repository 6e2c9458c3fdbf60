// The tables of the real plug-in's tickets and containers, with traced slots: copies of the real ones, but
// for the slots that the library calls and the Instance, which leads to the copy. A real table has one copy,
// which stays for good, as a host may hold it; for any thread.
#pragma once

#include "comgui/ticket/MTICKET_ACCESS.h"
#include "comgui/ticket/STICKET_ACCESS.h"

namespace trace
{
class TracedTicket
{
public:
    // session: that the ticket belongs to, null for none.
    TracedTicket(STICKET_ACCESS const* real, void* session);
    TracedTicket(TracedTicket const&) = delete;
    TracedTicket& operator=(TracedTicket const&) = delete;

    STICKET_ACCESS const* Access() const { return &m_access; }

    STICKET_ACCESS const* const real;
    STICKET_ACCESS const words;  // those of the real table
    void* const session;

private:
    STICKET_ACCESS m_access;
};

class TracedContainer
{
public:
    TracedContainer(MTICKET_ACCESS const* real, void* session);
    TracedContainer(TracedContainer const&) = delete;
    TracedContainer& operator=(TracedContainer const&) = delete;

    MTICKET_ACCESS const* Access() const { return &m_access; }

    MTICKET_ACCESS const* const real;
    MTICKET_ACCESS const words;
    void* const session;

private:
    MTICKET_ACCESS m_access;
};

// The copy of a table, null for null.
STICKET_ACCESS const* CopyOf(STICKET_ACCESS const* real, void* session);
MTICKET_ACCESS const* CopyOf(MTICKET_ACCESS const* real, void* session);

// The real table of a copy; any other pointer as it is, and never followed.
STICKET_ACCESS const* RealOf(STICKET_ACCESS const* table);
}  // namespace trace
