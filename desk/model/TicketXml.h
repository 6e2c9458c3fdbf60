// A ticket as the XML that comgui::Tickets::ToXml gives: a <ticket> with a <parameter> for each key, and in
// that a <value> for each of several values. From any thread.
#pragma once

#include "comgui/client/Snapshot.h"
#include "comgui/client/TicketAddress.h"
#include "desk/model/FileFault.h"
#include <optional>
#include <string>
#include <string_view>

namespace desk
{
struct TicketOfFile
{
    std::optional<comgui::TicketAddress> address;  // none in streams, and where the file does not say it
    comgui::Snapshot ticket;
};

// file: for the fault. Nothing that the reader does not know is passed over.
FileResult<TicketOfFile> TicketOfXml(std::string_view xml, std::string const& file);
}  // namespace desk
