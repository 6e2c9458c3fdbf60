// A ticket of the server as one session sees it, with a table of its own. It stands for that very ticket:
// once that is deleted every slot answers 0, also when another has its address by then. Any thread may use
// the table.
#pragma once

#include "standin/module/FolderTranslator.h"
#include "standin/module/TicketTable.h"
#include "standin/server/site/TicketServer.h"
#include <unordered_set>

namespace standin
{
class OpenTicket : private TicketSubject
{
public:
    // Server, session and the session's translator outlive it.
    OpenTicket(TicketServer& server, Session const& session, FolderTranslator& folders, TicketAddress address,
               Birth birth)
        : m_server(server), m_session(session), m_folders(folders), m_address(address), m_birth(birth)
    {
    }

    STICKET_ACCESS const* Access() const { return m_table.Access(); }

    // Which of the tickets that have or had the address it stands for; NoBirth: for none.
    Birth Which() const { return m_birth.load(std::memory_order_acquire); }
    void StandFor(Birth birth) { m_birth.store(birth, std::memory_order_release); }

private:
    bool Get(char const* key, PARAM_TYPE type, void* value, int pos) override;
    bool GetTable(GETMULTIPAR* table) override;
    bool Set(char const* key, PARAM_TYPE type, void const* value, int pos) override;
    bool SetTable(SETMULTIPAR* table) override;
    bool Walk(SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit) override;
    bool Option(int code, void* out) override;

    void const* WordOf(WalkedValue const& value, BIN_STRING& binary);

    TicketServer& m_server;
    Session const& m_session;
    FolderTranslator& m_folders;
    TicketAddress const m_address;
    std::atomic<Birth> m_birth;

    // Numbers that walks handed out. They stay where they are, each once, as the texts do: a client may
    // gather a ticket by its values' addresses.
    std::mutex m_lock;
    std::unordered_set<unsigned long long> m_numbers;

    TicketTable const m_table{*this};
};
}  // namespace standin
