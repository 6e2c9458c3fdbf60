// A site on disk that a program has open, with its server, as the plug-in opens one.
#pragma once

#include "standin/server/site/Site.h"
#include <memory>
#include <string>
#include <vector>

class OpenedSite
{
public:
    OpenedSite(std::filesystem::path const& folder, std::filesystem::path const& seed)
        : site(standin::SiteName::Of(folder.string()), seed),
          m_server(std::make_unique<standin::Server>(site.store(), site.folder()))
    {
        site.PutInOrder(*m_server);
    }
    ~OpenedSite()  // in order
    {
        m_server.reset();
        site.Leave();
    }
    OpenedSite(OpenedSite const&) = delete;
    OpenedSite& operator=(OpenedSite const&) = delete;

    standin::Server& Server() { return *m_server; }
    standin::Store& Store() { return site.store(); }

    bool Put(standin::TicketAddress ticket, std::string_view key, standin::TicketValue value, int pos = -1)
    {
        standin::TicketWrite write{key, pos, std::move(value)};
        return Server().Write(ticket, {&write, 1}) && write.ok;
    }
    bool Put(std::string_view key, std::string_view text, int pos = -1)
    {
        return Put(standin::SystemTicket, key, standin::TicketValue::String(text), pos);
    }

    // As the store has it, past the server: what a seed or an older program may have written, too.
    void PutPastTheServer(std::vector<standin::ParameterChange> parameters)
    {
        standin::TicketChange change;
        change.address = standin::SystemTicket;
        auto const state = Store().Load(standin::SystemTicket, [](auto, int, auto const&) {});
        change.incarnation = state->state.incarnation;
        change.revision = state->state.revision;
        change.parameters = std::move(parameters);
        if (Store().Commit(change, 1'000'000).kind != standin::CommitOutcome::Committed)
            throw std::runtime_error("a change past the server was not committed");
    }
    std::string Text(standin::TicketAddress address, std::string_view wanted)
    {
        std::string text = "(missing)";
        Store().Load(address,
                     [&](std::string_view key, int, standin::StoredValue const& value)
                     {
                         if (key == wanted)
                             text = value.bytes;
                     });
        return text;
    }
    std::vector<standin::TicketAddress> Tickets()
    {
        std::vector<standin::TicketAddress> tickets;
        Store().Tickets([&](standin::TicketAddress address, standin::TicketState const&)
                        { tickets.push_back(address); });
        return tickets;
    }

    standin::Site site;

private:
    std::unique_ptr<standin::Server> m_server;
};
