#include "standin/server/site/SystemTicketMirror.h"

#include "standin/server/files/Descriptor.h"
#include "standin/server/files/FileError.h"
#include "standin/server/files/Report.h"
#include "standin/server/tickets/TicketXml.h"
#include <cerrno>
#include <fcntl.h>
#include <sys/file.h>

namespace standin
{
SystemTicketMirror::SystemTicketMirror(TicketService& tickets, std::filesystem::path const& site)
    : m_tickets(tickets), m_file(site / "tickets" / "SYS_0000.xml")
{
}

void SystemTicketMirror::Write() noexcept
{
    try
    {
        std::lock_guard const turn(m_turn);
        auto const folder = m_file.parent_path();
        Descriptor const lock(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
        if (lock.Number() < 0 || flock(lock.Number(), LOCK_EX) != 0)
            throw FileError(FileFault(folder, "cannot be locked", errno));
        TicketXml copy;
        auto const take = [&](TicketSnapshot const& ticket) { copy = TicketXml::Of(SystemTicket, ticket); };
        if (m_tickets.LookAt(SystemTicket, 0, [&](auto const& ticket) { return take(ticket), true; }))
            copy.Write(m_file);
    }
    catch (std::exception const& error)
    {
        Report(error.what());
    }
}
}  // namespace standin
