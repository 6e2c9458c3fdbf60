// Tickets in files: reads those in XML and in streams, and finds what a file does not hold of the ticket that
// it was made of. From any thread.
//
// To export: the bytes are comgui::Tickets::ToXml() or StreamOf(), LossesOf() says what they lack, and
// SaveFile() writes them.
#pragma once

#include "comgui/client/Snapshot.h"
#include "desk/model/FileFault.h"
#include "desk/model/TicketXml.h"
#include <string>
#include <string_view>
#include <vector>

namespace desk
{
// The ticket of a file, by what is in it and not by its name.
FileResult<TicketOfFile> ImportTicket(std::string const& file);

// The same of bytes. file: for the fault.
FileResult<TicketOfFile> TicketOfBytes(std::string_view bytes, std::string const& file);

enum class LossKind
{
    TypeChanges,   // the same number or text, as another type
    ValueChanges,  // another value is read back
    LeftOut,       // the key is not in the file
    Added,         // the key is only in the file
};

struct FileLoss
{
    std::string key;
    LossKind kind;
};

// What differs once the bytes are read back, by key. Pointers are in no file. The ticket's paths must be as
// they are stored, as they are in XML. A fault: the bytes cannot be read back at all, as those of an empty
// stream.
FileResult<std::vector<FileLoss>> LossesOf(comgui::Snapshot const& ticket, std::string_view bytes);

// Of bytes that were made at some time between the two: a key that is not the same in both has been changed
// meanwhile, and is no loss.
FileResult<std::vector<FileLoss>> LossesOf(comgui::Snapshot const& before, comgui::Snapshot const& after,
                                           std::string_view bytes);
}  // namespace desk
