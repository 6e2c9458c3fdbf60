// The commands that a client sends by name.
#pragma once

#include "standin/module/Container.h"

namespace standin
{
// Answers a ModuleCode. container: null without a session, which "local.get.reason" alone does not need.
//
// data is of size bytes but for these, where it is a STICKET_ACCESS const* and size does not matter:
// - "local.set.callback" takes the pointers "pGUI2Notification" and "pUser" from that ticket and puts the int
//   "iGUINotificationID" there.
// - "local.get.reason" puts the string "Reason/Text" there: RefusableCall::TakeReason.
// - "local.get.progress" puts the int64 "Transfer/Done" and "Transfer/Size" there:
//   TransferService::ProgressOf.
// Of the last two, a key without a value is deleted. The commands that begin with "remote." have a
// TCommandRecord, those that set a folder its path.
int RunCommand(Container const* container, char const* command, int size, void* data);
}  // namespace standin
