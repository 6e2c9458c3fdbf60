// What the SQLite store promises beyond the contract of all stores: its files, and their damage.
#include "standin/server/store/sqlite/SqliteStore.h"

#include "tests/store/SqliteSite.h"
#include "tests/support/ChildProcess.h"
#include "tests/support/FullDisk.h"
#include "tests/support/sanitizers.h"
#include <fcntl.h>
#include <fstream>
#include <future>
#include <gmock/gmock.h>
#include <sys/file.h>
#include <thread>
#include <unistd.h>

using namespace standin;
using namespace std::chrono_literals;
using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;

namespace
{
class SiteInAFolder : public StoreSite
{
public:
    SiteInAFolder(StoreLimits const& limits, Durability durability)
    {
        m_options.limits = limits;
        m_options.durability = durability;
    }
    std::unique_ptr<Store> Open() override
    {
        return std::make_unique<SqliteStore>(m_folder.Path(), NoContent, m_options);
    }

private:
    MemoryFolder m_folder;
    SqliteOptions m_options;
};

template <Durability durability>
std::unique_ptr<StoreSite> MakeSite(StoreLimits const& limits)
{
    return std::make_unique<SiteInAFolder>(limits, durability);
}

STORE_ENGINE const Sqlite{"Process", MakeSite<Durability::Process>};
STORE_ENGINE const FlushedSqlite{"Full", MakeSite<Durability::Full>};

int KeyOf(Store& store, TicketAddress address, char const* key = "Key")
{
    StoreValues const values = ValuesOf(store, address);
    auto const found = values.find({key, 0});
    return found == values.end() ? -1 : static_cast<int>(found->second.value.integer);
}

using SqliteNewSite = SqliteSite;
using SqliteDamage = SqliteSite;
using SqliteEnd = SqliteSite;
using SqliteOpening = SqliteSite;
using SqliteUpgrade = SqliteSite;
using SqliteFailure = SqliteSite;
using SqliteCare = SqliteSite;
using SqliteJournal = SqliteSite;
}  // namespace

INSTANTIATE_TEST_SUITE_P(Sqlite, StoreContract, testing::Values(Sqlite, FlushedSqlite),
                         [](auto const& engine) { return std::string(engine.param.name); });

// --- a new site

TEST_F(SqliteNewSite, IsFilledWithWhatFirstGives)
{
    std::string const hash = "$y$hash";
    SqliteStore store(folder.Path(),
                      [&hash]
                      {
                          StoreContent content = OneTicket(Job, "Key", 5);
                          content.tickets.push_back(Creation({17, 1}).Put("A", -1, 2).Put("A", 3, 4));
                          content.users.push_back({"admin", hash, 16, 1});
                          return content;
                      });
    EXPECT_TRUE(store.WasFirst());
    EXPECT_THAT(AddressesIn(store), ElementsAre(Job, TicketAddress{17, 1}));
    EXPECT_EQ(KeyOf(store, Job), 5);
    EXPECT_EQ(KeyOf(store, {17, 1}, "A"), 2);
    EXPECT_EQ(ValuesOf(store, {17, 1}).size(), 2u);
    EXPECT_EQ(store.FindUser("admin")->passwordHash, hash);
    EXPECT_EQ(store.Committed(), 2u);
    EXPECT_EQ(StateOf(store, {17, 1})->incarnation, 2u);
    EXPECT_FALSE(store.ChangesSince(1, [](CommittedChange&&) {}));
    EXPECT_THAT(FeedOf(store, 2), IsEmpty());
    EXPECT_EQ(Writer(store).Put(Job, "Key", 0, 6).sequence, 3u);
}

TEST_F(SqliteNewSite, WhenFirstThrows_StaysNew)
{
    EXPECT_THROW(SqliteStore(folder.Path(), []() -> StoreContent { throw std::runtime_error("no seed"); }),
                 std::runtime_error);
    bool isAsked = false;
    SqliteStore const store(folder.Path(),
                            [&isAsked]
                            {
                                isAsked = true;
                                return StoreContent();
                            });
    EXPECT_TRUE(isAsked);
}

TEST_F(SqliteNewSite, WhenItsContentCannotBeStored_StaysNew)
{
    auto const unknownType = []
    {
        StoreContent content = OneTicket(Job, "Key", 5);
        content.tickets.push_back(Creation({3, 2}).Put("Key", 0, Integer(PARAM_COUNT, 1)));
        return content;
    };
    auto const twice = []
    {
        StoreContent content = OneTicket(Job, "Key", 5);
        content.tickets.push_back(Creation(Job));
        return content;
    };
    EXPECT_THROW(SqliteStore(folder.Path(), unknownType), StoreError);
    EXPECT_THROW(SqliteStore(folder.Path(), twice), StoreError);
    EXPECT_THAT(AddressesIn(*Open()), IsEmpty());
}

TEST_F(SqliteNewSite, OpenedAgain_AsksForNoContent)
{
    MakeWithOneTicket();
    SqliteStore store(folder.Path(), []() -> StoreContent { throw std::logic_error("asked"); });
    EXPECT_EQ(KeyOf(store, Job), 5);
}

TEST_F(SqliteNewSite, OpenedBesideAnother_AsksForNoContent)
{
    auto const store = Open();
    SqliteStore const other(folder.Path(), []() -> StoreContent { throw std::logic_error("asked"); });
    EXPECT_TRUE(store->WasFirst());
    EXPECT_FALSE(other.WasFirst());
}

TEST_F(SqliteNewSite, EmptyFile_CountsAsNew)
{
    WriteFile(File(), "");
    EXPECT_THAT(AddressesIn(*Open()), IsEmpty());
}

TEST_F(SqliteNewSite, WithoutItsDatabase_ALeftJournalIsNotTakenUp)
{
    ChildProcess child(
        [this](ChildProcess::Report const& report)
        {
            auto const store = Open();
            Writer(*store).Make(Job);
            report(1);
            pause();
        });
    ASSERT_TRUE(child.Next());
    child.Kill();
    ASSERT_THAT(NamesIn(folder.Path()), testing::Contains("site.db-wal"));
    std::filesystem::remove(File());
    EXPECT_THAT(AddressesIn(*Open()), IsEmpty());
}

TEST_F(SqliteNewSite, InNoFolder_SaysWhichAndWhatToDo)
{
    EXPECT_THAT(ReasonOf([this] { SqliteStore(folder / "missing", NoContent); }),
                AllOf(HasSubstr("missing"), HasSubstr("No such file"), HasSubstr("; make ")));
    WriteFile(folder / "file", "");
    EXPECT_THAT(ReasonOf([this] { SqliteStore(folder / "file", NoContent); }),
                AllOf(HasSubstr("file"), HasSubstr("Not a directory")));
}

// --- the end

TEST_F(SqliteEnd, OfTheLast_LeavesOneFileWithEverything)
{
    auto first = Open();
    auto second = Open();
    Writer(*first).Do(Creation(Job).Put("Key", 0, 5));
    first->Leave();
    EXPECT_THAT(NamesIn(folder.Path()), testing::Contains("site.db-wal"));
    second->Leave();
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("site.db", "site.lock"));
    std::filesystem::remove(LockedFile());
    EXPECT_EQ(KeyOf(*Open(), Job), 5);
}

TEST_F(SqliteEnd, InOrder_IsKnownToTheNext)
{
    {
        auto const store = Open();
        EXPECT_FALSE(store->EndedInOrder());  // nobody was there before
        store->Leave();
    }
    for (int round = 0; round < 2; ++round)
    {
        auto const store = Open();
        EXPECT_TRUE(store->WasFirst());
        EXPECT_TRUE(store->EndedInOrder()) << round;
        Writer(*store).Make({3, round});
        store->Leave();
    }
}

TEST_F(SqliteEnd, WithoutLeave_IsKnownToTheNext)
{
    MakeWithOneTicket();
    Open();
    auto const store = Open();
    EXPECT_TRUE(store->WasFirst());
    EXPECT_FALSE(store->EndedInOrder());
}

TEST_F(SqliteEnd, OfOneBesideWhomAnotherDied_IsInOrder)
{
    auto const store = Open();
    Open();
    store->Leave();
    EXPECT_TRUE(Open()->EndedInOrder());
}

TEST_F(SqliteEnd, OfTwoAtOnce_IsInOrder)
{
    for (int round = 0; round < 20; ++round)
    {
        auto first = Open();
        auto second = Open();
        EXPECT_EQ(first->EndedInOrder(), round > 0);
        std::thread leaving([&first] { first->Leave(); });
        second->Leave();
        leaving.join();
    }
}

// Of two who leave at the same moment each may find the other still there; the later one has to see that it
// is the last.
TEST_F(SqliteEnd, WhileAnotherLeavesOrOpens_WaitsForIt)
{
    auto const store = Open();
    {
        LockFile another(folder.Path());
        ASSERT_TRUE(another.TryLock(LockFile::Opening, LockFile::Hold::Exclusive));
        ASSERT_TRUE(another.TryLock(LockFile::Site, LockFile::Hold::Shared));
        std::thread leaving([&store] { store->Leave(); });
        std::this_thread::sleep_for(20ms);  // who does not wait is gone by then
        another.Close();
        leaving.join();
    }
    EXPECT_TRUE(Open()->EndedInOrder());
}

TEST_F(SqliteEnd, WithTheDatabaseOfAnotherTime_IsNotInOrder)
{
    MakeWithOneTicket();
    std::string const content = ContentOf(File());
    Overwrite(content);
    EXPECT_FALSE(Open()->EndedInOrder());
}

TEST_F(SqliteEnd, WithAnotherFileInItsPlace_IsNotInOrder)
{
    MakeWithOneTicket();
    auto const changed = std::filesystem::last_write_time(File());
    std::filesystem::copy_file(File(), folder / "copy");
    std::filesystem::rename(folder / "copy", File());
    std::filesystem::last_write_time(File(), changed);
    auto const store = Open();
    EXPECT_FALSE(store->EndedInOrder());
    EXPECT_EQ(KeyOf(*store, Job), 5);
}

TEST_F(SqliteEnd, WithAJournalBesideIt_IsNotInOrder)
{
    MakeWithOneTicket();
    WriteFile(folder / "site.db-wal", "what somebody left");
    auto const store = Open();
    EXPECT_FALSE(store->EndedInOrder());
    EXPECT_EQ(KeyOf(*store, Job), 5);
}

TEST_F(SqliteEnd, TidySite_StaysSoUntilAnEndThatIsNotInOrder)
{
    {
        auto const store = Open();
        EXPECT_FALSE(store->IsTidy());  // nobody has said so
        store->NoteTidy();
        EXPECT_TRUE(Open()->IsTidy());
        store->Leave();
    }
    Open()->Leave();
    auto const later = Open();
    EXPECT_TRUE(later->IsTidy());
    later->Leave();
    Open();  // dies
    EXPECT_FALSE(Open()->IsTidy());
}

// One that only looks in takes the site over from who died, and leaves it in order.
TEST_F(SqliteEnd, UntidySite_StaysSoThroughProgramsThatDoNotCare)
{
    MakeWithOneTicket();
    Open();  // dies
    Open()->Leave();
    auto const store = Open();
    EXPECT_TRUE(store->EndedInOrder());
    EXPECT_FALSE(store->IsTidy());
    store->NoteTidy();
    store->Leave();
    EXPECT_TRUE(Open()->IsTidy());
}

TEST_F(SqliteEnd, OfTheHandle_EndsWhatItDoes)
{
    auto const store = Open();
    store->Leave();
    EXPECT_THAT(ReasonOf([&store] { store->FindUser("admin"); }), HasSubstr("has been left"));
    EXPECT_THAT(ReasonOf([&store] { store->WaitForChanges(0, 60s); }), HasSubstr("has been left"));
    EXPECT_THAT(ReasonOf([&store] { store->Sync(); }), HasSubstr("has been left"));
    store->Interrupt();
    store->EndOpening();
}

// --- damage

TEST_F(SqliteDamage, FileOfAnotherKind)
{
    WriteFile(File(), "garbage");
    EXPECT_TRUE(IsReportedAsDamaged());
    EXPECT_EQ(ContentOf(File()), "garbage");
    WriteFile(File(), std::string(8192, 'x'));
    EXPECT_TRUE(IsReportedAsDamaged());
}

TEST_F(SqliteDamage, DatabaseOfAnotherProgram)
{
    RunSql(File(), "CREATE TABLE bookmark (url)");
    EXPECT_THAT(ReasonOfOpening(), AllOf(HasSubstr(File().string()), HasSubstr("another program")));
    EXPECT_TRUE(IsReportedAsDamaged());
}

TEST_F(SqliteDamage, UnknownOlderSchema)
{
    MakeWithOneTicket();
    RunSql(File(), "PRAGMA user_version = 0");
    EXPECT_TRUE(IsReportedAsDamaged());
}

TEST_F(SqliteDamage, NewerSchema_IsNone_AndIsRefusedAndLeftAsItIs)
{
    MakeWithOneTicket();
    RunSql(File(), "PRAGMA user_version = 3");
    std::string const before = ContentOf(File());
    EXPECT_THAT(ReasonOfOpening(), AllOf(HasSubstr(File().string()), HasSubstr("newer version")));
    EXPECT_EQ(ContentOf(File()), before);
    bool isDamaged = true;
    try
    {
        isDamaged = IsReportedAsDamaged();
    }
    catch (StoreError const&)
    {
        isDamaged = false;
    }
    EXPECT_FALSE(isDamaged);
}

TEST_F(SqliteDamage, MissingTable)
{
    for (char const* const table :
         {"user", "ticket", "parameter", "journal", "program", "session", "part_file", "site"})
    {
        std::filesystem::remove(File());
        MakeWithOneTicket();
        RunSql(File(), std::string("DROP TABLE ") + table);
        EXPECT_TRUE(IsReportedAsDamaged()) << table;
    }
}

TEST_F(SqliteDamage, CutAnywhere)
{
    MakeWithOneTicket();
    std::string const whole = ContentOf(File());
    for (std::size_t size = 2; size < whole.size(); size += 511)  // one byte counts as an empty file
    {
        Overwrite(whole.substr(0, size));
        EXPECT_TRUE(IsReportedAsDamaged()) << size << " of " << whole.size();
    }
}

TEST_F(SqliteDamage, OverwrittenPage)
{
    MakeWithOneTicket();
    std::string const whole = ContentOf(File());
    std::size_t const page = 4096;
    ASSERT_GE(whole.size(), 2 * page);
    for (std::size_t first = 0; first + page <= whole.size(); first += page)
    {
        std::string broken = whole;
        broken.replace(first, page, page, 'x');
        Overwrite(broken);
        EXPECT_TRUE(IsReportedAsDamaged()) << first;
        EXPECT_EQ(ContentOf(File()), broken);
    }
}

// The price of an opening that takes the same time at any size: what was changed without a trace is found
// when it is read. Damage that leaves a trace is found at once.
TEST_F(SqliteDamage, WithoutATraceAfterAnOrderlyEnd_IsNotLookedFor_ByDesign)
{
    MakeWithOneTicket();
    std::string broken = ContentOf(File());
    std::size_t const value = broken.rfind("Key");
    ASSERT_NE(value, std::string::npos);
    std::size_t const page = value / 4096 * 4096;
    broken.replace(page, 4096, 4096, 'x');
    Overwrite(broken, true);
    auto const store = Open();
    EXPECT_TRUE(store->EndedInOrder());
    EXPECT_THAT(ReasonOf([&store] { ValuesOf(*store, Job); }), HasSubstr("damaged"));
    store->Leave();
    EXPECT_TRUE(IsReportedAsDamaged());  // since it was found, the end was not in order
}

TEST_F(SqliteDamage, AfterAnEndThatWasNotInOrder_IsFoundWithoutATrace)
{
    MakeWithOneTicket();
    Open();
    std::string broken = ContentOf(File());
    broken.replace(4096, 4096, 4096, 'x');
    Overwrite(broken, true);
    EXPECT_TRUE(IsReportedAsDamaged());
}

TEST_F(SqliteDamage, ThatIsRefused_IsRefusedAgain)
{
    MakeWithOneTicket();
    std::string broken = ContentOf(File());
    broken.replace(4096, 4096, 4096, 'x');
    Overwrite(broken);
    for (int i = 0; i < 3; ++i)
        EXPECT_TRUE(IsReportedAsDamaged()) << i;
}

TEST_F(SqliteDamage, WhileOthersHaveItOpen_IsAPlainFailure)
{
    MakeWithOneTicket();
    auto const store = Open();
    RunSql(File(), "PRAGMA user_version = 0");
    bool isDamaged = true;
    EXPECT_THAT(ReasonOf([&] { isDamaged = IsReportedAsDamaged(); }), HasSubstr("damaged"));
    isDamaged = false;
    try
    {
        isDamaged = IsReportedAsDamaged();
    }
    catch (StoreError const&)
    {
    }
    EXPECT_FALSE(isDamaged);
    EXPECT_EQ(KeyOf(*store, Job), 5);
}

TEST_F(SqliteDamage, IsSetAsideByWhoOpensAlone)
{
    WriteFile(File(), "garbage");
    SqliteOptions options;
    std::string line;
    options.setAside = [&](DamagedStore const& damage)
    {
        line = damage.what();
        std::filesystem::rename(File(), folder / "aside");
    };
    SqliteStore store(
        folder.Path(), [] { return OneTicket(Job, "Key", 7); }, options);
    EXPECT_THAT(line, HasSubstr(File().string()));
    EXPECT_EQ(KeyOf(store, Job), 7);
    EXPECT_EQ(ContentOf(folder / "aside"), "garbage");
}

TEST_F(SqliteDamage, ThatStaysAfterItWasSetAside_IsThrown)
{
    WriteFile(File(), "garbage");
    SqliteOptions options;
    int calls = 0;
    options.setAside = [&calls](DamagedStore const&) { ++calls; };
    EXPECT_THROW(Open(options), DamagedStore);
    EXPECT_EQ(calls, 1);
}

TEST_F(SqliteDamage, ValueThatDoesNotFitItsType_IsToldWhenItIsRead)
{
    for (char const* const sql :
         {"UPDATE parameter SET value = 'text'", "UPDATE parameter SET value_type = 4",
          "UPDATE parameter SET value_type = 6", "UPDATE parameter SET value_type = 1, value = 1"})
    {
        std::filesystem::remove(File());
        MakeWithOneTicket();
        RunSql(File(), sql);
        auto const store = Open();
        EXPECT_THAT(ReasonOf([&store] { ValuesOf(*store, Job); }), HasSubstr("does not fit its type")) << sql;
    }
}

TEST_F(SqliteDamage, OfTheJournal_IsToldWhenItIsReadAndHandsNothingOut)
{
    for (char const* const sql : {"DELETE FROM journal WHERE sequence = 3",
                                  "UPDATE journal SET record = X'0130' "
                                  "WHERE sequence = 3",
                                  "UPDATE journal SET kind = 2 WHERE sequence = 3"})
    {
        std::filesystem::remove(File());
        {
            auto const store = Open();
            Writer writer(*store);
            for (int id = 1; id <= 5; ++id)
                writer.Make({3, id});
            store->Leave();
        }
        RunSql(File(), sql);
        auto const store = Open();
        int taken = 0;
        EXPECT_THAT(ReasonOf([&] { store->ChangesSince(0, [&taken](CommittedChange&&) { ++taken; }); }),
                    AllOf(HasSubstr(File().string()), HasSubstr("journal")))
            << sql;
        EXPECT_EQ(taken, 0);
        EXPECT_EQ(FeedOf(*store, 3).size(), 2u);
    }
}

// --- opening beside others

TEST_F(SqliteOpening, WithKeepOpening_OthersWaitUntilItEnds)
{
    SqliteOptions keeping;
    keeping.keepOpening = true;
    auto const store = Open(keeping);
    SqliteOptions impatient;
    impatient.openingLimit = 20ms;
    EXPECT_THAT(ReasonOf([&] { Open(impatient); }), HasSubstr("has been opening it"));
    auto waiting = std::async(std::launch::async, [this] { return Open()->WasFirst(); });
    store->EndOpening();
    EXPECT_FALSE(waiting.get());
    store->EndOpening();
    auto const second = Open(keeping);
    EXPECT_FALSE(second->WasFirst());
    EXPECT_THAT(ReasonOf([&] { Open(impatient); }), HasSubstr("has been opening it"));
    second->EndOpening();
    EXPECT_FALSE(Open(impatient)->WasFirst());
}

TEST_F(SqliteOpening, ByWhoDiesMeanwhile_IsNobodysAnyMore)
{
    SqliteOptions keeping;
    keeping.keepOpening = true;
    Open(keeping);
    EXPECT_TRUE(Open(keeping)->WasFirst());
}

TEST_F(SqliteOpening, LeavingWhileItIsKept_IsInOrder)
{
    SqliteOptions keeping;
    keeping.keepOpening = true;
    Open(keeping)->Leave();
    EXPECT_TRUE(Open()->EndedInOrder());
}

TEST_F(SqliteOpening, BySeveralAtOnce_FillsTheSiteOnce)
{
    std::atomic<int> filled{0};
    std::atomic<int> first{0};
    std::vector<std::unique_ptr<SqliteStore>> stores(6);
    std::vector<std::thread> threads;
    for (auto& store : stores)
        threads.emplace_back(
            [&]
            {
                store = std::make_unique<SqliteStore>(folder.Path(),
                                                      [&filled]
                                                      {
                                                          ++filled;
                                                          return OneTicket(Job, "Key", 5);
                                                      });
                first += store->WasFirst() ? 1 : 0;
            });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(filled, 1);
    EXPECT_EQ(first, 1);
    EXPECT_EQ(stores[0]->Programs().size(), stores.size());
}

TEST_F(SqliteOpening, WhileTheOlderVersionHasTheSite_IsRefused)
{
    WriteFile(LockedFile(), "4711 (session_tour)\n");
    int const file = open(LockedFile().c_str(), O_RDWR | O_CLOEXEC);
    ASSERT_EQ(flock(file, LOCK_EX | LOCK_NB), 0);
    EXPECT_THAT(ReasonOfOpening(),
                AllOf(HasSubstr("process 4711 (session_tour)"), HasSubstr("older version")));
    EXPECT_EQ(ContentOf(LockedFile()), "4711 (session_tour)\n");
    close(file);
    EXPECT_TRUE(Open()->WasFirst());
}

TEST_F(SqliteOpening, KeepsTheOlderVersionOut)
{
    auto const store = Open();
    int const file = open(LockedFile().c_str(), O_RDWR | O_CLOEXEC);
    EXPECT_NE(flock(file, LOCK_EX | LOCK_NB), 0);
    store->Leave();
    EXPECT_EQ(flock(file, LOCK_EX | LOCK_NB), 0);
    close(file);
}

TEST_F(SqliteOpening, AfterSiteLockWasRemovedUnderOthers_IsRefused)
{
    auto store = Open();
    auto other = Open();
    std::filesystem::remove(LockedFile());
    for (int i = 0; i < 2; ++i)
        EXPECT_THAT(ReasonOfOpening(),
                    AllOf(HasSubstr("site.lock"), HasSubstr("removed"), HasSubstr("end them")));
    Writer(*store).Make(Job);
    EXPECT_EQ(other->Committed(), 1u);  // those who are there go on
    store->Leave();
    EXPECT_THAT(ReasonOfOpening(), HasSubstr("removed"));
    other->Leave();
    auto const later = Open();
    EXPECT_TRUE(later->WasFirst());
    EXPECT_EQ(later->Committed(), 1u);
}

// Where the file system locks no folders: the file that the others have is the one that the database knows.
TEST_F(SqliteOpening, ByAnotherSiteLockThanTheOthers_IsRefused)
{
    auto const store = Open();
    RunSql(File(), "UPDATE site SET value = 1 WHERE name = 'lock file'");
    EXPECT_THAT(ReasonOfOpening(), AllOf(HasSubstr("site.lock"), HasSubstr("end them all")));
}

TEST_F(SqliteOpening, BesideOthersWithAnotherPage_IsRefused)
{
    auto const store = Open();
    {
        std::fstream file(LockedFile(), std::ios::in | std::ios::out | std::ios::binary);
        file.seekp(32);
        file.put(99);
    }
    EXPECT_THAT(ReasonOfOpening(), AllOf(HasSubstr("site.lock"), HasSubstr("another version")));
}

TEST_F(SqliteOpening, AfterTheDatabaseWasRemovedUnderOthers_IsRefused)
{
    MakeWithOneTicket();
    auto const store = Open();
    std::filesystem::remove(File());
    EXPECT_THAT(ReasonOfOpening(), HasSubstr(File().string()));
    EXPECT_FALSE(std::filesystem::exists(File()));
}

TEST_F(SqliteOpening, DatabaseThatIsReplaced_IsNoticedAndWrittenToNoMore)
{
    MakeWithOneTicket();
    auto const store = Open();
    store->Maintain(1);
    std::filesystem::copy_file(File(), folder / "copy");
    std::filesystem::rename(folder / "copy", File());
    EXPECT_THAT(ReasonOf([&store] { store->Maintain(1); }), HasSubstr("replaced"));
    EXPECT_THAT(ReasonOf([&store] { Writer(*store).Try(Creation({3, 2})); }), HasSubstr("replaced"));
}

// --- version 1

namespace
{
constexpr char const* Version1 = R"(
    CREATE TABLE ticket (
        type INTEGER NOT NULL, id INTEGER NOT NULL,
        PRIMARY KEY (type, id)) WITHOUT ROWID;
    CREATE TABLE parameter (
        ticket_type INTEGER NOT NULL, ticket_id INTEGER NOT NULL, key BLOB NOT NULL, pos INTEGER NOT NULL,
        value_type INTEGER NOT NULL, value NOT NULL,
        PRIMARY KEY (ticket_type, ticket_id, key, pos),
        FOREIGN KEY (ticket_type, ticket_id) REFERENCES ticket ON DELETE CASCADE) WITHOUT ROWID;
    CREATE TABLE user (
        name BLOB NOT NULL PRIMARY KEY, password_hash BLOB NOT NULL,
        role INTEGER NOT NULL, ticket_id INTEGER NOT NULL) WITHOUT ROWID;
    PRAGMA application_id = 0x434F4D47;
    PRAGMA user_version = 1;
    PRAGMA journal_mode = WAL;
    INSERT INTO ticket VALUES (0, 0), (3, 1), (3, 2), (3, 3), (4, 1), (17, 1);
    INSERT INTO parameter VALUES
        (0, 0, CAST('Key' AS BLOB), 0, 2, 5), (0, 0, CAST('Key' AS BLOB), 3, 4, X'C3A4'),
        (3, 1, CAST('Job/Prepared' AS BLOB), 0, 2, 1), (3, 1, CAST('Job/Name' AS BLOB), 0, 4, X'61'),
        (3, 2, CAST('Job/Prepared' AS BLOB), 0, 2, 1), (3, 2, CAST('Job/File' AS BLOB), 0, 4, X'61'),
        (4, 1, CAST('Job/Prepared' AS BLOB), 0, 2, 1);
    INSERT INTO user VALUES (CAST('admin' AS BLOB), CAST('$y$' AS BLOB), 16, 1);
)";
}

TEST_F(SqliteUpgrade, KeepsTicketsAndUsers)
{
    RunSql(File(), Version1);
    for (int round = 0; round < 2; ++round)  // upgraded, and opened as it is then
    {
        SqliteStore store(folder.Path(), []() -> StoreContent { throw std::logic_error("asked"); });
        EXPECT_THAT(AddressesIn(store),
                    ElementsAre(TicketAddress{0, 0}, TicketAddress{3, 1}, TicketAddress{3, 2},
                                TicketAddress{3, 3}, TicketAddress{4, 1}, TicketAddress{17, 1}));
        EXPECT_EQ(KeyOf(store, SystemTicket), 5);
        EXPECT_EQ(ValuesOf(store, SystemTicket).at({"Key", 3}).bytes, "\xC3\xA4");
        EXPECT_EQ(ValuesOf(store, {3, 1}).size(), 2u);
        EXPECT_EQ(store.FindUser("admin")->role, 16);
        EXPECT_EQ(StateOf(store, {3, 3})->incarnation, 1u);
        EXPECT_EQ(store.Committed(), static_cast<Sequence>(1 + round));
        EXPECT_FALSE(store.ChangesSince(0, [](CommittedChange&&) {}));
        EXPECT_THAT(store.Check({}), IsEmpty());
        Writer(store).Put({3, 3}, "A", 0, round);
        store.Leave();
    }
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("site.db", "site.lock"));
}

TEST_F(SqliteUpgrade, LeavesPreparedJobsToBeBuried)
{
    RunSql(File(), Version1);
    auto const store = Open();
    std::vector<TicketAddress> left;
    EXPECT_EQ(store->Bury(
                  [&left](Estate const& estate)
                  {
                      for (Estate::Ticket const& ticket : estate.tickets)
                      {
                          left.push_back(ticket.address);
                          EXPECT_EQ(ticket.incarnation, 1u);
                      }
                  }),
              1);
    EXPECT_THAT(left, ElementsAre(Job));
}

TEST_F(SqliteUpgrade, ThatFails_LeavesVersion1)
{
    RunSql(File(), Version1);
    RunSql(File(), "INSERT INTO parameter VALUES (0, 0, CAST('Large' AS BLOB), 0, 4, zeroblob(300000))");
    {
        FullDisk const full(400 * 1024);
        EXPECT_THAT(ReasonOfOpening(), HasSubstr("free space"));
    }
    sqlite3* database = nullptr;
    ASSERT_EQ(sqlite3_open(File().c_str(), &database), SQLITE_OK);
    std::string version;
    sqlite3_exec(
        database, "PRAGMA user_version",
        [](void* out, int, char** columns, char**)
        {
            *static_cast<std::string*>(out) = columns[0];
            return 0;
        },
        &version, nullptr);
    sqlite3_close(database);
    EXPECT_EQ(version, "1");
    EXPECT_EQ(AddressesIn(*Open()).size(), 6u);
}

TEST_F(SqliteUpgrade, OfADamagedFile_IsRefused)
{
    RunSql(File(), Version1);
    std::string broken = ContentOf(File());
    broken.replace(4096, 4096, 4096, 'x');
    WriteFile(File(), broken);
    EXPECT_TRUE(IsReportedAsDamaged());
    EXPECT_EQ(ContentOf(File()), broken);
}

// --- failures

TEST_F(SqliteFailure, DiskFull_FailsClearlyAndLosesNothing)
{
    auto const store = Open();
    Writer writer(*store);
    writer.Do(Creation(Job).Put("Key", 0, 1));
    std::string const large(1024ul * 1024, 'x');
    {
        FullDisk const full(256ul * 1024);
        EXPECT_THAT(ReasonOf(
                        [&]
                        {
                            writer.Try(WriteTo(Job, writer.State(Job))
                                           .Put("Key", 0, 2)
                                           .Put("Large", 0, Bytes(PARAM_STRING, large)));
                        }),
                    AllOf(HasSubstr("free some space"), HasSubstr(File().string())));
        EXPECT_EQ(KeyOf(*store, Job), 1);
        EXPECT_EQ(store->Committed(), 1u);
        EXPECT_EQ(FeedOf(*store, 0).size(), 1u);
    }
    EXPECT_EQ(writer.Put(Job, "Large", 0, Bytes(PARAM_STRING, large)).sequence, 2u);
    EXPECT_EQ(FeedOf(*store, 0).size(), 2u);
}

TEST_F(SqliteFailure, NoRoomForThePage_IsToldAndEndsNoProcess)
{
    FullDisk const full(1000);
    EXPECT_THAT(ReasonOfOpening(), AllOf(HasSubstr("site.lock"), HasSubstr("free some space")));
}

TEST_F(SqliteFailure, WriterThatDoesNotAnswer_IsGivenUp)
{
    SqliteOptions options;
    options.turnLimit = 50ms;
    auto const store = Open(options);
    Writer writer(*store);
    writer.Make(Job);
    LockFile file(folder.Path());
    SharedPage page(file);
    std::promise<void> taken, over;
    std::thread holding(
        [&]
        {
            SharedPage::Turn turn(page, 1s);
            taken.set_value();
            over.get_future().wait();
            turn.End();
        });
    taken.get_future().wait();
    EXPECT_THAT(ReasonOf(
                    [&] {
                        writer.Try(Creation({3, 2}));
                    }),
                AllOf(HasSubstr(folder.Path().string()), HasSubstr("does not answer")));
    EXPECT_EQ(KeyOf(*store, Job), -1);  // reading goes on
    over.set_value();
    holding.join();
    EXPECT_EQ(writer.Make({3, 2}).sequence, 2u);
}

// A program that has committed and died before it could say so, as one transaction beside the store.
TEST_F(SqliteFailure, ChangeThatNobodyAnnounced_IsSeenAtTheEndOfAWait)
{
    auto const store = Open();
    auto const other = Open();
    Writer(*store).Make(Job);
    RunSql(File(), "INSERT INTO ticket VALUES (3, 9, 2, 2, 0);"
                   "INSERT INTO journal VALUES (2, 77, 1, 4, 3, 9, X'0100')");
    EXPECT_EQ(store->Committed(), 1u);
    store->WaitForChanges(1, 1ms);
    EXPECT_EQ(store->Committed(), 2u);
    EXPECT_EQ(other->Committed(), 2u);
    auto const feed = FeedOf(*store, 1);
    ASSERT_EQ(feed.size(), 1u);
    EXPECT_EQ(feed[0].program, 77);
    EXPECT_EQ(Writer(*store).Make({3, 3}).sequence, 3u);
}

TEST_F(SqliteFailure, TurnThatWasNotEnded_MakesTheNextLookIntoTheDatabase)
{
    auto const store = Open();
    Writer(*store).Make(Job);
    RunSql(File(), "INSERT INTO ticket VALUES (3, 9, 2, 2, 0);"
                   "INSERT INTO journal VALUES (2, 77, 1, 4, 3, 9, X'0100')");
    {
        LockFile file(folder.Path());
        SharedPage page(file);
        SharedPage::Turn const turn(page, 1s);
    }
    EXPECT_EQ(Writer(*store).Make({3, 3}).sequence, 3u);
}

// --- the journal

TEST_F(SqliteJournal, ThatIsEmpty_GoesOnCountingAfterAllHaveLeft)
{
    SqliteOptions options;
    options.limits.journalKept = 0;
    {
        auto const store = Open(options);
        Writer writer(*store);
        for (int id = 1; id <= 2500; ++id)
            writer.Make({3, id});
        store->Maintain(2500);
        EXPECT_EQ(store->Measure().records, 0);
        store->Leave();
    }
    auto const store = Open(options);
    EXPECT_EQ(store->Committed(), 2500u);
    EXPECT_FALSE(store->ChangesSince(2499, [](CommittedChange&&) {}));
    EXPECT_THAT(FeedOf(*store, 2500), IsEmpty());
    EXPECT_EQ(Writer(*store).Make({4, 1}).sequence, 2501u);
}

TEST_F(SqliteJournal, KeepsAThousandRecords)
{
    auto const store = Open();
    Writer writer(*store);
    for (int id = 1; id <= 1010; ++id)
        writer.Make({3, id});
    store->Maintain(1010);
    EXPECT_EQ(store->Measure().records, 1000);
    EXPECT_EQ(FeedOf(*store, 10).size(), 1000u);
}

TEST_F(SqliteJournal, PruningThatFails_IsMadeUpFor)
{
    SqliteOptions options;
    options.limits.journalKept = 1;
    auto const store = Open(options);
    Writer writer(*store);
    std::string const text(3000, 'x');
    for (int id = 1; id <= 300; ++id)
        writer.Do(Creation({3, id}).Put("Key", 0, Bytes(PARAM_STRING, text)));
    {
        FullDisk const full(4096);
        EXPECT_NE(ReasonOf([&store] { store->Maintain(300); }), "");
        EXPECT_EQ(FeedOf(*store, 0).size(), 300u);
    }
    store->Maintain(300);
    EXPECT_EQ(store->Measure().records, 1);
    EXPECT_EQ(FeedOf(*store, 299).size(), 1u);
}

TEST_F(SqliteJournal, OfLargeRecords_ComesInPortions)
{
    auto const store = Open();
    Writer writer(*store);
    std::string const large(9ul << 20, 'x');
    for (int id = 1; id <= 5; ++id)
        writer.Do(Creation({3, id}).Put("Key", 0, Bytes(PARAM_STRING, large)));
    int taken = 0;
    EXPECT_TRUE(store->ChangesSince(0, [&taken](CommittedChange&&) { ++taken; }));
    EXPECT_GT(taken, 0);
    EXPECT_LT(taken, 5);
    EXPECT_EQ(FeedOf(*store, 0).size(), 5u);
}

// Reads are short, so that the database's own journal is worked in again and again.
TEST_F(SqliteJournal, OfTheDatabase_StaysSmall)
{
    auto const store = Open();
    auto const other = Open();
    Writer writer(*store);
    std::string const text(3000, 'x');
    for (int id = 1; id <= 3000; ++id)
    {
        writer.Do(Creation({3, id}).Put("Key", 0, Bytes(PARAM_STRING, text)));
        EXPECT_EQ(ValuesOf(*other, {3, id}).size(), 1u);
    }
    EXPECT_GT(other->Measure().databaseBytes, 9'000'000);
    EXPECT_LT(other->Measure().walBytes, 16'000'000);
}

// --- care

TEST_F(SqliteCare, CheckOfASoundSite_FindsNothingAndTellsItsProgress)
{
    auto const store = Open();
    auto const other = Open();
    Writer writer(*store);
    writer.Do(Creation(Job).Put("A", 0, 1).Own(CHANGE::Owner::ThisProgram));
    writer.Do(Creation({3, 2}).Put("A", 0, Double(1)).Put("B", 5, Bytes(PARAM_STRING, "x")));
    writer.Remove(Job);
    other->AddPartFile("/tmp/a");
    long long last = -1;
    long long end = 0;
    EXPECT_THAT(store->Check(
                    [&](long long done, long long total)
                    {
                        EXPECT_GE(done, last);
                        last = done;
                        end = total;
                    }),
                IsEmpty());
    EXPECT_GT(end, 0);
    EXPECT_EQ(last, end);
}

TEST_F(SqliteCare, CheckAfterABurialThatClearedNothing_FindsNothing)
{
    auto const store = Open();
    auto other = Open();
    Writer(*other).Do(Creation(Job).Own(CHANGE::Owner::ThisProgram));
    other.reset();
    EXPECT_EQ(store->Bury([](Estate const&) {}), 1);
    EXPECT_THAT(store->Check({}), IsEmpty());
}

TEST_F(SqliteCare, CheckFinds)
{
    struct
    {
        char const* sql;
        char const* problem;
    } const faults[] = {
        {"DELETE FROM ticket WHERE id = 2", "ticket 3/2: has values but is no ticket"},
        {"UPDATE parameter SET value = 'text'", "ticket 3/2: a value does not fit its type 2"},
        {"UPDATE parameter SET pos = -1", "ticket 3/2: a value at position -1"},
        {"UPDATE ticket SET revision = 4 WHERE id = 1", "ticket 3/1: made by change 1 and changed by 4"},
        {"UPDATE ticket SET incarnation = 2 WHERE id = 1", "ticket 3/1: made by change 2 and changed by 1"},
        {"UPDATE ticket SET owner = 99 WHERE id = 1", "ticket 3/1: belongs to a program that nobody knows"},
        {"UPDATE ticket SET type = 100 WHERE id = 1", "ticket 100/1: no ticket can have this address"},
        {"DELETE FROM journal WHERE sequence = 2", "journal: record 3 where 2 is due"},
        {"UPDATE journal SET record = X'02' WHERE sequence = 2", "journal: record 2: "},
        {"DROP INDEX ticket_by_owner; CREATE INDEX ticket_by_owner ON ticket (owner) WHERE owner <> 0; "
         "PRAGMA writable_schema = ON; UPDATE ticket SET owner = 1 WHERE id = 1; "
         "UPDATE sqlite_schema SET sql = replace(sql, '<> 0', '<> 1') WHERE name = 'ticket_by_owner'",
         "index ticket_by_owner"},
    };
    for (auto const& fault : faults)
    {
        MemoryFolder const place;
        SqliteStore store(place.Path(), NoContent);
        Writer writer(store);
        writer.Make({3, 1});
        writer.Do(Creation({3, 2}).Put("Key", 0, 5));
        writer.Make({3, 3});
        RunSql(place / "site.db", fault.sql);
        EXPECT_THAT(store.Check({}), testing::Contains(HasSubstr(fault.problem))) << fault.sql;
    }
}

TEST_F(SqliteCare, CheckOfASpoiltSite_NamesAHundredProblems)
{
    auto const store = Open();
    Writer writer(*store);
    for (int id = 0; id < 200; ++id)
        writer.Make({3, id});
    RunSql(File(), "UPDATE ticket SET owner = 99");
    EXPECT_EQ(store->Check({}).size(), 100u);
    store->Leave();
    EXPECT_FALSE(Open()->EndedInOrder());
}

TEST_F(SqliteCare, Backup_IsAWholeSiteOfOneMoment)
{
    auto const store = Open();
    auto const other = Open();
    Writer writer(*store);
    for (int id = 1; id <= 300; ++id)
        writer.Do(Creation({3, id}).Put("Key", 0, Bytes(PARAM_STRING, std::string(5000, 'x'))));
    writer.Do(Creation({4, 1}).Own(CHANGE::Owner::ThisProgram));
    MemoryFolder const place;
    Writer otherWriter(*other);
    int steps = 0;
    long long last = 0;
    long long end = 0;
    store->BackupTo(place / "site.db",
                    [&](long long done, long long total)
                    {
                        ++steps;
                        last = done;
                        end = total;
                        otherWriter.Do(CreationOfNext(5));  // the copy neither sees it nor begins anew
                    });
    EXPECT_GT(steps, 1);
    EXPECT_EQ(last, end);
    EXPECT_THAT(NamesIn(place.Path()), ElementsAre("site.db"));

    SqliteStore copy(place.Path(), NoContent);
    EXPECT_EQ(copy.Committed(), 301u);
    EXPECT_THAT(AddressesIn(copy), SizeIs(300));  // without the one that a program was about to finish
    EXPECT_THAT(copy.Check({}), IsEmpty());
    EXPECT_FALSE(copy.ChangesSince(300, [](CommittedChange&&) {}));  // nobody has heard of the copy before
    EXPECT_THAT(FeedOf(copy, 301), IsEmpty());
}

// A copy that is opened elsewhere must not clear up after programs that work on.
TEST_F(SqliteCare, Backup_KnowsNoProgramOfTheSite)
{
    auto const store = Open();
    Writer writer(*store);
    writer.Do(Creation({4, 1}).Own(CHANGE::Owner::ThisProgram).Put("Key", 0, Bytes(PARAM_STRING, "x")));
    writer.Make(Job);
    store->OpenSession("admin");
    store->AddPartFile("/upload/a");
    MemoryFolder const place;
    store->BackupTo(place / "site.db", {});

    SqliteStore copy(place.Path(), NoContent);
    EXPECT_THAT(AddressesIn(copy), ElementsAre(Job));
    EXPECT_THAT(copy.Sessions(), IsEmpty());
    EXPECT_EQ(copy.Programs().size(), 1u);  // itself
    EXPECT_EQ(copy.Bury([](Estate const&) { ADD_FAILURE(); }), 0);
    EXPECT_EQ(store->Programs().size(), 1u);
    EXPECT_EQ(store->Sessions().size(), 1u);
}

TEST_F(SqliteCare, BackupWhoseProgressThrows_LeavesNoFileAndAStoreThatGoesOn)
{
    auto const store = Open();
    Writer writer(*store);
    writer.Do(Creation({3, 1}).Put("Key", 0, Bytes(PARAM_STRING, std::string(3'000'000, 'x'))));
    int steps = 0;
    auto const giveUp = [&steps](long long, long long)
    {
        if (++steps == 2)
            throw StoreError("enough");
    };
    EXPECT_EQ(ReasonOf([&] { store->BackupTo(folder / "copy", giveUp); }), "enough");
    EXPECT_FALSE(std::filesystem::exists(folder / "copy"));
    writer.Make({3, 2});
    store->BackupTo(folder / "copy", {});
}

TEST_F(SqliteCare, BackupThatFails_LeavesNoFile)
{
    auto const store = Open();
    WriteFile(folder / "there", "mine");
    EXPECT_THAT(ReasonOf([&] { store->BackupTo(folder / "there", {}); }), HasSubstr("is there already"));
    EXPECT_EQ(ContentOf(folder / "there"), "mine");
    EXPECT_NE(ReasonOf([&] { store->BackupTo(folder / "missing" / "copy", {}); }), "");
    {
        FullDisk const full(8192);
        EXPECT_THAT(ReasonOf([&] { store->BackupTo(folder / "copy", {}); }), HasSubstr("free some space"));
    }
    EXPECT_FALSE(std::filesystem::exists(folder / "copy"));
    store->BackupTo(folder / "copy", {});
    EXPECT_TRUE(std::filesystem::exists(folder / "copy"));
}

TEST_F(SqliteCare, Sizes_AreThoseOfTheFiles)
{
    auto const store = Open();
    Writer writer(*store);
    writer.Make(Job);
    writer.Put(Job, "Key", 0, 1);
    store->PutUser({"admin", "", 16, 1});
    auto const sizes = store->Measure();
    EXPECT_EQ(sizes.tickets, 1);
    EXPECT_EQ(sizes.users, 1);
    EXPECT_EQ(sizes.records, 2);
    EXPECT_EQ(sizes.databaseBytes, static_cast<long long>(std::filesystem::file_size(File())));
    EXPECT_EQ(sizes.walBytes, static_cast<long long>(std::filesystem::file_size(folder / "site.db-wal")));
    EXPECT_GT(sizes.walBytes, 0);
}
