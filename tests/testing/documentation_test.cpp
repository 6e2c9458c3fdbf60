// What docs/testing-your-client.md shows.
#include <comgui/client.h>
#include <comgui/testing.h>
#include <gmock/gmock.h>
#include <string>

namespace
{
// What is tested there: a client that prints a job again, with one more copy.
class Reprint
{
public:
    explicit Reprint(comgui::Connection const& connection) : m_tickets(connection.GetTickets()) {}

    std::string OneMore(comgui::TicketAddress job) const
    {
        auto const copies = m_tickets.ReadAs<int>(job, "Job/Copies");
        if (!copies)
            return copies.GetError().Text();
        auto const done = m_tickets.Write(job, "Job/Copies", *copies + 1);
        return done ? "printing" : done.GetError().Text();
    }

private:
    comgui::Tickets m_tickets;
};
}  // namespace

// [module-fake]
TEST(ReprintOverAFake, WritesOneCopyMore)
{
    comgui::test::ModuleFake module;
    module.Use();
    auto const job = module.Create(3, {{"Job/Copies", 2}});

    comgui::Connection connection;
    ASSERT_TRUE(connection.LogIn({"localhost", 50000}, {"anna", "secret"}));
    EXPECT_EQ(Reprint(connection).OneMore({job.type, job.id}), "printing");

    EXPECT_THAT(module.Calls(), testing::Contains("MSETMULTIPAR 3/1 Job/Copies[-1]=int 3"));
}

TEST(ReprintOverAFake, TellsThatItMayNot)
{
    comgui::test::ModuleFake module;
    module.Use();
    auto const job = module.Create(3, {{"Job/Copies", 2}});
    module.Answer("MSETMULTIPAR", 1);  // of a slot every code but 0 is a failure

    comgui::Connection connection;
    ASSERT_TRUE(connection.LogIn({"localhost", 50000}, {"anna", "secret"}));
    EXPECT_THAT(Reprint(connection).OneMore({job.type, job.id}), testing::HasSubstr("Job/Copies"));
    EXPECT_EQ(module.Read(job, "Job/Copies"), comgui::test::Value(2));
}
// [/module-fake]

// [site]
TEST(ReprintAtASite, WritesOneCopyMore)
{
    comgui::test::TemporarySite site;
    auto const job = site.Create(3, {{"Job/Copies", 2}});

    comgui::Connection connection;
    ASSERT_TRUE(connection.LogIn({"localhost", 50000}, {"operator", "operator"}));
    EXPECT_EQ(Reprint(connection).OneMore({job.type, job.id}), "printing");

    EXPECT_EQ(site.Read(job, "Job/Copies"), comgui::test::Value(3));
}
// [/site]

// [trouble]
TEST(ReprintInTrouble, TellsThatTheServerIsAway)
{
    comgui::test::TemporarySite site;
    auto const job = site.Create(3, {{"Job/Copies", 2}});
    comgui::Connection connection;
    ASSERT_TRUE(connection.LogIn({"localhost", 50000}, {"operator", "operator"}));

    site.SetTrouble({"away"});
    EXPECT_NE(Reprint(connection).OneMore({job.type, job.id}), "printing");
    site.SetTrouble({});
    EXPECT_EQ(Reprint(connection).OneMore({job.type, job.id}), "printing");
}
// [/trouble]

namespace
{
// What is tested there: a function over the library's own table.
int CopiesOf(STICKET_ACCESS const* ticket)
{
    int copies = 1;
    ticket->SGETPARAMETER(ticket->Instance, "Job/Copies", PARAM_INT, &copies, -1);
    return copies;
}
}  // namespace

// [table-fake]
TEST(CopiesOf, WithoutTheKey_AreOne)
{
    comgui::test::TicketFake ticket;
    EXPECT_EQ(CopiesOf(ticket.Access()), 1);

    using comgui::test::CALL;
    using comgui::test::SLOT;
    EXPECT_THAT(ticket.container.calls,
                testing::ElementsAre(CALL{SLOT::GET, 0, 0, "Job/Copies", PARAM_INT, -1}));
}
// [/table-fake]
