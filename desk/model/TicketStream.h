// A ticket as the library's stream of one ticket, as bytes. From any thread.
#pragma once

#include "comgui/client/Snapshot.h"
#include "desk/model/FileFault.h"
#include <string>
#include <string_view>

namespace desk
{
// The very bytes that the library writes for a ticket with these values. What no stream can hold is left out:
// pointers, lists without values or within lists, positions out of order, keys that are empty, too long or
// have a zero byte. A text ends at its first zero byte. A ticket with nothing in it has no bytes. Faults:
// TooLarge, NoMemory.
FileResult<std::string> StreamOf(comgui::Snapshot const& ticket);

// The ticket of a stream that has at least its signature. A stream that was cut between two values cannot be
// told from a whole one. file: for the fault.
FileResult<comgui::Snapshot> TicketOfStream(std::string_view stream, std::string const& file);
}  // namespace desk
