// The commands that a client sends by name.
#pragma once

#include "standin/module/Container.h"

namespace standin
{
// Answers a ModuleCode. "local.set.callback" has a STICKET_ACCESS const* as its data; it takes the pointers
// "pGUI2Notification" and "pUser" from that ticket and puts the int "iGUINotificationID" there.
int RunCommand(Container const& container, char const* command, void* data);
}  // namespace standin
