// A fake must not answer a call that was meant for another object.
#include "comgui/testing/TicketFake.h"

#include <gtest/gtest.h>
#include <stdexcept>

using comgui::test::ContainerFake;
using comgui::test::TicketFake;

TEST(Fakes, CalledWithAnotherInstance_Throw)
{
    ContainerFake container;
    TicketFake ticket;
    int value = 0;
    for (void* const instance : {static_cast<void*>(nullptr), static_cast<void*>(container.Access())})
    {
        EXPECT_THROW(container.Access()->MGETPARAMETER(instance, 0, 0, "Key", PARAM_INT, &value, -1),
                     std::logic_error);
        EXPECT_THROW(ticket.Access()->SGETPARAMETER(instance, "Key", PARAM_INT, &value, -1),
                     std::logic_error);
    }
    EXPECT_THROW(container.Access()->MGETPARAMETER(&ticket, 0, 0, "Key", PARAM_INT, &value, -1),
                 std::logic_error);
    EXPECT_THROW(ticket.Access()->SGETPARAMETER(&container, "Key", PARAM_INT, &value, -1), std::logic_error);
}
