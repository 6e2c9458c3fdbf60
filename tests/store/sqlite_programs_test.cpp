// Several processes on one site: killed at any instant, stopped, forked.
#include "tests/store/SqliteSite.h"
#include "tests/support/ChildProcess.h"
#include "tests/support/sanitizers.h"
#include <csignal>
#include <fstream>
#include <gmock/gmock.h>
#include <random>
#include <sys/stat.h>
#include <thread>
#include <unistd.h>

using namespace standin;
using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

namespace
{
using Report = ChildProcess::Report;

// Children are made before the process itself opens the site: what it has open they could not open.
class SqlitePrograms : public SqliteSite
{
protected:
    static constexpr TicketAddress Shared{4, 1};

    // Writes number after number to five places of a ticket of its own, which goes when it dies, and counts
    // up a ticket that all share. Reports each number once it is committed; who is stopped the first and the
    // last.
    void Work(Report const& report, bool untilStopped) const
    {
        auto const store = OpenWithShared();
        Writer writer(*store);
        TicketAddress const own = writer.Do(CreationOfNext(3).Own(CHANGE::Owner::ThisProgram)).address;
        store->AddPartFile("/tmp/" + std::to_string(store->Self()));
        store->OpenSession("admin");
        std::int64_t number = 1;
        for (; !untilStopped || !std::filesystem::exists(folder / "stop"); ++number)
        {
            CHANGE change = WriteTo(own, writer.State(own));
            for (char const* const key : {"A", "B", "C", "D", "E"})
                std::move(change).Put(key, 0, Integer(PARAM_INT64, number));
            if (writer.Try(change).kind != CommitOutcome::Committed)
                throw std::logic_error("a ticket of one's own was changed by somebody else");
            CountUp(*store, writer);
            if (number % 8 == 0)
                store->Maintain(store->Committed());
            if (untilStopped && number % 16 == 0)
                BuryAll(*store, writer);
            if (!untilStopped || number == 1)
                report(number);
        }
        report(number - 1);
        writer.Remove(own);
        store->Leave();
    }

    std::unique_ptr<SqliteStore> OpenWithShared(SqliteOptions const& options = {}) const
    {
        return std::make_unique<SqliteStore>(
            folder.Path(), [] { return OneTicket(Shared, "Count", 0); }, options);
    }

    static std::int64_t CountOf(SqliteStore& store)
    {
        return ValuesOf(store, Shared).at({"Count", 0}).value.integer;
    }

    static void CountUp(SqliteStore& store, Writer& writer)
    {
        for (;;)
        {
            TicketState const state = writer.State(Shared);
            CHANGE change = WriteTo(Shared, state);
            std::move(change).Put("Count", 0, Integer(PARAM_INT64, CountOf(store) + 1));
            if (writer.Try(change).kind == CommitOutcome::Committed)
                return;
        }
    }

    static int BuryAll(SqliteStore& store, Writer& writer)
    {
        return store.Bury(
            [&](Estate const& estate)
            {
                for (Estate::Ticket const& ticket : estate.tickets)
                    writer.Try(DeletionOf(ticket.address, {ticket.incarnation, TicketChange::AnyRevision}));
            });
    }

    // So many rounds; on a busy machine as many more as it takes until a child has lived long enough.
    static bool MustGoOn(int round, int rounds, bool isEnough)
    {
        return round < rounds || (!isEnough && round < 10 * rounds);
    }

    void Stop() const { std::ofstream(folder / "stop") << "now"; }
};
}  // namespace

// Programs come and are killed at any instant, while two others work on and bury the dead. Nothing that was
// acknowledged is lost, no change is half there, no number is missing, and nobody who lives notices.
TEST_F(SqlitePrograms, KilledAtAnyInstant_HarmNobody)
{
    std::mt19937_64 random(4711);
    ChildProcess first([this](Report const& report) { Work(report, true); });
    ASSERT_TRUE(first.Next());
    ChildProcess second([this](Report const& report) { Work(report, true); });
    std::int64_t acknowledged = 0;
    int workers = 0;
    int rounds = 0;
    for (; MustGoOn(rounds, IsSanitized ? 30 : 150, workers > 0); ++rounds)
    {
        ChildProcess victim([this](Report const& report) { Work(report, false); });
        std::this_thread::sleep_for(std::chrono::microseconds(random() % (IsSanitized ? 200'000 : 20'000)));
        victim.Kill();
        std::int64_t const last = victim.Last(0);
        acknowledged += last;
        workers += last > 0 ? 1 : 0;
    }
    Stop();
    std::int64_t const byFirst = first.Last(0);
    std::int64_t const bySecond = second.Last(0);
    EXPECT_EQ(first.Wait(), 0);
    EXPECT_EQ(second.Wait(), 0);
    EXPECT_GT(workers, 0) << "no child has lived long enough to write";
    EXPECT_GT(byFirst, 0);
    EXPECT_GT(bySecond, 0);

    auto const store = OpenWithShared();
    EXPECT_TRUE(store->WasFirst());
    Writer writer(*store);
    for (TicketAddress const address : AddressesIn(*store))
    {
        if (address == Shared)
            continue;
        StoreValues const values = ValuesOf(*store, address);
        EXPECT_TRUE(values.empty() || values.size() == 5) << values.size();
        for (auto const& [place, value] : values)
            EXPECT_EQ(value, values.begin()->second);
    }
    // Each of the victims may have counted once without having said so.
    EXPECT_GE(CountOf(*store), acknowledged + byFirst + bySecond);
    EXPECT_LE(CountOf(*store), acknowledged + byFirst + bySecond + rounds);
    EXPECT_THAT(store->Check({}), IsEmpty());
    BuryAll(*store, writer);
    EXPECT_THAT(AddressesIn(*store), ElementsAre(Shared));
    EXPECT_THAT(store->Sessions(), IsEmpty());
    EXPECT_EQ(store->Programs().size(), 1u);
}

// A site whose only program is killed at any instant, also while it opens the site for the first time.
TEST_F(SqlitePrograms, KilledAlone_KeepAcknowledgedChangesWhole)
{
    std::mt19937_64 random(42);
    std::int64_t count = 0;
    for (int round = 0; MustGoOn(round, IsSanitized ? 15 : 60, count > 0); ++round)
    {
        ChildProcess child([this](Report const& report) { Work(report, false); });
        std::this_thread::sleep_for(std::chrono::microseconds(random() % (IsSanitized ? 100'000 : 15'000)));
        child.Kill();
        std::int64_t const acknowledged = child.Last(0);
        ChildProcess reader(
            [&](Report const& report)
            {
                auto const store = OpenWithShared();
                Writer writer(*store);
                report(CountOf(*store));
                report(store->Check({}).empty() ? 1 : 0);
                for (TicketAddress const address : AddressesIn(*store))
                    for (auto const& [place, value] : ValuesOf(*store, address))
                        report(address == Shared || value == ValuesOf(*store, address).begin()->second ? 1
                                                                                                       : 0);
                report(BuryAll(*store, writer) <= 2 && AddressesIn(*store).size() == 1 ? 1 : 0);
            });
        std::int64_t const now = reader.Next().value_or(-1);
        ASSERT_GE(now, count + acknowledged) << round;
        ASSERT_LE(now, count + acknowledged + 1) << round;
        while (auto const isSound = reader.Next())
            ASSERT_EQ(isSound, 1) << round;
        ASSERT_EQ(reader.Wait(), 0) << round;
        count = now;
    }
    EXPECT_GT(count, 0) << "no child has lived long enough to write";
}

TEST_F(SqlitePrograms, WorkingTogether_LoseNothing)
{
    std::vector<std::unique_ptr<ChildProcess>> programs;
    for (int i = 0; i < 4; ++i)
        programs.push_back(std::make_unique<ChildProcess>(
            [this](Report const& report)
            {
                auto const store = OpenWithShared();
                Writer writer(*store);
                for (int number = 1; number <= (IsSanitized ? 50 : 300); ++number)
                    CountUp(*store, writer);
                store->Leave();
                report(1);
            }));
    for (auto const& program : programs)
        EXPECT_EQ(program->Wait(), 0);
    auto const store = OpenWithShared();
    EXPECT_TRUE(store->EndedInOrder());
    EXPECT_EQ(CountOf(*store), 4 * (IsSanitized ? 50 : 300));
    EXPECT_EQ(store->Committed(), static_cast<Sequence>(1 + 4 * (IsSanitized ? 50 : 300)));
    EXPECT_EQ(FeedOf(*store, store->Committed() - 100).size(), 100u);
}

TEST_F(SqlitePrograms, ChangeOfAnotherProcess_EndsAWait)
{
    int const rounds = IsSanitized ? 100 : 1000;
    ChildProcess other(
        [=, this](Report const& report)
        {
            auto const store = OpenWithShared();
            Writer writer(*store);
            report(1);
            while (store->Programs().size() < 2)
                std::this_thread::sleep_for(1ms);
            for (int i = 0; i < rounds; ++i)
            {
                // Every change waits for an answer, so that each has a ring of its own to wake by.
                CountUp(*store, writer);
                auto const mine = static_cast<Sequence>(2 + 2 * i);
                while (store->Committed() <= mine)
                    store->WaitForChanges(mine, 60s);
            }
            report(2);
        });
    ASSERT_EQ(other.Next(), 1);
    auto const store = OpenWithShared();
    Writer writer(*store);
    auto const start = std::chrono::steady_clock::now();
    for (int i = 0; i < rounds; ++i)
    {
        auto const heard = static_cast<Sequence>(1 + 2 * i);
        while (store->Committed() <= heard)
            store->WaitForChanges(heard, 60s);
        CountUp(*store, writer);
    }
    EXPECT_EQ(other.Next(), 2);
    EXPECT_LT(std::chrono::steady_clock::now() - start, 50s);
    EXPECT_EQ(CountOf(*store), 2 * rounds);
}

TEST_F(SqlitePrograms, WhoBuriesIsKilled_AnotherOneBuries)
{
    ChildProcess dead(
        [this](Report const& report)
        {
            OpenWithShared()->AddPartFile("/tmp/a");
            report(1);
        });
    ASSERT_EQ(dead.Next(), 1);
    ASSERT_EQ(dead.Wait(), 0);
    ChildProcess digger(
        [this](Report const& report)
        {
            OpenWithShared()->Bury(
                [&report](Estate const& estate)
                {
                    report(estate.program);
                    pause();
                });
        });
    ProgramId const buried = digger.Next().value_or(0);
    EXPECT_GT(buried, 0);
    auto const store = OpenWithShared();
    EXPECT_EQ(store->Bury([](Estate const&) { ADD_FAILURE() << "somebody is at it"; }), 0);
    for (ProgramInfo const& program : store->Programs())
        EXPECT_EQ(program.isAlive, program.id != buried);
    digger.Kill();
    std::vector<std::string> partFiles;
    EXPECT_EQ(
        store->Bury([&partFiles](Estate const& estate)
                    { partFiles.insert(partFiles.end(), estate.partFiles.begin(), estate.partFiles.end()); }),
        2);
    EXPECT_THAT(partFiles, ElementsAre("/tmp/a"));
}

TEST_F(SqlitePrograms, Names_AreTheirOwn)
{
    ChildProcess other(
        [this](Report const& report)
        {
            auto const store = OpenWithShared();
            report(store->Self());
            pause();
        });
    ProgramId const others = other.Next().value_or(0);
    auto const store = OpenWithShared();
    auto const programs = store->Programs();
    ASSERT_EQ(programs.size(), 2u);
    EXPECT_EQ(programs[0].id, others);
    EXPECT_EQ(programs[0].process, other.Id());
    EXPECT_EQ(programs[1].process, getpid());
    EXPECT_THAT(programs[1].name, HasSubstr("store_tests"));
    EXPECT_FALSE(store->WasFirst());
}

// --- fork

TEST_F(SqlitePrograms, InAChild_EveryOperationIsRefused)
{
    auto const store = OpenWithShared();
    Writer writer(*store);
    writer.Make(Job);
    store->OpenSession("admin");
    std::function<void()> const operations[] = {
        [&] {
            store->Commit(WriteTo(Shared, {1, 1}), 99);
        },
        [&] { store->FindCommit(1); },
        [&] { store->Sync(); },
        [&] { AddressesIn(*store); },
        [&] { ValuesOf(*store, Shared); },
        [&] { store->ChangesSince(0, [](CommittedChange&&) {}); },
        [&] { store->WaitForChanges(0, 60s); },
        [&] { store->Maintain(1); },
        [&] { store->Programs(); },
        [&] { store->Bury([](Estate const&) {}); },
        [&] { store->Leave(); },
        [&] { store->OpenSession("admin"); },
        [&] { store->CloseSession(1); },
        [&] { store->Sessions(); },
        [&] { store->AddPartFile("/tmp/a"); },
        [&] { store->RemovePartFile("/tmp/a"); },
        [&] { store->FindUser("admin"); },
        [&] { store->Users(); },
        [&] {
            store->PutUser({"admin", "", 0, 0});
        },
        [&] { store->RemoveUser("admin"); },
        [&] { store->Check({}); },
        [&] { store->BackupTo(folder / "copy", {}); },
        [&] { store->Measure(); },
        [&] { OpenWithShared(); },
    };
    ChildProcess child(
        [&](Report const& report)
        {
            for (auto const& operation : operations)
            {
                std::string const reason = ReasonOf(operation);
                report(reason.find("started anew") != std::string::npos ? 1 : 0);
            }
            store->Interrupt();
            report(store->Committed() == 2 ? 1 : 0);
        });
    for (std::size_t i = 0; i <= std::size(operations); ++i)
        EXPECT_EQ(child.Next(), 1) << "operation " << i;
    EXPECT_EQ(child.Wait(), 0);
    EXPECT_EQ(store->Programs().size(), 1u);
    EXPECT_EQ(store->Sessions().size(), 1u);
    writer.Put(Job, "Key", 0, 1);
}

TEST_F(SqlitePrograms, AChildThatEndsItsCopy_LeavesTheParentAtWork)
{
    auto store = OpenWithShared();
    Writer writer(*store);
    writer.Make(Job);
    ChildProcess child(
        [&](Report const& report)
        {
            store.reset();
            report(1);
        });
    EXPECT_EQ(child.Next(), 1);
    EXPECT_EQ(child.Wait(), 0);
    EXPECT_TRUE(std::filesystem::exists(folder / "site.db-wal"));
    writer.Put(Job, "Key", 0, 1);
    store->Leave();
    EXPECT_EQ(ValuesOf(*OpenWithShared(), Job).size(), 1u);
}

TEST_F(SqlitePrograms, AChild_KeepsNeitherTheSiteNorTheProgramAlive)
{
    auto store = OpenWithShared();
    ProgramId const dead = store->Self();
    ChildProcess child(
        [](Report const& report)
        {
            report(1);
            pause();
        });
    ASSERT_TRUE(child.Next());
    store.reset();
    auto const later = OpenWithShared();
    EXPECT_TRUE(later->WasFirst());
    EXPECT_EQ(later->Bury([dead](Estate const& estate) { EXPECT_EQ(estate.program, dead); }), 1);
}

TEST_F(SqlitePrograms, AChildOfAProcessThatHasLeft_MayOpenTheSite)
{
    auto const store = OpenWithShared();
    store->Leave();
    ChildProcess child([this](Report const& report)
                       { report(static_cast<std::int64_t>(OpenWithShared()->Committed())); });
    EXPECT_EQ(child.Next(), 1);
    EXPECT_EQ(child.Wait(), 0);
}
