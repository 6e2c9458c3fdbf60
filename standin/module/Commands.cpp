#include "standin/module/Commands.h"

#include "standin/module/ModuleCodes.h"
#include <cstring>

namespace standin
{
namespace
{
// What the client gives; argA is the ticket's id, argB the notification id, code the ticket's type.
using ClientCallback = void (*)(void* user, int kind, int argA, int argB, int code, void* data);

void* PointerIn(STICKET_ACCESS const& ticket, char const* key)
{
    void* pointer = nullptr;
    ticket.SGETPARAMETER(ticket.Instance, key, PARAM_POINTER, &pointer, -1);
    return pointer;
}

int SetCallback(Container const& container, STICKET_ACCESS const* ticket)
{
    if (!ticket)
        return MODULE_INVALID_ARGUMENT;
    auto const callback = reinterpret_cast<ClientCallback>(PointerIn(*ticket, "pGUI2Notification"));
    if (!callback)
        return MODULE_INVALID_ARGUMENT;
    void* const user = PointerIn(*ticket, "pUser");

    NotificationService& service = container.Server().Notifications();
    int const id = service.NewId();
    // The answer first: nobody could ever switch off what came under an id that did not arrive.
    if (!ticket->SSETPARAMETER(ticket->Instance, "iGUINotificationID", PARAM_INT, &id, -1))
        return MODULE_INVALID_ARGUMENT;
    bool const registered =
        service.Register(container.Session(), id,
                         [callback, user](Notification const& notification)
                         {
                             callback(user, notification.kind, notification.ticket.id, notification.id,
                                      notification.ticket.type, notification.records);
                         });
    return registered ? MODULE_DONE : MODULE_UNKNOWN_SESSION;
}
}  // namespace

int RunCommand(Container const& container, char const* command, void* data)
{
    if (!command)
        return MODULE_INVALID_ARGUMENT;
    if (std::strcmp(command, "local.set.callback") == 0)
        return SetCallback(container, static_cast<STICKET_ACCESS const*>(data));
    return MODULE_NOT_SUPPORTED;
}
}  // namespace standin
