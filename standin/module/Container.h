// The tickets of the server as a session sees them. It stays allocated to the end of the process, since a
// client may hold its table longer than the session lives; once the session has ended, every slot answers 0.
// The same holds for the tables of its tickets.
#pragma once

#include "comgui/module/ContainerSlots.h"
#include "standin/module/Gate.h"
#include "standin/module/OpenTickets.h"
#include "standin/server/site/Server.h"

namespace standin
{
class Container : public HostCalls<comgui::plugin::ContainerSlots>
{
public:
    using Address = comgui::plugin::Address;

    Container(standin::Server& server, std::shared_ptr<Session> session);

    standin::Server& Server() const { return m_server; }
    standin::Session& Session() const { return *m_session; }
    Gate const& EveryCall() const { return m_gate; }

    // False if the session had ended before.
    bool EndSession();

    void Withdraw() noexcept override;
    bool Get(Address ticket, char const* key, PARAM_TYPE type, void* value, int pos) override;
    bool GetTable(Address ticket, GETMULTIPAR* table) override;
    bool WalkTickets(MWALKTICKETS_ACTION action, void* context, int type) override;
    bool Set(Address ticket, char const* key, PARAM_TYPE type, void const* value, int pos) override;
    bool SetTable(Address ticket, SETMULTIPAR* table) override;
    bool Operation(Address ticket, TICKET_OP op, void* arg) override;
    bool Switch(Address tickets, int notification, bool enable, char const* const* keys) override;
    STICKET_ACCESS const* CreateTicket(Address ticket, char const* const* keys) override;

private:
    bool Open(TicketAddress address, void* arg);
    bool CreateNext(TicketAddress address, void* arg) const;
    bool SetPartial(TicketAddress address, void* arg) const;
    bool HandOutFolders(TicketAddress address, void* arg);

    TicketService& Tickets() const { return m_server.Tickets(); }

    standin::Server& m_server;
    std::shared_ptr<standin::Session> const m_session;
    Gate const m_gate;
    FolderTranslator m_folders;
    std::shared_ptr<WalkedNumbers> m_ownNumbers =
        std::make_shared<WalkedNumbers>();  // until the session ends
    std::weak_ptr<WalkedNumbers> const m_numbers = m_ownNumbers;
    OpenTickets m_opened;
};
}  // namespace standin
