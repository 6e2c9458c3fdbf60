// A ticket of the server as one session sees it, with a table of its own. It stands for that very ticket:
// once that is deleted every slot answers 0, also when another has its address by then. Any thread may use
// the table.
#pragma once

#include "comgui/module/TicketSlots.h"
#include "standin/module/FolderTranslator.h"
#include "standin/module/Gate.h"
#include "standin/module/HostCalls.h"
#include "standin/module/WalkedNumbers.h"
#include "standin/server/sessions/TicketService.h"
#include <memory>

namespace standin
{
inline constexpr Incarnation NoTicket = ~Incarnation{0};  // the incarnation of none

// The slots of a ticket, as a session sees it; incarnation 0: whichever has the address.
bool ReadTicket(TicketService& tickets, Session const& session, TicketAddress address,
                Incarnation incarnation, char const* key, PARAM_TYPE type, void* value, int pos);
bool ReadTable(TicketService& tickets, Session const& session, TicketAddress address, Incarnation incarnation,
               GETMULTIPAR* table);
bool WriteTicket(TicketService& tickets, Session const& session, TicketAddress address,
                 Incarnation incarnation, char const* key, PARAM_TYPE type, void const* value, int pos);
bool WriteTable(TicketService& tickets, Session const& session, TicketAddress address,
                Incarnation incarnation, SETMULTIPAR* table);

class OpenTicket : public HostCalls<comgui::plugin::TicketSlots>
{
public:
    // The services, the session, its gate and its translator outlive it. numbers: of the session, gone with
    // its end.
    OpenTicket(TicketService& tickets, Session const& session, Gate const& gate, FolderTranslator& folders,
               std::weak_ptr<WalkedNumbers> numbers, TicketAddress address, Incarnation incarnation)
        : m_tickets(tickets), m_session(session), m_gate(gate), m_folders(folders),
          m_numbers(std::move(numbers)), m_address(address), m_incarnation(incarnation)
    {
    }

    // Which of the tickets that have or had the address it stands for; NoTicket: for none.
    Incarnation Which() const { return m_incarnation.load(std::memory_order_acquire); }
    void StandFor(Incarnation incarnation) { m_incarnation.store(incarnation, std::memory_order_release); }

private:
    bool Get(char const* key, PARAM_TYPE type, void* value, int pos) override;
    bool GetFolder(char const* key, PARAM_TYPE type, void* value, int pos);
    void EndFolderReading() const;
    bool GetTable(GETMULTIPAR* table) override;
    bool Set(char const* key, PARAM_TYPE type, void const* value, int pos) override;
    bool SetTable(SETMULTIPAR* table) override;
    bool Walk(SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit) override;
    bool Option(int code, void* out) override;

    TicketService& m_tickets;
    Session const& m_session;
    Gate const& m_gate;
    FolderTranslator& m_folders;
    std::weak_ptr<WalkedNumbers> const m_numbers;
    TicketAddress const m_address;
    std::atomic<Incarnation> m_incarnation;
};
}  // namespace standin
