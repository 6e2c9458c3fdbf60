#include "standin/module/LocalTickets.h"

#include "standin/server/files/FileError.h"
#include "standin/server/files/Report.h"

namespace standin
{
namespace
{
// Null for a file that is not there: clients ask for files that may be missing as a matter of course.
std::unique_ptr<LocalTicket> Opened(char const* path)
{
    if (!path)
        return std::make_unique<LocalTicket>();
    auto file = LocalTicket::FileToOpen(path);
    return file ? std::make_unique<LocalTicket>(std::move(*file)) : nullptr;
}
}  // namespace

LocalTickets& LocalTickets::Get()
{
    static auto& tickets = *new LocalTickets;
    return tickets;
}

STICKET_ACCESS const* LocalTickets::Create(char const* path)
{
    std::unique_ptr<LocalTicket> ticket;
    try
    {
        ticket = Opened(path);
    }
    catch (XmlError const& error)
    {
        Report(std::string(error.what()) + "; correct the file, or put a sound copy in its place");
    }
    catch (FileError const& error)
    {
        Report(error.what());
    }
    if (!ticket)
        return nullptr;
    STICKET_ACCESS const* const access = ticket->Access();
    std::lock_guard const lock(m_lock);
    m_tickets.emplace(access, std::move(ticket));
    return access;
}

bool LocalTickets::Destroy(STICKET_ACCESS const** ticket)
{
    if (!ticket)
        return true;
    decltype(m_tickets)::node_type node;
    {
        std::lock_guard const lock(m_lock);
        node = m_tickets.extract(*ticket);
    }
    if (!node)
        return true;
    *ticket = nullptr;
    try
    {
        node.mapped()->Save();
        return true;
    }
    catch (FileError const& error)
    {
        Report(error.what());
        return false;
    }
}
}  // namespace standin
