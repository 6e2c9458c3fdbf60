// The names of tickets, as a window asks for them while it paints.
#include "desk/model/TitleReader.h"

#include "tests/client/Client.h"
#include <gmock/gmock.h>

using namespace desk;
using namespace std::chrono_literals;

namespace
{
class TitlesOfTickets : public Client
{
protected:
    TitlesOfTickets()
    {
        LogIn();
        titles.onAsked = [this] { ++asked; };
        titles.onTitles = [this] { ++told; };
    }
    std::string Await(comgui::TicketAddress ticket, std::string const& title)
    {
        for (int tries = 0; titles.TitleOf(ticket) != title && tries < 2000; ++tries)
        {
            titles.Read();
            queue.RunFor(2ms);
        }
        return titles.TitleOf(ticket);
    }
    comgui::TicketAddress Job(std::string const& name) const
    {
        comgui::TicketAddress const job = NewTicket();
        EXPECT_TRUE(tickets.Write(job, "Job/Identification/Name", name));
        return job;
    }

    comgui::TaskQueue queue;
    comgui::Worker const worker{queue.GetExecutor()};
    TitleReader titles{tickets, worker};
    int asked = 0;
    int told = 0;
};
}  // namespace

TEST_F(TitlesOfTickets, AreThereSoon)
{
    comgui::TicketAddress const job = Job("poster.pdf");
    EXPECT_EQ(titles.TitleOf(job), "");
    EXPECT_EQ(asked, 1);
    EXPECT_EQ(Await(job, "poster.pdf"), "poster.pdf");
    EXPECT_GE(told, 1);
}

TEST_F(TitlesOfTickets, AreAskedForOnceForAll)
{
    for (int i = 0; i < 100; ++i)
        (void)titles.TitleOf({comgui::JobTickets, i});
    EXPECT_EQ(asked, 1);
}

TEST_F(TitlesOfTickets, AreReadAnewWhenTheyChange)
{
    comgui::TicketAddress const job = Job("poster.pdf");
    Await(job, "poster.pdf");
    ASSERT_TRUE(tickets.Write(job, "Job/Identification/Name", "flyer.pdf"));
    titles.Take(comgui::TicketChanged{job, {{"Job/Copies", 3}}, false});
    queue.RunFor(50ms);
    EXPECT_EQ(titles.TitleOf(job), "poster.pdf");  // it was another key
    titles.Take(comgui::TicketChanged{job, {{"Job/Identification/Name", "flyer.pdf"}}, false});
    EXPECT_EQ(Await(job, "flyer.pdf"), "flyer.pdf");
}

TEST_F(TitlesOfTickets, AreReadAnew_EvenIfAnotherOneWasAskedForSince)
{
    comgui::TicketAddress const job = Job("poster.pdf");
    Await(job, "poster.pdf");
    comgui::TicketAddress const another = Job("book.pdf");
    Await(another, "book.pdf");
    ASSERT_TRUE(tickets.Write(job, "Job/Identification/Name", "flyer.pdf"));
    titles.Take(comgui::TicketChanged{job, {{"Job/Identification/Name", "flyer.pdf"}}, false});
    EXPECT_EQ(Await(job, "flyer.pdf"), "flyer.pdf");
    EXPECT_EQ(titles.TitleOf(another), "book.pdf");
}

TEST_F(TitlesOfTickets, OfATicketWithoutAName_AreEmpty)
{
    comgui::TicketAddress const job = NewTicket();
    for (int tries = 0; told == 0 && tries < 2000; ++tries)
    {
        EXPECT_EQ(titles.TitleOf(job), "");
        titles.Read();
        queue.RunFor(2ms);
    }
    EXPECT_GE(told, 1);
}

TEST_F(TitlesOfTickets, OfADeletedTicket_AreForgotten)
{
    comgui::TicketAddress const job = Job("poster.pdf");
    Await(job, "poster.pdf");
    titles.Take(comgui::TicketDeleted{job});
    EXPECT_EQ(titles.TitleOf(job), "");
}

TEST_F(TitlesOfTickets, OfAnotherSession_AreRead)
{
    comgui::TicketAddress const job = Job("poster.pdf");
    Await(job, "poster.pdf");
    titles.Clear();
    EXPECT_EQ(titles.TitleOf(job), "");
    EXPECT_EQ(Await(job, "poster.pdf"), "poster.pdf");
}
