// Why a call failed: a code, a text for users, and the plug-in's own words if it has any. A plain value.
//
// Codes come from three places: positive ones from the plug-in, -1, -2005 and -9999 from the library, and
// those of ERROR_CODE from this layer. An author may look codes up in ErrorTexts().
#pragma once

#include "comgui/foundation/export.h"
#include <string>

namespace comgui
{
enum ERROR_CODE : int
{
    NoPlugIn = -3001,         // the communication plug-in cannot be opened
    NotLoggedIn = -3002,      // no login yet, or logged out
    ServerAway = -3003,       // no server answers at that host and port
    NoContainer = -3004,      // logged in, but the session has no tickets
    NoSuchTicket = -3005,     // of that type and id
    NoSuchKey = -3006,        // in the ticket, or no value at that position
    WrongType = -3007,        // the value cannot be read as the type asked for
    OutOfRange = -3008,       // a number that the type cannot hold
    NotANumber = -3009,       // a text where a number is due
    BadList = -3010,          // quotes that do not match in a list of values
    NotWritable = -3011,      // a value that no ticket can hold, such as a list within a list
    WriteRefused = -3012,     // by the server; often the user lacks the right
    CreateRefused = -3013,    // likewise
    DeleteRefused = -3014,    // likewise
    Cancelled = -3015,        // by the caller, or by the end of the session
    NoSuchFile = -3016,       // on this side
    BadAnswer = -3017,        // the plug-in answered with something that makes no sense
    OutOfMemory = -3018,      // or out of threads
    CallbackRefused = -3019,  // the plug-in reports no changes
    BadServer = -3020,        // no host, or a port outside 1 to 65535
    TooLong = -3021,          // a user, password or host of more than 127 bytes
};

struct COMGUI_EXPORT Error
{
    int code = 0;
    std::string about;   // what it is about: a key, a path, a server; UTF-8, may be empty
    std::string reason;  // from the plug-in, in its language; UTF-8, often empty

    // One line for a user, UTF-8: the text of the code in the user's language, what it is about, the reason.
    // wxWidgets' translations are asked, domain "comgui".
    std::string Text() const;

    // Whether the same call may succeed later without any change: the server is away, or the session is lost.
    bool IsTransient() const;
};

struct ERROR_TEXT
{
    int code;
    char const* text;  // English, as in the catalogue
};

// Every code that has a text, in ascending order; ends at a null text.
COMGUI_EXPORT ERROR_TEXT const* ErrorTexts();
}  // namespace comgui
