// One of several programs that have a site in memory open at the same time, with an administrator's session.
#pragma once

#include "standin/module/OpenTicket.h"
#include "standin/server/site/Server.h"
#include "standin/server/store/memory/MemoryStore.h"
#include <memory>
#include <optional>
#include <string>

class Program
{
public:
    // folder: of the site.
    Program(std::shared_ptr<standin::MemorySite> const& site, std::filesystem::path const& folder)
        : store(site), server(store, folder),
          opened(server.Open({"admin", "", standin::AdministratorRole, 1})), session(*opened)
    {
        server.StartCare();
    }

    standin::TicketService& Tickets() { return server.Tickets(); }

    bool Set(standin::TicketAddress address, char const* key, PARAM_TYPE type, void const* value,
             int pos = -1)
    {
        return standin::WriteTicket(Tickets(), session, address, 0, key, type, value, pos);
    }
    bool Set(standin::TicketAddress address, char const* key, int value, int pos = -1)
    {
        return Set(address, key, PARAM_INT, &value, pos);
    }
    bool Set(standin::TicketAddress address, char const* key, std::string const& text, int pos = -1)
    {
        return Set(address, key, PARAM_STRING, text.c_str(), pos);
    }
    bool Drop(standin::TicketAddress address, char const* key, int pos = -1)
    {
        return Set(address, key, PARAM_NONE, nullptr, pos);
    }
    bool Get(standin::TicketAddress address, char const* key, PARAM_TYPE type, void* value, int pos = -1)
    {
        return standin::ReadTicket(Tickets(), session, address, 0, key, type, value, pos);
    }
    std::optional<int> Int(standin::TicketAddress address, char const* key, int pos = -1)
    {
        int value = 0;
        return Get(address, key, PARAM_INT, &value, pos) ? std::optional(value) : std::nullopt;
    }
    std::string Text(standin::TicketAddress address, char const* key)
    {
        char const* text = nullptr;
        return Get(address, key, PARAM_STRING, &text) ? text : "";
    }
    std::optional<void*> Pointer(standin::TicketAddress address, char const* key)
    {
        void* pointer = nullptr;
        return Get(address, key, PARAM_POINTER, &pointer) ? std::optional(pointer) : std::nullopt;
    }
    int Count(standin::TicketAddress address, char const* key)
    {
        unsigned long count = 0;
        return Get(address, key, PARAM_COUNT, &count) ? static_cast<int>(count) : 0;
    }
    bool Exists(standin::TicketAddress address) { return Tickets().IncarnationOf(address) != 0; }
    bool Create(standin::TicketAddress address) { return Tickets().Create(session, address).has_value(); }
    bool Delete(standin::TicketAddress address) { return Tickets().Delete(session, address); }

    standin::MemoryStore store;
    standin::Server server;
    std::shared_ptr<standin::Session> opened;
    standin::Session& session;
};
