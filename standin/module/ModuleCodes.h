// What the entries of the module's table answer besides 0, success. A client passes them on as they are, so
// they keep clear of the codes that the library itself gives: 1, -1, -2005 and -9999.
#pragma once

#include "standin/server/transfer/TransferError.h"

namespace standin
{
enum ModuleCode : int
{
    MODULE_DONE = 0,
    MODULE_INVALID_ARGUMENT = 101,  // a null pointer, or a record that is not what its first words should say
    MODULE_UNKNOWN_INSTANCE = 102,  // hInstance is nothing that Open gave out
    MODULE_UNKNOWN_SESSION = 103,   // hSession was never given out, or has been logged out
    MODULE_UNKNOWN_RECORD = 104,    // Uninitialize of a record that is not initialised
    MODULE_NO_SERVER_THERE = 105,   // another host than this one, or another port than System/MasterSOAPPort
    MODULE_SITE_UNAVAILABLE = 106,  // the site cannot be opened or read; stderr tells why
    MODULE_LOGIN_REFUSED = 107,     // wrong user or wrong password: the code does not tell which
    MODULE_UNKNOWN_TICKET = 108,    // also of a job that was deleted while it was sent
    MODULE_UNKNOWN_FORMAT = 109,    // of ticket data
    MODULE_BUFFER_TOO_SMALL = 110,  // *size tells how many bytes it takes
    MODULE_NOT_SUPPORTED = 111,     // no command of that name
    MODULE_FAILED = 112,            // out of memory and the like; stderr tells

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
