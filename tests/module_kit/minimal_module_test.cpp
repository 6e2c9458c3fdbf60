// A session with the example plug-in, through the library, as any client has one.
#include "comgui/client.h"
#include "comgui/host/UtilityObjects.h"
#include <chrono>
#include <gtest/gtest.h>

using namespace comgui;
using namespace std::chrono_literals;

namespace
{
class MinimalModule : public testing::Test
{
protected:
    MinimalModule()
    {
        UtilityObjects::SetPlugInsFolder(wxString::FromUTF8(COMGUI_MINIMAL_MODULE));
        EXPECT_TRUE(connection.LogIn(here, demo));
    }
    ~MinimalModule() override { UtilityObjects::SetPlugInsFolder(wxString()); }

    Server const here{"localhost", 50000};
    Account const demo{"demo", "demo"};
    Connection connection;
    Tickets const tickets = connection.GetTickets();
};
}  // namespace

TEST_F(MinimalModule, LogIn_TellsWhoItIs)
{
    EXPECT_TRUE(connection.Test(here));
    EXPECT_EQ(tickets.ReadAs<std::string>({SystemTickets, 0}, "System/Name").ValueOr(""),
              "A server in a map");
}

TEST_F(MinimalModule, WrongPassword_IsRefusedAndTheNextLoginIsNot)
{
    EXPECT_TRUE(connection.LogOut());
    EXPECT_FALSE(connection.LogIn(here, {"demo", "wrong"}));
    EXPECT_TRUE(connection.LogIn(here, demo));
}

TEST_F(MinimalModule, OtherPort_HasNoServer)
{
    EXPECT_FALSE(connection.Test({"localhost", 50001}));
    EXPECT_FALSE(connection.Test({"elsewhere", 50000}));
}

TEST_F(MinimalModule, WhatIsWritten_IsReadAndWalked)
{
    auto const ticket = *tickets.Create(JobTickets);
    EXPECT_TRUE(tickets.Write(ticket, "Job/Copies", 25));
    EXPECT_TRUE(tickets.Write(ticket, "Job/Inks", MakeList<std::string>({"Cyan", "Gold"})));
    EXPECT_EQ(tickets.ReadAs<int>(ticket, "Job/Copies").ValueOr(0), 25);
    Snapshot const all = tickets.ReadAll(ticket).ValueOr({});
    EXPECT_EQ(all.Entries().size(), 2U);
    EXPECT_EQ(tickets.List(JobTickets)->size(), 1U);
}

TEST_F(MinimalModule, DeletedTicket_IsGoneAndItsIdIsNotUsedAgain)
{
    auto const ticket = *tickets.Create(JobTickets);
    EXPECT_TRUE(tickets.Delete(ticket));
    EXPECT_FALSE(tickets.Exists(ticket));
    EXPECT_NE(*tickets.Create(JobTickets), ticket);
}

TEST_F(MinimalModule, Change_IsHeardOf)
{
    auto const ticket = *tickets.Create(JobTickets);
    TaskQueue queue;
    std::string heard;
    auto const subscription = connection.Subscribe(
        Interest::InTickets({ticket}, {"Job/State"}), queue.GetExecutor(),
        [&](Event const& event)
        {
            auto const* const changed = std::get_if<TicketChanged>(&event);
            if (!changed || changed->keys.empty())
                return;
            heard = changed->keys[0].key + "=" + ToText(changed->keys[0].value.value_or("?"));
            queue.Stop();
        });
    EXPECT_TRUE(tickets.Write(ticket, "Job/State", "printed"));
    queue.RunFor(20s);
    EXPECT_EQ(heard, "Job/State=printed");
}

TEST_F(MinimalModule, WhatItDoesNotOffer_IsAFailure)
{
    Transfer job = connection.GetTransfers().SendJob(__FILE__, {});
    EXPECT_FALSE(job.Wait());
}
