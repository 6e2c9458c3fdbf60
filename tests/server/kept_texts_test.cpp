// How long texts live that were read, by a clock of the test's own.
#include "standin/module/WalkedNumbers.h"
#include "standin/server/sessions/KeptTexts.h"
#include "tests/support/Allocations.h"
#include <gtest/gtest.h>
#include <memory>
#include <optional>
#include <vector>

using namespace standin;
using namespace std::chrono_literals;

namespace
{
struct Client
{
    explicit Client(KeptTexts& kept) : lease(kept.Open(reader)) {}

    void Reads(std::uint64_t texts)
    {
        for (std::uint64_t i = 0; i < texts; ++i)
            reader.NoteRead();
    }

    TextReader reader;
    KeptTexts::Lease lease;
};

class KeptTextsTest : public testing::Test
{
protected:
    // A text that those have read leaves its ticket.
    void Replace(std::initializer_list<Client*> readers)
    {
        TicketTexts texts;
        texts.push_back(std::make_unique<TicketText>("a text that is long enough to be on the heap"));
        for (Client* const reader : readers)
            texts.back()->HandOut(reader->reader.Mark());
        kept.Keep(std::move(texts));
    }
    // One that nobody has read, so that what is old is looked for.
    void LookAgain() { kept.Keep({}); }

    KeptTexts::Time now{};
    KeptTexts kept{[this] { return now; }};
};
}  // namespace

TEST_F(KeptTextsTest, TextThatNobodyHasRead_IsNotKept)
{
    Client const client(kept);
    Replace({});
    EXPECT_EQ(kept.Count(), 0u);
}

TEST_F(KeptTextsTest, Text_IsKeptForThoseOnlyWhoHaveReadIt)
{
    auto first = std::make_unique<Client>(kept);
    auto second = std::make_unique<Client>(kept);
    Client const third(kept);
    Replace({first.get(), second.get()});
    first.reset();
    EXPECT_EQ(kept.Count(), 1u);
    second.reset();
    EXPECT_EQ(kept.Count(), 0u);
}

TEST_F(KeptTextsTest, TextReadByWhoHasEnded_IsNotKept)
{
    auto gone = std::make_unique<Client>(kept);
    std::uint64_t const mark = gone->reader.Mark();
    gone.reset();
    TicketTexts texts;
    texts.push_back(std::make_unique<TicketText>("a"));
    texts.back()->HandOut(mark);
    kept.Keep(std::move(texts));
    EXPECT_EQ(kept.Count(), 0u);
}

TEST_F(KeptTextsTest, WhoTakesTheMarkOfOneWhoHasEnded_GetsNoneOfHisTexts)
{
    Client other(kept);
    auto gone = std::make_unique<Client>(kept);
    Replace({gone.get(), &other});
    gone.reset();
    auto next = std::make_unique<Client>(kept);  // has the mark now
    other.lease.reset();
    EXPECT_EQ(kept.Count(), 0u);
}

TEST_F(KeptTextsTest, Lease_LivesAsLongAsItsLastCopy)
{
    Client client(kept);
    KeptTexts::Lease walk = client.lease;
    Replace({&client});
    client.lease.reset();
    EXPECT_EQ(kept.Count(), 1u);
    Replace({&client});  // while it walks
    EXPECT_EQ(kept.Count(), 2u);
    walk.reset();
    EXPECT_EQ(kept.Count(), 0u);
}

TEST(KeptTextsOfAServer, ThatHasGone_LeaveTheirReadersInPeace)
{
    auto kept = std::make_unique<KeptTexts>();
    Client const client(*kept);
    kept.reset();
}

TEST_F(KeptTextsTest, TenMinutesAlone_AreNotEnough)
{
    Client client(kept);
    Replace({&client});
    now += 24h;
    LookAgain();
    now += 24h;
    Replace({&client});
    now += 24h;
    LookAgain();
    EXPECT_EQ(kept.Count(), 2u);
}

TEST_F(KeptTextsTest, TenThousandReadsAlone_AreNotEnough)
{
    Client client(kept);
    Replace({&client});
    now += 1min;
    LookAgain();  // closes the group
    client.Reads(1'000'000);
    now += KeptTexts::KeptFor - 1ns;
    Replace({&client});
    EXPECT_EQ(kept.Count(), 2u);
}

// Reads are counted 64 at a time, by threads that read for one session only.
TEST_F(KeptTextsTest, TenMinutesAndTenThousandReads_AreEnough)
{
    Client client(kept);
    Replace({&client});
    now += 1min;
    Replace({&client});  // the first text's ten minutes and reads begin here
    now += KeptTexts::KeptFor;
    client.Reads(KeptTexts::KeptReads - 1);
    now += 1min;
    Replace({&client});
    EXPECT_EQ(kept.Count(), 3u);
    client.Reads(2 * 64);
    now += 1min;
    Replace({&client});
    EXPECT_EQ(kept.Count(), 3u) << "the first has gone, and there is a fourth";
}

// A dialog of a walk's action may be open for hours.
TEST_F(KeptTextsTest, WhileTheirReaderWalks_NoneGoes)
{
    Client client(kept);
    auto const growOld = [&]
    {
        for (int i = 0; i < 3; ++i)
        {
            client.Reads(2 * KeptTexts::KeptReads);
            now += 1h;
            LookAgain();
        }
    };
    {
        TextReader::Walk const walk(client.reader);
        {
            TextReader::Walk const inner(client.reader);
        }
        Replace({&client});
        growOld();
        EXPECT_EQ(kept.Count(), 1u);
    }
    growOld();
    EXPECT_EQ(kept.Count(), 0u);
}

TEST_F(KeptTextsTest, WithoutMemoryForAnAccount_TextsStayAsLongAsAnybodyReads)
{
    for (int failing = 0; failing < 3; ++failing)
    {
        KeptTexts texts;
        Client client(texts);
        std::optional<Client> other(texts);
        long const before = LiveAllocations();
        TicketTexts replaced;
        for (int i = 0; i < 2; ++i)
        {
            replaced.push_back(std::make_unique<TicketText>("a text that is long enough to be on the heap"));
            replaced.back()->HandOut(client.reader.Mark());
        }
        TicketText const* const handedOut[] = {replaced[0].get(), replaced[1].get()};
        bool hasFailed = false;
        {
            FailingAllocation const fault(failing);
            texts.Keep(std::move(replaced));
            hasFailed = fault.HasHappened();
        }
        EXPECT_TRUE(hasFailed || failing > 0) << "nothing was asked for";
        other.reset();
        for (TicketText const* const each : handedOut)
            EXPECT_EQ(each->bytes, "a text that is long enough to be on the heap");
        client.lease.reset();
        replaced.clear();
        EXPECT_LE(LiveAllocations(), before) << "they have gone";
    }
}

TEST_F(KeptTextsTest, WhoReadsOn_DoesNotTakeAwayWhatAnotherMayHold)
{
    Client busy(kept);
    Client idle(kept);
    Replace({&busy, &idle});
    Replace({&busy});
    now += 1min;
    LookAgain();
    for (int i = 0; i < 3; ++i)
    {
        busy.Reads(2 * KeptTexts::KeptReads);
        now += KeptTexts::KeptFor;
        Replace({&busy});
    }
    EXPECT_EQ(kept.Count(), 3u) << "the idle one's, and the two newest";
    idle.lease.reset();
    EXPECT_EQ(kept.Count(), 2u);
}

TEST_F(KeptTextsTest, MoreReadersThanMarks_ShareOneUntilTheLastHasEnded)
{
    std::vector<std::unique_ptr<Client>> clients;
    for (int i = 0; i < 63; ++i)
        clients.push_back(std::make_unique<Client>(kept));
    auto one = std::make_unique<Client>(kept);
    auto other = std::make_unique<Client>(kept);
    EXPECT_EQ(one->reader.Mark(), other->reader.Mark());
    EXPECT_NE(one->reader.Mark(), clients.back()->reader.Mark());
    Replace({one.get()});
    now += 1min;
    LookAgain();
    one->Reads(1'000'000);
    other->Reads(1'000'000);
    now += 24h;
    Replace({one.get()});
    one.reset();
    EXPECT_EQ(kept.Count(), 2u);
    clients.erase(clients.begin());
    Client const next(kept);  // has a mark of its own, as one is free
    EXPECT_NE(next.reader.Mark(), other->reader.Mark());
    other.reset();
    EXPECT_EQ(kept.Count(), 0u);
}

// Ten texts a second are read and replaced, for three days, beside a client that does nothing.
TEST_F(KeptTextsTest, ClientThatReadsForDays_HoldsABoundedNumberOfTexts)
{
    Client client(kept);
    Client idle(kept);
    std::size_t most = 0;
    for (int second = 0; second < 3 * 24 * 3600; ++second)
    {
        now += 1s;
        client.Reads(10);
        for (int i = 0; i < 10; ++i)
            Replace({&client});
        if (second % 600 == 599)
            most = std::max(most, kept.Count());
    }
    EXPECT_GT(most, 10'000u) << "the promise: so many reads, and ten minutes";
    EXPECT_LT(most, 22'000u);
}

TEST(TextReading, ByTwoInTurns_IsNeverCountedTooMuch)
{
    TextReader first;
    TextReader second;
    for (int i = 0; i < 1000; ++i)
    {
        first.NoteRead();
        second.NoteRead();
    }
    EXPECT_EQ(first.Reads(), 1000u);
    for (int i = 0; i < 1000; ++i)
    {
        for (int k = 0; k < 63; ++k)
            first.NoteRead();
        second.NoteRead();
    }
    EXPECT_LE(first.Reads(), 64'000u);
    EXPECT_GE(first.Reads(), 2000u);
    EXPECT_EQ(second.Reads(), 2000u);
}

// --- numbers

namespace
{
class WalkedNumbersTest : public testing::Test
{
protected:
    void HandOutOthers(unsigned long long count)
    {
        for (unsigned long long i = 0; i < count; ++i)
            numbers.AddressOf(++m_newest);
    }

    WalkedNumbers::Time now{};
    WalkedNumbers numbers{[this] { return now; }};

private:
    unsigned long long m_newest = 1'000'000;
};
}  // namespace

TEST_F(WalkedNumbersTest, NumberHandedOutAgain_IsWhereItWas)
{
    void const* const first = numbers.AddressOf(7);
    HandOutOthers(100);
    EXPECT_EQ(numbers.AddressOf(7), first);
    EXPECT_EQ(*static_cast<unsigned long long const*>(first), 7u);
}

TEST_F(WalkedNumbersTest, Number_StaysForTenMinutesAndTenThousandOthers)
{
    void const* const first = numbers.AddressOf(7);
    now += WalkedNumbers::KeptFor;
    HandOutOthers(9'998);
    void const* const last = numbers.AddressOf(8);  // just before the others grow old
    HandOutOthers(50'000);
    now += WalkedNumbers::KeptFor - 1ns;
    HandOutOthers(1);
    EXPECT_EQ(*static_cast<unsigned long long const*>(first), 7u);
    EXPECT_EQ(*static_cast<unsigned long long const*>(last), 8u);
    EXPECT_EQ(numbers.Count(), 60'001u);
    now += 1ns;
    HandOutOthers(1);
    EXPECT_EQ(numbers.Count(), 50'002u) << "the first 10,000 have gone";
}

TEST_F(WalkedNumbersTest, CounterThatIsWalkedOverForDays_TakesABoundedNumber)
{
    std::size_t most = 0;
    for (int second = 0; second < 3 * 24 * 3600; ++second)
    {
        now += 1s;
        HandOutOthers(10);
        most = std::max(most, numbers.Count());
    }
    EXPECT_LE(most, 20'001u);
}
