#include "tests/store/StoreContract.h"

#include "tests/support/sanitizers.h"
#include <algorithm>
#include <climits>
#include <future>
#include <gmock/gmock.h>
#include <limits>
#include <random>
#include <set>
#include <thread>
#include <unistd.h>

using namespace standin;
using namespace std::chrono_literals;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;
using testing::Pair;

std::string ReasonOf(std::function<void()> const& action)
{
    try
    {
        action();
    }
    catch (StoreError const& error)
    {
        return error.what();
    }
    return {};
}

StoreValues ValuesOf(Store& store, TicketAddress address)
{
    StoreValues values;
    store.Load(address, [&values](std::string_view key, int pos, StoredValue const& value)
               { values.emplace(std::pair(std::string(key), pos), KEPT_VALUE(value)); });
    return values;
}

std::optional<TicketState> StateOf(Store& store, TicketAddress address)
{
    auto const loaded = store.Load(address, [](std::string_view, int, StoredValue const&) {});
    return loaded ? std::optional(loaded->state) : std::nullopt;
}

std::vector<TicketAddress> AddressesIn(Store& store)
{
    std::vector<TicketAddress> addresses;
    store.Tickets([&addresses](TicketAddress address, TicketState const&) { addresses.push_back(address); });
    return addresses;
}

std::vector<CommittedChange> FeedOf(Store& store, Sequence after)
{
    std::vector<CommittedChange> feed;
    for (std::size_t before = feed.size() + 1; before != feed.size();)
    {
        before = feed.size();
        EXPECT_TRUE(store.ChangesSince(feed.empty() ? after : feed.back().sequence,
                                       [&feed](CommittedChange&& change)
                                       { feed.push_back(std::move(change)); }));
    }
    return feed;
}

CommitOutcome Writer::Try(TicketChange const& change) { return m_store.Commit(change, ++m_number); }

CommitOutcome Writer::Do(TicketChange const& change)
{
    CommitOutcome const outcome = Try(change);
    EXPECT_EQ(outcome.kind, CommitOutcome::Committed);
    return outcome;
}

CommitOutcome Writer::Put(TicketAddress address, std::string_view key, int pos, StoredValue const& value)
{
    return Do(WriteTo(address, State(address)).Put(key, pos, value));
}

CommitOutcome Writer::Put(TicketAddress address, std::string_view key, int pos, int value)
{
    return Put(address, key, pos, Integer(PARAM_INT, value));
}

CommitOutcome Writer::Drop(TicketAddress address, std::string_view key, int pos)
{
    return Put(address, key, pos, StoredValue());
}

CommitOutcome Writer::Remove(TicketAddress address) { return Do(DeletionOf(address, State(address))); }

TicketState Writer::State(TicketAddress address)
{
    auto const state = StateOf(m_store, address);
    EXPECT_TRUE(state);
    return state.value_or(TicketState());
}

void StoreContract::UseLimits(StoreLimits const& limits)
{
    store.reset();
    other.reset();
    site = GetParam().makeSite(limits);
    store = site->Open();
    other = site->Open();
    writer = std::make_unique<Writer>(*store);
    otherWriter = std::make_unique<Writer>(*other);
}

void StoreContract::ExpectHeard(Store& listener, Sequence committed) const
{
    if (GetParam().hearsByBell)
        listener.WaitForChanges(committed - 1, 60s);
    EXPECT_EQ(listener.Committed(), committed);
}

namespace
{
std::vector<Sequence> SequencesOf(std::vector<CommittedChange> const& feed)
{
    std::vector<Sequence> sequences;
    for (CommittedChange const& change : feed)
        sequences.push_back(change.sequence);
    return sequences;
}

std::vector<Sequence> UpTo(Sequence last, Sequence first = 1)
{
    std::vector<Sequence> sequences;
    for (Sequence sequence = first; sequence <= last; ++sequence)
        sequences.push_back(sequence);
    return sequences;
}

void LeaveAlone(Estate const&) {}

bool IsAlive(Store& store, ProgramId program)
{
    for (ProgramInfo const& info : store.Programs())
        if (info.id == program)
            return info.isAlive;
    ADD_FAILURE() << "no program " << program;
    return false;
}

std::vector<ProgramId> ProgramsOf(Store& store)
{
    std::vector<ProgramId> ids;
    for (ProgramInfo const& program : store.Programs())
        ids.push_back(program.id);
    return ids;
}

int IntOf(Store& store, TicketAddress address, std::string const& key, int pos = 0)
{
    StoreValues const values = ValuesOf(store, address);
    auto const found = values.find({key, pos});
    return found == values.end() ? INT_MIN : static_cast<int>(found->second.value.integer);
}
}  // namespace

// --- what a new site has

TEST_P(StoreContract, NewSite_HasNothing)
{
    EXPECT_EQ(store->Committed(), 0u);
    EXPECT_THAT(AddressesIn(*store), IsEmpty());
    EXPECT_THAT(store->Users(), IsEmpty());
    EXPECT_THAT(store->Sessions(), IsEmpty());
    EXPECT_THAT(FeedOf(*store, 0), IsEmpty());
}

// --- commits

TEST_P(StoreContract, Creation_MakesTheTicketWithItsValues)
{
    CommitOutcome const made = writer->Do(Creation(Job).Put("A", 0, 1).Put("B", 3, 2));
    EXPECT_EQ(made.sequence, 1u);
    EXPECT_EQ(made.address, Job);
    for (Store* const handle : {store.get(), other.get()})
    {
        EXPECT_EQ(IntOf(*handle, Job, "A"), 1);
        EXPECT_EQ(IntOf(*handle, Job, "B", 3), 2);
        EXPECT_EQ(ValuesOf(*handle, Job).size(), 2u);
    }
}

TEST_P(StoreContract, Creation_OfATicketThatIsThere_IsAConflictAndChangesNothing)
{
    writer->Do(Creation(Job).Put("A", 0, 1));
    CommitOutcome const lost = otherWriter->Try(Creation(Job).Put("A", 0, 2).Put("B", 0, 2));
    EXPECT_EQ(lost.kind, CommitOutcome::Conflict);
    EXPECT_EQ(lost.sequence, 1u);
    EXPECT_EQ(IntOf(*other, Job, "A"), 1);
    EXPECT_EQ(ValuesOf(*other, Job).size(), 1u);
    EXPECT_EQ(writer->State(Job).revision, 1u);
}

TEST_P(StoreContract, Sequences_CountTheChangesOfAllProgramsFromOne)
{
    for (Sequence sequence = 1; sequence <= 20; ++sequence)
    {
        Writer& either = sequence % 3 == 0 ? *otherWriter : *writer;
        EXPECT_EQ(either.Do(CreationOfNext(3)).sequence, sequence);
    }
    EXPECT_EQ(SequencesOf(FeedOf(*store, 0)), UpTo(20));
}

TEST_P(StoreContract, WhatFails_TakesNoSequence)
{
    writer->Make(Job);
    otherWriter->Try(Creation(Job));
    otherWriter->Try(WriteTo(Job, {}).Put("A", 0, 1));
    EXPECT_THROW(writer->Try(Creation(OtherJob).Put("A", 0, Integer(PARAM_COUNT, 1))), StoreError);
    EXPECT_EQ(writer->Make(OtherJob).sequence, 2u);
}

TEST_P(StoreContract, Committed_IsAtOnceSeenByEveryProgram)
{
    Sequence const made = writer->Make(Job).sequence;
    EXPECT_EQ(store->Committed(), made);
    ExpectHeard(*other, made);
    Sequence const next = otherWriter->Put(Job, "A", 0, 1).sequence;
    ExpectHeard(*store, next);
}

TEST_P(StoreContract, Committed_OfAProgramThatOpensLater_IsTheNewest)
{
    writer->Make(Job);
    writer->Make(OtherJob);
    EXPECT_EQ(site->Open()->Committed(), 2u);
}

TEST_P(StoreContract, Write_OnWhatHolds_IsCommittedAndRaisesTheRevision)
{
    writer->Make(Job);
    Sequence const second = writer->Put(Job, "A", 0, 1).sequence;
    EXPECT_EQ(otherWriter->State(Job).revision, second);
    EXPECT_EQ(otherWriter->State(Job).incarnation, 1u);
    Sequence const third = otherWriter->Put(Job, "A", 0, 2).sequence;
    EXPECT_EQ(third, second + 1);
    EXPECT_EQ(writer->State(Job).revision, third);
    EXPECT_EQ(IntOf(*store, Job, "A"), 2);
}

TEST_P(StoreContract, Write_RaisesTheRevisionOfNoOtherTicket)
{
    writer->Make(Job);
    writer->Make(OtherJob);
    writer->Put(Job, "A", 0, 1);
    EXPECT_EQ(writer->State(OtherJob).revision, 2u);
}

TEST_P(StoreContract, Write_OnAnOlderRevision_IsAConflictAndChangesNothing)
{
    writer->Make(Job);
    TicketState const old = writer->State(Job);
    otherWriter->Put(Job, "A", 0, 1);
    CommitOutcome const lost = writer->Try(WriteTo(Job, old).Put("A", 0, 2).Drop("B"));
    EXPECT_EQ(lost.kind, CommitOutcome::Conflict);
    EXPECT_EQ(lost.sequence, 2u);
    EXPECT_EQ(IntOf(*store, Job, "A"), 1);
    EXPECT_EQ(writer->State(Job).revision, 2u);
    EXPECT_EQ(FeedOf(*store, 0).size(), 2u);
}

TEST_P(StoreContract, Write_OnANewerRevisionThanThereIs_IsAConflict)
{
    writer->Make(Job);
    EXPECT_EQ(writer->Try(WriteTo(Job, {1, 2})).kind, CommitOutcome::Conflict);
}

TEST_P(StoreContract, Write_OfAnyRevision_IsAConflict)
{
    writer->Make(Job);
    EXPECT_EQ(writer->Try(WriteTo(Job, {1, TicketChange::AnyRevision})).kind, CommitOutcome::Conflict);
}

TEST_P(StoreContract, Write_ToNoTicket_IsAConflict)
{
    writer->Make(OtherJob);
    EXPECT_EQ(writer->Try(WriteTo(Job, {1, 1}).Put("A", 0, 1)).kind, CommitOutcome::Conflict);
    EXPECT_FALSE(StateOf(*store, Job));
    EXPECT_THAT(ValuesOf(*store, Job), IsEmpty());
}

TEST_P(StoreContract, Change_PlannedOnOtherTicketsAsWell_IsCommittedIfTheyAreAsTheyWere)
{
    writer->Make(Job);
    writer->Make(OtherJob);
    writer->Make(Printer);
    auto const planned = [&](CHANGE&& change)
    { return std::move(change).On(OtherJob, writer->State(OtherJob)).On(Printer, writer->State(Printer)); };
    EXPECT_EQ(writer->Do(planned(WriteTo(Job, writer->State(Job)).Put("A", 0, 1))).sequence, 4u);
    EXPECT_EQ(writer->Do(planned(DeletionOf(Job, writer->State(Job)))).sequence, 5u);
    EXPECT_EQ(writer->Do(planned(Creation(Job))).sequence, 6u);
}

TEST_P(StoreContract, Change_PlannedOnAnotherTicketThatIsNoLongerAsItWas_IsAConflictAndChangesNothing)
{
    writer->Make(Job);
    writer->Make(OtherJob);
    writer->Make(Printer);
    TicketState const asItWas = writer->State(OtherJob);
    auto const expectConflict = [&](TicketState const& planned)
    {
        Sequence const last = FeedOf(*store, 0).back().sequence;
        auto const changeOn = [&](CHANGE&& change)
        { return std::move(change).On(Printer, writer->State(Printer)).On(OtherJob, planned); };
        for (CommitOutcome const& lost :
             {writer->Try(changeOn(WriteTo(Job, writer->State(Job)).Put("A", 0, 1))),
              writer->Try(changeOn(DeletionOf(Job, writer->State(Job)))),
              writer->Try(changeOn(Creation({3, 77}))), writer->Try(changeOn(CreationOfNext(3)))})
        {
            EXPECT_EQ(lost.kind, CommitOutcome::Conflict);
            EXPECT_EQ(lost.sequence, last);
        }
        EXPECT_EQ(FeedOf(*store, 0).back().sequence, last);
        EXPECT_THAT(ValuesOf(*store, Job), IsEmpty());
        EXPECT_THAT(AddressesIn(*store), Not(Contains(TicketAddress{3, 77})));
    };
    expectConflict({asItWas.incarnation, asItWas.revision + 1});
    otherWriter->Put(OtherJob, "A", 0, 1);
    expectConflict(asItWas);
    otherWriter->Remove(OtherJob);
    expectConflict(asItWas);
    otherWriter->Make(OtherJob);
    expectConflict(asItWas);
}

TEST_P(StoreContract, Write_WithoutParameters_IsCommitted)
{
    writer->Make(Job);
    CommitOutcome const done = writer->Do(WriteTo(Job, writer->State(Job)));
    EXPECT_EQ(done.sequence, 2u);
    EXPECT_EQ(writer->State(Job).revision, 2u);
    ASSERT_EQ(FeedOf(*store, 1).size(), 1u);
    EXPECT_THAT(FeedOf(*store, 1)[0].change.parameters, IsEmpty());
}

TEST_P(StoreContract, Deletion_TakesTheTicketWithItsValuesAndNoOthers)
{
    writer->Do(Creation(Job).Put("A", 0, 1).Put("A", 1, 1));
    writer->Do(Creation(OtherJob).Put("A", 0, 2));
    EXPECT_EQ(otherWriter->Remove(Job).sequence, 3u);
    EXPECT_THAT(AddressesIn(*store), ElementsAre(OtherJob));
    EXPECT_THAT(ValuesOf(*store, Job), IsEmpty());
    EXPECT_EQ(IntOf(*store, OtherJob, "A"), 2);
    writer->Make(Job);
    EXPECT_THAT(ValuesOf(*store, Job), IsEmpty());
}

TEST_P(StoreContract, Deletion_OnAnOlderRevision_IsAConflict)
{
    writer->Make(Job);
    TicketState const old = writer->State(Job);
    writer->Put(Job, "A", 0, 1);
    CommitOutcome const lost = otherWriter->Try(DeletionOf(Job, old));
    EXPECT_EQ(lost.kind, CommitOutcome::Conflict);
    EXPECT_EQ(lost.sequence, 2u);
    EXPECT_EQ(IntOf(*store, Job, "A"), 1);
}

TEST_P(StoreContract, Deletion_OfAnyRevision_IsCommitted)
{
    writer->Make(Job);
    writer->Put(Job, "A", 0, 1);
    otherWriter->Do(DeletionOf(Job, {1, TicketChange::AnyRevision}));
    EXPECT_FALSE(StateOf(*store, Job));
}

TEST_P(StoreContract, Deletion_OfAnotherIncarnation_IsAConflict)
{
    writer->Make(Job);
    writer->Remove(Job);
    writer->Make(Job);
    EXPECT_EQ(otherWriter->Try(DeletionOf(Job, {1, TicketChange::AnyRevision})).kind,
              CommitOutcome::Conflict);
    EXPECT_EQ(otherWriter->Try(DeletionOf(Job, {1, 3})).kind, CommitOutcome::Conflict);
    EXPECT_TRUE(StateOf(*store, Job));
}

TEST_P(StoreContract, Deletion_OfNoTicket_IsAConflict)
{
    EXPECT_EQ(writer->Try(DeletionOf(Job, {1, TicketChange::AnyRevision})).kind, CommitOutcome::Conflict);
}

TEST_P(StoreContract, TicketMadeAgain_HasTheIncarnationOfItsCreation)
{
    writer->Make(Job);
    TicketState const first = writer->State(Job);
    otherWriter->Remove(Job);
    otherWriter->Make(Job);
    TicketState const second = writer->State(Job);
    EXPECT_EQ(first.incarnation, 1u);
    EXPECT_EQ(second.incarnation, 3u);
    EXPECT_EQ(second.revision, 3u);
    EXPECT_EQ(writer->Try(WriteTo(Job, first).Put("A", 0, 1)).kind, CommitOutcome::Conflict);
    EXPECT_EQ(writer->Try(WriteTo(Job, {1, 3}).Put("A", 0, 1)).kind, CommitOutcome::Conflict);
    EXPECT_THAT(ValuesOf(*store, Job), IsEmpty());
}

// --- ids

TEST_P(StoreContract, NextId_OfTheFirstTicketOfAType_IsOne)
{
    writer->Make({4, 77});
    EXPECT_EQ(writer->Do(CreationOfNext(3)).address, (TicketAddress{3, 1}));
    EXPECT_THAT(AddressesIn(*other), ElementsAre(TicketAddress{3, 1}, TicketAddress{4, 77}));
}

TEST_P(StoreContract, NextId_BesideZero_IsOne)
{
    writer->Make({3, 0});
    EXPECT_EQ(writer->Do(CreationOfNext(3)).address.id, 1);
}

TEST_P(StoreContract, NextId_IsAboveTheLargestInUse)
{
    writer->Make({3, 1});
    writer->Make({3, 7});
    writer->Make({2, 50});
    EXPECT_EQ(otherWriter->Do(CreationOfNext(3)).address.id, 8);
    otherWriter->Remove({3, 8});
    EXPECT_EQ(writer->Do(CreationOfNext(3)).address.id, 8);
}

TEST_P(StoreContract, NextId_IsAboveTheIdThatTheCallerNames)
{
    writer->Make({3, 7});
    EXPECT_EQ(writer->Do(CreationOfNext(3).Above(6)).address.id, 8);
    EXPECT_EQ(writer->Do(CreationOfNext(3).Above(8)).address.id, 9);
    EXPECT_EQ(writer->Do(CreationOfNext(3).Above(100)).address.id, 101);
    EXPECT_EQ(writer->Do(CreationOfNext(4).Above(5)).address.id, 6);
}

TEST_P(StoreContract, NextId_BelowTheLargestPossible_IsTheLargestPossible)
{
    writer->Make({3, LargestId - 1});
    EXPECT_EQ(writer->Do(CreationOfNext(3)).address.id, LargestId);
}

TEST_P(StoreContract, NextId_WithTheLargestPossibleInUse_IsTheSmallestFreeOne)
{
    writer->Make({3, LargestId});
    EXPECT_EQ(writer->Do(CreationOfNext(3)).address.id, 0);
    EXPECT_EQ(writer->Do(CreationOfNext(3)).address.id, 1);
    writer->Make({3, 3});
    EXPECT_EQ(otherWriter->Do(CreationOfNext(3)).address.id, 2);
    EXPECT_EQ(otherWriter->Do(CreationOfNext(3)).address.id, 4);
    writer->Remove({3, 1});
    EXPECT_EQ(otherWriter->Do(CreationOfNext(3)).address.id, 1);
}

TEST_P(StoreContract, NextId_AboveTheLargestPossible_IsTheSmallestFreeOne)
{
    writer->Make({3, 0});
    EXPECT_EQ(writer->Do(CreationOfNext(3).Above(LargestId)).address.id, 1);
}

TEST_P(StoreContract, NextId_WithTheLargestPossibleAloneFree_IsThat)
{
    StoreLimits limits;
    limits.largestId = 3;
    UseLimits(limits);
    for (int const id : {0, 1, 2})
        writer->Make({3, id});
    EXPECT_EQ(writer->Do(CreationOfNext(3).Above(3)).address.id, 3);
}

TEST_P(StoreContract, NextId_WithEveryIdInUse_AnswersSo)
{
    StoreLimits limits;
    limits.largestId = 3;
    UseLimits(limits);
    for (int const id : {1, 2, 3, 0})
        EXPECT_EQ(writer->Do(CreationOfNext(3).Put("A", 0, 1)).address.id, id);
    EXPECT_EQ(writer->Try(CreationOfNext(3).Put("A", 0, 1)).kind, CommitOutcome::NoFreeId);
    EXPECT_EQ(store->Committed(), 4u);
    EXPECT_EQ(AddressesIn(*store).size(), 4u);
    EXPECT_EQ(writer->Do(CreationOfNext(4)).address.id, 1);
    writer->Remove({3, 2});
    EXPECT_EQ(otherWriter->Do(CreationOfNext(3)).address.id, 2);
}

TEST_P(StoreContract, Creation_AtAnAddressThatNoTicketHas_IsRefused)
{
    for (TicketAddress const address : {TicketAddress{-1, 1},
                                        {100, 1},
                                        {3, LargestId + 1},
                                        {3, -2},
                                        {-1, CHANGE::NextId},
                                        {100, CHANGE::NextId}})
        EXPECT_THROW(writer->Try(Creation(address)), StoreError) << address.type << "/" << address.id;
    EXPECT_THAT(AddressesIn(*store), IsEmpty());
    EXPECT_EQ(store->Committed(), 0u);
    writer->Make({99, LargestId});
    writer->Make({0, 0});
}

// --- values

TEST_P(StoreContract, EveryKindOfValue_ComesBackBitForBit)
{
    std::string allBytes;
    for (int byte = 0; byte < 256; ++byte)
        allBytes.push_back(static_cast<char>(byte));
    using Limits = std::numeric_limits<double>;
    std::vector<StoredValue> const values{
        Integer(PARAM_INT, std::numeric_limits<int>::min()),
        Integer(PARAM_INT, -1),
        Integer(PARAM_INT64, std::numeric_limits<long long>::min()),
        Integer(PARAM_UNSIGNED, std::numeric_limits<unsigned>::max()),
        Integer(PARAM_UNSIGNED64, -1),
        Double(0.0),
        Double(-0.0),
        Double(Limits::infinity()),
        Double(-Limits::infinity()),
        Double(Limits::quiet_NaN()),
        Double(std::bit_cast<double>(0xFFF8000000000123u)),
        Double(Limits::denorm_min()),
        Double(Limits::max()),
        Double(5.0),
        Bytes(PARAM_STRING, ""),
        Bytes(PARAM_STRING, {}),
        Bytes(PARAM_STRING, "  \xC3\xA4\xF0\x9F\x8E\xA8\x01\x1F\xFF\xC0 \r\n"),
        Bytes(PARAM_BINSTRING, allBytes),
        Bytes(PARAM_BINSTRING, std::string_view("\0", 1)),
    };
    writer->Make(Job);
    for (std::size_t i = 0; i < values.size(); ++i)
        writer->Put(Job, "Key", static_cast<int>(i), values[i]);
    StoreValues const found = ValuesOf(*other, Job);
    auto const feed = FeedOf(*other, 1);
    ASSERT_EQ(found.size(), values.size());
    ASSERT_EQ(feed.size(), values.size());
    for (std::size_t i = 0; i < values.size(); ++i)
    {
        EXPECT_EQ(found.at({"Key", static_cast<int>(i)}), KEPT_VALUE(values[i])) << i;
        EXPECT_TRUE(SameValue(feed[i].change.parameters.at(0).value, TicketValue::FromStored(values[i])))
            << i;
    }
}

TEST_P(StoreContract, KeyOfAnyBytes_ComesBack)
{
    std::string const key("\x01\xFF\0key\n", 7);
    writer->Do(Creation(Job).Put(key, 0, 1).Put("", 0, 2));
    EXPECT_EQ(IntOf(*other, Job, key), 1);
    EXPECT_EQ(IntOf(*other, Job, ""), 2);
    EXPECT_EQ(FeedOf(*other, 0)[0].change.parameters.at(0).key, key);
}

TEST_P(StoreContract, Load_GoesByKeyBytewiseAndThenByPosition)
{
    writer->Do(Creation(Job)
                   .Put("b", 10, 1)
                   .Put("b", 9, 1)
                   .Put("\xC3\xA4", 0, 1)
                   .Put("B", 0, 1)
                   .Put("b/c", 0, 1)
                   .Put("", INT_MAX, 1));
    std::vector<std::string> order;
    other->Load(Job, [&order](std::string_view key, int pos, StoredValue const&)
                { order.push_back(std::string(key) + " " + std::to_string(pos)); });
    EXPECT_THAT(order, ElementsAre(" 2147483647", "B 0", "b 9", "b 10", "b/c 0", "\xC3\xA4 0"));
}

TEST_P(StoreContract, Value_TakesThePlaceOfOneOfAnotherType)
{
    writer->Do(Creation(Job).Put("Key", 0, Double(1)).Put("Key", 1, 2));
    writer->Put(Job, "Key", 0, Bytes(PARAM_STRING, "one"));
    EXPECT_THAT(ValuesOf(*store, Job),
                ElementsAre(Pair(Pair("Key", 0), KEPT_VALUE(Bytes(PARAM_STRING, "one"))),
                            Pair(Pair("Key", 1), KEPT_VALUE(Integer(PARAM_INT, 2)))));
}

TEST_P(StoreContract, WholeKey_HasItsValueAtZeroAndNoOther)
{
    writer->Do(Creation(Job).Put("Key", 0, 1).Put("Key", 7, 1).Put("Key/Sub", 0, 1).Put("Ke", 0, 1));
    writer->Put(Job, "Key", -1, 5);
    EXPECT_THAT(ValuesOf(*store, Job),
                ElementsAre(Pair(Pair("Ke", 0), KEPT_VALUE(Integer(PARAM_INT, 1))),
                            Pair(Pair("Key", 0), KEPT_VALUE(Integer(PARAM_INT, 5))),
                            Pair(Pair("Key/Sub", 0), KEPT_VALUE(Integer(PARAM_INT, 1)))));
}

TEST_P(StoreContract, WholeKey_ThatHadNoOthers_TakesThePlaceOfItsValue)
{
    writer->Make(Job);
    for (int const value : {5, 6})
    {
        writer->Do(WriteTo(Job, writer->State(Job)).Put("Key", -1, Integer(PARAM_INT, value), false));
        EXPECT_EQ(IntOf(*store, Job, "Key"), value);
    }
    EXPECT_EQ(ValuesOf(*store, Job).size(), 1u);
}

TEST_P(StoreContract, DeletedKey_LosesAllPositions)
{
    writer->Do(Creation(Job).Put("Key", 0, 1).Put("Key", 7, 1).Put("Key/Sub", 0, 1));
    writer->Drop(Job, "Key", -1);
    EXPECT_THAT(ValuesOf(*store, Job), ElementsAre(Pair(Pair("Key/Sub", 0), testing::_)));
}

TEST_P(StoreContract, DeletedValue_LeavesTheOtherPositionsWhereTheyAre)
{
    writer->Do(Creation(Job).Put("Key", 0, 1).Put("Key", 1, 2).Put("Key", 2, 3));
    writer->Drop(Job, "Key", 1);
    EXPECT_EQ(ValuesOf(*store, Job).size(), 2u);
    EXPECT_EQ(IntOf(*store, Job, "Key", 2), 3);
}

TEST_P(StoreContract, Parameters_AreChangedInTheirOrder)
{
    writer->Do(Creation(Job).Put("A", 0, 1).Put("A", 0, 2).Put("B", 0, 1).Drop("B").Drop("C").Put("C", 4, 1));
    EXPECT_EQ(IntOf(*store, Job, "A"), 2);
    EXPECT_EQ(IntOf(*store, Job, "C", 4), 1);
    EXPECT_EQ(ValuesOf(*store, Job).size(), 2u);
}

TEST_P(StoreContract, Pointer_IsNotStored_ButWhatItReplacesGoes)
{
    int anything = 0;
    writer->Do(Creation(Job).Put("A", 0, 1).Put("A", 1, 2).Put("B", 0, 1).Put("B", 1, 2).Put(
        "C", 0, Pointer(&anything)));
    writer->Put(Job, "A", 0, Pointer(&anything));
    writer->Put(Job, "B", -1, Pointer(&anything));
    EXPECT_THAT(ValuesOf(*store, Job), ElementsAre(Pair(Pair("A", 1), testing::_)));

    auto const feed = FeedOf(*other, 0);
    ASSERT_EQ(feed.size(), 3u);
    EXPECT_EQ(feed[0].change.parameters.at(4).value.type, PARAM_NONE);
    EXPECT_EQ(feed[1].change.parameters.at(0).value.type, PARAM_NONE);
    EXPECT_EQ(feed[1].change.parameters.at(0).pos, 0);
    EXPECT_EQ(feed[2].change.parameters.at(0).value.type, PARAM_NONE);
    EXPECT_EQ(feed[2].change.parameters.at(0).pos, -1);
}

TEST_P(StoreContract, WhatCannotBeStored_FailsAndLeavesAllAsItWas)
{
    writer->Do(Creation(Job).Put("A", 0, 1));
    TicketState const before = writer->State(Job);
    EXPECT_THROW(
        writer->Try(WriteTo(Job, before).Put("A", 0, 2).Drop("A").Put("B", 0, Integer(PARAM_COUNT, 1))),
        StoreError);
    EXPECT_THROW(writer->Try(WriteTo(Job, before).Put("A", 0, 2).Put("B", -2, 1)), StoreError);
    EXPECT_EQ(IntOf(*store, Job, "A"), 1);
    EXPECT_EQ(writer->State(Job).revision, before.revision);
    EXPECT_EQ(store->Committed(), 1u);
    EXPECT_EQ(FeedOf(*store, 0).size(), 1u);
    EXPECT_EQ(writer->Put(Job, "A", 0, 3).sequence, 2u);
}

TEST_P(StoreContract, LargeValue_ComesBack)
{
    std::string large(3'000'000, 'x');
    large[1'234'567] = 'y';
    writer->Do(Creation(Job).Put("Large", 0, Bytes(PARAM_STRING, large)));
    EXPECT_TRUE(ValuesOf(*other, Job).at({"Large", 0}).bytes == large);
    EXPECT_TRUE(FeedOf(*other, 0)[0].change.parameters.at(0).value.text->bytes == large);
}

// --- what holds

TEST_P(StoreContract, Load_OfNoTicket_GivesNothingAndTakesNothing)
{
    writer->Do(Creation(OtherJob).Put("A", 0, 1));
    bool taken = false;
    EXPECT_FALSE(store->Load(Job, [&taken](std::string_view, int, StoredValue const&) { taken = true; }));
    EXPECT_FALSE(taken);
}

TEST_P(StoreContract, Load_NamesTheTicketsStateAndTheLastChangeOfTheSite)
{
    writer->Make(Job);
    writer->Put(Job, "A", 0, 1);
    writer->Make(OtherJob);
    auto const loaded = other->Load(Job, [](std::string_view, int, StoredValue const&) {});
    ASSERT_TRUE(loaded);
    EXPECT_EQ(loaded->state.incarnation, 1u);
    EXPECT_EQ(loaded->state.revision, 2u);
    EXPECT_EQ(loaded->sequence, 3u);
}

TEST_P(StoreContract, Load_WhenTheFunctionThrows_CanBeCalledAgain)
{
    writer->Do(Creation(Job).Put("A", 0, 1));
    EXPECT_THROW(store->Load(Job, [](std::string_view, int, StoredValue const&) { throw 1; }), int);
    EXPECT_EQ(IntOf(*store, Job, "A"), 1);
    writer->Remove(Job);
    EXPECT_FALSE(StateOf(*store, Job));
}

// A ticket whose values are always equal is changed without pause: no load finds two different ones, and the
// numbers that the load names are those of the change that it has seen.
TEST_P(StoreContract, Load_IsOfOneMoment)
{
    auto const change = [](TicketState const& state, int value)
    {
        CHANGE all = WriteTo(Job, state);
        for (char const* const key : {"A", "B", "C", "D"})
            std::move(all).Put(key, 0, value);
        return all;
    };
    writer->Make(Job);
    std::atomic<bool> isOver{false};
    std::thread writing(
        [&]
        {
            // The ticket is changed by change number n alone, so its n-th value is n.
            for (int value = 2; !isOver; ++value)
                writer->Do(change({1, static_cast<Sequence>(value - 1)}, value));
        });
    for (int round = 0; round < (IsSanitized ? 200 : 1000);)
    {
        std::set<long long> values;
        auto const loaded = other->Load(Job, [&values](std::string_view, int, StoredValue const& value)
                                        { values.insert(value.integer); });
        if (values.empty())
            continue;
        ++round;
        EXPECT_EQ(values.size(), 1u);
        EXPECT_EQ(loaded->state.revision, static_cast<Sequence>(*values.begin()));
        EXPECT_EQ(loaded->sequence, loaded->state.revision);
    }
    isOver = true;
    writing.join();
}

TEST_P(StoreContract, Tickets_ComeInAscendingOrderWithTheirStates)
{
    for (TicketAddress const address : {TicketAddress{17, 1}, {3, LargestId}, {3, 2}, {0, 0}})
        writer->Make(address);
    writer->Put({3, 2}, "A", 0, 1);
    std::vector<std::tuple<TicketAddress, Incarnation, Sequence>> found;
    Sequence const sequence =
        other->Tickets([&found](TicketAddress address, TicketState const& state)
                       { found.emplace_back(address, state.incarnation, state.revision); });
    EXPECT_EQ(sequence, 5u);
    EXPECT_THAT(found,
                ElementsAre(std::tuple(TicketAddress{0, 0}, 4u, 4u), std::tuple(TicketAddress{3, 2}, 3u, 5u),
                            std::tuple(TicketAddress{3, LargestId}, 2u, 2u),
                            std::tuple(TicketAddress{17, 1}, 1u, 1u)));
}

TEST_P(StoreContract, Tickets_WhenTheFunctionThrows_CanBeCalledAgain)
{
    writer->Make(Job);
    EXPECT_THROW(store->Tickets([](TicketAddress, TicketState const&) { throw 1; }), int);
    EXPECT_THAT(AddressesIn(*store), ElementsAre(Job));
    writer->Make(OtherJob);
}

// Any sequence of changes by either program leaves in the store what it leaves in a plain map, and the
// journal repeats it.
TEST_P(StoreContract, RandomChanges_EqualAPlainMapAndTheJournal)
{
    std::mt19937_64 random(20240611);
    auto const below = [&random](int limit)
    { return static_cast<int>(random() % static_cast<unsigned>(limit)); };
    using Model = std::map<TicketAddress, StoreValues>;
    auto const play = [](Model& model, TicketChange const& change)
    {
        StoreValues& values = model[change.address];
        for (ParameterChange const& parameter : change.parameters)
        {
            if (parameter.pos == -1)
                std::erase_if(values,
                              [&parameter](auto const& entry) { return entry.first.first == parameter.key; });
            std::pair const place(parameter.key, std::max(parameter.pos, 0));
            values.erase(place);
            if (parameter.value.type != PARAM_NONE)
                values.emplace(place, parameter.value.ToStored());
        }
        if (change.kind == TicketChange::Delete)
            model.erase(change.address);
    };
    std::vector<std::string> const keys{"", "A", "A/B", "a", "\xFF", "\x01", "Job/Name"};
    Model model;
    for (int round = 0; round < (IsSanitized ? 200 : 1000); ++round)
    {
        Writer& either = below(2) == 0 ? *writer : *otherWriter;
        TicketAddress const address{below(3), below(4)};
        bool const exists = model.contains(address);
        bool const isDeleted = exists && below(12) == 0;
        TicketState const state = exists ? either.State(address) : TicketState();
        CHANGE change = !exists     ? Creation(address)
                        : isDeleted ? DeletionOf(address, state)
                                    : WriteTo(address, state);
        for (int count = isDeleted ? 0 : below(6); count > 0; --count)
        {
            std::string text;
            for (int size = below(20); size > 0; --size)
                text.push_back(static_cast<char>(random()));
            auto const bits = static_cast<long long>(random());
            StoredValue const choices[] = {{},
                                           Integer(PARAM_INT, static_cast<int>(bits)),
                                           Integer(PARAM_UNSIGNED64, bits),
                                           Double(std::bit_cast<double>(bits)),
                                           Bytes(PARAM_STRING, text),
                                           Bytes(PARAM_BINSTRING, text)};
            std::move(change).Put(keys[static_cast<std::size_t>(below(7))], below(5) - 1, choices[below(6)]);
        }
        either.Do(change);
        play(model, change);
        if (round % 50 == 0)
        {
            std::vector<TicketAddress> addresses;
            for (auto const& [known, values] : model)
            {
                addresses.push_back(known);
                ASSERT_EQ(ValuesOf(*store, known), values) << round;
            }
            ASSERT_EQ(AddressesIn(*other), addresses) << round;
        }
    }
    Model replayed;
    for (CommittedChange const& committed : FeedOf(*other, 0))
        play(replayed, committed.change);
    EXPECT_EQ(replayed, model);
}

// --- the feed

TEST_P(StoreContract, Feed_HasWhatWasCommittedByWhomUnderWhichNumber)
{
    store->Commit(Creation(Job).Put("A", 3, 1), 41);
    other->Commit(WriteTo(Job, {1, 1}).Put("B", -1, Integer(PARAM_INT, 2), false), 7);
    store->Commit(DeletionOf(Job, {1, 2}), 40);
    auto const feed = FeedOf(*other, 0);
    ASSERT_EQ(feed.size(), 3u);
    EXPECT_EQ(SequencesOf(feed), UpTo(3));

    EXPECT_EQ(feed[0].program, store->Self());
    EXPECT_EQ(feed[0].number, 41u);
    EXPECT_EQ(feed[0].change.kind, TicketChange::Create);
    EXPECT_EQ(feed[0].change.address, Job);
    EXPECT_EQ(feed[0].change.incarnation, 1u);
    ASSERT_EQ(feed[0].change.parameters.size(), 1u);
    EXPECT_EQ(feed[0].change.parameters[0].key, "A");
    EXPECT_EQ(feed[0].change.parameters[0].pos, 3);

    EXPECT_EQ(feed[1].program, other->Self());
    EXPECT_EQ(feed[1].number, 7u);
    EXPECT_EQ(feed[1].change.kind, TicketChange::Write);
    ASSERT_EQ(feed[1].change.parameters.size(), 1u);
    EXPECT_EQ(feed[1].change.parameters[0].pos, -1);
    EXPECT_FALSE(feed[1].change.parameters[0].hadOthers);

    EXPECT_EQ(feed[2].number, 40u);
    EXPECT_EQ(feed[2].change.kind, TicketChange::Delete);
    EXPECT_EQ(feed[2].change.address, Job);
}

TEST_P(StoreContract, Feed_OfACreationHasTheIdThatTheStoreGave)
{
    writer->Make({3, 6});
    writer->Do(CreationOfNext(3));
    auto const feed = FeedOf(*other, 1);
    ASSERT_EQ(feed.size(), 1u);
    EXPECT_EQ(feed[0].change.address, (TicketAddress{3, 7}));
    EXPECT_EQ(feed[0].change.incarnation, 2u);
    EXPECT_EQ(feed[0].change.revision, 2u);
}

TEST_P(StoreContract, Feed_BeginsBehindTheGivenChange)
{
    for (int i = 0; i < 5; ++i)
        writer->Do(CreationOfNext(3));
    EXPECT_EQ(SequencesOf(FeedOf(*other, 2)), UpTo(5, 3));
    EXPECT_THAT(FeedOf(*other, 5), IsEmpty());
}

TEST_P(StoreContract, Feed_ComesInPortionsWithoutGaps)
{
    StoreLimits limits;
    limits.feedLargest = 4;
    UseLimits(limits);
    for (int i = 0; i < 10; ++i)
        writer->Do(CreationOfNext(3));
    std::vector<Sequence> portion;
    auto const take = [&portion](CommittedChange&& change) { portion.push_back(change.sequence); };
    EXPECT_TRUE(other->ChangesSince(0, take));
    EXPECT_EQ(portion, UpTo(4));
    EXPECT_TRUE(other->ChangesSince(8, take));
    EXPECT_THAT(portion, ElementsAre(1, 2, 3, 4, 9, 10));
}

TEST_P(StoreContract, Feed_MayUseTheStoreWhileItTakes)
{
    writer->Do(Creation(Job).Put("A", 0, 1));
    writer->Put(Job, "A", 0, 2);
    int seen = 0;
    EXPECT_TRUE(store->ChangesSince(0, [&](CommittedChange&&) { seen += IntOf(*store, Job, "A"); }));
    EXPECT_EQ(seen, 4);
}

TEST_P(StoreContract, Feed_WhenTheFunctionThrows_CanBeReadAgain)
{
    writer->Make(Job);
    EXPECT_THROW(store->ChangesSince(0, [](CommittedChange&&) { throw 1; }), int);
    EXPECT_EQ(FeedOf(*store, 0).size(), 1u);
    writer->Make(OtherJob);
}

// --- waiting

TEST_P(StoreContract, Wait_ReturnsAtOnceForWhatIsCommittedAlready)
{
    otherWriter->Make(Job);
    auto const start = std::chrono::steady_clock::now();
    store->WaitForChanges(0, 20s);
    EXPECT_LT(std::chrono::steady_clock::now() - start, 10s);
}

TEST_P(StoreContract, Wait_EndsWithItsTime)
{
    writer->Make(Job);
    auto const start = std::chrono::steady_clock::now();
    int waits = 0;
    while (std::chrono::steady_clock::now() - start < 50ms && ++waits < 1000)
        store->WaitForChanges(1, 50ms);
    EXPECT_LT(waits, 1000);  // it did wait, but for a few wakings without a reason
    EXPECT_LT(std::chrono::steady_clock::now() - start, 10s);
}

TEST_P(StoreContract, Wait_EndsWhenAnotherProgramCommits)
{
    Sequence const heard = store->Committed();
    auto waited = std::async(std::launch::async,
                             [&]
                             {
                                 auto const end = std::chrono::steady_clock::now() + 60s;
                                 while (other->Committed() <= heard && std::chrono::steady_clock::now() < end)
                                     other->WaitForChanges(heard, 60s);
                                 return std::chrono::steady_clock::now() < end;
                             });
    writer->Do(CreationOfNext(3));
    EXPECT_TRUE(waited.get());
}

TEST_P(StoreContract, Wait_EndsForEveryChange)
{
    int const count = IsSanitized ? 200 : 2000;
    auto listening = std::async(std::launch::async,
                                [&]
                                {
                                    Sequence heard = 0;
                                    auto const start = std::chrono::steady_clock::now();
                                    while (heard < static_cast<Sequence>(count))
                                    {
                                        other->WaitForChanges(heard, 60s);
                                        heard = other->Committed();
                                    }
                                    return std::chrono::steady_clock::now() - start;
                                });
    for (int i = 0; i < count; ++i)
    {
        writer->Do(CreationOfNext(3));
        if (i % 16 == 0)
            std::this_thread::yield();
    }
    EXPECT_LT(listening.get(), 50s);  // a ring that is lost costs 60 seconds
}

TEST_P(StoreContract, Interrupt_EndsAWaitThatRuns)
{
    std::promise<void> begun;
    auto waited = std::async(std::launch::async,
                             [&]
                             {
                                 auto const start = std::chrono::steady_clock::now();
                                 begun.set_value();
                                 store->WaitForChanges(0, 60s);
                                 return std::chrono::steady_clock::now() - start;
                             });
    begun.get_future().wait();
    std::this_thread::yield();
    store->Interrupt();
    EXPECT_LT(waited.get(), 50s);
}

TEST_P(StoreContract, Interrupt_EndsTheNextWait_AndOnlyThat)
{
    store->Interrupt();
    auto const start = std::chrono::steady_clock::now();
    store->WaitForChanges(0, 60s);
    EXPECT_LT(std::chrono::steady_clock::now() - start, 50s);
    auto const second = std::chrono::steady_clock::now();
    int waits = 0;
    while (std::chrono::steady_clock::now() - second < 50ms && ++waits < 1000)
        store->WaitForChanges(0, 50ms);
    EXPECT_LT(waits, 1000);
}

// --- the journal's end

TEST_P(StoreContract, Journal_IsPrunedOfWhatEveryProgramHasHeard_ButForTheLastRecords)
{
    StoreLimits limits;
    limits.journalKept = 5;
    UseLimits(limits);
    for (int i = 0; i < 20; ++i)
        writer->Do(CreationOfNext(3));
    store->Maintain(20);
    EXPECT_EQ(FeedOf(*store, 0).size(), 20u);  // the other program has heard nothing yet
    other->Maintain(12);
    store->Maintain(20);
    auto const none = [](CommittedChange&&) { ADD_FAILURE(); };
    EXPECT_FALSE(store->ChangesSince(0, none));
    EXPECT_FALSE(store->ChangesSince(11, none));
    EXPECT_EQ(SequencesOf(FeedOf(*store, 12)), UpTo(20, 13));
    other->Maintain(20);
    store->Maintain(20);
    EXPECT_FALSE(other->ChangesSince(14, none));
    EXPECT_EQ(SequencesOf(FeedOf(*other, 15)), UpTo(20, 16));
}

TEST_P(StoreContract, Journal_GoesOnCountingAfterItWasPruned)
{
    StoreLimits limits;
    limits.journalKept = 0;
    UseLimits(limits);
    for (int i = 0; i < 10; ++i)
        writer->Do(CreationOfNext(3));
    other->Maintain(10);
    store->Maintain(10);
    EXPECT_FALSE(store->ChangesSince(9, [](CommittedChange&&) { ADD_FAILURE(); }));
    EXPECT_THAT(FeedOf(*store, 10), IsEmpty());
    EXPECT_EQ(store->Tickets([](TicketAddress, TicketState const&) {}), 10u);
    EXPECT_EQ(store->Load(Job, [](std::string_view, int, StoredValue const&) {})->sequence, 10u);
    auto const third = site->Open();
    EXPECT_EQ(third->Committed(), 10u);
    EXPECT_EQ(otherWriter->Do(CreationOfNext(3)).sequence, 11u);
    EXPECT_EQ(SequencesOf(FeedOf(*third, 10)), UpTo(11, 11));
}

TEST_P(StoreContract, Journal_OfADeadProgramIsNotKept)
{
    StoreLimits limits;
    limits.journalKept = 0;
    UseLimits(limits);
    for (int i = 0; i < 3; ++i)
        writer->Do(CreationOfNext(3));
    store->Maintain(3);
    EXPECT_EQ(FeedOf(*store, 0).size(), 3u);
    other.reset();
    store->Maintain(3);
    EXPECT_FALSE(store->ChangesSince(2, [](CommittedChange&&) { ADD_FAILURE(); }));
}

TEST_P(StoreContract, Journal_LeavesBehindWhoIsTooSlow)
{
    StoreLimits limits;
    limits.journalKept = 2;
    limits.journalLargest = 6;
    UseLimits(limits);
    for (int i = 0; i < 10; ++i)
        writer->Do(CreationOfNext(3));
    store->Maintain(10);
    EXPECT_FALSE(other->ChangesSince(3, [](CommittedChange&&) { ADD_FAILURE(); }));
    EXPECT_EQ(SequencesOf(FeedOf(*other, 4)), UpTo(10, 5));
}

TEST_P(StoreContract, Journal_OfAProgramThatHasJustOpened_IsKeptFromThenOn)
{
    StoreLimits limits;
    limits.journalKept = 0;
    UseLimits(limits);
    writer->Make(Job);
    auto const third = site->Open();
    Sequence const opened = third->Committed();
    writer->Make(OtherJob);
    other->Maintain(2);
    store->Maintain(2);
    EXPECT_EQ(SequencesOf(FeedOf(*third, opened)), UpTo(2, 2));
}

TEST_P(StoreContract, Maintain_NotesWhatTheProgramHasHeard)
{
    for (int i = 0; i < 3; ++i)
        writer->Do(CreationOfNext(3));
    store->Maintain(2);
    store->Maintain(3);
    for (ProgramInfo const& program : other->Programs())
        EXPECT_EQ(program.heard, program.id == store->Self() ? 3u : 0u);
}

// --- after an answer that did not come

TEST_P(StoreContract, FindCommit_KnowsTheNumbersOfThisProgramAlone)
{
    store->Commit(Creation(Job), 5);
    other->Commit(CreationOfNext(3), 6);
    store->Commit(Creation(Job), 7);  // a conflict
    auto const found = store->FindCommit(5);
    ASSERT_TRUE(found);
    EXPECT_EQ(found->kind, CommitOutcome::Committed);
    EXPECT_EQ(found->sequence, 1u);
    EXPECT_EQ(found->address, Job);
    EXPECT_FALSE(store->FindCommit(6));
    EXPECT_FALSE(store->FindCommit(7));
    EXPECT_FALSE(store->FindCommit(8));
    auto const others = other->FindCommit(6);
    ASSERT_TRUE(others);
    EXPECT_EQ(others->sequence, 2u);
    EXPECT_EQ(others->address, (TicketAddress{3, 2}));
}

TEST_P(StoreContract, Sync_LeavesEverythingAsItIs)
{
    store->Sync();
    writer->Do(Creation(Job).Put("A", 0, 1));
    store->Sync();
    other->Sync();
    EXPECT_EQ(IntOf(*other, Job, "A"), 1);
    EXPECT_EQ(writer->Put(Job, "A", 0, 2).sequence, 2u);
}

// --- programs

TEST_P(StoreContract, Programs_AreListedWithWhatTheyAre)
{
    auto const programs = store->Programs();
    ASSERT_EQ(programs.size(), 2u);
    EXPECT_EQ(programs[0].id, store->Self());
    EXPECT_EQ(programs[1].id, other->Self());
    for (ProgramInfo const& program : programs)
    {
        EXPECT_GT(program.id, 0);
        EXPECT_EQ(program.process, getpid());
        EXPECT_FALSE(program.machine.empty());
        EXPECT_FALSE(program.name.empty());
        EXPECT_NEAR(static_cast<double>(program.since), static_cast<double>(std::time(nullptr)), 100);
        EXPECT_TRUE(program.isAlive);
    }
}

TEST_P(StoreContract, ProgramIds_AreNeverGivenTwice)
{
    std::set<ProgramId> ids{store->Self(), other->Self()};
    other->Leave();
    other.reset();
    for (int i = 0; i < 3; ++i)
    {
        auto const another = site->Open();
        EXPECT_TRUE(ids.insert(another->Self()).second);
        another->Leave();
    }
    site->Open();  // and dies
    store->Bury(LeaveAlone);
    EXPECT_GT(site->Open()->Self(), *ids.rbegin() + 1);
}

TEST_P(StoreContract, DeadProgram_IsListedAsDeadUntilItIsBuried)
{
    ProgramId const dead = other->Self();
    other.reset();
    EXPECT_FALSE(IsAlive(*store, dead));
    EXPECT_TRUE(IsAlive(*store, store->Self()));
    EXPECT_EQ(store->Bury(
                  [&](Estate const& estate)
                  {
                      EXPECT_EQ(estate.program, dead);
                      EXPECT_FALSE(IsAlive(*store, dead));
                  }),
              1);
    EXPECT_THAT(ProgramsOf(*store), ElementsAre(store->Self()));
}

TEST_P(StoreContract, Bury_LeavesTheLivingAlone)
{
    writer->Do(Creation(Job).Own(CHANGE::Owner::ThisProgram));
    EXPECT_EQ(other->Bury([](Estate const&) { ADD_FAILURE(); }), 0);
    EXPECT_EQ(store->Bury([](Estate const&) { ADD_FAILURE(); }), 0);
    EXPECT_EQ(ProgramsOf(*store).size(), 2u);
}

TEST_P(StoreContract, Bury_HandsOverWhatTheDeadHasLeft)
{
    writer->Do(Creation(Job).Own(CHANGE::Owner::ThisProgram));
    writer->Make(OtherJob);
    writer->Do(WriteTo(OtherJob, writer->State(OtherJob)).Own(CHANGE::Owner::ThisProgram));
    writer->Put(OtherJob, "A", 0, 1);
    writer->Do(Creation({3, 3}).Own(CHANGE::Owner::ThisProgram));
    writer->Do(WriteTo({3, 3}, writer->State({3, 3})).Own(CHANGE::Owner::Nobody));
    writer->Do(Creation({3, 4}).Own(CHANGE::Owner::ThisProgram));
    writer->Remove({3, 4});
    writer->Make({3, 5});
    writer->Do(Creation({3, 6}).Own(CHANGE::Owner::ThisProgram));
    otherWriter->Do(WriteTo({3, 6}, otherWriter->State({3, 6})).Own(CHANGE::Owner::ThisProgram));
    otherWriter->Do(Creation({3, 7}).Own(CHANGE::Owner::ThisProgram));
    writer->Do(Creation({3, 8}).Own(CHANGE::Owner::Nobody));
    store->AddPartFile("/tmp/b");
    store->AddPartFile("/tmp/a");
    store->AddPartFile("/tmp/gone");
    store->RemovePartFile("/tmp/gone");
    other->AddPartFile("/tmp/other");
    store->OpenSession("admin");
    long long const living = other->OpenSession("operator");
    ProgramId const dead = store->Self();
    store.reset();

    Estate estate;
    EXPECT_EQ(other->Bury([&estate](Estate const& left) { estate = left; }), 1);
    EXPECT_EQ(estate.program, dead);
    std::vector<std::pair<TicketAddress, Incarnation>> tickets;
    for (Estate::Ticket const& ticket : estate.tickets)
        tickets.emplace_back(ticket.address, ticket.incarnation);
    EXPECT_THAT(tickets, testing::UnorderedElementsAre(Pair(Job, 1u), Pair(OtherJob, 2u)));
    EXPECT_THAT(estate.partFiles, testing::UnorderedElementsAre("/tmp/a", "/tmp/b"));
    ASSERT_EQ(other->Sessions().size(), 1u);
    EXPECT_EQ(other->Sessions()[0].id, living);
    EXPECT_THAT(ProgramsOf(*other), ElementsAre(other->Self()));
    EXPECT_EQ(other->Bury([](Estate const&) { ADD_FAILURE(); }), 0);

    // The burial has left the other program's own things where they are.
    auto const third = site->Open();
    other.reset();
    EXPECT_EQ(third->Bury([&estate](Estate const& left) { estate = left; }), 1);
    EXPECT_EQ(estate.tickets.size(), 2u);
    EXPECT_THAT(estate.partFiles, ElementsAre("/tmp/other"));
}

TEST_P(StoreContract, Bury_GivesTheRevisionThatATicketHas)
{
    writer->Do(Creation(Job).Own(CHANGE::Owner::ThisProgram));
    writer->Put(Job, "A", 0, 1);
    store.reset();
    Estate estate;
    EXPECT_EQ(other->Bury([&estate](Estate const& left) { estate = left; }), 1);
    ASSERT_EQ(estate.tickets.size(), 1u);
    EXPECT_EQ(estate.tickets[0].incarnation, 1u);
    EXPECT_EQ(estate.tickets[0].revision, 2u);
}

TEST_P(StoreContract, Bury_LetsTheStoreBeUsed)
{
    writer->Do(Creation(Job).Own(CHANGE::Owner::ThisProgram));
    store.reset();
    int const buried = other->Bury(
        [&](Estate const& estate)
        {
            for (Estate::Ticket const& ticket : estate.tickets)
                otherWriter->Do(DeletionOf(ticket.address, {ticket.incarnation, CHANGE::AnyRevision}));
        });
    EXPECT_EQ(buried, 1);
    EXPECT_THAT(AddressesIn(*other), IsEmpty());
}

TEST_P(StoreContract, Bury_OfWhatWasNotCleared_LeavesItToNobody)
{
    writer->Do(Creation(Job).Own(CHANGE::Owner::ThisProgram));
    store.reset();
    EXPECT_EQ(other->Bury(LeaveAlone), 1);
    EXPECT_THAT(AddressesIn(*other), ElementsAre(Job));
    EXPECT_EQ(otherWriter->Put(Job, "A", 0, 1).sequence, 2u);
}

TEST_P(StoreContract, Bury_ThatThrows_IsRepeated)
{
    store->AddPartFile("/tmp/a");
    store->OpenSession("admin");
    store.reset();
    EXPECT_THROW(other->Bury([](Estate const&) { throw 1; }), int);
    EXPECT_EQ(other->Sessions().size(), 1u);
    EXPECT_EQ(ProgramsOf(*other).size(), 2u);
    Estate estate;
    EXPECT_EQ(other->Bury([&estate](Estate const& left) { estate = left; }), 1);
    EXPECT_THAT(estate.partFiles, ElementsAre("/tmp/a"));
    EXPECT_THAT(other->Sessions(), IsEmpty());
}

TEST_P(StoreContract, Bury_OfAProgramThatSomebodyElseIsBurying_IsLeftToThem)
{
    auto const third = site->Open();
    store.reset();
    int inner = -1;
    int outer = other->Bury([&](Estate const&)
                            { inner = third->Bury([](Estate const&) { ADD_FAILURE() << "twice"; }); });
    EXPECT_EQ(inner, 0);
    EXPECT_EQ(outer, 1);
}

TEST_P(StoreContract, Bury_BySeveralThreadsOfOneProgram_HappensOnce)
{
    store.reset();
    int inner = -1;
    EXPECT_EQ(other->Bury(
                  [&](Estate const&)
                  {
                      inner =
                          std::async(std::launch::async, [&]
                                     { return other->Bury([](Estate const&) { ADD_FAILURE() << "twice"; }); })
                              .get();
                  }),
              1);
    EXPECT_EQ(inner, 0);
}

TEST_P(StoreContract, Bury_ByAProgramThatDiesMeanwhile_IsRepeated)
{
    auto const third = site->Open();
    store->AddPartFile("/tmp/a");
    store.reset();
    // The one that buries first ends while it is at it. Its own death leaves a second estate.
    std::vector<std::string> partFiles;
    struct DIED
    {
    };
    EXPECT_THROW(other->Bury([](Estate const&) { throw DIED(); }), DIED);
    other.reset();
    EXPECT_EQ(
        third->Bury([&](Estate const& estate)
                    { partFiles.insert(partFiles.end(), estate.partFiles.begin(), estate.partFiles.end()); }),
        2);
    EXPECT_THAT(partFiles, ElementsAre("/tmp/a"));
}

TEST_P(StoreContract, Bury_ByAllAtOnce_HappensOnceForEachDead)
{
    constexpr int Dead = 20;
    for (int i = 0; i < Dead; ++i)
        site->Open()->AddPartFile("/tmp/" + std::to_string(i));
    std::atomic<int> cleared{0};
    std::atomic<int> buried{0};
    std::vector<std::thread> diggers;
    for (int i = 0; i < 6; ++i)
        diggers.emplace_back(
            [&, handle = i % 2 == 0 ? store.get() : other.get()]
            {
                buried += handle->Bury([&cleared](Estate const& estate)
                                       { cleared += static_cast<int>(estate.partFiles.size()); });
            });
    for (std::thread& digger : diggers)
        digger.join();
    EXPECT_EQ(cleared, Dead);
    EXPECT_EQ(buried, Dead);
    EXPECT_EQ(ProgramsOf(*store).size(), 2u);
}

TEST_P(StoreContract, Bury_ThatThrowsForOne_BuriesTheOthers)
{
    auto const third = site->Open();
    store->AddPartFile("/tmp/a");
    other->AddPartFile("/tmp/b");
    ProgramId const first = store->Self();
    store.reset();
    other.reset();
    EXPECT_THROW(third->Bury(
                     [&](Estate const& estate)
                     {
                         if (estate.program == first)
                             throw 1;
                     }),
                 int);
    EXPECT_THAT(ProgramsOf(*third), ElementsAre(first, third->Self()));
}

TEST_P(StoreContract, Leave_ForgetsTheProgramWithItsSessions)
{
    store->OpenSession("admin");
    store->AddPartFile("/tmp/a");
    store->RemovePartFile("/tmp/a");
    other->OpenSession("operator");
    store->Leave();
    EXPECT_EQ(other->Sessions().size(), 1u);
    EXPECT_THAT(ProgramsOf(*other), ElementsAre(other->Self()));
    EXPECT_EQ(other->Bury([](Estate const&) { ADD_FAILURE(); }), 0);
    store.reset();
    EXPECT_EQ(other->Bury([](Estate const&) { ADD_FAILURE(); }), 0);
}

// The process may end before what writes to it has.
TEST_P(StoreContract, Leave_WithPartFiles_LeavesThemToBeBuried)
{
    store->AddPartFile("/tmp/a");
    ProgramId const gone = store->Self();
    store->Leave();
    EXPECT_FALSE(IsAlive(*other, gone));
    Estate estate;
    EXPECT_EQ(other->Bury([&estate](Estate const& left) { estate = left; }), 1);
    EXPECT_THAT(estate.partFiles, ElementsAre("/tmp/a"));
    EXPECT_THAT(ProgramsOf(*other), ElementsAre(other->Self()));
}

TEST_P(StoreContract, Leave_WithTicketsOfItsOwn_LeavesThemToBeBuried)
{
    writer->Do(Creation(Job).Own(CHANGE::Owner::ThisProgram));
    ProgramId const gone = store->Self();
    store->Leave();
    EXPECT_FALSE(IsAlive(*other, gone));
    Estate estate;
    EXPECT_EQ(other->Bury([&estate](Estate const& left) { estate = left; }), 1);
    ASSERT_EQ(estate.tickets.size(), 1u);
    EXPECT_EQ(estate.tickets[0].address, Job);
    EXPECT_THAT(estate.partFiles, IsEmpty());
}

TEST_P(StoreContract, Leave_MakesTheHandleUseless)
{
    writer->Make(Job);
    store->Leave();
    EXPECT_THROW(store->Commit(Creation(OtherJob), 9), StoreError);
    EXPECT_THROW(ValuesOf(*store, Job), StoreError);
    EXPECT_THROW(store->Leave(), StoreError);
    EXPECT_THAT(AddressesIn(*other), ElementsAre(Job));
}

TEST_P(StoreContract, EverythingStays_WhenAllHaveLeft)
{
    writer->Do(Creation(Job).Put("A", 0, 1));
    store->PutUser({"admin", "$y$", 16, 1});
    store->Leave();
    store.reset();
    other->Leave();
    other.reset();
    auto const later = site->Open();
    EXPECT_EQ(later->Committed(), 1u);
    EXPECT_EQ(IntOf(*later, Job, "A"), 1);
    EXPECT_TRUE(later->FindUser("admin"));
    EXPECT_EQ(SequencesOf(FeedOf(*later, 0)), UpTo(1));
    EXPECT_THAT(ProgramsOf(*later), ElementsAre(later->Self()));
}

TEST_P(StoreContract, EverythingStays_WhenAllHaveDied)
{
    writer->Do(Creation(Job).Put("A", 0, 1).Own(CHANGE::Owner::ThisProgram));
    store.reset();
    other.reset();
    auto const later = site->Open();
    EXPECT_EQ(IntOf(*later, Job, "A"), 1);
    EXPECT_EQ(later->Committed(), 1u);
    int tickets = 0;
    EXPECT_EQ(
        later->Bury([&tickets](Estate const& estate) { tickets += static_cast<int>(estate.tickets.size()); }),
        2);
    EXPECT_EQ(tickets, 1);
}

// --- sessions and part files

TEST_P(StoreContract, Sessions_AreSeenByEveryProgramUntilTheyEnd)
{
    long long const first = store->OpenSession("admin");
    long long const second = other->OpenSession("\xC3\xA4");
    EXPECT_NE(first, second);
    auto sessions = store->Sessions();
    ASSERT_EQ(sessions.size(), 2u);
    std::sort(sessions.begin(), sessions.end(),
              [](auto const& left, auto const& right) { return left.id < right.id; });
    EXPECT_EQ(sessions[0].id, first);
    EXPECT_EQ(sessions[0].program, store->Self());
    EXPECT_EQ(sessions[0].user, "admin");
    EXPECT_NEAR(static_cast<double>(sessions[0].since), static_cast<double>(std::time(nullptr)), 100);
    EXPECT_EQ(sessions[1].program, other->Self());
    EXPECT_EQ(sessions[1].user, "\xC3\xA4");
    store->CloseSession(first);
    store->CloseSession(first);
    ASSERT_EQ(other->Sessions().size(), 1u);
    EXPECT_EQ(other->Sessions()[0].id, second);
}

TEST_P(StoreContract, SessionIds_AreNeverGivenTwice)
{
    long long const first = store->OpenSession("admin");
    store->CloseSession(first);
    EXPECT_GT(store->OpenSession("admin"), first);
}

// Two processes may have had the same number, one after the other, and name their files by it.
TEST_P(StoreContract, PartFile_OfAPathThatAnotherProgramHasNoted_StaysThatPrograms)
{
    EXPECT_TRUE(store->AddPartFile("/tmp/a"));
    EXPECT_TRUE(store->AddPartFile("/tmp/a"));
    EXPECT_FALSE(other->AddPartFile("/tmp/a"));
    other->RemovePartFile("/tmp/a");
    other->RemovePartFile("/tmp/never");
    auto const third = site->Open();
    other.reset();
    third->Bury([](Estate const& estate) { EXPECT_THAT(estate.partFiles, IsEmpty()); });
    store.reset();
    third->Bury([](Estate const& estate) { EXPECT_THAT(estate.partFiles, ElementsAre("/tmp/a")); });
    EXPECT_TRUE(third->AddPartFile("/tmp/a"));
}

// --- users

TEST_P(StoreContract, Users_AreFoundByTheirExactNames)
{
    store->PutUser({"operator", "$y$1", 1, 2});
    store->PutUser({"admin", "$y$2", 16, 1});
    store->PutUser({"\xC3\xA4", "", 0, 0});
    auto const found = other->FindUser("admin");
    ASSERT_TRUE(found);
    EXPECT_EQ(found->name, "admin");
    EXPECT_EQ(found->passwordHash, "$y$2");
    EXPECT_EQ(found->role, 16);
    EXPECT_EQ(found->ticketId, 1);
    EXPECT_FALSE(other->FindUser("Admin"));
    EXPECT_FALSE(other->FindUser(""));
    std::vector<std::string> names;
    for (User const& user : other->Users())
        names.push_back(user.name);
    EXPECT_THAT(names, ElementsAre("admin", "operator", "\xC3\xA4"));
}

TEST_P(StoreContract, User_IsReplaced)
{
    store->PutUser({"admin", "$y$1", 16, 1});
    other->PutUser({"admin", "$y$2", 1, 2});
    ASSERT_EQ(store->Users().size(), 1u);
    EXPECT_EQ(store->FindUser("admin")->passwordHash, "$y$2");
    EXPECT_EQ(store->FindUser("admin")->role, 1);
    EXPECT_EQ(store->FindUser("admin")->ticketId, 2);
}

TEST_P(StoreContract, User_IsRemovedOnce)
{
    store->PutUser({"admin", "$y$1", 16, 1});
    EXPECT_FALSE(other->RemoveUser("Admin"));
    EXPECT_TRUE(other->RemoveUser("admin"));
    EXPECT_FALSE(store->RemoveUser("admin"));
    EXPECT_FALSE(store->FindUser("admin"));
}

// --- all at once

// Threads of both programs count up the same values, each as a writer does: plan on what holds, and again
// after a conflict. No count is lost, and the feed that runs beside them has every change once and in order.
TEST_P(StoreContract, ManyThreadsOfTwoPrograms_LoseNothing)
{
    constexpr int Threads = 4;  // of each program
    int const rounds = IsSanitized ? 25 : 100;
    writer->Do(Creation(Job).Put("Count", 0, 0));
    writer->Do(Creation(OtherJob).Put("Count", 0, 0));

    std::atomic<bool> isOver{false};
    auto listening =
        std::async(std::launch::async,
                   [&]
                   {
                       std::vector<Sequence> heard;
                       auto const newest = [&]
                       { return std::max(store->Committed().load(), other->Committed().load()); };
                       while (!isOver || heard.size() < newest())
                       {
                           EXPECT_TRUE(other->ChangesSince(heard.size(), [&heard](CommittedChange&& change)
                                                           { heard.push_back(change.sequence); }));
                           other->WaitForChanges(heard.size(), 20ms);
                       }
                       return heard;
                   });
    std::atomic<std::uint64_t> number{1000};
    std::vector<std::thread> threads;
    for (int i = 0; i < 2 * Threads; ++i)
        threads.emplace_back(
            [&, handle = i % 2 == 0 ? store.get() : other.get(), address = i % 4 < 2 ? Job : OtherJob]
            {
                for (int done = 0; done < rounds;)
                {
                    int count = 0;
                    auto const loaded =
                        handle->Load(address, [&count](std::string_view, int, StoredValue const& value)
                                     { count = static_cast<int>(value.integer); });
                    auto const outcome =
                        handle->Commit(WriteTo(address, loaded->state).Put("Count", 0, count + 1), ++number);
                    if (outcome.kind == CommitOutcome::Conflict)
                    {
                        EXPECT_GE(outcome.sequence, loaded->sequence);
                    }
                    done += outcome.kind == CommitOutcome::Committed ? 1 : 0;
                }
            });
    for (std::thread& thread : threads)
        thread.join();
    isOver = true;
    EXPECT_EQ(listening.get(), UpTo(static_cast<Sequence>(2 + 2 * Threads * rounds)));
    EXPECT_EQ(IntOf(*store, Job, "Count"), Threads * rounds);
    EXPECT_EQ(IntOf(*other, OtherJob, "Count"), Threads * rounds);
}

TEST_P(StoreContract, ManyThreadsThatCreate_GetAnIdEach)
{
    int const rounds = IsSanitized ? 25 : 100;
    std::mutex mutex;
    std::set<int> ids;
    std::atomic<std::uint64_t> number{0};
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i)
        threads.emplace_back(
            [&, handle = i % 2 == 0 ? store.get() : other.get()]
            {
                for (int round = 0; round < rounds; ++round)
                {
                    auto const outcome = handle->Commit(CreationOfNext(3), ++number);
                    std::lock_guard const lock(mutex);
                    EXPECT_EQ(outcome.kind, CommitOutcome::Committed);
                    EXPECT_TRUE(ids.insert(outcome.address.id).second);
                }
            });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(ids.size(), static_cast<std::size_t>(4 * rounds));
    EXPECT_EQ(*ids.rbegin(), 4 * rounds);
}

TEST_P(StoreContract, ManyThreadsThatMakeOneTicket_MakeItOnce)
{
    for (int round = 0; round < 20; ++round)
    {
        std::atomic<int> made{0};
        std::atomic<std::uint64_t> number{static_cast<std::uint64_t>(100 * round)};
        std::vector<std::thread> threads;
        for (int i = 0; i < 4; ++i)
            threads.emplace_back(
                [&, handle = i % 2 == 0 ? store.get() : other.get()]
                {
                    auto const kind = handle->Commit(Creation({5, round}), ++number).kind;
                    EXPECT_TRUE(kind == CommitOutcome::Committed || kind == CommitOutcome::Conflict);
                    made += kind == CommitOutcome::Committed ? 1 : 0;
                });
        for (std::thread& thread : threads)
            thread.join();
        EXPECT_EQ(made, 1);
    }
}
