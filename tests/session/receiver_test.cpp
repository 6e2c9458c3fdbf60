// The thread that takes notifications off the queue and publishes them.
#include "tests/session/Receiver.h"

#include <atomic>
#include <chrono>
#include <gmock/gmock.h>
#include <stdexcept>
#include <thread>

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

namespace
{
class RemoteEndPoint : public Receiver
{
protected:
    static void QueueEndPoint(char const* text, char const* key = "Job/Identification/RemoteEndpoint")
    {
        Queue(1, 3, key, text);
    }
};
}  // namespace

TEST_F(Receiver, Notifications_ArePublishedInTheOrderOfTheQueue)
{
    Queue(4, 3, "first");
    Queue(1, 17, "second");
    Queue(5, 3, "third");
    Run();
    WaitUntilHandled();
    EXPECT_THAT(EventIds(), ElementsAre(1000002, 1000014, 1000003));
    EXPECT_EQ(Events()[1].key, "second");
}

TEST_F(Receiver, NotificationWithoutAnEvent_LeavesTheQueueUnpublished)
{
    Queue(1, 1);
    Queue(4, 5);
    Queue(2, 2);
    Run();
    WaitUntilHandled();
    EXPECT_THAT(Events(), IsEmpty());
    EXPECT_EQ(Size(), 0u);
}

TEST_F(Receiver, Handler_RunsUnderTheLockOfTheQueue)
{
    std::atomic<bool> locked = false;
    onEvent = [&](NotifData const&)
    {
        // A critical section lets its own thread in again, so another one has to ask.
        bool entered = false;
        std::thread asker(
            [&]
            {
                entered = ComGUIManager::m_csNotificationList.TryEnter();
                if (entered)
                    ComGUIManager::m_csNotificationList.Leave();
            });
        asker.join();
        locked = !entered;
    };
    Queue(4, 3);
    Run();
    WaitUntilHandled();
    EXPECT_TRUE(locked);
}

TEST_F(Receiver, OnePass_HandlesOneNotificationAndTakes2Milliseconds)
{
    constexpr int Count = 50;
    for (int i = 0; i < Count; ++i)
        Queue(4, 3);
    auto const start = std::chrono::steady_clock::now();
    Run();
    WaitUntilHandled();
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(2 * Count));
}

TEST_F(RemoteEndPoint, OwnEndPointInAnotherLetterCase_IsTheClientsOwnEvent)
{
    QueueEndPoint("hOST.lOCAL:50006");
    Run();
    WaitUntilHandled();
    EXPECT_THAT(EventIds(), ElementsAre(1000101));
}

TEST_F(RemoteEndPoint, EndPointOfAnother_IsNotPublished)
{
    QueueEndPoint("other.local:50006");
    QueueEndPoint("");
    Run();
    WaitUntilHandled();
    EXPECT_THAT(Events(), IsEmpty());
    EXPECT_EQ(Size(), 0u);
}

TEST_F(RemoteEndPoint, KeyInAnotherLetterCase_IsAnOrdinaryJobParameter)
{
    QueueEndPoint(EndPoint, "job/identification/remoteendpoint");
    QueueEndPoint(EndPoint, "Job/State");
    Run();
    WaitUntilHandled();
    EXPECT_THAT(EventIds(), ElementsAre(1000004, 1000004));
}

TEST_F(RemoteEndPoint, OfTheFirstThread_CountsForAllThatFollow_ByDesign)
{
    Run();
    WaitUntilHandled();
    ShutDown();
    SetEndPoint("new.local:50007");
    QueueEndPoint("new.local:50007");
    QueueEndPoint(EndPoint);
    Run();
    WaitUntilHandled();
    EXPECT_THAT(EventIds(), ElementsAre(1000101));
}

TEST_F(Receiver, Kind0_StaysInHandUntilTheNextOneTakesItsPlace_ByDesign)
{
    auto* const lost = new NotifData(nullptr, 0, 0, 0, 3, 0, nullptr);
    Queue(lost);
    Run();
    WaitUntilHandled();
    EXPECT_THAT(Events(), IsEmpty());
    EXPECT_EQ(lost->NotifCode, 3);  // neither published nor freed
    ShutDown();
    delete lost;
}

TEST_F(Receiver, ShutDown_LeavesWhatIsQueuedAndTellsOnStdout)
{
    testing::internal::CaptureStdout();
    Run();
    WaitUntilHandled();
    ShutDown();
    Queue(4, 3);
    EXPECT_EQ(Size(), 1u);
    EXPECT_EQ(testing::internal::GetCapturedStdout(),
              "\nReceiverThread Stopped!\n\nOnExit:: ReceiverThread Stopped!\n");
}

TEST_F(Receiver, ThreadThatIsShutDownBeforeItRuns_HandlesNothing)
{
    ReceiverThread thread;
    EXPECT_TRUE(thread.ShutDown());
    EXPECT_TRUE(thread.ShutDown());  // not only the first time
    Queue(4, 3);
    testing::internal::CaptureStdout();
    EXPECT_EQ(thread.Entry(), nullptr);
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "\nReceiverThread Stopped!\n");
    EXPECT_EQ(Size(), 1u);
}

TEST_F(Receiver, OnExit_StopsTheThreadToo)
{
    ReceiverThread thread;
    testing::internal::CaptureStdout();
    thread.OnExit();
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "\nOnExit:: ReceiverThread Stopped!\n");
    testing::internal::CaptureStdout();
    EXPECT_EQ(thread.Entry(), nullptr);
    testing::internal::GetCapturedStdout();
}

TEST_F(Receiver, Delete_EndsTheThreadWithoutTheMessageOfShutDown)
{
    testing::internal::CaptureStdout();
    Run();
    WaitUntilHandled();
    Delete();
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "\nOnExit:: ReceiverThread Stopped!\n");
}

TEST_F(Receiver, ExceptionOfAHandler_IsToldAndTheNotificationComesAgain)
{
    std::atomic<int> calls = 0;
    onEvent = [&](NotifData const&)
    {
        if (++calls < 3)
            throw std::runtime_error("a handler's");
    };
    Queue(4, 3, "again");
    testing::internal::CaptureStdout();
    Run();
    while (calls < 3)
        std::this_thread::yield();
    WaitUntilHandled();
    ShutDown();
    EXPECT_THAT(EventIds(), ElementsAre(1000002, 1000002, 1000002));
    std::string const said = testing::internal::GetCapturedStdout();
    EXPECT_THAT(said, testing::StartsWith("\nUnhandled Exception found in ReceiverThread..."
                                          "\nUnhandled Exception found in ReceiverThread..."));
    EXPECT_THAT(said, testing::Not(HasSubstr("ReceiverThread...\n\nUnhandled")));
}

TEST_F(Receiver, ExceptionOfAHandler_LosesItsNotificationToTheNextInTheQueue_ByDesign)
{
    auto* const lost = new NotifData(nullptr, 4, 0, 0, 3, 0, nullptr);
    onEvent = [&](NotifData const& data)
    {
        if (&data == lost)
            throw std::runtime_error("a handler's");
    };
    Queue(lost);
    Queue(5, 3);
    testing::internal::CaptureStdout();
    Run();
    WaitUntilHandled();
    ShutDown();
    testing::internal::GetCapturedStdout();
    EXPECT_THAT(EventIds(), ElementsAre(1000002, 1000003));
    EXPECT_EQ(lost->NotifKind, 4);  // never freed
    delete lost;
}
