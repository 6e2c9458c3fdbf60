// What the callback makes of the plug-in's notifications.
#include "tests/session/NotificationQueue.h"
#include "tests/session/ScarceMemory.h"
#include <new>

namespace
{
class Notifications : public NotificationQueue
{
protected:
    std::vector<std::unique_ptr<NotifData>> Notified(int kind, void* data)
    {
        ComGUIManager::fGUI2NOTIFICATION(this, kind, 21, 22, 23, data);
        return TakeNotifications();
    }

    // The only one; a failed test otherwise.
    std::unique_ptr<NotifData> One(int kind, void* data)
    {
        auto all = Notified(kind, data);
        EXPECT_EQ(all.size(), 1u);
        return all.empty() ? std::make_unique<NotifData>(nullptr, 0, 0, 0, 0, 0, nullptr) : std::move(all[0]);
    }

    void ExpectArguments(NotifData const& notification, int kind)
    {
        EXPECT_EQ(notification.pUser, this);
        EXPECT_EQ(notification.NotifKind, kind);
        EXPECT_EQ(notification.NotifArgA, 21);
        EXPECT_EQ(notification.NotifArgB, 22);
        EXPECT_EQ(notification.NotifCode, 23);
    }

    char const keyA[6] = "Key/A";
    char const keyB[6] = "Key/B";
    int const number = -5;
    double const fraction = 2.5;
};

using ParameterChanges = Notifications;
using ScarceNotifications = Notifications;
}  // namespace

TEST_F(Notifications, WithoutARecord_CarriesTheArgumentsAlone)
{
    auto const notification = One(4, nullptr);
    ExpectArguments(*notification, 4);
    EXPECT_EQ(notification->NotifValueType, 0);
    EXPECT_EQ(notification->NotifKey, "");
    EXPECT_EQ(notification->NotifText, "");
}

TEST_F(Notifications, TextRecord_ComesAsTheKey_ByDesign)
{
    SETMULTIPAR record = Record(keyA, PARAM_STRING, "Gr\xC3\xBCn", 3);
    auto const notification = One(4, &record);
    ExpectArguments(*notification, 4);
    EXPECT_EQ(notification->NotifValueType, PARAM_STRING);
    EXPECT_EQ(notification->NotifKey, wxString::FromUTF8("Gr\xC3\xBCn"));
    EXPECT_EQ(notification->NotifText, "");
}

TEST_F(Notifications, TextRecordOfKind7_KeepsItsKey)
{
    SETMULTIPAR record = Record(keyA, PARAM_STRING, "value", 3);
    EXPECT_EQ(One(7, &record)->NotifKey, "Key/A");
}

TEST_F(Notifications, RecordOfAnotherType_CarriesItsKeyAndNoValue)
{
    SETMULTIPAR record = Record(keyA, PARAM_DOUBLE, &fraction, 3);
    auto const notification = One(5, &record);
    NotifData const untouched(nullptr, 0, 0, 0, 0, 0, nullptr);
    EXPECT_EQ(notification->NotifValueType, PARAM_DOUBLE);
    EXPECT_EQ(notification->NotifKey, "Key/A");
    EXPECT_EQ(notification->NotifNumber, untouched.NotifNumber);
    EXPECT_EQ(notification->NotifPos, untouched.NotifPos);
}

TEST_F(Notifications, RecordWithoutAText_LeavesTheKeyEmpty)
{
    SETMULTIPAR text = Record(keyA, PARAM_STRING, nullptr, 3);
    EXPECT_EQ(One(4, &text)->NotifKey, "");
    SETMULTIPAR noKey = Record(nullptr, PARAM_INT, &number, 3);
    EXPECT_EQ(One(4, &noKey)->NotifKey, "");
}

TEST_F(Notifications, OfKind0_AreQueuedLikeTheOthers) { EXPECT_EQ(Notified(0, nullptr).size(), 1u); }

TEST_F(ParameterChanges, WithoutATable_QueueNothing) { EXPECT_TRUE(Notified(1, nullptr).empty()); }

TEST_F(ParameterChanges, EmptyTable_QueuesNothing)
{
    SETMULTIPAR table[1] = {};
    EXPECT_TRUE(Notified(1, table).empty());
}

TEST_F(ParameterChanges, Int_ArrivesAsADoubleWithItsSign)
{
    SETMULTIPAR table[] = {Record(keyA, PARAM_INT, &number, 4), {}};
    auto const notification = One(1, table);
    ExpectArguments(*notification, 1);
    EXPECT_EQ(notification->NotifKey, "Key/A");
    EXPECT_EQ(notification->NotifValueType, PARAM_INT);
    EXPECT_EQ(notification->NotifNumber, -5.0);
    EXPECT_EQ(notification->NotifPos, 4);
}

TEST_F(ParameterChanges, Double_ArrivesAsItIs)
{
    SETMULTIPAR table[] = {Record(keyA, PARAM_DOUBLE, &fraction, -1), {}};
    auto const notification = One(1, table);
    EXPECT_EQ(notification->NotifNumber, 2.5);
}

TEST_F(ParameterChanges, Text_ArrivesBesideItsKey)
{
    SETMULTIPAR table[] = {Record(keyA, PARAM_STRING, "Gr\xC3\xBCn", -1), {}};
    auto const notification = One(1, table);
    EXPECT_EQ(notification->NotifKey, "Key/A");
    EXPECT_EQ(notification->NotifText, wxString::FromUTF8("Gr\xC3\xBCn"));
}

TEST_F(ParameterChanges, OtherTypes_ComeWithoutTheirValue)
{
    unsigned int const big = 7;
    SETMULTIPAR table[] = {Record(keyA, PARAM_UNSIGNED, &big, 2), {}};
    auto const notification = One(1, table);
    EXPECT_EQ(notification->NotifValueType, PARAM_UNSIGNED);
    EXPECT_EQ(notification->NotifPos, 2);
    EXPECT_EQ(notification->NotifNumber, NotifData(nullptr, 0, 0, 0, 0, 0, nullptr).NotifNumber);
}

TEST_F(ParameterChanges, NullValue_ComesWithTypeAndPositionOnly)
{
    SETMULTIPAR table[] = {Record(keyA, PARAM_STRING, nullptr, 2), Record(keyB, PARAM_INT, nullptr, 3), {}};
    auto const all = Notified(1, table);
    ASSERT_EQ(all.size(), 2u);
    EXPECT_EQ(all[0]->NotifValueType, PARAM_STRING);
    EXPECT_EQ(all[0]->NotifText, "");
    EXPECT_EQ(all[1]->NotifPos, 3);
}

TEST_F(ParameterChanges, SeveralRecordsOfAKey_AreOneNotificationWithoutAValue)
{
    SETMULTIPAR table[] = {Record(keyA, PARAM_INT, &number, 0),
                           Record(keyA, PARAM_INT, &number, 1),
                           Record(keyA, PARAM_INT, &number, 2),
                           Record(keyB, PARAM_DOUBLE, &fraction, 0),
                           {}};
    auto const all = Notified(1, table);
    NotifData const untouched(nullptr, 0, 0, 0, 0, 0, nullptr);
    ASSERT_EQ(all.size(), 2u);
    EXPECT_EQ(all[0]->NotifKey, "Key/A");
    EXPECT_EQ(all[0]->NotifValueType, 6);
    EXPECT_EQ(all[0]->NotifNumber, untouched.NotifNumber);
    EXPECT_EQ(all[0]->NotifPos, untouched.NotifPos);
    EXPECT_EQ(all[1]->NotifKey, "Key/B");
    EXPECT_EQ(all[1]->NotifNumber, 2.5);
}

TEST_F(ParameterChanges, EqualTextsAtTwoAddresses_AreTwoKeys_ByDesign)
{
    char const sameText[] = "Key/A";
    SETMULTIPAR table[] = {Record(keyA, PARAM_INT, &number, 0), Record(sameText, PARAM_INT, &number, 1), {}};
    auto const all = Notified(1, table);
    ASSERT_EQ(all.size(), 2u);
    EXPECT_EQ(all[0]->NotifValueType, PARAM_INT);
    EXPECT_EQ(all[1]->NotifPos, 1);
}

TEST_F(ParameterChanges, KeyThatComesAgainLater_IsARunOfItsOwn)
{
    SETMULTIPAR table[] = {Record(keyA, PARAM_INT, &number, 0),
                           Record(keyB, PARAM_INT, &number, 0),
                           Record(keyA, PARAM_INT, &number, 1),
                           {}};
    auto const all = Notified(1, table);
    ASSERT_EQ(all.size(), 3u);
    EXPECT_EQ(all[2]->NotifKey, "Key/A");
    EXPECT_EQ(all[2]->NotifPos, 1);
}

TEST_F(ScarceNotifications, OfATable_AreLostFromTheFirstWithoutMemoryOn_AndThePlugInDoesNotNotice)
{
    char const keyC[] = "Key/C";
    SETMULTIPAR table[] = {Record(keyA, PARAM_STRING, "a long enough text", -1),
                           Record(keyB, PARAM_STRING, "a long enough text", -1),
                           Record(keyC, PARAM_STRING, "a long enough text", -1),
                           {}};
    std::vector<std::string> const keys = {"Key/A", "Key/B", "Key/C"};
    std::size_t most = 0;
    int allocations = 0;
    for (; most < keys.size(); ++allocations)
    {
        {
            ScarceMemory const memory(allocations);
            EXPECT_NO_THROW(ComGUIManager::fGUI2NOTIFICATION(this, 1, 0, 0, 3, table));
        }
        auto const queued = TakeNotifications();
        ASSERT_GE(queued.size(), most);
        ASSERT_LE(queued.size(), keys.size());
        most = queued.size();
        for (std::size_t i = 0; i < most; ++i)
        {
            EXPECT_EQ(queued[i]->NotifKey, keys[i]);
            EXPECT_EQ(queued[i]->NotifText, "a long enough text");
        }
    }
    // Four each, as few as can be: the record, its key, its text, its place in the queue.
    EXPECT_EQ(allocations - 1, 3 * 4);
}

TEST_F(ScarceNotifications, OfOtherKinds_PassTheFailureToThePlugInAndQueueNothing_ByDesign)
{
    SETMULTIPAR record = Record(keyA, PARAM_STRING, "a long enough text", -1);
    int failures = 0;
    for (bool failed = true; failed; failures += failed ? 1 : 0)
    {
        failed = false;
        try
        {
            ScarceMemory const memory(failures);
            ComGUIManager::fGUI2NOTIFICATION(this, 4, 0, 0, 3, &record);
        }
        catch (std::bad_alloc const&)
        {
            failed = true;
        }
        EXPECT_EQ(TakeNotifications().size(), failed ? 0u : 1u);
    }
    EXPECT_EQ(failures, 3);  // the record, its text, and its place in the queue
}
