// A server over a storage in memory, with an administrator and two operators logged in.
#pragma once

#include "standin/server/site/TicketServer.h"
#include "tests/server/MemoryStorage.h"
#include <gtest/gtest.h>

inline constexpr standin::TicketAddress Job{3, 1};
inline constexpr standin::TicketAddress OperatorsTicket{17, 2};
inline constexpr standin::TicketAddress GuestsTicket{17, 3};

class ServerTest : public testing::Test
{
protected:
    ServerTest()
    {
        // The cheapest hash that yescrypt knows, of "secret": these tests are not about its price.
        std::string const hash = "$y$j75$k0xKNpTyyqUCI91fDe6.t/$AOpC.H0fgbhxHFr1JrsgxvC18fxDi2KoRtFQgKObcJ0";
        storage.users["admin"] = {"admin", hash, standin::AdministratorRole, 1};
        storage.users["operator"] = {"operator", hash, 1, 2};
        storage.users["guest"] = {"guest", hash, 17, 3};
        for (auto const address : {standin::SystemTicket, Job, OperatorsTicket, GuestsTicket})
            storage.tickets[address];
    }

    standin::TicketServer& Server()
    {
        if (!server)
            server = std::make_unique<standin::TicketServer>(storage, [this] { ++systemTicketChanges; });
        return *server;
    }

    standin::Session& As(std::string const& user)
    {
        auto& session = sessions[user];
        if (!session)
            session = Server().Login(user, "secret");
        return *session;
    }

    // Reads and writes as the administrator.
    bool Set(standin::TicketAddress address, char const* key, int value, int pos = -1)
    {
        return Server().Set(As("admin"), address, key, PARAM_INT, &value, pos);
    }
    bool Set(standin::TicketAddress address, char const* key, char const* value, int pos = -1)
    {
        return Server().Set(As("admin"), address, key, PARAM_STRING, value, pos);
    }
    std::optional<int> Int(standin::TicketAddress address, char const* key, int pos = -1)
    {
        int value = 0;
        return Server().Get(As("admin"), address, key, PARAM_INT, &value, pos) ? std::optional(value)
                                                                               : std::nullopt;
    }
    char const* Text(standin::TicketAddress address, char const* key, int pos = -1)
    {
        char const* value = nullptr;
        return Server().Get(As("admin"), address, key, PARAM_STRING, &value, pos) ? value : nullptr;
    }

    void Restart()
    {
        sessions.clear();
        server.reset();
    }

    MemoryStorage storage;
    int systemTicketChanges = 0;
    std::unique_ptr<standin::TicketServer> server;
    std::map<std::string, std::shared_ptr<standin::Session>> sessions;
};
