#include "desk/model/TicketSearch.h"

#include <future>
#include <gtest/gtest.h>
#include <map>
#include <thread>

using namespace comgui;
using namespace desk;

namespace
{
// Tickets in memory, with the errors that a reader may give.
struct Site
{
    std::map<TicketAddress, Snapshot> tickets;
    std::map<TicketAddress, int> errors;
    int reads = 0;

    SearchReader Reader()
    {
        return [this](TicketAddress ticket) -> Result<Snapshot>
        {
            ++reads;
            if (auto const error = errors.find(ticket); error != errors.end())
                return Error{error->second, {}, {}};
            auto const found = tickets.find(ticket);
            return found == tickets.end() ? Result<Snapshot>(Error{NoSuchTicket, {}, {}}) : found->second;
        };
    }

    std::vector<TicketAddress> All() const
    {
        std::vector<TicketAddress> all;
        for (auto const& [address, ticket] : tickets)
            all.push_back(address);
        return all;
    }
};

Site SomeJobs()
{
    Site site;
    site.tickets[{3, 1}] = Snapshot({{"Job/Copies", 3}, {"Job/Name", "Spring catalogue"}});
    site.tickets[{3, 2}] =
        Snapshot({{"Job/Copies", 30}, {"Job/Inks", List{{0, "Cyan"}, {2, "Black, rich"}}}});
    site.tickets[{7, 1}] = Snapshot({{"Queue/Name", "copies"}, {"Queue/Mark", Bytes{"\x0A\xFF"}}});
    return site;
}

Site ManyJobs(int count)
{
    Site site;
    for (int id = 0; id < count; ++id)
        site.tickets[{3, id}] = Snapshot({{"Job/Number", id}});
    return site;
}

std::string Found(std::string const& text, SearchIn where)
{
    Site site = SomeJobs();
    TicketSearch search({text, where}, site.All(), site.Reader());
    std::string found;
    for (auto const& match : search.Step(1000).matches)
        found += std::to_string(match.ticket.type) + "/" + std::to_string(match.ticket.id) + " " + match.key +
                 " " + std::to_string(match.keys) + "; ";
    return found;
}
}  // namespace

TEST(TicketSearch, InKeys_PassesOverValues)
{
    EXPECT_EQ(Found("copies", SearchIn::Keys), "3/1 Job/Copies 1; 3/2 Job/Copies 1; ");
}

TEST(TicketSearch, InValues_PassesOverKeys)
{
    EXPECT_EQ(Found("COPIES", SearchIn::Values), "7/1 Queue/Name 1; ");
}

TEST(TicketSearch, InBoth_FindsBoth)
{
    EXPECT_EQ(Found("copies", SearchIn::Both), "3/1 Job/Copies 1; 3/2 Job/Copies 1; 7/1 Queue/Name 1; ");
}

TEST(TicketSearch, ATicket_IsOneMatchWithItsFirstKey)
{
    EXPECT_EQ(Found("job/", SearchIn::Keys), "3/1 Job/Copies 2; 3/2 Job/Copies 2; ");
}

TEST(TicketSearch, NumbersAreTexts) { EXPECT_EQ(Found("30", SearchIn::Values), "3/2 Job/Copies 1; "); }

TEST(TicketSearch, BytesAreHexadecimal) { EXPECT_EQ(Found("0AFF", SearchIn::Values), "7/1 Queue/Mark 1; "); }

TEST(TicketSearch, ListsMatchAsShownAndEachValue)
{
    EXPECT_EQ(Found("black, rich", SearchIn::Values), "3/2 Job/Inks 1; ");
    EXPECT_EQ(Found("cyan, , \"black", SearchIn::Values), "3/2 Job/Inks 1; ");
}

TEST(TicketSearch, AnEquation_WantsTheWholeKeyAndValue)
{
    EXPECT_EQ(Found("Job/Copies=3", SearchIn::Both), "3/1 Job/Copies 1; ");
    EXPECT_EQ(Found("job/inks=CYAN", SearchIn::Both), "3/2 Job/Inks 1; ");
    EXPECT_EQ(Found("Copies=3", SearchIn::Both), "");
    EXPECT_EQ(Found("Job/Copies=3", SearchIn::Keys), "");
}

TEST(TicketSearch, TheEmptyText_FindsNothingAndReadsNothing)
{
    Site site = SomeJobs();
    TicketSearch search({"", SearchIn::Both}, site.All(), site.Reader());
    SearchBatch const batch = search.Step(10);
    EXPECT_EQ(batch.state, SearchState::Finished);
    EXPECT_TRUE(batch.matches.empty());
    EXPECT_EQ(site.reads, 0);
}

TEST(TicketSearch, WithoutTickets_IsFinished)
{
    Site site;
    TicketSearch search({"a", SearchIn::Both}, {}, site.Reader());
    EXPECT_EQ(search.Step(10).state, SearchState::Finished);
}

TEST(TicketSearch, Steps_SayHowFarTheyAre)
{
    Site site = ManyJobs(5);
    TicketSearch search({"number", SearchIn::Keys}, site.All(), site.Reader());
    SearchBatch batch = search.Step(2);
    EXPECT_EQ(batch.state, SearchState::Running);
    EXPECT_EQ(batch.done, 2U);
    EXPECT_EQ(batch.total, 5U);
    EXPECT_EQ(batch.matches.size(), 2U);
    EXPECT_EQ(search.Step(2).matches.at(0).ticket, (TicketAddress{3, 2}));
    batch = search.Step(2);
    EXPECT_EQ(batch.state, SearchState::Finished);
    EXPECT_EQ(batch.done, 5U);
    EXPECT_EQ(batch.matches.size(), 1U);
}

TEST(TicketSearch, AStepBeyondTheEnd_ReadsNothing)
{
    Site site = ManyJobs(2);
    TicketSearch search({"number", SearchIn::Keys}, site.All(), site.Reader());
    search.Step(2);
    EXPECT_TRUE(search.Step(2).matches.empty());
    EXPECT_EQ(site.reads, 2);
}

TEST(TicketSearch, AStepOfNothing_StillMovesOn)
{
    Site site = ManyJobs(2);
    TicketSearch search({"number", SearchIn::Keys}, site.All(), site.Reader());
    EXPECT_EQ(search.Step(0).done, 1U);
    EXPECT_EQ(search.Step(static_cast<std::size_t>(-1)).done, 2U);
}

TEST(TicketSearch, TicketsThatAreGone_AreCountedAndPassedOver)
{
    Site site = ManyJobs(4);
    auto const all = site.All();
    site.tickets.erase({3, 1});
    site.errors[{3, 2}] = BadAnswer;
    TicketSearch search({"number", SearchIn::Keys}, all, site.Reader());
    SearchBatch const batch = search.Step(10);
    EXPECT_EQ(batch.state, SearchState::Finished);
    EXPECT_EQ(batch.matches.size(), 2U);
    EXPECT_EQ(batch.gone, 1U);
    EXPECT_EQ(batch.unreadable, 1U);
    EXPECT_EQ(batch.done, 4U);
}

TEST(TicketSearch, WithoutTheServer_WaitsAtTheTicketThatItCouldNotRead)
{
    Site site = ManyJobs(4);
    site.errors[{3, 2}] = ServerAway;
    TicketSearch search({"number", SearchIn::Keys}, site.All(), site.Reader());
    SearchBatch batch = search.Step(10);
    EXPECT_EQ(batch.state, SearchState::Interrupted);
    ASSERT_TRUE(batch.error);
    EXPECT_EQ(batch.error->code, ServerAway);
    EXPECT_EQ(batch.done, 2U);
    EXPECT_EQ(batch.matches.size(), 2U);
    site.errors.clear();
    batch = search.Step(10);
    EXPECT_EQ(batch.state, SearchState::Finished);
    EXPECT_EQ(batch.matches.at(0).ticket, (TicketAddress{3, 2}));
    EXPECT_FALSE(batch.error);
}

TEST(TicketSearch, CancelledBefore_ReadsNothing)
{
    Site site = ManyJobs(2);
    TicketSearch search({"number", SearchIn::Keys}, site.All(), site.Reader());
    search.Cancel();
    EXPECT_EQ(search.Step(10).state, SearchState::Cancelled);
    EXPECT_EQ(site.reads, 0);
}

TEST(TicketSearch, CancelledWithinAStep_ReportsOnlyWhatWasFound)
{
    Site site = ManyJobs(10);
    TicketSearch* running = nullptr;
    TicketSearch search({"number", SearchIn::Keys}, site.All(),
                        [&, read = site.Reader()](TicketAddress ticket)
                        {
                            if (ticket.id == 3)
                                running->Cancel();
                            return read(ticket);
                        });
    running = &search;
    SearchBatch const batch = search.Step(10);
    EXPECT_EQ(batch.state, SearchState::Cancelled);
    EXPECT_EQ(batch.matches.size(), 3U);
    EXPECT_EQ(batch.done, 3U);
    EXPECT_EQ(site.reads, 4);
}

TEST(TicketSearch, CancelledFromAnotherThread_LooksAtNoFurtherKey)
{
    std::promise<void> isReading;
    std::promise<void> isCancelled;
    TicketSearch search({"key", SearchIn::Keys}, {{3, 1}, {3, 2}},
                        [&](TicketAddress) -> Result<Snapshot>
                        {
                            isReading.set_value();  // a second time would throw
                            isCancelled.get_future().wait();
                            return Snapshot({{"Key", 1}});
                        });
    auto step = std::async(std::launch::async, [&search] { return search.Step(10); });
    isReading.get_future().wait();
    search.Cancel();
    isCancelled.set_value();
    SearchBatch const batch = step.get();
    EXPECT_EQ(batch.state, SearchState::Cancelled);
    EXPECT_TRUE(batch.matches.empty());
}

TEST(TicketSearch, ATicketOfHundredThousandKeys_IsOneMatch)
{
    std::vector<SnapshotEntry> entries;
    for (int i = 0; i < 100000; ++i)
        entries.push_back({"Key/" + std::to_string(1000000 + i), i});
    Site site;
    site.tickets[{3, 1}] = Snapshot(std::move(entries));
    TicketSearch search({"key", SearchIn::Keys}, site.All(), site.Reader());
    SearchBatch const batch = search.Step(1);
    ASSERT_EQ(batch.matches.size(), 1U);
    EXPECT_EQ(batch.matches[0].keys, 100000U);
    EXPECT_EQ(batch.matches[0].key, "Key/1000000");
}

TEST(TicketSearch, HundredThousandTickets_AreSearched)
{
    Site site = ManyJobs(100000);
    TicketSearch search({"99999", SearchIn::Values}, site.All(), site.Reader());
    std::size_t matches = 0;
    SearchBatch batch;
    while (batch.state == SearchState::Running)
    {
        batch = search.Step(500);
        matches += batch.matches.size();
    }
    EXPECT_EQ(batch.done, 100000U);
    EXPECT_EQ(matches, 1U);
}

TEST(TicketSearch, Step_EndsWhenItsTimeIsOver_ButNotBeforeItHasLookedAtOne)
{
    Site site = ManyJobs(10);
    auto const slowly = [read = site.Reader()](TicketAddress ticket)
    {
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
        return read(ticket);
    };
    TicketSearch search({"number"}, site.All(), slowly);
    EXPECT_EQ(search.Step(10, std::chrono::nanoseconds(0)).done, 1u);
    EXPECT_LE(search.Step(10, std::chrono::milliseconds(50)).done, 4u);
    EXPECT_EQ(search.Step(10).done, 10u);
}

TEST(TicketSearch, ThatHasFoundEnough_ReadsNoMore)
{
    Site site = ManyJobs(10);
    TicketSearch search({"number", SearchIn::Both, 3}, site.All(), site.Reader());
    EXPECT_EQ(search.Step(2).state, SearchState::Running);
    SearchBatch const last = search.Step(100);
    EXPECT_EQ(last.state, SearchState::Enough);
    EXPECT_EQ(last.matches.size(), 1u);
    EXPECT_EQ(last.found, 3u);
    EXPECT_EQ(last.done, 3u);
    EXPECT_EQ(search.Step(100).state, SearchState::Enough);
    EXPECT_EQ(site.reads, 3);
}

TEST(TicketSearch, ThatHasFoundEnoughWithTheLastTicket_IsFinished)
{
    Site site = ManyJobs(3);
    TicketSearch search({"number", SearchIn::Both, 3}, site.All(), site.Reader());
    EXPECT_EQ(search.Step(100).state, SearchState::Finished);
}
