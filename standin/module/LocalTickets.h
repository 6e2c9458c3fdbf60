// The tickets that the factory has made and that are not yet destroyed. A pointer is looked up here before
// it is followed, so that one that is foreign, or was destroyed before, does no harm. For any thread.
#pragma once

#include "standin/module/LocalTicket.h"
#include <map>
#include <memory>
#include <mutex>

namespace standin
{
class LocalTickets
{
public:
    static LocalTickets& Get();  // never destroyed

    // A ticket in memory for a null path, else the ticket in that file. Null if there is no such file, of
    // which nothing is said, or if it cannot be read, which is one line on stderr.
    STICKET_ACCESS const* Create(char const* path);

    // Saves and frees the ticket, and clears the caller's pointer. A ticket that cannot be saved is one line
    // on stderr, and gone as well: false. Nothing happens for a pointer that is null or no ticket of these.
    bool Destroy(STICKET_ACCESS const** ticket);

private:
    std::mutex m_lock;
    std::map<STICKET_ACCESS const*, std::unique_ptr<LocalTicket>> m_tickets;
};
}  // namespace standin
