#include "desk/model/JobBoard.h"

#include <cmath>
#include <comgui/client/Connection.h>
#include <gtest/gtest.h>

using namespace desk;
using comgui::Value;
using std::chrono::seconds;
using Change = JobBoard::Change;

namespace
{
comgui::TransferProgressed Progressed(int transfer, long long done, std::optional<long long> total,
                                      double rate = 0, std::optional<seconds> rest = {})
{
    return {transfer, {done, total, rate, rest}};
}

comgui::Snapshot Ticket(int state, std::string name, std::optional<int> progress = {})
{
    std::vector<comgui::SnapshotEntry> entries{{"Job/State", state},
                                               {"Job/Identification/Name", std::move(name)}};
    if (progress)
        entries.push_back({"Job/Progress", *progress});
    return comgui::Snapshot(std::move(entries));
}

class Board : public testing::Test
{
protected:
    JobRow const& Last() const { return board.At(board.Count() - 1); }
    JobBoard board;
};
}  // namespace

TEST_F(Board, ATransferWaitsIsSentAndArrives)
{
    EXPECT_EQ(board.Add(7, "poster.pdf"), Change::Rows);
    EXPECT_EQ(Last().name, "poster.pdf");
    EXPECT_EQ(Last().state, JobState::Waiting);
    EXPECT_FALSE(Last().percent);
    EXPECT_TRUE(Last().IsCancellable());

    EXPECT_EQ(board.Take(Progressed(7, 250, 1000, 50, seconds(15)), 1), Change::Row);
    EXPECT_EQ(Last().state, JobState::Sending);
    EXPECT_EQ(Last().percent, 25);
    EXPECT_EQ(Last().progress.rate, 50);
    EXPECT_EQ(Last().progress.rest, seconds(15));

    EXPECT_EQ(board.Take(comgui::TransferEnded{7, {}, 12}, 2), Change::Row);
    EXPECT_EQ(Last().state, JobState::Arrived);
    EXPECT_EQ(Last().percent, 100);
    EXPECT_EQ(Last().progress.done, 1000);
    EXPECT_EQ(Last().progress.rate, 0);
    EXPECT_FALSE(Last().progress.rest);
    EXPECT_EQ(Last().job, 12);
    EXPECT_FALSE(Last().IsCancellable());
}

TEST_F(Board, AFailureKeepsItsReasonAndACancelIsNone)
{
    board.Add(1, "a");
    board.Add(2, "b");
    board.Take(comgui::TransferEnded{1, comgui::Error{116, "a", "disk full"}, {}}, 1);
    board.Take(comgui::TransferEnded{2, comgui::Error{comgui::Cancelled, "b", ""}, {}}, 1);
    EXPECT_EQ(board.At(0).state, JobState::Failed);
    EXPECT_EQ(board.At(0).error.reason, "disk full");
    EXPECT_EQ(board.At(1).state, JobState::Cancelled);
}

TEST_F(Board, NothingHappensToATransferThatIsOverOrUnknown)
{
    board.Add(1, "a");
    board.Take(comgui::TransferEnded{1, {}, {}}, 1);
    EXPECT_EQ(board.Take(Progressed(1, 1, 2), 2), Change::None);
    EXPECT_EQ(board.Take(comgui::TransferEnded{1, comgui::Error{1, "", ""}, {}}, 2), Change::None);
    EXPECT_EQ(board.Take(Progressed(99, 1, 2), 2), Change::None);
    EXPECT_EQ(board.Add(1, "again"), Change::None);
    EXPECT_EQ(Last().state, JobState::Arrived);
    EXPECT_EQ(board.Count(), 1U);
}

TEST_F(Board, SenselessProgressIsTamed)
{
    board.Add(1, "a");
    board.Take(Progressed(1, -5, 100, std::nan(""), seconds(-3)), 1);
    EXPECT_EQ(Last().progress.done, 0);
    EXPECT_EQ(Last().progress.rate, 0);
    EXPECT_FALSE(Last().progress.rest);
    board.Take(Progressed(1, 300, 100), 2);
    EXPECT_FALSE(Last().progress.total);
    EXPECT_FALSE(Last().percent);
    board.Take(Progressed(1, 0, 0), 3);
    EXPECT_FALSE(Last().percent);
    constexpr auto Most = std::numeric_limits<long long>::max();
    board.Take(Progressed(1, Most, Most), 4);
    EXPECT_EQ(Last().percent, 100);
    board.Take(Progressed(1, 999, 1000), 5);
    EXPECT_EQ(Last().percent, 99);
}

TEST_F(Board, HistoryIsKeptForAPlot)
{
    board.Add(1, "a");
    for (int i = 1; i <= 10; ++i)
        board.Take(Progressed(1, i * 10, 100, i * 5), i);
    EXPECT_EQ(Last().rates.Points().size(), 10U);
    EXPECT_EQ(Last().rates.Highest(), 50);
    EXPECT_EQ(Last().percents.Last(), 100);
}

TEST_F(Board, AHandleIsTakenAsFarAsItIs)
{
    comgui::Connection const connection;
    comgui::Transfer const transfer = connection.GetTransfers().SendJob("/no/such/folder/page.pdf");
    ASSERT_FALSE(transfer.Wait());
    EXPECT_EQ(board.Add(transfer, 1), Change::Rows);
    EXPECT_EQ(Last().transfer, transfer.Number());
    EXPECT_EQ(Last().name, "page.pdf");
    EXPECT_EQ(Last().state, JobState::Failed);
    EXPECT_EQ(Last().error.code, transfer.Wait().GetError().code);
}

TEST_F(Board, AJobOfOthersIsKnownByItsTicket)
{
    EXPECT_EQ(board.TakeJob(4, Ticket(0, "flyer.pdf"), 1), Change::Rows);
    EXPECT_EQ(Last().state, JobState::Waiting);
    EXPECT_EQ(Last().name, "flyer.pdf");
    EXPECT_FALSE(Last().IsCancellable());
    EXPECT_EQ(board.TakeJob(4, {"Job/Progress", Value(30)}, 2), Change::Row);
    EXPECT_EQ(Last().state, JobState::Sending);
    EXPECT_EQ(Last().percent, 30);
    EXPECT_EQ(board.TakeJob(4, {"Job/Progress", Value(30)}, 3), Change::None);
    EXPECT_EQ(board.TakeJob(4, {"Job/State", Value(1)}, 4), Change::Row);
    EXPECT_EQ(Last().state, JobState::Arrived);
    EXPECT_EQ(Last().percent, 100);
    EXPECT_EQ(Last().percents.Points().size(), 2U);
    EXPECT_EQ(board.RemoveJob(4), Change::Rows);
    EXPECT_EQ(board.Count(), 0U);
    EXPECT_EQ(board.RemoveJob(4), Change::None);
}

TEST_F(Board, ValuesOfATicketThatMakeNoSenseAreAsIfTheyWereNotThere)
{
    board.TakeJob(4, Ticket(0, "flyer.pdf", 30), 1);
    for (Value const& bad : {Value("60"), Value(-1), Value(comgui::MakeList<int>({60})), Value(60.5), Value(),
                             Value(std::nan("")), Value(comgui::Bytes{"60"}), Value(1ULL << 40)})
        for (char const* const key : {"Job/Progress", "Job/State"})
            EXPECT_EQ(board.TakeJob(4, {key, bad}, 2), Change::None) << key << comgui::ToText(bad);
    EXPECT_EQ(board.TakeJob(4, {"Job/Identification/Name", Value(3)}, 2), Change::None);
    EXPECT_EQ(board.TakeJob(4, {"Job/Progress", std::nullopt}, 2), Change::None);
    EXPECT_EQ(board.TakeJob(5, {"Job/Copies", Value(3)}, 2), Change::None);
    EXPECT_EQ(board.TakeJob(4, {"Job/Progress", Value(1000)}, 2), Change::Row);
    EXPECT_EQ(Last().percent, 100);
    EXPECT_EQ(Last().state, JobState::Sending);
    EXPECT_EQ(board.Count(), 1U);
}

TEST_F(Board, AJobAndItsTransferAreOneRow)
{
    board.Add(1, "a.pdf");
    board.TakeJob(9, Ticket(0, "a.pdf"), 1);
    EXPECT_EQ(board.Count(), 2U);
    EXPECT_EQ(board.Identify(1, 9), Change::Rows);
    EXPECT_EQ(board.Count(), 1U);
    EXPECT_EQ(board.Identify(1, 9), Change::None);
    // The transfer knows better than the ticket how far it is; the name is the server's.
    EXPECT_EQ(board.TakeJob(9, {"Job/Progress", Value(80)}, 2), Change::None);
    EXPECT_EQ(board.TakeJob(9, {"Job/Identification/Name", Value("b.pdf")}, 2), Change::Row);
    EXPECT_EQ(Last().name, "b.pdf");
    EXPECT_EQ(board.RemoveJob(9), Change::Row);
    EXPECT_FALSE(Last().job);
    EXPECT_EQ(board.Count(), 1U);
}

TEST_F(Board, TheEndOfATransferTakesTheRowOfItsTicket)
{
    board.TakeJob(9, Ticket(0, "a.pdf"), 1);
    board.Add(1, "a.pdf");
    EXPECT_EQ(board.Take(comgui::TransferEnded{1, {}, 9}, 2), Change::Rows);
    ASSERT_EQ(board.Count(), 1U);
    EXPECT_EQ(Last().transfer, 1);
    EXPECT_EQ(Last().job, 9);
}

TEST_F(Board, ARowIsFoundByItsNumberUntilItGoes)
{
    for (int i = 0; i < 5; ++i)
        board.Add(i, std::to_string(i));
    RowNumber const second = board.At(1).number;
    RowNumber const last = board.At(4).number;
    board.Take(comgui::TransferEnded{1, {}, {}}, 1);
    EXPECT_EQ(board.RemoveOver(), Change::Rows);
    EXPECT_EQ(board.RemoveOver(), Change::None);
    EXPECT_EQ(board.Find(second), nullptr);
    EXPECT_EQ(board.IndexOf(last), 3U);
    EXPECT_EQ(board.Find(last)->name, "4");
    EXPECT_EQ(board.Take(Progressed(4, 1, 2), 1), Change::Row);
    EXPECT_EQ(board.At(3).percent, 50);
    board.Clear();
    EXPECT_EQ(board.Find(last), nullptr);
}

TEST(JobBoard, RemovedJob_IsNotBroughtBackByWhatIsToldOfItLater)
{
    JobBoard board;
    comgui::Snapshot const arrived = Ticket(1, "flyer.pdf");
    board.Add(1, "mine");
    board.Take(comgui::TransferEnded{1, {}, 7}, 1);
    board.TakeJob(8, arrived, 1);
    ASSERT_EQ(board.Count(), 2U);
    board.RemoveOver();
    for (int const job : {7, 8})
    {
        EXPECT_EQ(board.TakeJob(job, arrived, 2), Change::None);
        EXPECT_EQ(board.TakeJob(job, {"Job/State", Value(2)}, 2), Change::None);
    }
    EXPECT_EQ(board.Count(), 0U);
    board.RemoveJob(8);
    EXPECT_EQ(board.TakeJob(8, arrived, 3), Change::Rows) << "another job with the same number";
    board.RemoveOver();
    board.Clear();
    EXPECT_EQ(board.TakeJob(8, arrived, 4), Change::Rows) << "another session";
}

TEST(JobBoard, IsBoundedButKeepsWhatIsOnItsWay)
{
    JobBoard board(3);
    for (int i = 0; i < 3; ++i)
        board.Add(i, std::to_string(i));
    board.Take(comgui::TransferEnded{1, {}, {}}, 1);
    board.Add(3, "3");
    ASSERT_EQ(board.Count(), 3U);
    EXPECT_EQ(board.At(1).name, "2");  // "1" was over
    board.Add(4, "4");
    EXPECT_EQ(board.Count(), 4U);  // all are on their way
}

TEST(JobBoard, ALyingServerDoesNotFillIt)
{
    JobBoard board(100);
    board.Add(1, "mine");
    for (int i = 0; i < 100000; ++i)
        board.TakeJob(i, Ticket(0, "job"), i);
    EXPECT_EQ(board.Count(), 100U);
    EXPECT_EQ(board.At(0).name, "mine");
    EXPECT_EQ(board.At(99).job, 99999);
    EXPECT_EQ(board.TakeJob(99950, {"Job/Progress", Value(5)}, 1), Change::Row);
}

TEST_F(Board, ATicketThatTellsNothingMakesNoRow)
{
    EXPECT_EQ(board.TakeJob(1, comgui::Snapshot({{"Job/Copies", 3}}), 0), Change::None);
    EXPECT_EQ(board.Count(), 0U);
    EXPECT_EQ(board.TakeJob(2, Ticket(0, "a"), 0), Change::Rows);
    board.Add(7, "of no job yet");
    EXPECT_EQ(board.Jobs(), std::vector{2});
}
