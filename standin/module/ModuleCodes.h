// What the entries of the module's table answer besides 0, success: the plug-in kit's codes, and those that
// are the module's own. A client passes them on as they are, so they keep clear of the codes that the library
// itself gives: 1, -1, -2005 and -9999.
#pragma once

#include "comgui/module/Codes.h"
#include "standin/server/transfer/TransferError.h"

namespace standin
{
enum ModuleCode : int
{
    MODULE_DONE = comgui::plugin::Done,
    MODULE_INVALID_ARGUMENT = comgui::plugin::InvalidArgument,
    MODULE_UNKNOWN_INSTANCE = comgui::plugin::UnknownInstance,
    MODULE_UNKNOWN_SESSION = comgui::plugin::UnknownSession,
    MODULE_UNKNOWN_RECORD = comgui::plugin::UnknownRecord,
    MODULE_NO_SERVER_THERE = 105,   // another host than this one, or another port than System/MasterSOAPPort
    MODULE_SITE_UNAVAILABLE = 106,  // the site cannot be opened or read; stderr tells why
    MODULE_LOGIN_REFUSED = comgui::plugin::LoginRefused,  // the code does not tell whether user or password
    MODULE_UNKNOWN_TICKET =
        comgui::plugin::UnknownTicket,                  // also of a job that was deleted while it was sent
    MODULE_UNKNOWN_FORMAT = 109,                        // of ticket data
    MODULE_BUFFER_TOO_SMALL = 110,                      // *size tells how many bytes it takes
    MODULE_NOT_SUPPORTED = comgui::plugin::NotOffered,  // no command of that name
    MODULE_FAILED = comgui::plugin::Failed,             // out of memory and the like; stderr tells

    // Of files and jobs; stderr tells more
    MODULE_SOURCE_UNREADABLE = SourceUnreadable,
    MODULE_NOT_A_FILE = NotAFile,  // or not a folder, where one is due
    MODULE_PATH_REFUSED = PathRefused,
    MODULE_TARGET_UNWRITABLE = TargetUnwritable,
    MODULE_EMPTY_JOB = EmptyJob,
    MODULE_TRANSFER_CUT = TransferCut,
    MODULE_TOO_MANY_TRANSFERS = TooManyTransfers,
};
static_assert(int{MODULE_UNKNOWN_TICKET} == JobGone && int{MODULE_FAILED} == TransferFailed);
}  // namespace standin
