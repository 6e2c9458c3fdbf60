// What programs that work on one site at once see of each other: clients of the real library and bundle, each
// a process of its own, which these tests start, speak to, stop and kill.
#include "comgui/testing/TemporaryFolder.h"
#include "tests/support/Files.h"
#include "tests/support/Program.h"
#include "tests/support/SiteClient.h"
#include "tests/support/TestSite.h"
#include "tests/support/sanitizers.h"
#include <algorithm>
#include <deque>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <map>
#include <numeric>
#include <set>
#include <sstream>
#include <thread>
#include <unistd.h>

using comgui::test::TemporaryFolder;

namespace fs = std::filesystem;
using namespace std::chrono_literals;

namespace
{
constexpr auto Patience = 60s;  // for what always arrives unless something is wrong
constexpr auto GoneWithin = IsSanitized ? 10s : 2s;
constexpr std::int64_t LongestPause = 2000000;  // in us, of a busy machine; an idle one stays far below

// One such program, logged in. What it hears of changes is kept apart from its answers.
class Client
{
public:
    Client() : m_program({COMGUI_SITE_CLIENT}) { EXPECT_EQ(Ask("login"), "0"); }

    void Begin(std::string const& command) { EXPECT_TRUE(m_program.Say(command)) << command; }

    std::string Answer()
    {
        auto const deadline = Program::Clock::now() + Patience;
        while (auto line = m_program.Line(deadline))
        {
            if (!IsEvent(*line))
                return *line;
            m_events.push_back(*line);
        }
        return "no answer";
    }

    std::string Ask(std::string const& command)
    {
        Begin(command);
        return Answer();
    }

    // The next change that it hears, "changed 60/1 Key=7"; empty if there is none within that time.
    std::string Event(Program::Clock::duration patience = Patience)
    {
        if (m_events.empty())
        {
            auto const line = m_program.Line(Program::Clock::now() + patience);
            if (!line)
                return "";
            EXPECT_TRUE(IsEvent(*line)) << *line;
            m_events.push_back(*line);
        }
        std::string event = m_events.front().substr(6);
        m_events.pop_front();
        return event;
    }

    std::vector<std::string> Events(std::size_t count)
    {
        std::vector<std::string> events;
        while (events.size() < count)
        {
            events.push_back(Event());
            if (events.back().empty())
                break;
        }
        return events;
    }

    // Waits for that event and drops those before it.
    bool Hears(std::string const& wanted, Program::Clock::duration patience = Patience)
    {
        auto const deadline = Program::Clock::now() + patience;
        for (;;)
        {
            std::string const event = Event(deadline - Program::Clock::now());
            if (event == wanted || event.empty())
                return !event.empty();
        }
    }

    void Stop() { m_program.Signal(SIGSTOP); }
    void Continue() { m_program.Signal(SIGCONT); }
    void Kill() { m_program.Kill(); }

private:
    static bool IsEvent(std::string const& line) { return line.starts_with("event "); }

    Program m_program;
    std::deque<std::string> m_events;
};

std::vector<std::int64_t> Numbers(std::string const& text)
{
    std::istringstream words(text);
    return {std::istream_iterator<std::int64_t>(words), {}};
}

std::vector<std::int64_t> Sequence(std::int64_t first, std::int64_t count)
{
    std::vector<std::int64_t> numbers(static_cast<std::size_t>(count));
    std::iota(numbers.begin(), numbers.end(), first);
    return numbers;
}

std::vector<std::int64_t> Sorted(std::vector<std::int64_t> numbers)
{
    std::sort(numbers.begin(), numbers.end());
    return numbers;
}

class ManyPrograms : public testing::Test
{
protected:
    ManyPrograms()
    {
        SiteClient::MakeSite(site);
        UseSiteIn(site);
    }

    // Gives all of them the command made from their number and only then waits, so that they work at once.
    static std::vector<std::string> AskAll(std::vector<Client>& clients,
                                           std::function<std::string(std::size_t)> const& command)
    {
        for (std::size_t i = 0; i < clients.size(); ++i)
            clients[i].Begin(command(i));
        std::vector<std::string> answers;
        for (Client& client : clients)
            answers.push_back(client.Answer());
        return answers;
    }

    static std::vector<std::int64_t> AllNumbers(std::vector<std::string> const& answers)
    {
        std::vector<std::int64_t> all;
        for (std::string const& answer : answers)
            for (std::int64_t const number : Numbers(answer))
                all.push_back(number);
        return all;
    }

    // A file that takes long to carry: many pieces with holes between, which are carried one by one.
    std::string SlowFile() const
    {
        fs::path const file = folder / "slow";
        std::string const piece(4096, 'x');
        int const target = open(file.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600);
        for (off_t i = 0; i < 20000; ++i)
            EXPECT_EQ(pwrite(target, piece.data(), piece.size(), 2 * i * 4096), 4096);
        close(target);
        return file.string();
    }

    // For what no program reports: checks repeatedly until it is so.
    static bool Becomes(std::function<bool()> const& so, Program::Clock::duration within)
    {
        auto const deadline = Program::Clock::now() + within;
        while (!so())
        {
            if (Program::Clock::now() > deadline)
                return false;
            std::this_thread::sleep_for(1ms);
        }
        return true;
    }

    // How long something took, for the log of the test.
    static void Record(char const* what, Program::Clock::time_point since)
    {
        auto const took = Program::Clock::now() - since;
        RecordProperty(what,
                       static_cast<int>(std::chrono::duration_cast<std::chrono::milliseconds>(took).count()));
    }

    TemporaryFolder folder;
    fs::path const site = folder / "site";
};

using KilledProgram = ManyPrograms;
using StoppedProgram = ManyPrograms;
}  // namespace

// --- What one wrote the others read ----------------------------------------------------------------------

TEST_F(ManyPrograms, WriteThatReturned_IsReadByItsProgramAndByEveryOther)
{
    std::vector<Client> clients(3);
    ASSERT_EQ(clients[0].Ask("make 60/1"), "1");
    for (std::size_t round = 0; round < 150; ++round)
    {
        std::string const value = std::to_string(round);
        ASSERT_EQ(clients[round % 3].Ask("set 60/1 Value " + value), "1");
        for (Client& client : clients)
            ASSERT_EQ(client.Ask("get 60/1 Value"), value);
    }
}

TEST_F(ManyPrograms, TicketThatOneMadeOrDeleted_IsThereOrGoneForTheOther)
{
    Client one;
    Client other;
    for (int round = 0; round < 20; ++round)
    {
        ASSERT_EQ(one.Ask("make 60/1"), "1");
        ASSERT_EQ(other.Ask("set 60/1 Value 5"), "1");
        ASSERT_EQ(other.Ask("ids 60"), "1");
        ASSERT_EQ(one.Ask("delete 60 1 1"), "1");
        ASSERT_EQ(other.Ask("get 60/1 Value"), "none");
        ASSERT_EQ(other.Ask("ids 60"), "");
        ASSERT_EQ(other.Ask("set 60/1 Value 6"), "0");
    }
}

TEST_F(ManyPrograms, ValueThatOneRemoved_IsGoneForTheOther)
{
    Client one;
    Client other;
    ASSERT_EQ(one.Ask("make 60/1"), "1");
    ASSERT_EQ(one.Ask("set 60/1 Value 5"), "1");
    ASSERT_EQ(other.Ask("get 60/1 Value"), "5");
    ASSERT_EQ(one.Ask("remove 60/1 Value"), "1");
    EXPECT_EQ(other.Ask("get 60/1 Value"), "none");
}

// --- A table is whole ------------------------------------------------------------------------------------

TEST_F(ManyPrograms, Tables_AreSeenWholeOrNotAtAll)
{
    std::vector<Client> clients(5);
    ASSERT_EQ(clients[0].Ask("make 60/1"), "1");
    auto const answers =
        AskAll(clients, [](std::size_t i) { return i < 2 ? "tables 60/1 1500" : "look 60/1 1500"; });
    for (std::size_t i = 0; i < 2; ++i)
        EXPECT_GT(std::stoi(answers[i]), 1);
    for (std::size_t i = 2; i < answers.size(); ++i)
    {
        auto const seen = Numbers(answers[i]);  // reads, different ones, torn ones
        ASSERT_EQ(seen.size(), 3u) << answers[i];
        EXPECT_GT(seen[1], 1) << "this reader has seen nothing change";
        EXPECT_EQ(seen[2], 0) << "torn, of " << seen[0];
    }
}

// --- Nothing is lost -------------------------------------------------------------------------------------

TEST_F(ManyPrograms, EightThatAppendToOneList_LoseNothing)
{
    constexpr std::size_t Programs = 8;
    constexpr std::int64_t Each = 100;
    std::vector<Client> clients(Programs);
    ASSERT_EQ(clients[0].Ask("make 60/1"), "1");
    auto const answers =
        AskAll(clients, [](std::size_t i)
               { return "append 60/1 List " + std::to_string(1000 * i) + " " + std::to_string(Each); });
    EXPECT_EQ(answers, std::vector<std::string>(Programs, std::to_string(Each)));

    std::map<std::int64_t, std::vector<std::int64_t>> appended;
    for (std::int64_t const value : Numbers(clients[3].Ask("list 60/1 List")))
        appended[value / 1000].push_back(value);
    ASSERT_EQ(appended.size(), Programs);
    for (auto const& [program, values] : appended)
        EXPECT_EQ(values, Sequence(1000 * program, Each));  // each once, in the order of its program
}

TEST_F(ManyPrograms, EightThatCreateTheNextTicket_GetEachIdOnce)
{
    constexpr std::int64_t Each = 25;
    std::vector<Client> clients(8);
    auto const ids =
        AllNumbers(AskAll(clients, [](std::size_t) { return "create 62 " + std::to_string(Each); }));
    EXPECT_EQ(Sorted(ids), Sequence(1, 8 * Each));
    EXPECT_EQ(Numbers(clients[0].Ask("ids 62")), Sequence(1, 8 * Each));
}

TEST_F(ManyPrograms, EightThatDeleteTheSameTickets_DeleteEachOnce)
{
    constexpr std::int64_t Tickets = 50;
    std::vector<Client> clients(8);
    ASSERT_EQ(Numbers(clients[0].Ask("create 62 50")), Sequence(1, Tickets));
    auto const deleted = AllNumbers(AskAll(clients, [](std::size_t) { return "delete 62 1 50"; }));
    EXPECT_EQ(Sorted(deleted), Sequence(1, Tickets));
    EXPECT_EQ(clients[7].Ask("ids 62"), "");
}

TEST_F(ManyPrograms, WritesOfSeveralToOwnKeysOfOneTicket_AllLast)
{
    std::vector<Client> clients(4);
    ASSERT_EQ(clients[0].Ask("make 60/1"), "1");
    auto const answers =
        AskAll(clients, [](std::size_t i) { return "stream 60/1 Key" + std::to_string(i) + " 500"; });
    for (std::size_t i = 0; i < clients.size(); ++i)
    {
        std::string const written = answers[i].substr(0, answers[i].find(' '));
        EXPECT_GT(std::stoi(written), 0);
        EXPECT_EQ(clients[(i + 1) % 4].Ask("get 60/1 Key" + std::to_string(i)), written);
    }
}

TEST_F(ManyPrograms, WriteThroughTheTableOfATicketThatIsGone_FailsAlsoAtItsNextTenant)
{
    Client one;
    Client other;
    ASSERT_EQ(one.Ask("make 60/1"), "1");
    ASSERT_EQ(other.Ask("open 60/1"), "1");
    ASSERT_EQ(other.Ask("write Value 1"), "1");
    ASSERT_EQ(one.Ask("delete 60 1 1"), "1");
    EXPECT_EQ(other.Ask("write Value 2"), "0");
    ASSERT_EQ(one.Ask("make 60/1"), "1");
    EXPECT_EQ(other.Ask("write Value 3"), "0");
    EXPECT_EQ(one.Ask("get 60/1 Value"), "none");
    ASSERT_EQ(other.Ask("open 60/1"), "1");
    EXPECT_EQ(other.Ask("write Value 4"), "1");
    EXPECT_EQ(one.Ask("get 60/1 Value"), "4");
}

// --- Everybody hears of everything -----------------------------------------------------------------------

TEST_F(ManyPrograms, Subscriber_HearsWhatTheOthersAndItselfDid)
{
    Client one;
    Client other;
    ASSERT_EQ(other.Ask("watch 60"), "1");
    ASSERT_EQ(one.Ask("make 60/1"), "1");
    ASSERT_EQ(one.Ask("set 60/1 Value 5"), "1");
    ASSERT_EQ(other.Ask("set 60/1 Value 6"), "1");
    ASSERT_EQ(one.Ask("remove 60/1 Value"), "1");
    ASSERT_EQ(one.Ask("delete 60 1 1"), "1");
    EXPECT_EQ(other.Events(5),
              (std::vector<std::string>{"created 60/1", "changed 60/1 Value=5", "changed 60/1 Value=6",
                                        "changed 60/1 Value=none", "deleted 60/1"}));
}

TEST_F(ManyPrograms, Subscribers_HearEveryChangeOnceAndInTheSameOrder)
{
    std::vector<Client> clients(4);  // the last one only listens
    ASSERT_EQ(clients[0].Ask("make 60/1"), "1");
    for (Client& client : clients)
        ASSERT_EQ(client.Ask("watch 60"), "1");
    constexpr std::size_t Each = 200;
    for (std::size_t i = 0; i < 3; ++i)
        clients[i].Begin("append 60/1 List " + std::to_string(1000 * i) + " " + std::to_string(Each));
    for (std::size_t i = 0; i < 3; ++i)
        ASSERT_EQ(clients[i].Answer(), std::to_string(Each));
    ASSERT_EQ(clients[0].Ask("set 60/1 End 1"), "1");

    // The order of the commits is that of the list.
    std::vector<std::string> expected;
    for (std::int64_t const value : Numbers(clients[0].Ask("list 60/1 List")))
        expected.push_back("changed 60/1 List=" + std::to_string(value));
    ASSERT_EQ(expected.size(), 3 * Each);
    expected.push_back("changed 60/1 End=1");
    for (Client& client : clients)
        EXPECT_EQ(client.Events(expected.size()), expected);
}

TEST_F(StoppedProgram, HearsEverythingInOrderWhenItGoesOn)
{
    Client stopped;
    Client writer;
    ASSERT_EQ(writer.Ask("make 60/1"), "1");
    ASSERT_EQ(stopped.Ask("watch 60"), "1");
    ASSERT_EQ(writer.Ask("set 60/1 Value 0"), "1");
    ASSERT_EQ(stopped.Event(), "changed 60/1 Value=0");

    stopped.Stop();
    auto const written = Numbers(writer.Ask("stream 60/1 Value 700"));
    ASSERT_EQ(written.size(), 2u);
    ASSERT_GT(written[0], 1);
    EXPECT_LT(written[1], LongestPause) << "who does not listen holds up who writes";
    RecordProperty("longest_write_us", static_cast<int>(written[1]));
    ASSERT_EQ(writer.Ask("set 60/1 Value -1"), "1");
    stopped.Continue();

    for (std::int64_t value = 1; value <= written[0]; ++value)
        ASSERT_EQ(stopped.Event(), "changed 60/1 Value=" + std::to_string(value)) << "of " << written[0];
    EXPECT_EQ(stopped.Event(), "changed 60/1 Value=-1");
    EXPECT_EQ(stopped.Ask("get 60/1 Value"), "-1");
}

// --- A program may die at any instant --------------------------------------------------------------------

TEST_F(KilledProgram, InTheMiddleOfItsWrites_LeavesTheOthersAtWork)
{
    Client watcher;
    std::vector<Client> survivors(2);
    for (char const* ticket : {"60/0", "60/1", "61/1"})
        ASSERT_EQ(watcher.Ask(std::string("make ") + ticket), "1");
    ASSERT_EQ(watcher.Ask("watch 61"), "1");  // the victims' ticket; the survivors write others
    for (std::size_t i = 0; i < survivors.size(); ++i)
        survivors[i].Begin("stream 60/" + std::to_string(i) + " Value 2500");
    for (int kill = 1; kill <= 3; ++kill)
    {
        Client victim;
        ASSERT_EQ(victim.Ask("set 61/1 Value 0"), "1");
        victim.Begin("stream 61/1 Value 60000");
        ASSERT_TRUE(watcher.Hears("changed 61/1 Value=20"));
        victim.Kill();
    }
    int longest = 0;
    for (Client& survivor : survivors)
    {
        auto const written = Numbers(survivor.Answer());
        ASSERT_EQ(written.size(), 2u);
        EXPECT_LT(written[1], LongestPause);
        longest = std::max(longest, static_cast<int>(written[1]));
    }
    RecordProperty("longest_pause_us", longest);
    EXPECT_GE(Numbers(survivors[0].Ask("get 61/1 Value")).at(0), 20);
}

TEST_F(KilledProgram, WhatItHadAcknowledged_IsReadAndHeardByTheOthers)
{
    Client other;
    Client victim;
    ASSERT_EQ(other.Ask("make 60/1"), "1");
    ASSERT_EQ(other.Ask("watch 60"), "1");
    ASSERT_EQ(victim.Ask("append 60/1 List 1 50"), "50");
    victim.Kill();
    EXPECT_EQ(Numbers(other.Ask("list 60/1 List")), Sequence(1, 50));
    for (int value = 1; value <= 50; ++value)
        EXPECT_EQ(other.Event(), "changed 60/1 List=" + std::to_string(value));
}

TEST_F(KilledProgram, PreparedJob_IsGone)
{
    Client other;
    Client victim;
    ASSERT_EQ(other.Ask("watch 3"), "1");
    std::string const job = victim.Ask("prepare brochure.pdf");
    ASSERT_TRUE(other.Hears("created 3/" + job));
    ASSERT_EQ(other.Ask("state " + job), "0");
    auto const before = Program::Clock::now();
    victim.Kill();
    EXPECT_TRUE(other.Hears("deleted 3/" + job, GoneWithin));
    Record("gone_after_ms", before);
    EXPECT_EQ(other.Ask("state " + job), "none");
}

TEST_F(KilledProgram, JobOnItsWay_IsGoneWithItsFolder)
{
    std::string const source = SlowFile();
    Client other;
    Client victim;
    ASSERT_EQ(other.Ask("watch 3"), "1");
    std::string const job = victim.Ask("prepare slow");
    fs::path const place = site / "job" / job;
    victim.Begin("send " + source + " slow");
    ASSERT_TRUE(Becomes([&] { return fs::exists(place); }, Patience));
    victim.Stop();
    ASSERT_TRUE(fs::exists(place) && !fs::exists(place / "slow")) << "the file was there too soon";
    auto const before = Program::Clock::now();
    victim.Kill();
    EXPECT_TRUE(other.Hears("deleted 3/" + job, GoneWithin));
    EXPECT_TRUE(Becomes([&] { return !fs::exists(place); }, GoneWithin));
    Record("gone_after_ms", before);
}

TEST_F(KilledProgram, FileOnItsWay_LeavesNoPartOfItself)
{
    std::string const source = SlowFile();
    Client other;  // keeps the site open
    Client victim;
    fs::path const place = site / "temp";
    ASSERT_TRUE(fs::is_empty(place));
    ASSERT_EQ(victim.Ask("put " + source + " $(TEMP)/slow"), "0");
    ASSERT_TRUE(Becomes([&] { return !fs::is_empty(place); }, Patience));
    victim.Stop();
    ASSERT_FALSE(fs::is_empty(place) || fs::exists(place / "slow")) << "the file was there too soon";
    auto const before = Program::Clock::now();
    victim.Kill();
    EXPECT_TRUE(Becomes([&] { return fs::is_empty(place); }, GoneWithin));
    Record("gone_after_ms", before);
    EXPECT_EQ(other.Ask("ids 3"), "");
}

TEST_F(StoppedProgram, KeepsItsPreparedJob)
{
    Client other;
    Client stopped;
    std::string const job = stopped.Ask("prepare brochure.pdf");
    stopped.Stop();
    ASSERT_EQ(other.Ask("make 60/1"), "1");
    auto const written =
        Numbers(other.Ask("stream 60/1 Value 2500"));  // longer than a dead one's job is left
    EXPECT_EQ(written.size(), 2u);
    EXPECT_EQ(other.Ask("state " + job), "0");
    stopped.Continue();
    EXPECT_EQ(stopped.Ask("state " + job), "0");
}
