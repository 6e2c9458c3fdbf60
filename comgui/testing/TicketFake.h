// A single ticket in memory for tests of whatever calls one: a ContainerFake's ticket behind the slots of a
// ticket of its own, so that it writes down calls, fails where it is told and throws at another Instance just
// as that one does.
#pragma once

#include "comgui/testing/ContainerFake.h"
#include "comgui/ticket/STICKET_ACCESS.h"
#include <vector>

namespace comgui::test
{
class TicketFake
{
    static constexpr unsigned long long Mark = 0x5449434B45544641;
    unsigned long long const m_mark = Mark;  // the first word: whatever else comes as Instance has another

public:
    TicketFake();
    TicketFake(TicketFake const&) = delete;
    TicketFake& operator=(TicketFake const&) = delete;

    // The table; it dies with the fake.
    STICKET_ACCESS* Access() { return &m_access; }

    // Holds the ticket, type 0 and id 0, with its calls and settings.
    ContainerFake container;

    // What SOPTION answers to the two codes that it knows, and all codes that it was asked for. The
    // translator is that of the container fake; without one, asking for it fails.
    int optionResult = 1;
    std::vector<int> options;

private:
    static TicketFake& Of(void* instance);  // throws std::logic_error for any other
    static int OnOption(void* instance, int code, void* out);

    STICKET_ACCESS m_access{};
};
}  // namespace comgui::test
