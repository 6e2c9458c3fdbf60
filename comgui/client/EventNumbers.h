// Names for the ids of the events that the bare library publishes (ServerNotificationEvent::GetId()). The
// kit's own events are in Event.h; the numbers are for programs that listen to both, or are on their way from
// one to the other. The library chooses the number by a notification's kind and code; the names follow what
// the codes mean to the plug-in of this package, ticket types.
#pragma once

namespace comgui
{
enum EVENT_NUMBER : int
{
    // A parameter has changed, of a ticket of type:
    SystemChangedEvent = 1000044,  // 0
    DeviceChangedEvent = 1000200,  // 2
    JobChangedEvent = 1000004,     // 3
    QueueChangedEvent = 1000034,   // 7, and 5
    Type6ChangedEvent = 1000024,   // 6
    PaperChangedEvent = 1000094,   // 12
    UserChangedEvent = 1000014,    // 17

    // A ticket was created, of type:
    DeviceCreatedEvent = 1000226,  // 2
    JobCreatedEvent = 1000002,     // 3
    QueueCreatedEvent = 1000036,   // 7
    UserCreatedEvent = 1000012,    // 17

    // A ticket was deleted, of type:
    DeviceDeletedEvent = 1000225,  // 2
    JobDeletedEvent = 1000003,     // 3
    QueueDeletedEvent = 1000035,   // 7
    PaperDeletedEvent = 1000093,   // 12
    UserDeletedEvent = 1000013,    // 17

    JobOfThisClientEvent =
        1000101,  // a job's remote end point is this client's; notifications of kind 11, too
    TransferEndedEvent = 10000015,  // kind 6; one digit more than the others
    Kind9Event = 10000110,          // kind 9; likewise. The plug-in of this package sends none
};
}  // namespace comgui
