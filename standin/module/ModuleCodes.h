// What the entries of the module's table answer besides 0, success. A client passes them on as they are, so
// they keep clear of the codes that the library itself gives: 1, -1, -2005 and -9999.
#pragma once

namespace standin
{
enum ModuleCode : int
{
    MODULE_DONE = 0,
    MODULE_INVALID_ARGUMENT = 101,  // a null pointer, or a TLogin whose nSize is not 2632
    MODULE_UNKNOWN_INSTANCE = 102,  // hInstance is nothing that Open gave out
    MODULE_UNKNOWN_SESSION = 103,   // hSession was never given out, or has been logged out
    MODULE_UNKNOWN_RECORD = 104,    // Uninitialize of a record that is not initialised
    MODULE_NO_SERVER_THERE = 105,   // another host than this one, or another port than System/MasterSOAPPort
    MODULE_SITE_UNAVAILABLE = 106,  // the site cannot be opened or read; stderr tells why
    MODULE_LOGIN_REFUSED = 107,     // wrong user or wrong password: the code does not tell which
    MODULE_UNKNOWN_TICKET = 108,
    MODULE_UNKNOWN_FORMAT = 109,    // of ticket data
    MODULE_BUFFER_TOO_SMALL = 110,  // *size tells how many bytes it takes
    MODULE_NOT_SUPPORTED = 111,     // commands, files and jobs, so far
    MODULE_FAILED = 112,            // out of memory and the like; stderr tells
};
}  // namespace standin
