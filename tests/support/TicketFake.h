// A single ticket in memory for tests of whatever calls one: a ContainerFake's ticket behind the slots of a
// ticket of its own, so that it writes down calls and fails where it is told just as that one does.
#pragma once

#include "comgui/ticket/STICKET_ACCESS.h"
#include "tests/support/ContainerFake.h"
#include <vector>

class TicketFake
{
public:
    TicketFake();
    TicketFake(TicketFake const&) = delete;
    TicketFake& operator=(TicketFake const&) = delete;

    // The table; it dies with the fake.
    STICKET_ACCESS* Access() { return &m_access; }

    // Holds the ticket, type 0 and id 0, with its calls and settings.
    ContainerFake container;

    // What SOPTION answers by code, and the codes that it was asked for. folders: of the container fake.
    int optionResult = 1;
    std::vector<int> options;

private:
    static TicketFake& Of(void* instance) { return *static_cast<TicketFake*>(instance); }
    static int OnOption(void* instance, int code, void* out);

    STICKET_ACCESS m_access{};
};
