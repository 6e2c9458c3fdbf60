// tickets/SYS_0000.xml: the system ticket as a file, for programs that read a local ticket file.
#pragma once

#include "standin/server/sessions/TicketService.h"
#include <filesystem>

namespace standin
{
class SystemTicketMirror
{
public:
    // site: the folder of the site.
    SystemTicketMirror(TicketService& tickets, std::filesystem::path const& site);

    // Writes the file from the newest system ticket. Programs take turns, and each reads in its turn, so what
    // the last of them leaves is no older than any change before. The file is a copy: a failure is reported
    // on stderr and stops nobody.
    void Write() noexcept;

private:
    TicketService& m_tickets;
    std::filesystem::path const m_file;
    std::mutex m_turn;  // of this program's threads
};
}  // namespace standin
