// tickets/SYS_0000.xml: the system ticket as a file, for programs that read a local ticket file.
#pragma once

#include "standin/server/sessions/TicketService.h"
#include <atomic>
#include <chrono>
#include <filesystem>
#include <mutex>

namespace standin
{
class SystemTicketMirror
{
public:
    // site: the folder of the site.
    SystemTicketMirror(Store& store, TicketService& tickets, std::filesystem::path const& site);

    // Writes the file from the newest system ticket. Programs take turns, and each reads in its turn, so what
    // the last of them leaves is no older than any change before. The file is a copy: a failure is reported
    // on stderr and stops nobody, and neither does a program that keeps its turn.
    void Write() noexcept;

    // Writes it if the last attempt failed. To be called now and then.
    void CatchUp() noexcept;

private:
    void WriteInTurn(std::chrono::milliseconds limit);

    Store& m_store;
    TicketService& m_tickets;
    std::filesystem::path const m_file;
    std::mutex m_turn;  // of this program's threads
    std::atomic<bool> m_isBehind{false};
    std::atomic<bool> m_hasReported{false};  // since it worked
};
}  // namespace standin
