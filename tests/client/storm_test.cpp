// The kit while everything goes wrong at once: calls fail and are late, notifications are lost, late, twice
// and swapped, transfers stand still, the disk is full, the server goes and comes back, with its sessions or
// without.
#include "tests/client/Client.h"

#include "tests/support/Files.h"
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <gmock/gmock.h>
#include <iostream>
#include <mutex>
#include <thread>

using namespace comgui;
using namespace std::chrono_literals;

namespace
{
using Clock = std::chrono::steady_clock;

constexpr auto Patience = 30s;

// A minute, or as many seconds as COMGUI_STORM says.
std::chrono::seconds LengthOfTheStorm()
{
    char const* const told = std::getenv("COMGUI_STORM");
    return std::chrono::seconds(told ? std::atoi(told) : 60);
}

std::vector<std::string> Weather(int gust)
{
    std::string const seed = " seed=" + std::to_string(gust);
    std::vector<std::string> const always{"fail share=5%" + seed, "delay by=5ms share=5%" + seed};
    std::vector<std::vector<std::string>> const gusts{
        {"late by=200ms share=20%" + seed, "twice share=20%" + seed, "swapped share=20%" + seed},
        {"lost share=50%" + seed, "stall by=300ms share=50%" + seed},
        {"away for=300ms"},
        {"full", "fail call=MENDISNOTIF"},
        {"away for=200ms sessions=lost"},
        {"fail share=60%" + seed},
        {"fail call=LoginEntry", "fail call=remote.system.isalive share=50%" + seed},
        {},
    };
    auto rules = gusts[static_cast<std::size_t>(gust) % gusts.size()];
    rules.insert(rules.end(), always.begin(), always.end());
    return rules;
}

class Storm : public Client
{
protected:
    Storm()
    {
        LogIn();
        counters = {NewTicket(), NewTicket()};
    }

    void Blow()
    {
        auto const end = Clock::now() + LengthOfTheStorm();
        for (int gust = 0; Clock::now() < end; ++gust)
        {
            site.SetTrouble(Weather(gust));
            for (auto const change = Clock::now() + 700ms; Clock::now() < change;)
                queue.RunFor(10ms);
        }
        isOver = true;
    }

    // Counts in a ticket; gives the last number that the kit said was written.
    int Count(TicketAddress ticket) const
    {
        int written = 0;
        for (int number = 1; !isOver; ++number)
        {
            if (tickets.Write(ticket, "Count", number))
                written = number;
            std::this_thread::sleep_for(1ms);
        }
        return written;
    }

    // A read is a number that was written, or a failure; never an older number than before.
    void Watch(TicketAddress ticket) const
    {
        for (int last = 0; !isOver; std::this_thread::sleep_for(1ms))
            if (auto const number = tickets.ReadAs<int>(ticket, "Count"))
            {
                EXPECT_GE(*number, last);
                last = *number;
            }
    }

    // Sends files and jobs, and fetches them again; what arrived is whole.
    void Carry()
    {
        std::string const content(100'000, 'x');
        auto const file = folder.Write("here", content).string();
        auto const transfers = connection.GetTransfers();
        while (!isOver)
        {
            auto const sent = transfers.Put(file, "$(TEMP)/there");
            auto const job = transfers.SendJob(file);
            auto const fetched = transfers.Get("$(TEMP)/there", (folder / "back").string());
            for (Transfer const& transfer : {sent, job, fetched})
                EXPECT_TRUE(transfer.WaitFor(Patience)) << "a transfer hangs";
            auto const isWhole = [&](Transfer const& transfer, std::filesystem::path const& where)
            { return !transfer.Wait() || ContentOf(where) == content; };
            EXPECT_TRUE(isWhole(sent, site.Folder() / "temp/there"));
            EXPECT_TRUE(isWhole(fetched, folder / "back"));
            arrived += sent.Wait() ? 1 : 0;
        }
    }

    // A second client, who comes and goes.
    void ComeAndGo()
    {
        Connection other;
        while (!isOver)
        {
            auto const subscription =
                other.Subscribe(Interest::InTypes({JobTickets}), queue.GetExecutor(), [](Event const&) {});
            if (other.LogIn(Here(), Operator()))
                ++logins;
            std::this_thread::sleep_for(20ms);
            static_cast<void>(other.LogOut());  // the session may be lost
        }
    }

    template <typename IsThere>
    void Await(IsThere const& isThere, char const* what)
    {
        for (auto const end = Clock::now() + Patience; !isThere() && Clock::now() < end;)
            queue.RunFor(5ms);
        EXPECT_TRUE(isThere()) << what;
    }

    TaskQueue queue;
    std::atomic<bool> isOver{false};
    std::array<TicketAddress, 2> counters{};
    std::atomic<int> arrived{0};
    std::atomic<int> logins{0};
};
}  // namespace

TEST_F(Storm, IsSurvived)
{
    int lost = 0;
    bool isLost = false;
    int changes = 0;
    std::optional<int> heard;
    auto const subscription = connection.Subscribe(
        Interest::InTypes({JobTickets}), queue.GetExecutor(),
        [&](Event const& event)
        {
            lost += std::holds_alternative<ServerLost>(event) ? 1 : 0;
            if (std::holds_alternative<ServerLost>(event) || std::holds_alternative<ServerBack>(event))
                isLost = std::holds_alternative<ServerLost>(event);
            auto const* const change = std::get_if<TicketChanged>(&event);
            if (!change || change->ticket != counters[0])
                return;
            ++changes;
            for (KeyChange const& key : change->keys)
                if (key.value && std::holds_alternative<int>(*key.value))
                    heard = std::get<int>(*key.value);
        });
    testing::internal::CaptureStderr();  // the stand-in tells what it refuses
    std::array<int, 2> written{};
    std::vector<std::thread> clients;
    clients.emplace_back([&] { written[0] = Count(counters[0]); });
    clients.emplace_back([&] { written[1] = Count(counters[1]); });
    clients.emplace_back([&] { Watch(counters[0]); });
    clients.emplace_back([&] { Carry(); });
    clients.emplace_back([&] { ComeAndGo(); });
    Blow();
    for (std::thread& client : clients)
        client.join();
    std::string const told = testing::internal::GetCapturedStderr();
    if (told.find("Sanitizer") != std::string::npos)
        std::cerr << told;
    site.SetTrouble({});

    // The kit asks once a second; until then it may not know that its session is lost.
    Await([&] { return tickets.Read(counters[0], "Count").operator bool(); }, "the server is back");
    Await([&] { return connection.IsLoggedIn() && connection.IsServerThere(); }, "and the kit knows it");
    for (std::size_t i = 0; i < counters.size(); ++i)
    {
        auto const number = tickets.ReadAs<int>(counters[i], "Count");
        ASSERT_TRUE(number);
        EXPECT_GE(*number, written[i]) << "a write that succeeded is lost";
    }
    int below = 0;  // the storm's numbers
    Await(
        [&]
        {
            EXPECT_TRUE(tickets.Write(counters[0], "Count", --below));
            return heard && *heard < 0;
        },
        "changes are heard of again");
    // A question asked during the storm may have been answered only now.
    Await([&] { return !isLost; }, "and the last that was told is that it is back");
    EXPECT_GT(lost, 0);
    EXPECT_GT(changes, 1);
    EXPECT_GT(arrived, 0);
    EXPECT_GT(logins, 0);
    EXPECT_TRUE(connection.LogOut());
}
