#include "standin/server/site/SystemTicketMirror.h"

#include "standin/server/files/Descriptor.h"
#include "standin/server/files/FileError.h"
#include "standin/server/files/Report.h"
#include "standin/server/tickets/TicketXml.h"
#include <cerrno>
#include <chrono>
#include <fcntl.h>
#include <sys/file.h>
#include <thread>

namespace standin
{
namespace
{
constexpr std::chrono::milliseconds TurnLimit(2000);
constexpr std::chrono::milliseconds Pause(1);

// The turn among programs. It ends by itself with the last copy of the descriptor, which may be that of a
// child that was made by fork meanwhile; so it is ended in words.
class Turn
{
public:
    explicit Turn(std::filesystem::path const& folder)
        : m_folder(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC))
    {
        if (m_folder.Number() < 0)
            throw FileError(FileFault(folder, "cannot be locked", errno));
    }
    ~Turn() { flock(m_folder.Number(), LOCK_UN); }
    Turn(Turn const&) = delete;
    Turn& operator=(Turn const&) = delete;

    bool Try() { return flock(m_folder.Number(), LOCK_EX | LOCK_NB) == 0; }  // errno tells why not

private:
    Descriptor m_folder;
};
}  // namespace

SystemTicketMirror::SystemTicketMirror(Store& store, TicketService& tickets,
                                       std::filesystem::path const& site)
    : m_store(store), m_tickets(tickets), m_file(site / "tickets" / "SYS_0000.xml")
{
}

// Behind somebody who keeps the turn only the first waits.
void SystemTicketMirror::Write() noexcept
{
    bool const wasBehind = m_isBehind.exchange(false);  // before the ticket is read
    try
    {
        WriteInTurn(wasBehind ? std::chrono::milliseconds(0) : TurnLimit);
        m_hasReported = false;
    }
    catch (std::exception const& error)
    {
        m_isBehind = true;
        if (!m_hasReported.exchange(true))
            Report(error.what());
    }
}

void SystemTicketMirror::CatchUp() noexcept
{
    if (m_isBehind)
        Write();
}

void SystemTicketMirror::WriteInTurn(std::chrono::milliseconds limit)
{
    auto const end = std::chrono::steady_clock::now() + limit;
    auto const folder = m_file.parent_path();
    std::unique_lock turn(m_turn, std::defer_lock);
    Turn programs(folder);
    errno = EWOULDBLOCK;
    while (!(turn.owns_lock() || turn.try_lock()) || !programs.Try())
    {
        if (errno != EWOULDBLOCK || std::chrono::steady_clock::now() > end)
            throw FileError(FileFault(folder, "cannot be locked", errno));
        std::this_thread::sleep_for(Pause);
        errno = EWOULDBLOCK;
    }
    // Others may have written what is not heard of here yet.
    auto const found = m_store.Load(SystemTicket, [](auto, int, auto const&) {});
    if (found && !m_tickets.CatchUp(found->sequence))
        throw StoreError(m_file.string() + ": is not up to date; it is written again by itself");
    TicketXml copy;
    auto const take = [&](TicketSnapshot const& ticket) { copy = TicketXml::Of(SystemTicket, ticket); };
    if (m_tickets.LookAt(SystemTicket, 0, [&](auto const& ticket) { return take(ticket), true; }))
        copy.Write(m_file);
}
}  // namespace standin
