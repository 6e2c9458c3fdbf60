// A server over a site in memory, with an administrator and two operators logged in, and reads and writes as
// the slots of the plug-in make them.
#pragma once

#include "standin/module/OpenTicket.h"
#include "standin/server/site/Server.h"
#include "standin/server/store/memory/MemoryStore.h"
#include "tests/server/MemoryFolder.h"
#include <chrono>
#include <gtest/gtest.h>
#include <map>

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
        site->PutUser({"admin", hash, standin::AdministratorRole, 1});
        site->PutUser({"operator", hash, 1, 2});
        site->PutUser({"guest", hash, 17, 3});
        for (auto const address : {standin::SystemTicket, Job, OperatorsTicket, GuestsTicket})
            site->AddTicket(address);
        std::filesystem::create_directories(folder.Path() / "tickets");
    }

    standin::Server& Server()
    {
        if (!store)
            store = std::make_unique<standin::MemoryStore>(site);
        if (!server)
        {
            server = std::make_unique<standin::Server>(*store, siteFolder);
            server->StartCare();
        }
        return *server;
    }
    standin::TicketService& Tickets() { return Server().Tickets(); }

    standin::Session& As(std::string const& user)
    {
        auto& session = sessions[user];
        if (!session)
            session = Server().Login(user, "secret");
        return *session;
    }
    bool Logout(std::string const& user) { return Server().Logout(As(user)); }

    // Texts that are gone from their tickets and that somebody may still have the address of.
    std::size_t RetiredTexts()
    {
        standin::Epochs::Get().Drain();
        return Server().Texts().Count();
    }

    // Of any type, as that user.
    bool Get(standin::Session const& session, standin::TicketAddress address, char const* key,
             PARAM_TYPE type, void* value, int pos, standin::Incarnation incarnation = 0)
    {
        return standin::ReadTicket(Tickets(), session, address, incarnation, key, type, value, pos);
    }
    bool GetTable(standin::Session const& session, standin::TicketAddress address, GETMULTIPAR* table)
    {
        return standin::ReadTable(Tickets(), session, address, 0, table);
    }
    bool Set(standin::Session const& session, standin::TicketAddress address, char const* key,
             PARAM_TYPE type, void const* value, int pos, standin::Incarnation incarnation = 0)
    {
        return standin::WriteTicket(Tickets(), session, address, incarnation, key, type, value, pos);
    }
    bool SetTable(standin::Session const& session, standin::TicketAddress address, SETMULTIPAR* table)
    {
        return standin::WriteTable(Tickets(), session, address, 0, table);
    }

    // Reads and writes as the administrator.
    bool Set(standin::TicketAddress address, char const* key, int value, int pos = -1)
    {
        return Set(As("admin"), address, key, PARAM_INT, &value, pos);
    }
    bool Set(standin::TicketAddress address, char const* key, char const* value, int pos = -1)
    {
        return Set(As("admin"), address, key, PARAM_STRING, value, pos);
    }
    std::optional<int> Int(standin::TicketAddress address, char const* key, int pos = -1)
    {
        int value = 0;
        return Get(As("admin"), address, key, PARAM_INT, &value, pos) ? std::optional(value) : std::nullopt;
    }
    char const* Text(standin::TicketAddress address, char const* key, int pos = -1)
    {
        char const* value = nullptr;
        return Get(As("admin"), address, key, PARAM_STRING, &value, pos) ? value : nullptr;
    }

    bool Exists(standin::TicketAddress address) { return Tickets().IncarnationOf(address) != 0; }

    // What the store has of a ticket: key and position of every value.
    std::vector<std::pair<std::string, int>> PlacesInStore(standin::TicketAddress address)
    {
        std::vector<std::pair<std::string, int>> places;
        standin::MemoryStore reader(site);
        reader.Load(address,
                    [&](std::string_view key, int pos, auto const&) { places.emplace_back(key, pos); });
        reader.Leave();
        return places;
    }

    // Clears up after dead programs until the condition holds; false if it never does. A caretaker may be at
    // it on its own, so one round of the test's own is not enough.
    template <typename Condition>
    bool TidiesUntil(Condition const& condition)
    {
        auto const end = std::chrono::steady_clock::now() + std::chrono::minutes(1);
        while (!condition())
        {
            if (std::chrono::steady_clock::now() > end)
                return false;
            Server().Tidy();
            std::this_thread::yield();
        }
        return true;
    }

    // The program's death and its next start.
    void Restart()
    {
        sessions.clear();
        server.reset();
        store.reset();
    }

    MemoryFolder folder;
    std::filesystem::path siteFolder =
        folder.Path();  // a fixture may choose another before the server starts
    std::shared_ptr<standin::MemorySite> site = std::make_shared<standin::MemorySite>();
    std::unique_ptr<standin::MemoryStore> store;
    std::unique_ptr<standin::Server> server;
    std::map<std::string, std::shared_ptr<standin::Session>> sessions;
};
