// The names of event numbers, against the numbers that the library publishes.
#include "comgui/client/EventNumbers.h"

#include "comgui/session/NotificationEvents.h"
#include <gtest/gtest.h>
#include <set>

using namespace comgui;

namespace
{
constexpr int Changed = 1, Created = 4, Deleted = 5;

struct NUMBER_FACT
{
    int kind;
    int code;
    EVENT_NUMBER number;
};

constexpr NUMBER_FACT Facts[] = {
    {Changed, 0, SystemChangedEvent},
    {Changed, 2, DeviceChangedEvent},
    {Changed, 3, JobChangedEvent},
    {Changed, 5, QueueChangedEvent},
    {Changed, 6, Type6ChangedEvent},
    {Changed, 7, QueueChangedEvent},
    {Changed, 12, PaperChangedEvent},
    {Changed, 17, UserChangedEvent},
    {Created, 2, DeviceCreatedEvent},
    {Created, 3, JobCreatedEvent},
    {Created, 7, QueueCreatedEvent},
    {Created, 17, UserCreatedEvent},
    {Deleted, 2, DeviceDeletedEvent},
    {Deleted, 3, JobDeletedEvent},
    {Deleted, 7, QueueDeletedEvent},
    {Deleted, 12, PaperDeletedEvent},
    {Deleted, 17, UserDeletedEvent},
    {6, 0, TransferEndedEvent},
    {9, 0, Kind9Event},
    {11, 0, JobOfThisClientEvent},
};

std::optional<int> Published(int kind, int code)
{
    return detail::EventIdOf(NotifData(nullptr, kind, 0, 0, code, 0, nullptr), {});
}
}  // namespace

TEST(EventNumbers, AreThoseOfTheLibrary)
{
    for (auto const& [kind, code, number] : Facts)
        EXPECT_EQ(Published(kind, code), number) << kind << ' ' << code;
}

TEST(EventNumbers, NameEachThatIsPublished)
{
    std::set<int> named, published;
    for (NUMBER_FACT const& fact : Facts)
        named.insert(fact.number);
    for (int kind = 0; kind < 100; ++kind)
        for (int code = 0; code < 100; ++code)
            if (auto const number = Published(kind, code))
                published.insert(*number);
    EXPECT_EQ(published, named);
}
