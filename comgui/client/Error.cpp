#include "comgui/client/Error.h"

#include <algorithm>
#include <iterator>
#include <wx/translation.h>

namespace comgui
{
namespace
{
// wxTRANSLATE marks the texts for the tools that fill catalogues.
constexpr ERROR_TEXT Texts[] = {
    {-9999, wxTRANSLATE("the library does not support this")},
    {TooLong, wxTRANSLATE("a user, a password or a host may have no more than 127 bytes")},
    {BadServer, wxTRANSLATE("a server is a host and a port from 1 to 65535")},
    {CallbackRefused, wxTRANSLATE("the server reports no changes to this session")},
    {OutOfMemory, wxTRANSLATE("out of memory or threads")},
    {BadAnswer, wxTRANSLATE("the communication plug-in gave an answer that makes no sense")},
    {NoSuchFile, wxTRANSLATE("there is no such file, or it cannot be read")},
    {Cancelled, wxTRANSLATE("cancelled")},
    {DeleteRefused, wxTRANSLATE("the server refuses to delete this")},
    {CreateRefused, wxTRANSLATE("the server refuses to create this")},
    {WriteRefused, wxTRANSLATE("the server refuses this value")},
    {NotWritable, wxTRANSLATE("no ticket can hold this value")},
    {BadList, wxTRANSLATE("the quotes in this list do not match")},
    {NotANumber, wxTRANSLATE("this is not a number")},
    {OutOfRange, wxTRANSLATE("this number is out of range")},
    {WrongType, wxTRANSLATE("the value is of another type")},
    {NoSuchKey, wxTRANSLATE("there is no such value")},
    {NoSuchTicket, wxTRANSLATE("there is no such ticket")},
    {NoContainer, wxTRANSLATE("the session has no tickets")},
    {ServerAway, wxTRANSLATE("no server answers")},
    {NotLoggedIn, wxTRANSLATE("not logged in")},
    {NoPlugIn, wxTRANSLATE("the communication plug-in cannot be opened")},
    {-2005, wxTRANSLATE("no server answers")},
    {-1, wxTRANSLATE("not logged in")},
    {0, wxTRANSLATE("success")},
    // Those of the plug-in of this package.
    {101, wxTRANSLATE("the call was malformed")},
    {102, wxTRANSLATE("the communication plug-in does not know this program")},
    {103, wxTRANSLATE("the session has ended")},
    {104, wxTRANSLATE("the session was not prepared")},
    {105, wxTRANSLATE("no such server")},
    {106, wxTRANSLATE("the server cannot reach its data")},
    {107, wxTRANSLATE("wrong user or password")},
    {108, wxTRANSLATE("there is no such ticket")},
    {109, wxTRANSLATE("there is no such format of ticket data")},
    {110, wxTRANSLATE("the buffer is too small")},
    {111, wxTRANSLATE("the server does not know this command")},
    {112, wxTRANSLATE("the server is out of memory")},
    {113, wxTRANSLATE("the source cannot be read")},
    {114, wxTRANSLATE("this is no regular file, or no folder where one is due")},
    {115, wxTRANSLATE("the server does not accept this path or name")},
    {116, wxTRANSLATE("the target cannot be written")},
    {117, wxTRANSLATE("an empty file is no job")},
    {118, wxTRANSLATE("cancelled, since the session has ended")},
    {119, wxTRANSLATE("too many transfers are waiting")},
    {0, nullptr},
};

wxString TextOf(int code)
{
    for (ERROR_TEXT const* known = Texts; known->text; ++known)
        if (known->code == code)
            return wxGetTranslation(known->text, "comgui");
    return wxString::Format(wxGetTranslation(wxTRANSLATE("the server refuses, with code %d"), "comgui"),
                            code);
}
}  // namespace

std::string Error::Text() const
{
    std::string text = TextOf(code).utf8_string();
    if (!about.empty())
        text.insert(0, about + ": ");
    if (!reason.empty())
        text += " (" + reason + ")";
    return text;
}

bool Error::IsTransient() const
{
    constexpr int Transient[] = {ServerAway, NotLoggedIn, -2005, -1, 103, 106, 119};
    return std::find(std::begin(Transient), std::end(Transient), code) != std::end(Transient);
}

ERROR_TEXT const* ErrorTexts() { return Texts; }
}  // namespace comgui
