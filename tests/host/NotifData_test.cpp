#include "comgui/host/NotifData.h"

#include "comgui/host/ServerNotificationEvent.h"
#include <gtest/gtest.h>
#include <memory>
#include <optional>

namespace
{
NotifData Sample()
{
    NotifData data(nullptr, 1, 2, 3, 4, 5, "Gr\xC3\xBCn");
    data.NotifText = "text";
    data.NotifNumber = 2.5;
    data.NotifPos = 7;
    return data;
}
}  // namespace

TEST(NotifData, Constructor_TakesItsArgumentsInTheOrderOfTheFields)
{
    int user = 0;
    NotifData const data(&user, 1, 2, 3, 4, 5, "Gr\xC3\xBCn");
    EXPECT_EQ(data.pUser, &user);
    EXPECT_EQ(data.NotifKind, 1);
    EXPECT_EQ(data.NotifArgA, 2);
    EXPECT_EQ(data.NotifArgB, 3);
    EXPECT_EQ(data.NotifCode, 4);
    EXPECT_EQ(data.NotifValueType, 5);
    EXPECT_EQ(data.NotifKey, wxString::FromUTF8("Gr\xC3\xBCn"));
    EXPECT_EQ(data.NotifText, "");
    EXPECT_EQ(data.NotifNumber, 0.0);
    EXPECT_EQ(data.NotifPos, -1);
}

TEST(NotifData, NullKey_IsEmpty) { EXPECT_EQ(NotifData(nullptr, 0, 0, 0, 0, 0, nullptr).NotifKey, ""); }

TEST(NotifData, Copy_HasEveryField)
{
    NotifData const copy = Sample();
    EXPECT_EQ(copy.NotifKey, wxString::FromUTF8("Gr\xC3\xBCn"));
    EXPECT_EQ(copy.NotifText, "text");
    EXPECT_EQ(copy.NotifNumber, 2.5);
    EXPECT_EQ(copy.NotifPos, 7);
    EXPECT_EQ(copy.NotifValueType, 5);
}

TEST(ServerNotificationEvent, HasItsIdItsTypeAndRefersToTheData)
{
    NotifData const data = Sample();
    ServerNotificationEvent const event(1000002, data);
    EXPECT_EQ(event.GetId(), 1000002);
    EXPECT_EQ(event.GetEventType(), EVT_SERVER_NOTIFICATION);
    EXPECT_EQ(&event.GetNotifData(), &data);
}

TEST(ServerNotificationEvent, Clone_OutlivesTheData)
{
    std::optional<NotifData> data = Sample();
    std::unique_ptr<wxEvent> const clone(ServerNotificationEvent(1000002, *data).Clone());
    data->NotifKey = "another";
    data->NotifPos = 8;
    data.reset();
    auto const& event = dynamic_cast<ServerNotificationEvent const&>(*clone);
    EXPECT_EQ(event.GetId(), 1000002);
    EXPECT_EQ(event.GetNotifData().NotifKey, wxString::FromUTF8("Gr\xC3\xBCn"));
    EXPECT_EQ(event.GetNotifData().NotifPos, 7);
}
