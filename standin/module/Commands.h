// The commands that a client sends by name.
#pragma once

#include "standin/module/Container.h"

namespace standin
{
// Answers a ModuleCode. data is of size bytes but for "local.set.callback", where it is a STICKET_ACCESS
// const*: the command takes the pointers "pGUI2Notification" and "pUser" from that ticket and puts the int
// "iGUINotificationID" there. The commands that begin with "remote." have a TCommandRecord, those that set a
// folder its path.
int RunCommand(Container const& container, char const* command, int size, void* data);
}  // namespace standin
