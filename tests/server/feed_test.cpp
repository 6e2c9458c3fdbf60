// Several programs on one site: what one of them changes reaches the others once, in order, and whole.
#include "standin/server/feed/Feed.h"

#include "comgui/ticket/TICKET_ID.h"
#include "standin/server/files/RefusableCall.h"
#include "tests/server/EditedTicket.h"
#include "tests/server/MemoryFolder.h"
#include "tests/server/Program.h"
#include "tests/server/StoredValues.h"
#include "tests/support/sanitizers.h"
#include <condition_variable>
#include <fstream>
#include <future>
#include <gmock/gmock.h>
#include <random>
#include <thread>

using namespace standin;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;

namespace
{
constexpr TicketAddress Job{3, 1};
constexpr TicketAddress OtherJob{3, 2};

// Of a large text only how it ends.
std::string Short(std::string const& text)
{
    return text.size() < 100 ? text : "..." + text.substr(text.find_last_of('x') + 1);
}

std::string Shown(ChangedParameter const& change)
{
    std::string text = change.key->CStr();
    if (change.pos != -1)
        text += "@" + std::to_string(change.pos);
    switch (change.value.type)
    {
    case PARAM_NONE:
        return text + " gone";
    case PARAM_INT:
        return text + "=" + std::to_string(change.value.ToStored().integer);
    case PARAM_STRING:
        return text + "=" + Short(change.value.text->bytes);
    default:
        return text + ":" + std::to_string(change.value.type);
    }
}

// What one program is notified of, of tickets of type 3: "4 3/1", "1 3/1 KEY=VALUE ..." and the like. Stands
// still while it is held.
class EARS
{
public:
    explicit EARS(Program& program) : m_program(program)
    {
        auto& service = program.server.Notifications();
        int const id = service.NewId();
        program.Tickets().CatchUp();  // what came before is not for these ears
        EXPECT_TRUE(service.Register(program.session, id, [this](Notification const& told) { Hear(told); }));
        EXPECT_TRUE(service.Enable(program.session, id, {Job.type, TICKET_ID_ALL}, KeyFilter(nullptr)));
    }
    ~EARS()
    {
        Hold(false);
        m_program.server.Notifications().Remove(m_program.session);
    }
    EARS(EARS const&) = delete;
    EARS& operator=(EARS const&) = delete;

    void Hold(bool isHeld)
    {
        std::lock_guard const lock(m_lock);
        m_isHeld = isHeld;
        m_changed.notify_all();
    }

    // Waits until there are that many; a change that tells of more shows in the next Heard.
    std::vector<std::string> Heard(std::size_t count)
    {
        std::unique_lock lock(m_lock);
        m_changed.wait_for(lock, std::chrono::minutes(1), [&] { return m_heard.size() >= count; });
        return m_heard;
    }

private:
    void Hear(Notification const& told)
    {
        std::string text = std::to_string(told.kind) + " " + std::to_string(told.ticket.type) + "/" +
                           std::to_string(told.ticket.id);
        for (ChangedParameter const& change : told.parameters)
            text += " " + Shown(change);
        std::unique_lock lock(m_lock);
        m_changed.wait(lock, [this] { return !m_isHeld; });
        m_heard.push_back(text);
        m_changed.notify_all();
    }

    Program& m_program;
    std::mutex m_lock;
    std::condition_variable m_changed;
    bool m_isHeld = false;
    std::vector<std::string> m_heard;
};

class TwoPrograms : public testing::Test
{
protected:
    TwoPrograms()
    {
        std::filesystem::create_directories(folder / "tickets");
        site->AddTicket(SystemTicket);
        site->AddTicket(Job);
    }

    // Runs the work in both programs at the same time.
    template <typename Work>
    void InBoth(Work const& work)
    {
        std::thread other([&] { work(two); });
        work(one);
        other.join();
    }

    MemoryFolder folder;
    std::shared_ptr<MemorySite> site = std::make_shared<MemorySite>();
    Program one{site, folder.Path()};
    Program two{site, folder.Path()};
};
}  // namespace

// --- what one writes the other reads

TEST_F(TwoPrograms, AWrite_IsSeenByTheNextReadOfTheOther)
{
    for (int i = 0; i < 500; ++i)
    {
        ASSERT_TRUE(one.Set(Job, "K", i));
        ASSERT_EQ(two.Int(Job, "K"), i);
        ASSERT_TRUE(two.Set(Job, "K", "text"));
        ASSERT_EQ(one.Text(Job, "K"), "text");
    }
}

TEST_F(TwoPrograms, ATicketThatOneMakes_IsThereForTheOther_AndGoesForIt)
{
    EXPECT_TRUE(one.Create(OtherJob));
    EXPECT_TRUE(two.Exists(OtherJob));
    EXPECT_FALSE(two.Create(OtherJob));
    EXPECT_EQ(two.Tickets().NextTicket(3, 1), 2);
    EXPECT_TRUE(two.Set(OtherJob, "K", 7));
    EXPECT_TRUE(two.Delete(OtherJob));
    EXPECT_FALSE(one.Exists(OtherJob));
    EXPECT_FALSE(one.Set(OtherJob, "K", 7));
    EXPECT_FALSE(one.Delete(OtherJob));
    EXPECT_TRUE(one.Create(OtherJob));
    EXPECT_EQ(two.Int(OtherJob, "K"), std::nullopt);
}

TEST_F(TwoPrograms, IdsThatBothAskFor_AreGivenOnce)
{
    std::mutex lock;
    std::multiset<int> ids;
    InBoth(
        [&](Program& program)
        {
            for (int i = 0; i < 100; ++i)
            {
                int const id = program.Tickets().CreateNext(program.session, 12);
                std::lock_guard const guard(lock);
                ids.insert(id);
            }
        });
    EXPECT_EQ(std::set<int>(ids.begin(), ids.end()).size(), 200u);
    EXPECT_EQ(*ids.begin(), 1);
    EXPECT_EQ(*ids.rbegin(), 200);
}

TEST_F(TwoPrograms, AppendsOfBothAtOnce_LoseNone)
{
    InBoth(
        [&](Program& program)
        {
            for (int i = 0; i < 300; ++i)
                EXPECT_TRUE(program.Set(Job, "V", i, -2));
        });
    EXPECT_EQ(one.Count(Job, "V"), 600);
    std::map<int, int> times;
    for (int pos = 0; pos < 600; ++pos)
    {
        ASSERT_EQ(one.Int(Job, "V", pos), two.Int(Job, "V", pos));
        ++times[one.Int(Job, "V", pos).value_or(-1)];
    }
    EXPECT_THAT(times, SizeIs(300));
    EXPECT_THAT(times, testing::Each(testing::Pair(testing::_, 2)));
}

// --- a change that another was faster than is planned anew

TEST_F(TwoPrograms, AnAppendThatCameTooLate_TakesTheNextPosition)
{
    one.Set(Job, "V", 1, -2);
    site->Interject([&] { EXPECT_TRUE(two.Set(Job, "V", 2, -2)); });
    EXPECT_TRUE(one.Set(Job, "V", 3, -2));
    EXPECT_EQ(one.Int(Job, "V", 1), 2);
    EXPECT_EQ(one.Int(Job, "V", 2), 3);
}

TEST_F(TwoPrograms, ACreationThatCameTooLate_IsRefused)
{
    site->Interject([&] { EXPECT_TRUE(two.Create(OtherJob)); });
    EXPECT_FALSE(one.Create(OtherJob));
    EXPECT_TRUE(one.Exists(OtherJob));
}

TEST_F(TwoPrograms, AWriteToATicketThatHasGone_IsRefused)
{
    one.Int(Job, "K");
    site->Interject([&] { EXPECT_TRUE(two.Delete(Job)); });
    EXPECT_FALSE(one.Set(Job, "K", 7));
}

TEST_F(TwoPrograms, AWriteToOneTicketAndNoOther_IsRefusedOnceAnotherHasItsAddress)
{
    Incarnation const first = one.Tickets().IncarnationOf(Job);
    site->Interject(
        [&]
        {
            EXPECT_TRUE(two.Delete(Job));
            EXPECT_TRUE(two.Create(Job));
        });
    EXPECT_FALSE(WriteTicket(one.Tickets(), one.session, Job, first, "K", PARAM_STRING, "text", -1));
    EXPECT_EQ(two.Text(Job, "K"), "");
}

TEST_F(TwoPrograms, ADeletionOfATicketThatWasWrittenMeanwhile_IsDone)
{
    site->Interject([&] { EXPECT_TRUE(two.Set(Job, "K", 7)); });
    EXPECT_TRUE(one.Delete(Job));
    EXPECT_FALSE(two.Exists(Job));
}

TEST_F(TwoPrograms, ADeletionOfWhatHasGoneMeanwhile_IsNoChange)
{
    one.Set(Job, "K", 7);
    site->Interject([&] { EXPECT_TRUE(two.Drop(Job, "K")); });
    int const before = site->Commits();
    EXPECT_TRUE(one.Drop(Job, "K"));
    EXPECT_EQ(site->Commits(), before + 1);  // the other's
}

// --- notifications

TEST_F(TwoPrograms, BothAreNotifiedOfWhatEitherDoes)
{
    EARS ofOne(one);
    EARS ofTwo(two);
    EXPECT_TRUE(one.Create(OtherJob));
    EXPECT_TRUE(two.Set(OtherJob, "K", 7));
    EXPECT_TRUE(one.Set(OtherJob, "K", "text", 1));
    EXPECT_TRUE(two.Drop(OtherJob, "K"));
    EXPECT_TRUE(one.Delete(OtherJob));
    auto const expected = ElementsAre("4 3/2", "1 3/2 K=7", "1 3/2 K@1=text", "1 3/2 K gone", "5 3/2");
    EXPECT_THAT(ofOne.Heard(5), expected);
    EXPECT_THAT(ofTwo.Heard(5), expected);
}

TEST_F(TwoPrograms, NotificationsComeInTheOrderOfTheCommits_OnceEach)
{
    constexpr int Each = 400;
    EARS ofOne(one);
    EARS ofTwo(two);
    InBoth(
        [&](Program& program)
        {
            std::thread another(
                [&]
                {
                    for (int i = 0; i < Each; ++i)
                        program.Set(Job, "V", 1, -2);
                });
            for (int i = 0; i < Each; ++i)
                program.Set(Job, "V", 2, -2);
            another.join();
        });
    std::vector<std::string> expected;  // an append has the position that its commit gave it
    for (int pos = 0; pos < 4 * Each; ++pos)
        expected.push_back("1 3/1 V@" + std::to_string(pos) + "=" + std::to_string(*one.Int(Job, "V", pos)));
    EXPECT_EQ(ofOne.Heard(4 * Each), expected);
    EXPECT_EQ(ofTwo.Heard(4 * Each), expected);
}

TEST_F(TwoPrograms, AWriteThatChangesNothing_IsNeitherCommittedNorTold)
{
    EARS ears(two);
    int const before = site->Commits();
    EXPECT_TRUE(one.Drop(Job, "Missing"));
    EXPECT_EQ(site->Commits(), before);
    EXPECT_TRUE(one.Set(Job, "K", 1));
    EXPECT_THAT(ears.Heard(1), ElementsAre("1 3/1 K=1"));
}

// --- commits of which nobody knows at first whether they were made

class OutcomeUnknown : public TwoPrograms, public testing::WithParamInterface<bool>
{
protected:
    void BeUnknownOnce() { site->AnswerUnknownOnce(GetParam()); }
};

TEST_P(OutcomeUnknown, AWrite_IsMadeExactlyOnce)
{
    EARS ears(two);
    BeUnknownOnce();
    EXPECT_TRUE(one.Set(Job, "V", 7, -2));
    EXPECT_TRUE(site->HasFailed());
    EXPECT_TRUE(one.Set(Job, "V", 8, -2));
    EXPECT_EQ(one.Count(Job, "V"), 2);
    EXPECT_EQ(two.Count(Job, "V"), 2);
    EXPECT_THAT(ears.Heard(2), ElementsAre("1 3/1 V@0=7", "1 3/1 V@1=8"));
}

TEST_P(OutcomeUnknown, ACreation_IsMadeExactlyOnce)
{
    BeUnknownOnce();
    EXPECT_EQ(one.Tickets().CreateNext(one.session, 12), 1);
    EXPECT_TRUE(site->HasFailed());
    EXPECT_EQ(two.Tickets().NextTicket(12, -1), 1);
    EXPECT_EQ(two.Tickets().NextTicket(12, 1), -1);
    BeUnknownOnce();
    EXPECT_TRUE(one.Create(OtherJob));
}

TEST_P(OutcomeUnknown, ADeletion_IsMade)
{
    BeUnknownOnce();
    EXPECT_TRUE(one.Delete(Job));
    EXPECT_TRUE(site->HasFailed());
    EXPECT_FALSE(two.Exists(Job));
}

TEST_P(OutcomeUnknown, APointer_IsThereAfterwards)
{
    int target = 0;
    BeUnknownOnce();
    EXPECT_TRUE(one.Set(Job, "P", PARAM_POINTER, &target));
    EXPECT_TRUE(site->HasFailed());
    EXPECT_EQ(one.Pointer(Job, "P"), &target);
    EXPECT_TRUE(one.Set(Job, "K", 7));
    EXPECT_EQ(two.Int(Job, "K"), 7);
}

TEST_P(OutcomeUnknown, AWrite_LeavesThePointersOfTheTicket)
{
    int target = 0;
    EXPECT_TRUE(one.Set(Job, "P", PARAM_POINTER, &target));
    BeUnknownOnce();
    EXPECT_TRUE(one.Set(Job, "K", 7));
    EXPECT_TRUE(site->HasFailed());
    EXPECT_EQ(one.Pointer(Job, "P"), &target);
}

// However much happens before the answer, and however eagerly the journal is pruned.
TEST(UnknownOutcomeInAShortJournal, AWrite_IsMadeExactlyOnce)
{
    MemoryFolder const folder;
    std::filesystem::create_directories(folder / "tickets");
    auto const site =
        std::make_shared<MemorySite>(StoreLimits{.journalKept = 4, .journalLargest = 1000, .feedLargest = 7});
    site->AddTicket(SystemTicket);
    site->AddTicket(Job);
    Program one(site, folder.Path());
    Program two(site, folder.Path());
    site->AnswerUnknownOnce(true);
    site->InterjectBehind(
        [&]
        {
            for (int i = 0; i < 50; ++i)
                two.Set(Job, "K", i);
            one.Tickets().CatchUp();
            for (Program* const program : {&one, &two, &one, &two})
                program->server.Tidy();
        });
    EXPECT_TRUE(one.Set(Job, "V", 7, -2));
    EXPECT_TRUE(site->HasFailed());
    EXPECT_EQ(one.Count(Job, "V"), 1);
    EXPECT_EQ(two.Count(Job, "V"), 1);
}

INSTANTIATE_TEST_SUITE_P(Commits, OutcomeUnknown, testing::Bool(),
                         [](auto const& happened) { return happened.param ? "Made" : "NotMade"; });

// A change with a pointer comes from its writer's hand alone, who waits for the store.
TEST_F(TwoPrograms, ReadsBehindAChangeInDoubt_GoOnOnceTheStoreIsOutOfReach)
{
    int target = 0;
    EXPECT_TRUE(one.Set(Job, "K", 1));
    EXPECT_TRUE(two.Set(Job, "K", 2));
    EXPECT_EQ(one.Int(Job, "K"), 2);
    site->Fail("FindCommit", true);
    site->AnswerUnknownOnce(true);
    auto write = std::async(std::launch::async, [&] { return one.Set(Job, "P", PARAM_POINTER, &target); });
    while (!site->HasFailed())
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    EXPECT_TRUE(two.Set(Job, "K", 3));
    auto read = std::async(std::launch::async, [&] { return one.Int(Job, "K"); });
    EXPECT_EQ(read.wait_for(std::chrono::milliseconds(300)), std::future_status::timeout);
    site->BeUnreachable(true);
    EXPECT_EQ(read.wait_for(std::chrono::seconds(10)), std::future_status::ready);
    site->Fail("FindCommit", false);
    EXPECT_EQ(read.get(), 2);
    EXPECT_TRUE(write.get());
    site->BeUnreachable(false);
    EXPECT_EQ(one.Int(Job, "K"), 3);
}

// --- pointers

TEST_F(TwoPrograms, APointer_StaysInItsProgramAndIsADeletionElsewhere)
{
    EARS ofOne(one);
    EARS ofTwo(two);
    EXPECT_TRUE(one.Set(Job, "P", 7));
    EXPECT_EQ(two.Int(Job, "P"), 7);
    int target = 0;
    EXPECT_TRUE(one.Set(Job, "P", PARAM_POINTER, &target));
    EXPECT_EQ(one.Pointer(Job, "P"), &target);
    EXPECT_EQ(two.Pointer(Job, "P"), std::nullopt);
    EXPECT_EQ(two.Int(Job, "P"), std::nullopt);
    EXPECT_THAT(ofOne.Heard(2), ElementsAre("1 3/1 P=7", "1 3/1 P:" + std::to_string(PARAM_POINTER)));
    EXPECT_THAT(ofTwo.Heard(2), ElementsAre("1 3/1 P=7", "1 3/1 P gone"));
    EXPECT_TRUE(two.Set(Job, "P", 8));
    EXPECT_EQ(one.Int(Job, "P"), 8);
    EXPECT_EQ(one.Pointer(Job, "P"), std::nullopt);
}

TEST_F(TwoPrograms, APointer_StaysWhileOtherKeysOfItsTicketChange)
{
    int target = 0;
    EXPECT_TRUE(one.Set(Job, "P", PARAM_POINTER, &target));
    EXPECT_TRUE(two.Set(Job, "K", 7));
    EXPECT_EQ(one.Int(Job, "K"), 7);
    EXPECT_EQ(one.Pointer(Job, "P"), &target);
}

// The journal shows the change to others before its writer knows that it is made, and has no pointer in it.
TEST_F(TwoPrograms, APointerThatTheJournalBringsFirst_IsWaitedFor)
{
    int target = 0;
    one.Set(Job, "P", 1);
    EARS ears(one);
    std::thread reader;
    std::optional<int> read;
    site->InterjectBehind(
        [&]
        {
            two.Set(Job, "K", 7);
            reader = std::thread([&] { read = one.Int(Job, "K"); });
            std::this_thread::sleep_for(
                std::chrono::milliseconds(30));  // enough for a feed that does not wait
        });
    EXPECT_TRUE(one.Set(Job, "P", PARAM_POINTER, &target));
    reader.join();
    EXPECT_EQ(read, 7);
    EXPECT_EQ(one.Pointer(Job, "P"), &target);
    EXPECT_THAT(ears.Heard(2), ElementsAre("1 3/1 P:" + std::to_string(PARAM_POINTER), "1 3/1 K=7"));
}

// A pointer is only in the hands of its writer, while the journal may bring what comes behind it.
TEST_F(TwoPrograms, PointersAmongChangesOfOthers_AreThereWhenTheirWriteReturns)
{
    std::atomic<bool> done{false};
    std::thread other(
        [&]
        {
            for (int i = 0; !done; ++i)
                two.Set(Job, "Other", i);
        });
    std::thread reader(
        [&]
        {
            while (!done)
                one.Int(Job, "Other");
        });
    int target[2] = {};
    int missing = 0;
    for (int i = 0; i < (IsSanitized ? 300 : 1000); ++i)
    {
        EXPECT_TRUE(one.Set(Job, "P", PARAM_POINTER, &target[i % 2]));
        missing += one.Pointer(Job, "P") == &target[i % 2] ? 0 : 1;
    }
    done = true;
    other.join();
    reader.join();
    EXPECT_EQ(missing, 0);
}

// --- a store that fails

TEST_F(TwoPrograms, WhileTheStoreFails_KnownTicketsAreReadAndNothingIsWritten)
{
    site->AddTicket(OtherJob);
    EXPECT_TRUE(one.Set(Job, "K", 7));
    EXPECT_EQ(two.Int(Job, "K"), 7);
    testing::internal::CaptureStderr();
    site->FailAll(true);
    EXPECT_EQ(two.Int(Job, "K"), 7);
    EXPECT_EQ(two.Int(OtherJob, "K"), std::nullopt);  // nobody has read it before
    EXPECT_FALSE(two.Set(Job, "K", 8));
    EXPECT_FALSE(two.Create({3, 50}));
    EXPECT_FALSE(two.Delete(Job));
    EXPECT_EQ(two.Int(Job, "K"), 7);
    site->FailAll(false);
    EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr("told to fail"));
    EXPECT_TRUE(two.Set(Job, "K", 8));
    EXPECT_EQ(one.Int(Job, "K"), 8);
    EXPECT_TRUE(one.Set(OtherJob, "K", 9));
    EXPECT_EQ(two.Int(OtherJob, "K"), 9);
    EXPECT_TRUE(two.Create({3, 50}));
}

// On stderr it is told once at most: the feed's thread may have told something before.
TEST_F(TwoPrograms, EveryReadThatTheStoreFails_HasItsReason)
{
    site->AddTicket(OtherJob);
    Program three(site, folder.Path());
    EXPECT_EQ(three.Int(Job, "K"), std::nullopt);  // is known from now on, and has no such key
    RefusableCall::TakeReason();                   // another test's
    testing::internal::CaptureStderr();
    site->FailAll(true);
    for (int i = 0; i < 3; ++i)
    {
        EXPECT_EQ(three.Int(OtherJob, "K"), std::nullopt);
        EXPECT_THAT(RefusableCall::TakeReason(), HasSubstr("Load was told to fail")) << i;
    }
    EXPECT_EQ(three.Int(Job, "K"), std::nullopt);
    EXPECT_EQ(RefusableCall::TakeReason(), "");
    site->FailAll(false);
    std::string const told = testing::internal::GetCapturedStderr();
    EXPECT_EQ(told.find("Load"), told.rfind("Load")) << told;
}

TEST_F(TwoPrograms, WhatWasCommittedBeforeTheStoreFailed_ComesWhenItWorksAgain)
{
    one.Set(Job, "K", 7);
    two.Int(Job, "K");
    testing::internal::CaptureStderr();
    one.Set(Job, "K", 8);
    site->FailAll(true);
    auto const meanwhile = two.Int(Job, "K");
    EXPECT_TRUE(meanwhile == 7 || meanwhile == 8);
    site->FailAll(false);
    EXPECT_EQ(two.Int(Job, "K"), 8);
    testing::internal::GetCapturedStderr();
}

// Every operation of the store fails once, whichever comes first: afterwards all is as it was, or as told.
TEST_F(TwoPrograms, AfterAnySingleFailure_BothAgree)
{
    testing::internal::CaptureStderr();
    int value = 0;
    for (int which = 1; which < 40; ++which)
    {
        site->FailOperation(which);
        for (int i = 0; i < 10; ++i)
        {
            int const before = value++;
            bool const isDone = (i % 2 ? one : two).Set(Job, "K", value);
            if (!isDone)
                value = before;
            two.Int(Job, "K");
        }
        site->FailOperation(0);
        ASSERT_TRUE(one.Set(Job, "Last", which));
        ASSERT_EQ(two.Int(Job, "Last"), which);
        ASSERT_EQ(one.Int(Job, "K"), value) << which;
        ASSERT_EQ(two.Int(Job, "K"), value) << which;
    }
    testing::internal::GetCapturedStderr();
}

// A journal that cannot be read is no reason to ask for it without a pause.
TEST_F(TwoPrograms, WhileTheJournalCannotBeRead_ItIsAskedForNowAndThen)
{
    testing::internal::CaptureStderr();
    one.Int(Job, "K");
    two.Int(Job, "K");
    site->Fail("ChangesSince", true);
    EXPECT_TRUE(two.Set(Job, "K", 1));
    int const before = site->Looks();
    std::this_thread::sleep_for(std::chrono::milliseconds(300));
    EXPECT_LE(site->Looks() - before, 4);
    site->Fail("ChangesSince", false);
    EXPECT_EQ(one.Int(Job, "K"), 1);
    EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr("ChangesSince was told to fail"));
}

// What a broken record hides is found in the tickets.
TEST_F(TwoPrograms, ARecordThatCannotBeRead_IsPassedAndItsChangeTold)
{
    testing::internal::CaptureStderr();
    EARS ears(two);
    one.Int(Job, "K");
    two.Int(Job, "K");
    site->InterjectBehind([this] { site->BreakJournal(); });  // before anybody can have heard of it
    site->Fail("ChangesSince", true);
    EXPECT_TRUE(one.Set(Job, "K", 1));
    site->Fail("ChangesSince", false);
    EXPECT_EQ(two.Int(Job, "K"), 1);
    EXPECT_THAT(ears.Heard(1), ElementsAre("1 3/1 K@0=1"));
    EXPECT_TRUE(two.Set(Job, "K", 2));
    EXPECT_EQ(one.Int(Job, "K"), 2);
    EXPECT_THAT(ears.Heard(2), ElementsAre("1 3/1 K@0=1", "1 3/1 K=2"));
    testing::internal::GetCapturedStderr();
}

// --- a listener that has no room

namespace
{
// Gives what EARS says of it.
std::string SetLargeText(Program& program, int value)
{
    EXPECT_TRUE(program.Set(Job, "T", std::string(2u << 20, 'x') + std::to_string(value)));
    return "1 3/1 T=..." + std::to_string(value);
}

class NoRoom : public testing::Test
{
protected:
    NoRoom()
    {
        std::filesystem::create_directories(folder / "tickets");
        site->AddTicket(SystemTicket);
        site->AddTicket(Job);
    }

    // So many texts that the rest of them finds no room, while the ears stand still.
    std::vector<std::string> Overwhelm(Program& program, int& value)
    {
        std::vector<std::string> told;
        while (one.server.Notifications().HasRoom())
        {
            told.push_back(SetLargeText(program, ++value));
            one.Tickets().CatchUp();
        }
        for (int i = 0; i < 20; ++i)
            told.push_back(SetLargeText(program, ++value));
        return told;
    }

    // Once there is room what is lost is told to the owner, and what comes from then on to the ears.
    void ExpectLossAndNewsAfterwards(EARS& ears)
    {
        testing::internal::CaptureStderr();
        ears.Hold(false);
        std::string heard;
        for (int i = 0; i < 3000 && heard.find("Last") == heard.npos; ++i)
        {
            two.Set(Job, "Last", i);
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
            auto const all = ears.Heard(0);
            heard = all.empty() ? "" : all.back();
        }
        EXPECT_THAT(heard, HasSubstr("Last"));
        EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr("too slow"));
    }

    MemoryFolder folder;
    std::shared_ptr<MemorySite> site =
        std::make_shared<MemorySite>(StoreLimits{.journalKept = 4, .journalLargest = 200, .feedLargest = 7});
    Program one{site, folder.Path()};
    Program two{site, folder.Path()};
};
}  // namespace

TEST_F(NoRoom, WhatComesMeanwhile_IsToldWhenThereIsRoom)
{
    EARS ears(one);
    int value = 0;
    std::vector<std::string> told;
    for (int round = 0; round < 3; ++round)
    {
        ears.Hold(true);
        for (Program* const writer : {&two, &one})
        {
            auto const more = Overwhelm(*writer, value);
            told.insert(told.end(), more.begin(), more.end());
        }
        one.server.Tidy();  // what is not told yet is not pruned
        two.server.Tidy();
        one.server.Tidy();
        ears.Hold(false);
        EXPECT_EQ(ears.Heard(told.size()), told);
    }
    EXPECT_TRUE(one.server.Notifications().HasRoom());
    told.push_back(SetLargeText(two, ++value));
    EXPECT_EQ(ears.Heard(told.size()), told);
}

TEST_F(NoRoom, CreationsAndDeletions_ComeInTheirPlaces)
{
    EARS ears(one);
    ears.Hold(true);
    int value = 0;
    auto told = Overwhelm(two, value);
    two.Create(OtherJob);
    two.Delete(OtherJob);
    one.Create(OtherJob);
    one.Set(OtherJob, "K", 7);
    for (char const* const more : {"4 3/2", "5 3/2", "4 3/2", "1 3/2 K=7"})
        told.push_back(more);
    ears.Hold(false);
    EXPECT_EQ(ears.Heard(told.size()), told);
}

TEST_F(NoRoom, APointer_IsToldAsOne)
{
    EARS ears(one);
    ears.Hold(true);
    int value = 0;
    auto told = Overwhelm(two, value);
    EXPECT_TRUE(one.Set(Job, "P", PARAM_POINTER, &value));
    told.push_back("1 3/1 P:" + std::to_string(PARAM_POINTER));
    ears.Hold(false);
    EXPECT_EQ(ears.Heard(told.size()), told);
}

TEST_F(NoRoom, ForLongerThanTheJournalGoesBack_IsToldOnStderr)
{
    EARS ears(one);
    ears.Hold(true);
    int value = 0;
    Overwhelm(two, value);
    for (int i = 0; i < 250; ++i)
        two.Set(Job, "K", i);
    two.server.Tidy();
    ExpectLossAndNewsAfterwards(ears);
}

TEST_F(NoRoom, BeforeARecordThatCannotBeRead_IsToldOnStderr)
{
    EARS ears(one);
    ears.Hold(true);
    int value = 0;
    Overwhelm(two, value);
    one.Tickets().CatchUp();
    site->BreakJournal();
    ExpectLossAndNewsAfterwards(ears);
}

// --- a feed that the journal was pruned past

namespace
{
// Knows of tickets only what it is told, and counts what it was told for nothing.
class REMEMBERING_LISTENER : public ChangeListener
{
public:
    bool Wants(TicketAddress ticket) const override { return ticket.type == Job.type; }
    bool HasRoom() const override { return true; }
    void Created(TicketAddress ticket) noexcept override
    {
        needless += tickets.contains(ticket) ? 1 : 0;
        tickets[ticket];
    }
    void Written(TicketAddress ticket, ChangedParameters&& parameters) noexcept override
    {
        auto& model = tickets[ticket];
        for (ChangedParameter const& change : parameters)
        {
            auto& values = model[change.key->CStr()];
            auto const before = values;
            if (change.pos == -1)
                values.clear();
            values.erase(std::max(change.pos, 0));
            if (change.value.type != PARAM_NONE)
                values.emplace(std::max(change.pos, 0), MODEL_VALUE(change.value));
            needless += values == before ? 1 : 0;
            if (values.empty())
                model.erase(change.key->CStr());
        }
    }
    void Deleted(TicketAddress ticket) noexcept override { needless += tickets.erase(ticket) == 1 ? 0 : 1; }

    std::map<TicketAddress, TICKET_MODEL> tickets;
    int needless = 0;
};

std::map<TicketAddress, TICKET_MODEL> ContentOf(Store& store)
{
    std::map<TicketAddress, TICKET_MODEL> content;
    std::vector<TicketAddress> addresses;
    store.Tickets([&](TicketAddress address, TicketState const&) { addresses.push_back(address); });
    for (TicketAddress const address : addresses)
        if (address.type == Job.type)
            store.Load(address,
                       [&model = content[address]](std::string_view key, int pos, StoredValue const& value) {
                           model[std::string(key)].emplace(pos, MODEL_VALUE(TicketValue::FromStored(value)));
                       });
    return content;
}

// A feed without a thread of its own, so that it falls behind as far as a test wants, and a program that
// makes the changes.
class PrunedJournal : public testing::Test
{
protected:
    PrunedJournal()
    {
        std::filesystem::create_directories(folder / "tickets");
        site->AddTicket(SystemTicket);
        for (int id = 1; id < 6; ++id)
            site->Put({Job.type, id}, "K", 0, Integer(PARAM_INT, id));
        feed = std::make_unique<Feed>(store, listener, texts);
        feed->Stop();
        listener.tickets = ContentOf(store);
        for (auto const& [address, model] : listener.tickets)
            feed->Load(address);
    }

    // Changes something or other.
    void Change()
    {
        static char const* const keys[] = {"K", "V", "Text"};
        TicketAddress const ticket{Job.type, Among(1, 6)};
        char const* const key = keys[Among(0, 2)];
        switch (Among(0, 9))
        {
        case 0:
            program.Create(ticket);
            break;
        case 1:
            program.Delete(ticket);
            break;
        case 2:
            program.Drop(ticket, key);
            break;
        case 3:
            program.Drop(ticket, key, Among(0, 3));
            break;
        case 4:
        case 5:
            program.Set(ticket, key, "text " + std::to_string(++m_newest), Among(-1, 3));
            break;
        default:
            program.Set(ticket, key, ++m_newest, Among(-2, 3));
        }
    }

    bool IsLeftBehind()
    {
        program.server.Tidy();
        return !store.ChangesSince(feed->Heard(), [](CommittedChange&&) {});
    }

    // What the feed has of a ticket, whether the listener wants it or not.
    void ExpectCacheToBe(std::map<TicketAddress, TICKET_MODEL> const& content)
    {
        for (auto const& [address, model] : content)
        {
            ASSERT_TRUE(feed->Fresh().Find(address) || feed->Load(address));
            Epochs::Guard const guard;
            EditedTicket::ExpectEqual(*feed->Fresh().Find(address), model);
        }
        int tickets = 0;
        for (int id = feed->Fresh().NextId(Job.type, -1); id >= 0; id = feed->Fresh().NextId(Job.type, id))
            ++tickets;
        ASSERT_EQ(tickets, static_cast<int>(content.size()));
    }

    int Among(int from, int to) { return std::uniform_int_distribution(from, to)(m_random); }

    MemoryFolder folder;
    std::shared_ptr<MemorySite> site =
        std::make_shared<MemorySite>(StoreLimits{.journalKept = 10, .journalLargest = 20, .feedLargest = 7});
    Program program{site, folder.Path()};
    MemoryStore store{site};
    KeptTexts texts;
    REMEMBERING_LISTENER listener;
    std::unique_ptr<Feed> feed;

private:
    std::mt19937 m_random{11};
    int m_newest = 100;
};
}  // namespace

TEST_F(PrunedJournal, ATicketThatIsTakenOverAnew_IsThereAllTheTime)
{
    std::atomic<bool> isOver{false};
    std::thread reader(
        [&]
        {
            while (!isOver && feed->Fresh().IncarnationOf(Job) != 0)
                ;
            EXPECT_NE(feed->Fresh().IncarnationOf(Job), 0u);
            EXPECT_TRUE(isOver);
        });
    for (int i = 0; i < 20'000; ++i)
        feed->Reload(Job);
    isOver = true;
    reader.join();
}

TEST_F(PrunedJournal, ATicketThatCannotBeTakenOver_StaysAsItIs)
{
    program.Set(Job, "K", 7);
    site->Fail("ChangesSince", true);
    feed->Reload(Job);
    EXPECT_NE(feed->Fresh().IncarnationOf(Job), 0u);
    site->Fail("ChangesSince", false);
    ExpectCacheToBe(ContentOf(store));
}

TEST_F(PrunedJournal, AFeedThatFellBehind_TellsExactlyTheDifference)
{
    program.Set({3, 1}, "K", 1);   // as it is already
    program.Set({3, 2}, "K", 20);  // another value
    program.Drop({3, 3}, "K");     // gone
    program.Set({3, 4}, "V", 1, 1);
    program.Delete({3, 5});
    program.Create({3, 6});
    program.Set({3, 6}, "New", 6);
    program.Delete({3, 4});
    program.Create({3, 4});
    for (int i = 0; i < 30; ++i)
        program.Set(SystemTicket, "K", i);
    ASSERT_TRUE(IsLeftBehind());
    feed->Fresh();
    EXPECT_EQ(listener.tickets, ContentOf(store));
    EXPECT_EQ(listener.needless, 0);
    ExpectCacheToBe(ContentOf(store));
}

TEST_F(PrunedJournal, ManyTimesBehind_MoreOrLess_TheListenerKnowsWhatIs)
{
    int leftBehind = 0;
    for (int round = 0; round < 150 && !HasFatalFailure(); ++round)
    {
        for (int count = Among(0, 90); count > 0; --count)
            Change();
        bool const isLeftBehind = IsLeftBehind();
        leftBehind += isLeftBehind ? 1 : 0;
        listener.needless = 0;
        feed->Fresh();
        ASSERT_EQ(listener.tickets, ContentOf(store)) << round;
        ASSERT_TRUE(!isLeftBehind || listener.needless == 0) << round;
        ExpectCacheToBe(ContentOf(store));
    }
    EXPECT_GT(leftBehind, 20);
    EXPECT_LT(leftBehind, 130);
}

TEST_F(PrunedJournal, OfATicketThatNobodyHasRead_OnlyItsBeingIsNoted)
{
    site->AddTicket({12, 1});
    for (int i = 0; i < 30; ++i)
        program.Set({12, 1}, "K", i);
    ASSERT_TRUE(IsLeftBehind());
    int const before = site->Loads();
    EXPECT_NE(feed->Fresh().IncarnationOf({12, 1}), 0u);
    EXPECT_EQ(site->Loads(), before);
    EXPECT_TRUE(feed->Load({12, 1}));
}

// --- what programs that died have left

TEST_F(TwoPrograms, PreparedJobsAndPartFilesOfADeadProgram_GoWithItsBurial)
{
    std::filesystem::path const part = folder / ".transfer.0123456789abcdef.tmp";
    std::ofstream(part) << "half";
    auto dead = std::make_unique<Program>(site, folder.Path());
    int id = 0;
    ASSERT_EQ(dead->server.Jobs().Prepare(dead->session, {"job.pdf"}, id), Transferred);
    dead->store.AddPartFile(part.string());
    EXPECT_TRUE(one.Exists({JobTicketType, id}));
    EXPECT_THAT(one.store.Sessions(), SizeIs(3));
    one.server.Tidy();
    EXPECT_TRUE(one.Exists({JobTicketType, id}));  // its program lives
    EXPECT_TRUE(std::filesystem::exists(part));

    testing::internal::CaptureStderr();
    dead->store.Die();
    auto const end = std::chrono::steady_clock::now() + std::chrono::minutes(1);
    while (one.store.Programs().size() > 2 && std::chrono::steady_clock::now() < end)
        one.server.Tidy();  // or a caretaker of the two was faster
    dead.reset();
    testing::internal::GetCapturedStderr();
    EXPECT_FALSE(one.Exists({JobTicketType, id}));
    EXPECT_FALSE(two.Exists({JobTicketType, id}));
    EXPECT_FALSE(std::filesystem::exists(part));
    EXPECT_THAT(one.store.Sessions(), SizeIs(2));
    EXPECT_TRUE(one.Exists(Job));
}
