// Snapshots of tickets: what is read from them, and what of memory one shares with the next.
#include "standin/server/tickets/TicketSnapshot.h"

#include "tests/server/EditedTicket.h"
#include "tests/support/Allocations.h"
#include "tests/support/sanitizers.h"
#include <algorithm>
#include <cstring>
#include <deque>
#include <gmock/gmock.h>
#include <random>

using namespace standin;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

namespace
{
std::string KeyOf(int number) { return "Key/" + std::to_string(number); }

std::vector<ParameterChange> NumbersFor(int from, int to)
{
    std::vector<ParameterChange> changes;
    for (int i = from; i < to; ++i)
        changes.push_back(Putting(KeyOf(i), -1, TicketValue::Int(i)));
    return changes;
}

std::vector<ParameterChange> DropsOf(int from, int to)
{
    std::vector<ParameterChange> changes;
    for (int i = from; i < to; ++i)
        changes.push_back(Dropping(KeyOf(i)));
    return changes;
}

std::vector<std::string> NamesOf(std::vector<KeyValues const*> const& keys)
{
    std::vector<std::string> names;
    for (KeyValues const* const each : keys)
        names.push_back(each->Name()->CStr());
    return names;
}

struct RandomChanges
{
    int keys;
    std::mt19937 random;

    int Among(int from, int to) { return std::uniform_int_distribution(from, to)(random); }

    TicketValue Value()
    {
        switch (Among(0, 5))
        {
        case 0:
        case 1:
            return TicketValue::Int(Among(-1000, 1000));
        case 2:
        {
            double const number = Among(0, 1000) / 8.0;
            return TicketValue::Number(PARAM_DOUBLE, &number);
        }
        case 3:
            return TicketValue::Int64(Among(0, 1000) * 10'000'000'000);
        case 4:
            return TicketValue::Text(PARAM_BINSTRING,
                                     std::string(static_cast<std::size_t>(Among(1, 40)), '\0'));
        default:
            return TicketValue::String(std::string(static_cast<std::size_t>(Among(0, 60)), 'x'));
        }
    }
    ParameterChange Next()
    {
        std::string const key = KeyOf(Among(0, keys - 1));
        int const pos = Among(0, 3) ? Among(0, 9) : -1;
        bool const drops = Among(0, 3) == 0;
        return {key, Among(0, 50) ? pos : LargestPosition, drops ? TicketValue() : Value()};
    }
};
}  // namespace

class SnapshotModel : public testing::TestWithParam<int>
{
};

TEST_P(SnapshotModel, RandomEdits_LeaveWhatAPlainMapHolds_AndOldSnapshotsAsTheyWere)
{
    long const before = LiveAllocations();
    {
        EditedTicket ticket;
        RandomChanges changes{GetParam(), std::mt19937(static_cast<unsigned>(GetParam()))};
        ticket.Make(NumbersFor(0, GetParam()));
        int const rounds = std::clamp(60'000 / GetParam(), 12, IsSanitized ? 60 : 200);
        for (int round = 0; round < rounds && !testing::Test::HasFatalFailure(); ++round)
        {
            TicketSnapshot const& old = *ticket.Now();
            TICKET_MODEL const oldModel = ticket.Model();
            std::vector<ParameterChange> some;
            for (int count = changes.Among(0, round % 10 ? 8 : GetParam()); count > 0; --count)
                some.push_back(changes.Next());
            Garbage const garbage = ticket.Make(std::move(some));
            EditedTicket::ExpectEqual(*ticket.Now(), ticket.Model());
            EditedTicket::ExpectEqual(old, oldModel);  // until its garbage is freed
        }
        EditedTicket::ExpectEqual(*ticket.Now(), ticket.Model());
    }
    EXPECT_EQ(LiveAllocations(), before);
}

INSTANTIATE_TEST_SUITE_P(Keys, SnapshotModel, testing::Values(1, 2, 7, 95, 96, 97, 200, 1000, 5000));

TEST(TicketSnapshot, WithoutValues_FindsNothing)
{
    EditedTicket ticket;
    ticket.Make(std::vector<ParameterChange>());
    EXPECT_EQ(ticket.Now()->Keys(), 0u);
    EXPECT_EQ(ticket.Now()->Find("A"), nullptr);
    EXPECT_EQ(ticket.Now()->Find(""), nullptr);
    EXPECT_THAT(ticket.Now()->Sorted(), IsEmpty());
}

TEST(TicketSnapshot, HasTheVersionThatItWasFinishedWith)
{
    SnapshotEdit edit(nullptr);
    Garbage garbage;
    TicketSnapshot const* const ticket = edit.Finish({7, 9}, garbage);
    EXPECT_EQ(ticket->Which().incarnation, 7u);
    EXPECT_EQ(ticket->Which().revision, 9u);
    EXPECT_TRUE(garbage.IsEmpty());
    SnapshotEdit::Destroy(ticket);
}

TEST(TicketSnapshot, Sorted_IsInTheOrderOfBytes_AndSelectsByPrefix)
{
    EditedTicket ticket;
    for (char const* const key : {"b", "B", "a/b", "a", "\xC3\xA4", "ab", "a/"})
        ticket.Make(Putting(key, -1, TicketValue::Int(1)));
    EXPECT_THAT(NamesOf(ticket.Now()->Sorted()), ElementsAre("B", "a", "a/", "a/b", "ab", "b", "\xC3\xA4"));
    EXPECT_THAT(NamesOf(ticket.Now()->Sorted("a/")), ElementsAre("a/", "a/b"));
    EXPECT_THAT(ticket.Now()->Sorted("c"), IsEmpty());
}

TEST(TicketSnapshot, Positions_HaveGapsAndTypesOfTheirOwn)
{
    EditedTicket ticket;
    ticket.Make(Putting("V", 7, TicketValue::String("seven")), Putting("V", 2, TicketValue::Int(2)));
    KeyValues const* const values = ticket.Now()->Find("V");
    ASSERT_TRUE(values);
    EXPECT_EQ(values->Count(), 8);
    EXPECT_THAT(values->Elements(), SizeIs(2));
    EXPECT_EQ(values->At(0), nullptr);
    EXPECT_EQ(values->At(2)->type, PARAM_INT);
    EXPECT_EQ(values->At(7)->text->bytes, "seven");
    EXPECT_EQ(values->From(3), values->At(7));
}

TEST(TicketSnapshot, AKeyWhoseLastValueGoes_IsNone)
{
    EditedTicket ticket;
    ticket.Make(Putting("V", 3, TicketValue::Int(1)), Putting("W", 0, TicketValue::Int(1)));
    ticket.Make(Dropping("V", 3));
    EXPECT_EQ(ticket.Now()->Find("V"), nullptr);
    EXPECT_EQ(ticket.Now()->Keys(), 1u);
}

// A key as the pool lays it out, with a hash that the test has chosen.
class MADE_KEY
{
public:
    MADE_KEY(std::string_view text, std::size_t hash) : m_words(Header + (text.size() + 8) / 8)
    {
        m_words[0] = hash;
        m_words[1] = text.size();
        std::memcpy(&m_words[Header], text.data(), text.size());
    }
    Key Get() const { return reinterpret_cast<Key>(m_words.data()); }

private:
    static constexpr std::size_t Header = sizeof(PooledKey) / sizeof(std::size_t);
    std::vector<std::size_t> m_words;
};

// Keys whose hashes are equal as a whole, or in the part that one of the look-up's steps takes.
class ChosenHashes : public testing::TestWithParam<std::vector<std::size_t>>
{
};

TEST_P(ChosenHashes, EveryKeyIsFound_AndAbsentOnesOfTheSameHashAreNot)
{
    std::deque<MADE_KEY> keys;
    for (int i = 0; i < 300; ++i)
        keys.emplace_back(KeyOf(i), GetParam()[static_cast<std::size_t>(i) % GetParam().size()]);
    ASSERT_EQ(keys[7].Get()->Text(), KeyOf(7));
    ASSERT_EQ(keys[7].Get()->Hash(), GetParam()[7 % GetParam().size()]);
    SnapshotEdit edit(nullptr);
    for (int i = 0; i < 300; i += 2)
        edit.Put(keys[static_cast<std::size_t>(i)].Get(), 0, TicketValue::Int(i));
    Garbage garbage;
    TicketSnapshot const* const ticket = edit.Finish({1, 1}, garbage);
    for (int i = 0; i < 300; ++i)
    {
        KeyValues const* const found = ticket->Find(keys[static_cast<std::size_t>(i)].Get());
        ASSERT_EQ(found != nullptr, i % 2 == 0) << i;
        ASSERT_EQ(found ? found->At(0)->word : 0, i % 2 == 0 ? static_cast<unsigned long long>(i) : 0);
    }
    SnapshotEdit::Destroy(ticket);
}

INSTANTIATE_TEST_SUITE_P(Hashes, ChosenHashes,
                         testing::Values(std::vector<std::size_t>{42}, std::vector<std::size_t>{0},
                                         std::vector<std::size_t>{~std::size_t{0}},
                                         std::vector<std::size_t>{1, 1 + (std::size_t{1} << 40)},
                                         std::vector<std::size_t>{5, 5 + (std::size_t{1} << 63)},
                                         std::vector<std::size_t>{0xFFFF, 0x1FFFF, 0x2FFFF, 0x3FFFF}));

// What one edit gives to the garbage, by number of blocks and of texts.
TEST(SnapshotGarbage, OfASmallTicket_IsItsOneBlock)
{
    EditedTicket ticket;
    EXPECT_TRUE(ticket.Make(NumbersFor(0, 96)).IsEmpty());
    Garbage const garbage = ticket.Make(NumbersFor(5, 6));
    EXPECT_THAT(garbage.memory, SizeIs(1));
    EXPECT_THAT(garbage.texts, IsEmpty());
}

TEST(SnapshotGarbage, OfALargeTicket_IsItsHeaderAndTheSegmentsThatAreTouched)
{
    EditedTicket ticket;
    ticket.Make(NumbersFor(0, 2000));
    EXPECT_THAT(ticket.Make(NumbersFor(5, 6)).memory, SizeIs(2));
    EXPECT_THAT(ticket.Make(DropsOf(5, 6)).memory, SizeIs(2));
    EXPECT_THAT(ticket.Make(std::vector<ParameterChange>()).memory, SizeIs(1));
}

TEST(SnapshotGarbage, OfAVector_IsItsElementsToo)
{
    EditedTicket ticket;
    ticket.Make(Putting("V", 0, TicketValue::Int(1)), Putting("V", 1, TicketValue::Int(2)),
                Putting("W", 0, TicketValue::Int(1)), Putting("W", 1, TicketValue::Int(2)));
    EXPECT_THAT(ticket.Make(Putting("V", 1, TicketValue::Int(3))).memory, SizeIs(2));
    EXPECT_THAT(ticket.Make(Dropping("V", 1)).memory, SizeIs(2));
    EXPECT_THAT(ticket.Make(Dropping("V", 0)).memory,
                SizeIs(1));  // a single value has no elements of its own
    EXPECT_THAT(ticket.Make(Dropping("W")).memory, SizeIs(2));
}

TEST(SnapshotGarbage, Texts_AreThoseThatWereReplacedOrDeleted)
{
    EditedTicket ticket;
    ticket.Make(Putting("A", -1, TicketValue::String("a")), Putting("B", -1, TicketValue::String("b")),
                Putting("C", 0, TicketValue::String("c0")), Putting("C", 1, TicketValue::String("c1")));
    TicketText const* const a = ticket.Now()->Find("A")->At(0)->text;
    TicketText const* const b = ticket.Now()->Find("B")->At(0)->text;
    Garbage const garbage = ticket.Make(Putting("A", -1, TicketValue::Int(1)));
    ASSERT_THAT(garbage.texts, SizeIs(1));
    EXPECT_EQ(garbage.texts[0].get(), a);
    EXPECT_EQ(ticket.Now()->Find("B")->At(0)->text, b);  // shared, not copied
    EXPECT_THAT(ticket.Make(Dropping("C")).texts, SizeIs(2));
    EXPECT_THAT(ticket.Make(Putting("B", 1, TicketValue::Int(1))).texts, IsEmpty());
}

TEST(SnapshotGarbage, TextThatOneEditPutsAndReplaces_IsGarbageAtOnce)
{
    EditedTicket ticket;
    Garbage const garbage = ticket.Make(Putting("A", -1, TicketValue::String("first")),
                                        Putting("A", -1, TicketValue::String("second")));
    ASSERT_THAT(garbage.texts, SizeIs(1));
    EXPECT_EQ(garbage.texts[0]->bytes, "first");
    EXPECT_EQ(ticket.Now()->Find("A")->At(0)->text->bytes, "second");
}

// The number of blocks of a ticket: one, or a header and the segments.
TEST(Segments, AreDividedAbove96KeysEach_AndUnitedOnlyWhenFarFewerAreLeft)
{
    EditedTicket ticket;
    ticket.Make(NumbersFor(0, 96));
    EXPECT_THAT(ticket.Make(NumbersFor(96, 97)).memory, SizeIs(1));   // the block becomes two segments
    EXPECT_THAT(ticket.Make(NumbersFor(97, 193)).memory, SizeIs(3));  // two become four
    EXPECT_THAT(ticket.Make(DropsOf(96, 193)).memory, SizeIs(5));     // 96 keys still are in four
    EXPECT_THAT(ticket.Make(DropsOf(95, 96)).memory, SizeIs(5));      // 95 are united
    EXPECT_THAT(ticket.Make(NumbersFor(0, 1)).memory, SizeIs(1));
    EditedTicket::ExpectEqual(*ticket.Now(), ticket.Model());
}

TEST(SnapshotEdit, ThatIsGivenUp_ChangesNothing)
{
    EditedTicket ticket;
    ticket.Make(Putting("A", -1, TicketValue::String("a")), Putting("B", -1, TicketValue::Int(1)));
    TicketValue const value = TicketValue::String("another");
    {
        SnapshotEdit edit(ticket.Now());
        edit.Put(ticket.Keys().Intern("A"), 0, value);
        edit.Clear(ticket.Keys().Intern("B"));
        EXPECT_EQ(edit.ReplacedTexts(), 1u);
    }
    EditedTicket::ExpectEqual(*ticket.Now(), ticket.Model());
    EXPECT_EQ(value.text->bytes, "another");
}

TEST(SnapshotEdit, WithoutMemory_ChangesNothing)
{
    bool hasFailed = true;
    int failures = -1;
    for (; hasFailed && failures < 1000; ++failures)
    {
        EditedTicket ticket;
        ticket.Make(NumbersFor(0, 120));
        ticket.Make(Putting("V", 0, TicketValue::String("v0")), Putting("V", 1, TicketValue::String("v1")));
        TicketValue value = TicketValue::String("another");
        TicketValue const number = TicketValue::Int(1);
        Key const vector = ticket.Keys().Intern("V");
        Key const fresh = ticket.Keys().Intern("fresh");
        long const before = LiveAllocations();
        try
        {
            FailingAllocation const failing(failures + 1);
            SnapshotEdit edit(ticket.Now());
            edit.Put(vector, 1, value);
            edit.Put(fresh, 3, number);
            Garbage garbage;
            ticket.Become(edit.Finish({1, 9}, garbage));
            hasFailed = false;
        }
        catch (std::bad_alloc const&)
        {
            EXPECT_EQ(LiveAllocations(), before);
            EditedTicket::ExpectEqual(*ticket.Now(), ticket.Model());
            continue;
        }
        EXPECT_EQ(ticket.Now()->Keys(), 122u);
        EXPECT_EQ(ticket.Now()->Find("V")->At(1)->text, value.text.release());
    }
    EXPECT_GT(failures, 3);
    EXPECT_FALSE(hasFailed);
}

TEST(SnapshotEdit, ATicketThatCannotBeTakenApartForWantOfMemory_StaysWhole)
{
    EditedTicket ticket;
    ticket.Make(NumbersFor(0, 120));
    ticket.Make(Putting("V", 0, TicketValue::String("v0")), Putting("V", 1, TicketValue::String("v1")));
    int failures = 0;
    for (bool hasFailed = true; hasFailed; ++failures)
    {
        try
        {
            FailingAllocation const failing(failures);
            Garbage const garbage = SnapshotEdit::Dismantle(ticket.Now());
            FailingAllocation::Stop();
            EXPECT_THAT(garbage.texts, SizeIs(2));
            EXPECT_THAT(garbage.memory, SizeIs(4));  // header, two segments, one vector
            ticket.Become(nullptr);
            hasFailed = false;
        }
        catch (std::bad_alloc const&)
        {
            EditedTicket::ExpectEqual(*ticket.Now(), ticket.Model());
        }
    }
    EXPECT_GT(failures, 1);
}
