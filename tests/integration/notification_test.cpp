// The whole road of a change: a write through one session, the plug-in's thread, the library's queue, the
// receiver's event.
#include "tests/integration/Host.h"

#include "tests/support/Notifications.h"
#include <chrono>
#include <condition_variable>
#include <future>
#include <mutex>
#include <thread>
#include <vector>
#include <wx/init.h>

namespace
{
// Tells when it is gone: a detached thread cannot be joined.
class RECEIVER : public ReceiverThread
{
public:
    explicit RECEIVER(std::promise<void>& gone) : m_gone(gone) {}
    ~RECEIVER() override { m_gone.set_value(); }

private:
    std::promise<void>& m_gone;
};

class Notification : public Host
{
protected:
    Notification() : writer(Record())
    {
        EXPECT_EQ(LogIn(), 0);
        EXPECT_EQ(Manager().InitializeBackward(&writer, 1), 0);
        EXPECT_EQ(Manager().LoginBackward(&writer), 0);
        container = Manager().GetBackwardContainer();
        writer.iGUINotificationID = -1;
    }

    ~Notification() override
    {
        Manager().LogoutBackward(&writer);
        TakeNotifications();
    }

    // Waits until that many have come.
    static std::vector<std::unique_ptr<NotifData>> Take(std::size_t count)
    {
        std::vector<std::unique_ptr<NotifData>> all;
        auto const end = std::chrono::steady_clock::now() + std::chrono::minutes(2);
        while (all.size() < count && std::chrono::steady_clock::now() < end)
        {
            for (auto& notification : TakeNotifications())
                all.push_back(std::move(notification));
            std::this_thread::yield();
        }
        EXPECT_EQ(all.size(), count);
        return all;
    }

    // Waits until the queue has one, and leaves it there.
    static void WaitForOne()
    {
        auto const end = std::chrono::steady_clock::now() + std::chrono::minutes(2);
        bool isThere = false;
        while (!isThere && std::chrono::steady_clock::now() < end)
        {
            std::this_thread::yield();
            wxCriticalSectionLocker const lock(ComGUIManager::m_csNotificationList);
            isThere = !ComGUIManager::m_notificationList.empty();
        }
        EXPECT_TRUE(isThere);
    }

    // The Backward session's record is the one whose id a test can see.
    void Listen(int type, std::vector<char const*> keys = {})
    {
        keys.push_back(nullptr);
        ASSERT_EQ(Manager().SetCallback(&writer, this), 0);
        ASSERT_GT(writer.iGUINotificationID, 0);
        ASSERT_EQ(Manager().EnableNotifications(&writer, type, keys.data()), 0);
    }

    TLogin writer;
    MTICKET_ACCESS const* container = nullptr;
};
}  // namespace

TEST_F(Notification, OfAWrite_ArrivesInTheQueueWithItsValue)
{
    Listen(3, {"Test/*"});
    Manager().SetParameter(3, 1, "Other", PARAM_STRING, "nobody asked", -1);
    Manager().SetParameter(3, 1, "Test/Text", PARAM_STRING,
                           "Gr\xC3\xBC\xC3\x9F"
                           "e",
                           -1);
    WriteInt("Test/Number", -5);
    auto const all = Take(2);
    ASSERT_EQ(all.size(), 2u);
    EXPECT_EQ(all[0]->pUser, this);
    EXPECT_EQ(all[0]->NotifKind, 1);
    EXPECT_EQ(all[0]->NotifArgA, 1);
    EXPECT_EQ(all[0]->NotifArgB, writer.iGUINotificationID);
    EXPECT_EQ(all[0]->NotifCode, 3);
    EXPECT_EQ(all[0]->NotifKey, "Test/Text");
    EXPECT_EQ(all[0]->NotifValueType, PARAM_STRING);
    EXPECT_EQ(all[0]->NotifText, wxString::FromUTF8("Gr\xC3\xBC\xC3\x9F"
                                                    "e"));
    EXPECT_EQ(all[0]->NotifPos, -1);
    EXPECT_EQ(all[1]->NotifKey, "Test/Number");
    EXPECT_EQ(all[1]->NotifNumber, -5.0);
}

TEST_F(Notification, LeftInTheQueueAtTheLogout_IsThereForTheNextSession_ByDesign)
{
    Listen(3, {"Test/*"});
    int const id = writer.iGUINotificationID;
    WriteInt("Test/Number", 1);
    WaitForOne();
    Manager().DisableNotifications(&writer, 3);
    Manager().LogoutBackward(&writer);

    ASSERT_EQ(Manager().InitializeBackward(&writer, 1), 0);
    ASSERT_EQ(Manager().LoginBackward(&writer), 0);
    Listen(3);
    auto const all = TakeNotifications();
    ASSERT_EQ(all.size(), 1u);
    EXPECT_EQ(all[0]->NotifArgB, id);
    EXPECT_NE(writer.iGUINotificationID, id);  // so a host can tell
}

TEST_F(Notification, OfAVector_IsOneForItsKey)
{
    Listen(3);
    int const number = 7;
    SETMULTIPAR table[] = {{"A", PARAM_INT, 0, &number, -1, false, {}},
                           {"B", PARAM_INT, 0, &number, -1, false, {}},
                           {"A", PARAM_INT, 0, &number, 1, false, {}},
                           {}};
    ASSERT_EQ(container->MSETMULTIPAR(container->Instance, 3, 1, table), 1);
    auto const all = Take(2);
    ASSERT_EQ(all.size(), 2u);
    EXPECT_EQ(all[0]->NotifKey, "A");
    EXPECT_EQ(all[0]->NotifValueType, PARAM_COUNT);
    EXPECT_EQ(all[1]->NotifKey, "B");
    EXPECT_EQ(all[1]->NotifValueType, PARAM_INT);
}

TEST_F(Notification, OfANewJob_ReachesTheHostsEventHandlers)
{
    Listen(3);
    std::mutex lock;
    std::condition_variable came;
    std::vector<int> events;
    auto const token = CEventManager::GetInstance()->Subscribe(
        [&](wxEvent& event)
        {
            std::lock_guard const guard(lock);
            events.push_back(event.GetId());
            came.notify_all();
        });
    wxInitializer const wx;  // threads need it
    std::promise<void> gone;
    auto* const receiver = new RECEIVER(gone);
    ASSERT_EQ(receiver->Run(), wxTHREAD_NO_ERROR);
    int const id = MTICKET_ADMIN::Of(container)->CreateNextTicket(3);
    EXPECT_GT(id, 0);
    EXPECT_EQ(Manager().SetParameter(3, id, "Job/Name", PARAM_STRING, "A4", -1), 1);
    EXPECT_EQ(Manager().DeleteTicketOfType(3, id), 1);
    {
        std::unique_lock guard(lock);
        came.wait_for(guard, std::chrono::minutes(2), [&] { return events.size() >= 3; });
        EXPECT_EQ(events, (std::vector{1000002, 1000004, 1000003}));
    }
    receiver->ShutDown();
    gone.get_future().wait();
    CEventManager::GetInstance()->Unsubscribe(token);
}

TEST_F(Notification, SetAgain_EndsTheOneBefore)
{
    Listen(3);
    int const before = writer.iGUINotificationID;
    Listen(7);
    EXPECT_GT(writer.iGUINotificationID, before);
    WriteInt("K", 1);
    Manager().SetParameter(7, 1, "K", PARAM_STRING, "x", -1);
    auto const all = Take(1);
    ASSERT_EQ(all.size(), 1u);
    EXPECT_EQ(all[0]->NotifCode, 7);
}

TEST_F(Notification, SwitchedOff_ComesNoMore)
{
    Listen(3);
    EXPECT_EQ(Manager().DisableNotifications(&writer, 3), 0);
    WriteInt("K", 1);
    char const* const every[] = {nullptr};
    Manager().EnableNotifications(&writer, 7, every);
    Manager().SetParameter(7, 1, "K", PARAM_STRING, "x", -1);
    auto const all = Take(1);
    ASSERT_EQ(all.size(), 1u);
    EXPECT_EQ(all[0]->NotifCode, 7);
}

TEST_F(Notification, OfTheImplicitSession_IsNotEnabledByItsRecordsId0_ByDesign)
{
    ASSERT_EQ(Manager().SetCallback(this), 0);
    char const* const every[] = {nullptr};
    EXPECT_EQ(Manager().EnableNotifications(nullptr, 3, every), 0);  // id 0 is nobody's
    WriteInt("K", 1);
    Listen(7);
    Manager().SetParameter(7, 1, "K", PARAM_STRING, "x", -1);
    auto const all = Take(1);
    ASSERT_EQ(all.size(), 1u);
    EXPECT_EQ(all[0]->NotifCode, 7);
}
