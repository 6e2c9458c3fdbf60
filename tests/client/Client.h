// A client of the stand-in server: a site of the test's own, and connections to it.
#pragma once

#include "comgui/client.h"
#include "comgui/testing/TemporaryFolder.h"
#include "comgui/testing/TemporarySite.h"
#include <gtest/gtest.h>

using comgui::test::TemporaryFolder;

class Client : public testing::Test
{
protected:
    static constexpr comgui::TicketAddress System{comgui::SystemTickets, 0};

    static comgui::Server Here() { return {}; }
    static comgui::Account Admin() { return {"admin", "admin"}; }
    static comgui::Account Operator() { return {"operator", "operator"}; }

    void LogIn() { ASSERT_TRUE(connection.LogIn(Here(), Admin())); }

    // A new, empty ticket.
    comgui::TicketAddress NewTicket(int type = comgui::JobTickets) const { return *tickets.Create(type); }

    TemporaryFolder const folder;
    comgui::test::TemporarySite site;
    comgui::Connection connection;
    comgui::Tickets const tickets = connection.GetTickets();
};

// The code of a failure, 0 of a success.
template <typename T>
int CodeOf(comgui::Result<T> const& result)
{
    return result ? 0 : result.GetError().code;
}
