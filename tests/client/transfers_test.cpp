// Jobs and files on their way.
#include "tests/client/Client.h"

#include "tests/client/NoThreads.h"
#include "tests/support/Files.h"
#include <chrono>
#include <filesystem>
#include <fstream>
#include <gmock/gmock.h>
#include <thread>

using namespace comgui;
using namespace std::chrono_literals;
namespace fs = std::filesystem;
using testing::AnyOf;
using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
class TransfersOfAClient : public Client
{
protected:
    TransfersOfAClient() { LogIn(); }

    // Some tenths of a second on its way.
    std::string LargeFile() const
    {
        std::ofstream file(folder / "large", std::ios::binary);
        std::string const block(1 << 20, 'x');
        for (long long written = 0; written < LargeSize; written += 1 << 20)
            file << block;
        return (folder / "large").string();
    }

    fs::path Site(char const* rest) const { return site.Folder() / rest; }

    template <typename IsThere>
    static void Await(Transfer const& transfer, IsThere const& isThere)
    {
        for (auto const end = Clock::now() + 20s; !isThere() && !transfer.IsOver() && Clock::now() < end;)
            std::this_thread::sleep_for(1ms);
    }

    static constexpr long long LargeSize = 512LL << 20;
    using Clock = std::chrono::steady_clock;
    Transfers const transfers = connection.GetTransfers();
};
}  // namespace

TEST_F(TransfersOfAClient, Job_ArrivesWithItsTicket)
{
    auto const file = folder.Write("page.pdf", "content");
    auto const transfer = transfers.SendJob(file.string(), {"name.pdf", std::nullopt, 3});
    ASSERT_TRUE(transfer.Wait());
    ASSERT_TRUE(transfer.Job());
    TicketAddress const job{JobTickets, *transfer.Job()};
    EXPECT_EQ(*tickets.ReadAs<int>(job, "Job/Copies"), 3);
    EXPECT_EQ(*tickets.ReadAs<int>(job, "Job/State"), 1);
    EXPECT_EQ(ContentOf(*tickets.ReadAs<std::string>(job, "Job/File")), "content");
    EXPECT_EQ(transfer.Progress().done, 7);
    EXPECT_EQ(transfer.Progress().total, 7);
    EXPECT_EQ(*tickets.ReadAs<std::string>(job, "Job/Identification/RemoteEndpoint"),
              connection.LocalEndPoint());
}

TEST_F(TransfersOfAClient, Files_GoThereAndBack)
{
    auto const file = folder.Write("here", "to and fro");
    ASSERT_TRUE(transfers.Put(file.string(), "$(TEMP)/there").Wait());
    EXPECT_EQ(ContentOf(Site("temp/there")), "to and fro");
    ASSERT_TRUE(transfers.Get("$(TEMP)/there", (folder / "back").string()).Wait());
    EXPECT_EQ(ContentOf(folder / "back"), "to and fro");
}

TEST_F(TransfersOfAClient, Failure_HasCodeFileAndReason)
{
    auto const before = *tickets.List(JobTickets);
    testing::internal::CaptureStderr();
    auto const missing = transfers.Put((folder / "missing").string(), "$(TEMP)/x").Wait();
    testing::internal::GetCapturedStderr();
    ASSERT_EQ(CodeOf(missing), 113);
    EXPECT_EQ(missing.GetError().about, (folder / "missing").string());
    EXPECT_NE(missing.GetError().reason, "");
    testing::internal::CaptureStderr();
    EXPECT_EQ(CodeOf(transfers.SendJob(folder.Write("empty", "").string()).Wait()), 117);
    EXPECT_EQ(CodeOf(transfers.Put(folder.Write("a", "b").string(), "$(NOWHERE)/x").Wait()), 115);
    testing::internal::GetCapturedStderr();
    EXPECT_EQ(*tickets.List(JobTickets), before);
}

TEST_F(TransfersOfAClient, WithoutThreads_Fail_AndDoNotRunLater)
{
    auto const file = folder.Write("here", "content").string();
    {
        NoThreads const none;
        EXPECT_EQ(CodeOf(transfers.Put(file, "$(TEMP)/refused").Wait()), OutOfMemory);
    }
    EXPECT_TRUE(transfers.Put(file, "$(TEMP)/later").Wait());
    EXPECT_THAT(NamesIn(Site("temp")), ElementsAre("later"));
}

TEST_F(TransfersOfAClient, QuickFetch_EndsWithTheSizeOfItsFile)
{
    auto const file = folder.Write("here", std::string(100000, 'x')).string();
    ASSERT_TRUE(transfers.Put(file, "$(TEMP)/there").Wait());
    auto const get = transfers.Get("$(TEMP)/there", (folder / "back").string());
    ASSERT_TRUE(get.Wait());
    EXPECT_EQ(get.Progress().done, 100000);
    EXPECT_EQ(get.Progress().total, 100000);
}

TEST_F(TransfersOfAClient, JobForAQueueThatIsNotThere_IsAFailure)
{
    auto const before = *tickets.List(JobTickets);
    auto const file = folder.Write("page.pdf", "content").string();
    auto const outcome = transfers.SendJob(file, {"", 77, std::nullopt}).Wait();
    ASSERT_EQ(CodeOf(outcome), NoSuchTicket);
    EXPECT_EQ(outcome.GetError().about, "7/77");
    EXPECT_EQ(CodeOf(transfers.SendJob(file, {"", std::nullopt, 0}).Wait()), OutOfRange);
    EXPECT_EQ(CodeOf(transfers.SendJob(file, {"", std::nullopt, -3}).Wait()), OutOfRange);
    EXPECT_EQ(*tickets.List(JobTickets), before);
}

TEST_F(TransfersOfAClient, JobForAQueue_ArrivesInIt)
{
    TicketAddress const queue = NewTicket(QueueTickets);
    auto const file = folder.Write("page.pdf", "content").string();
    EXPECT_TRUE(transfers.SendJob(file, {"", queue.id, 1}).Wait());
}

TEST_F(TransfersOfAClient, Progress_NeverGoesBack_AndOtherCallsGoOn)
{
    auto const transfer = transfers.Put(LargeFile(), "$(TEMP)/large");
    EXPECT_EQ(transfer.Progress().total, LargeSize);
    for (long long done = 0; !transfer.IsOver(); done = transfer.Progress().done)
    {
        EXPECT_GE(transfer.Progress().done, done);
        EXPECT_EQ(*tickets.ReadAs<int>(System, "System/MasterSOAPPort"), 50000);
        EXPECT_TRUE(tickets.Write(System, "System/Test", 1));
    }
    EXPECT_TRUE(transfer.Wait());
    EXPECT_EQ(transfer.Progress().done, LargeSize);
}

TEST_F(TransfersOfAClient, CancelledJob_LeavesNothing)
{
    std::string const large = LargeFile();
    auto const before = *tickets.List(JobTickets);
    int cancelled = 0;
    for (int tries = 0; cancelled < 2 && tries < 30; ++tries)
    {
        auto job = transfers.SendJob(large);
        Await(job, [&job] { return job.Job().has_value(); });
        auto const start = Clock::now();
        job.Cancel();
        if (job.Wait())
        {
            ASSERT_TRUE(tickets.Delete({JobTickets, *job.Job()}));  // it was faster
            continue;
        }
        EXPECT_EQ(CodeOf(job.Wait()), Cancelled);
        EXPECT_LT(Clock::now() - start, 5s);  // a tenth of a second on a machine that is not busy
        EXPECT_FALSE(job.Job());
        EXPECT_EQ(*tickets.List(JobTickets), before);
        ++cancelled;
    }
    EXPECT_EQ(cancelled, 2);
}

TEST_F(TransfersOfAClient, CancelledFile_LeavesWhatWasThere)
{
    std::string const large = LargeFile();
    auto const target = Site("temp/large");
    ASSERT_TRUE(transfers.Put(folder.Write("small", "before").string(), "$(TEMP)/large").Wait());
    int cancelled = 0;
    for (int tries = 0; cancelled < 2 && tries < 30; ++tries)
    {
        auto put = transfers.Put(large, "$(TEMP)/large");
        Await(put, [this] { return NamesIn(Site("temp")).size() > 1; });
        put.Cancel();
        Outcome const outcome = put.Wait();
        EXPECT_EQ(NamesIn(Site("temp")).size(), 1u);
        if (outcome)
            fs::copy_file(folder / "small", target, fs::copy_options::overwrite_existing);
        else
            ++cancelled;
        EXPECT_EQ(fs::file_size(target), 6u);
    }
    EXPECT_EQ(cancelled, 2);
}

TEST_F(TransfersOfAClient, BeyondFour_Wait_AndCanBeCancelledToo)
{
    std::string const large = LargeFile();
    std::vector<Transfer> all;
    for (int i = 0; i < 6; ++i)
        all.push_back(transfers.Put(large, "$(TEMP)/" + std::to_string(i)));
    auto const running = transfers.Running();
    ASSERT_EQ(running.size(), 6u);
    EXPECT_EQ(running[0].Number(), all[0].Number());
    all[5].Cancel();
    EXPECT_EQ(CodeOf(*all[5].WaitFor(0ms)), Cancelled);
    for (Transfer const& each : transfers.Running())
        EXPECT_NE(each.Number(), all[5].Number());
    EXPECT_TRUE(connection.LogOut());
    for (Transfer const& each : all)
        EXPECT_TRUE(each.IsOver());
    EXPECT_EQ(CodeOf(all[4].Wait()), Cancelled);
    EXPECT_THAT(transfers.Running(), IsEmpty());
    EXPECT_FALSE(fs::exists(Site("temp/4")));
}

// Also one that a worker takes up in the very moment of the logout.
TEST_F(TransfersOfAClient, AtALogout_AreDoneOrCancelled)
{
    std::string const small = folder.Write("small", "x").string();
    for (int round = 0; round < 20; ++round)
    {
        std::vector<Transfer> all;
        for (int i = 0; i < 40; ++i)
            all.push_back(transfers.Put(small, "$(TEMP)/" + std::to_string(i)));
        (void)all[static_cast<std::size_t>(round)].Wait();
        ASSERT_TRUE(connection.LogOut());
        for (Transfer const& each : all)
            EXPECT_THAT(CodeOf(each.Wait()), AnyOf(0, Cancelled));
        LogIn();
    }
}

TEST_F(TransfersOfAClient, AreEvents)
{
    TaskQueue queue;
    std::vector<std::string> heard;
    int number = 0;
    auto const subscription =
        connection.Subscribe(Interest::InTransfers(), queue.GetExecutor(),
                             [&](Event const& event)
                             {
                                 if (auto const* const ended = std::get_if<TransferEnded>(&event))
                                 {
                                     heard.push_back(ended->outcome ? "good" : "bad");
                                     number = ended->transfer;
                                     queue.Stop();
                                 }
                             });
    auto const transfer = transfers.Put(folder.Write("a", "b").string(), "$(TEMP)/a");
    queue.RunFor(20s);
    EXPECT_THAT(heard, ElementsAre("good"));
    EXPECT_EQ(number, transfer.Number());
}

TEST_F(TransfersOfAClient, Handle_OutlivesTheConnection)
{
    auto other = std::make_unique<Connection>();
    ASSERT_TRUE(other->LogIn(Here(), Admin()));
    auto const left = other->GetTransfers();
    std::vector<Transfer> all;
    for (int i = 0; i < 5; ++i)
        all.push_back(left.Put(LargeFile(), "$(TEMP)/a"));
    other.reset();
    EXPECT_EQ(CodeOf(all.back().Wait()), Cancelled);
    EXPECT_EQ(CodeOf(left.Put("/etc/hostname", "$(TEMP)/x").Wait()), NotLoggedIn);
}
