// The whole window while tickets, jobs and the server change.
#include "tests/desk/WindowOfTheDesk.h"

#include "desk/view/InkBars.h"
#include "desk/view/JobsPane.h"

using namespace desk;

using TheDeskFollows = WindowOfTheDesk;

TEST_F(TheDeskFollows, TheNamesOfQueues_BeforeAnybodyLooksAtThem)
{
    Enter();
    comgui::TicketAddress const job = NewTicket();
    ASSERT_TRUE(tickets.Write(job, "Job/Identification/Name", "poster.pdf"));
    ShowJob(job);
    ASSERT_TRUE(Await([&] { return shown.RowOf(1, "poster.pdf").has_value(); }));  // read behind the queues
    std::vector<JobQueue> const queues = Find<JobsPane>("jobs pane")->queues();
    ASSERT_FALSE(queues.empty());
    for (JobQueue const& queue : queues)
        EXPECT_EQ(queue.name,
                  tickets.ReadAs<std::string>({comgui::QueueTickets, queue.id}, "Queue/Name").ValueOr("?"));
}
