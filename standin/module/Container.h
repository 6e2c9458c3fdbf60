// What a client of the module sees of its session: the handle and the table of the ticket container. It
// stays allocated to the end of the process, since a client may hold the table longer than the session
// lives; once the session has ended, every slot answers 0. The same holds for the tables of its tickets.
#pragma once

#include "comgui/ticket/MTICKET_ACCESS.h"
#include "standin/module/OpenTickets.h"
#include "standin/server/site/Server.h"

namespace standin
{
class Container
{
public:
    Container(standin::Server& server, std::shared_ptr<Session> session);
    Container(Container const&) = delete;
    Container& operator=(Container const&) = delete;

    MTICKET_ACCESS const* Access() const { return &m_access; }
    standin::Server& Server() const { return m_server; }
    standin::Session& Session() const { return *m_session; }
    FolderTranslator& Folders() { return m_folders; }
    OpenTickets& Opened() { return m_opened; }
    std::weak_ptr<WalkedNumbers> const& Numbers() const { return m_numbers; }

    // False if the session had ended before.
    bool EndSession();

private:
    standin::Server& m_server;
    std::shared_ptr<standin::Session> const m_session;
    FolderTranslator m_folders;
    std::shared_ptr<WalkedNumbers> m_ownNumbers =
        std::make_shared<WalkedNumbers>();  // until the session ends
    std::weak_ptr<WalkedNumbers> const m_numbers = m_ownNumbers;
    OpenTickets m_opened;
    MTICKET_ACCESS m_access{};
};
}  // namespace standin
