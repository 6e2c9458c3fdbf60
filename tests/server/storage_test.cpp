#include "standin/server/store/SqliteStorage.h"

#include "tests/server/MemoryFolder.h"
#include "tests/server/StoredValues.h"
#include "tests/support/ChildProcess.h"
#include "tests/support/Files.h"
#include "tests/support/sanitizers.h"
#include <bit>
#include <chrono>
#include <csignal>
#include <cstdint>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <limits>
#include <map>
#include <random>
#include <sqlite3.h>
#include <sys/resource.h>
#include <thread>
#include <tuple>

using namespace standin;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

namespace
{
constexpr TicketAddress Job{3, 1};

Change Create(TicketAddress address) { return {Change::CreateTicket, address}; }

Change Put(TicketAddress address, std::string_view key, int pos, StoredValue const& value)
{
    return {Change::PutValue, address, key, pos, value};
}

StorageContent Nothing() { return {}; }

// A value that owns its bytes.
struct Kept
{
    explicit Kept(StoredValue const& from) : value(from), bytes(from.bytes) { value.bytes = {}; }
    StoredValue View() const
    {
        StoredValue view = value;
        view.bytes = bytes;
        return view;
    }
    bool operator==(Kept const& other) const { return SameValue(View(), other.View()); }

    StoredValue value;
    std::string bytes;
};
using Values = std::map<std::pair<std::string, int>, Kept>;

Values ValuesOf(Storage& storage, TicketAddress address)
{
    Values values;
    storage.Load(address, [&values](std::string_view key, int pos, StoredValue const& value)
                 { values.emplace(std::pair(std::string(key), pos), Kept(value)); });
    return values;
}

std::string ReasonOf(std::function<void()> const& action)
{
    try
    {
        action();
    }
    catch (StorageError const& error)
    {
        return error.what();
    }
    return {};
}

void RunSql(std::filesystem::path const& file, char const* sql)
{
    sqlite3* database = nullptr;
    ASSERT_EQ(sqlite3_open(file.c_str(), &database), SQLITE_OK);
    EXPECT_EQ(sqlite3_exec(database, sql, nullptr, nullptr, nullptr), SQLITE_OK) << sqlite3_errmsg(database);
    sqlite3_close(database);
}

class SqliteStorageFile : public testing::Test
{
protected:
    SqliteStorage Open() { return SqliteStorage(File(), Nothing); }
    std::filesystem::path File() const { return folder / "site.db"; }
    void MakeWithOneTicket()
    {
        SqliteStorage(File(), Nothing).Apply({Create(Job), Put(Job, "Key", 0, Integer(PARAM_INT, 5))});
    }
    std::string ReasonOfOpening()
    {
        return ReasonOf([this] { SqliteStorage(File(), Nothing); });
    }
    bool IsReportedAsDamaged()
    {
        try
        {
            SqliteStorage(File(), Nothing);
        }
        catch (DamagedStorage const&)
        {
            return true;
        }
        return false;
    }

    MemoryFolder folder;
};
}  // namespace

TEST_F(SqliteStorageFile, New_HasNoTicketAndNoUser)
{
    SqliteStorage storage(File(), Nothing);
    EXPECT_THAT(storage.Tickets(), IsEmpty());
    EXPECT_FALSE(storage.FindUser("admin"));
    EXPECT_THAT(ValuesOf(storage, Job), IsEmpty());
}

TEST_F(SqliteStorageFile, New_IsFilledWithWhatFirstGives)
{
    std::string const hash = "$y$hash";
    SqliteStorage storage(File(),
                          [&hash] {
                              return StorageContent{{Create(Job)}, {{"admin", hash, 16, 1}}};
                          });
    EXPECT_THAT(storage.Tickets(), ElementsAre(Job));
    auto const user = storage.FindUser("admin");
    ASSERT_TRUE(user);
    EXPECT_EQ(std::tie(user->name, user->passwordHash), std::tie("admin", hash));
    EXPECT_EQ(user->role, 16);
    EXPECT_EQ(user->ticketId, 1);
    EXPECT_FALSE(storage.FindUser("Admin"));
    EXPECT_FALSE(storage.FindUser(""));
}

TEST_F(SqliteStorageFile, New_WhenFirstThrows_StaysNew)
{
    EXPECT_THROW(SqliteStorage(File(), []() -> StorageContent { throw std::runtime_error("no seed"); }),
                 std::runtime_error);
    bool asked = false;
    SqliteStorage const storage(File(),
                                [&asked]
                                {
                                    asked = true;
                                    return StorageContent();
                                });
    EXPECT_TRUE(asked);
}

TEST_F(SqliteStorageFile, New_WhenItsContentCannotBeStored_StaysNew)
{
    auto const broken = [] { return StorageContent{{Create(Job), Put({3, 2}, "Key", 0, Double(1))}, {}}; };
    EXPECT_THROW(SqliteStorage(File(), broken), StorageError);
    SqliteStorage storage(File(), Nothing);
    EXPECT_THAT(storage.Tickets(), IsEmpty());
}

TEST_F(SqliteStorageFile, OpenedAgain_AsksForNoContentAndHasAllValues)
{
    MakeWithOneTicket();
    SqliteStorage storage(File(), []() -> StorageContent { throw std::logic_error("asked"); });
    EXPECT_THAT(storage.Tickets(), ElementsAre(Job));
    EXPECT_EQ(ValuesOf(storage, Job).at({"Key", 0}).value.integer, 5);
}

TEST_F(SqliteStorageFile, Tickets_ComeInAscendingOrder)
{
    SqliteStorage storage(File(), Nothing);
    storage.Apply({Create({17, 1}), Create({3, 16777215}), Create({3, 2}), Create({0, 0})});
    EXPECT_THAT(storage.Tickets(), ElementsAre(TicketAddress{0, 0}, TicketAddress{3, 2},
                                               TicketAddress{3, 16777215}, TicketAddress{17, 1}));
}

TEST_F(SqliteStorageFile, Load_GoesByKeyBytewiseAndThenByPosition)
{
    SqliteStorage storage(File(), Nothing);
    StoredValue const one = Integer(PARAM_INT, 1);
    storage.Apply({Create(Job), Put(Job, "b", 10, one), Put(Job, "b", 9, one), Put(Job, "\xC3\xA4", 0, one),
                   Put(Job, "B", 0, one), Put(Job, "b/c", 0, one)});
    std::vector<std::string> order;
    storage.Load(Job, [&order](std::string_view key, int pos, StoredValue const&)
                 { order.push_back(std::string(key) + " " + std::to_string(pos)); });
    EXPECT_THAT(order, ElementsAre("B 0", "b 9", "b 10", "b/c 0", "\xC3\xA4 0"));
}

TEST_F(SqliteStorageFile, EveryKindOfValue_ComesBackBitForBit)
{
    std::string allBytes;
    for (int byte = 0; byte < 256; ++byte)
        allBytes.push_back(static_cast<char>(byte));
    using Limits = std::numeric_limits<double>;
    std::vector<StoredValue> const values{
        Integer(PARAM_INT, std::numeric_limits<int>::min()),
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
    {
        SqliteStorage storage(File(), Nothing);
        storage.Apply({Create(Job)});
        for (std::size_t i = 0; i < values.size(); ++i)
            storage.Apply({Put(Job, "Key", static_cast<int>(i), values[i])});
    }
    SqliteStorage storage(File(), Nothing);
    Values const found = ValuesOf(storage, Job);
    ASSERT_EQ(found.size(), values.size());
    for (std::size_t i = 0; i < values.size(); ++i)
        EXPECT_TRUE(found.at({"Key", static_cast<int>(i)}) == Kept(values[i])) << i;
}

TEST_F(SqliteStorageFile, KeyOfAnyBytes_ComesBack)
{
    SqliteStorage storage(File(), Nothing);
    std::string const key("\x01\xFF key\n", 7);
    storage.Apply({Create(Job), Put(Job, key, 0, Double(1)), Put(Job, "", 0, Double(2))});
    Values const found = ValuesOf(storage, Job);
    EXPECT_EQ(found.at({key, 0}).value.number, 1);
    EXPECT_EQ(found.at({"", 0}).value.number, 2);
}

TEST_F(SqliteStorageFile, PutValue_TakesThePlaceOfAValueOfAnotherType)
{
    SqliteStorage storage(File(), Nothing);
    storage.Apply(
        {Create(Job), Put(Job, "Key", 0, Double(1)), Put(Job, "Key", 0, Bytes(PARAM_STRING, "one"))});
    Values const found = ValuesOf(storage, Job);
    ASSERT_EQ(found.size(), 1u);
    EXPECT_TRUE(found.at({"Key", 0}) == Kept(Bytes(PARAM_STRING, "one")));
}

TEST_F(SqliteStorageFile, Pointer_IsNotStored_ButWhatWasThereGoes)
{
    SqliteStorage storage(File(), Nothing);
    StoredValue pointer;
    pointer.type = PARAM_POINTER;
    pointer.pointer = &storage;
    storage.Apply({Create(Job), Put(Job, "Key", 0, Double(1)), Put(Job, "Key", 1, Double(2)),
                   Put(Job, "Key", 0, pointer)});
    Values const found = ValuesOf(storage, Job);
    ASSERT_EQ(found.size(), 1u);
    EXPECT_EQ(found.begin()->first.second, 1);
}

TEST_F(SqliteStorageFile, DeleteKey_TakesAllPositionsOfThatKeyOnly)
{
    SqliteStorage storage(File(), Nothing);
    storage.Apply({Create(Job),
                   Put(Job, "Key", 0, Double(1)),
                   Put(Job, "Key", 7, Double(1)),
                   Put(Job, "Key/Sub", 0, Double(1)),
                   {Change::DeleteKey, Job, "Key"}});
    Values const found = ValuesOf(storage, Job);
    ASSERT_EQ(found.size(), 1u);
    EXPECT_EQ(found.begin()->first.first, "Key/Sub");
}

TEST_F(SqliteStorageFile, DeleteValue_LeavesTheOtherPositionsWhereTheyAre)
{
    SqliteStorage storage(File(), Nothing);
    storage.Apply({Create(Job),
                   Put(Job, "Key", 0, Double(1)),
                   Put(Job, "Key", 1, Double(2)),
                   Put(Job, "Key", 2, Double(3)),
                   {Change::DeleteValue, Job, "Key", 1}});
    Values const found = ValuesOf(storage, Job);
    ASSERT_EQ(found.size(), 2u);
    EXPECT_EQ(found.at({"Key", 2}).value.number, 3);
}

TEST_F(SqliteStorageFile, DeleteTicket_TakesItsValuesAndNoOthers)
{
    SqliteStorage storage(File(), Nothing);
    TicketAddress const other{3, 2};
    storage.Apply({Create(Job),
                   Create(other),
                   Put(Job, "Key", 0, Double(1)),
                   Put(other, "Key", 0, Double(2)),
                   {Change::DeleteTicket, Job}});
    EXPECT_THAT(storage.Tickets(), ElementsAre(other));
    EXPECT_THAT(ValuesOf(storage, Job), IsEmpty());
    EXPECT_EQ(ValuesOf(storage, other).size(), 1u);
}

TEST_F(SqliteStorageFile, CreateTicketTwice_KeepsItsValues)
{
    SqliteStorage storage(File(), Nothing);
    storage.Apply({Create(Job), Put(Job, "Key", 0, Double(1)), Create(Job)});
    EXPECT_EQ(ValuesOf(storage, Job).size(), 1u);
}

TEST_F(SqliteStorageFile, Apply_WhenOneChangeFails_MakesNoneOfThem)
{
    SqliteStorage storage(File(), Nothing);
    storage.Apply({Create(Job), Put(Job, "Key", 0, Double(1))});
    std::string const reason = ReasonOf(
        [&storage]
        {
            storage.Apply({Put(Job, "Key", 0, Double(2)),
                           {Change::DeleteKey, Job, "Key"},
                           Create({3, 2}),
                           Put({9, 9}, "Key", 0, Double(3))});
        });
    EXPECT_THAT(reason, testing::AllOf(HasSubstr(File().string()), HasSubstr("create the ticket before")));
    EXPECT_THAT(storage.Tickets(), ElementsAre(Job));
    EXPECT_EQ(ValuesOf(storage, Job).at({"Key", 0}).value.number, 1);
    storage.Apply({Create({3, 2})});
    EXPECT_EQ(storage.Tickets().size(), 2u);
}

TEST_F(SqliteStorageFile, Apply_OfACount_IsRefused)
{
    SqliteStorage storage(File(), Nothing);
    EXPECT_THAT(ReasonOf(
                    [&storage] {
                        storage.Apply({Create(Job), Put(Job, "Key", 0, Integer(PARAM_COUNT, 1))});
                    }),
                HasSubstr("type 6"));
    EXPECT_THAT(storage.Tickets(), IsEmpty());
}

TEST_F(SqliteStorageFile, Load_WhenTheFunctionThrows_CanBeCalledAgain)
{
    SqliteStorage storage(File(), Nothing);
    storage.Apply({Create(Job), Put(Job, "Key", 0, Double(1))});
    EXPECT_THROW(storage.Load(Job, [](std::string_view, int, StoredValue const&) { throw 1; }), int);
    EXPECT_EQ(ValuesOf(storage, Job).size(), 1u);
    storage.Apply({{Change::DeleteTicket, Job}});
    EXPECT_THAT(storage.Tickets(), IsEmpty());
}

// Any sequence of changes leaves in the file what it leaves in a plain map.
TEST_F(SqliteStorageFile, RandomChanges_EqualAPlainMap)
{
    std::mt19937_64 random(20240611);
    auto const below = [&random](unsigned limit) { return static_cast<int>(random() % limit); };
    std::map<TicketAddress, Values> model;
    auto const check = [&model](Storage& storage)
    {
        std::vector<TicketAddress> addresses;
        for (auto const& [address, values] : model)
        {
            addresses.push_back(address);
            ASSERT_TRUE(ValuesOf(storage, address) == values);
        }
        ASSERT_EQ(storage.Tickets(), addresses);
    };
    std::vector<std::string> const keys{"", "A", "A/B", "a", "\xFF", "\x01", "Job/Name"};
    auto storage = std::make_unique<SqliteStorage>(File(), Nothing);
    for (int round = 0; round < (IsSanitized ? 60 : 300); ++round)
    {
        std::vector<std::string> bytes(8);
        std::vector<Change> changes;
        for (std::string& text : bytes)
        {
            TicketAddress const address{below(3), below(4)};
            std::string const& key = keys[static_cast<std::size_t>(below(7))];
            int const pos = below(4);
            bool const exists = model.contains(address);
            int const what = below(20);
            if (what == 0)
            {
                changes.push_back({Change::DeleteTicket, address});
                model.erase(address);
            }
            else if (!exists || what == 1)
            {
                changes.push_back(Create(address));
                model[address];
            }
            else if (what == 2)
            {
                changes.push_back({Change::DeleteKey, address, key});
                std::erase_if(model[address], [&key](auto const& entry) { return entry.first.first == key; });
            }
            else if (what < 6)
            {
                changes.push_back({Change::DeleteValue, address, key, pos});
                model[address].erase({key, pos});
            }
            else
            {
                for (int size = below(20); size > 0; --size)
                    text.push_back(static_cast<char>(random()));
                auto const bits = static_cast<long long>(random());
                StoredValue const choices[] = {Integer(PARAM_INT, static_cast<int>(bits)),
                                               Integer(PARAM_UNSIGNED64, bits),
                                               Double(std::bit_cast<double>(bits)), Bytes(PARAM_STRING, text),
                                               Bytes(PARAM_BINSTRING, text)};
                StoredValue const& value = choices[below(5)];
                changes.push_back(Put(address, key, pos, value));
                model[address].insert_or_assign({key, pos}, Kept(value));
            }
        }
        storage->Apply(changes);
        if (round % 10 == 9)
        {
            storage.reset();
            storage = std::make_unique<SqliteStorage>(File(), Nothing);
            ASSERT_NO_FATAL_FAILURE(check(*storage)) << round;
        }
    }
}

TEST_F(SqliteStorageFile, ManyTickets_AreListedAndReadQuickly)
{
    int const count = IsSanitized ? 1000 : 5000;
    std::vector<std::string> keys(50);
    for (std::size_t i = 0; i < keys.size(); ++i)
        keys[i] = "Job/Some/Parameter/" + std::to_string(i);
    std::vector<Change> changes;
    for (int id = 0; id < count; ++id)
    {
        changes.push_back(Create({3, id}));
        for (std::string const& key : keys)
            changes.push_back(Put({3, id}, key, 0, Integer(PARAM_INT, id)));
    }
    SqliteStorage storage(File(), Nothing);
    storage.Apply(changes);

    auto const start = std::chrono::steady_clock::now();
    EXPECT_EQ(storage.Tickets().size(), static_cast<std::size_t>(count));
    EXPECT_EQ(ValuesOf(storage, {3, count / 2}).size(), 50u);
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(1));
}

TEST_F(SqliteStorageFile, Empty_CountsAsNew)
{
    WriteFile(File(), "");
    EXPECT_THAT(SqliteStorage(File(), Nothing).Tickets(), IsEmpty());
}

TEST_F(SqliteStorageFile, WithoutItsDatabase_ALeftJournalIsNotTakenUp)
{
    ChildProcess child(
        [this](ChildProcess::Report const& report)
        {
            SqliteStorage storage(File(), Nothing);
            storage.Apply({Create(Job)});
            report(1);
            pause();
        });
    ASSERT_TRUE(child.Next());
    child.Kill();
    ASSERT_THAT(NamesIn(folder.Path()), testing::Contains("site.db-wal"));
    std::filesystem::remove(File());
    EXPECT_THAT(SqliteStorage(File(), Nothing).Tickets(), IsEmpty());
}

TEST_F(SqliteStorageFile, FileOfAnotherKind_IsDamaged)
{
    WriteFile(File(), "garbage");
    EXPECT_TRUE(IsReportedAsDamaged());
    EXPECT_EQ(ContentOf(File()), "garbage");
    WriteFile(File(), std::string(8192, 'x'));
    EXPECT_TRUE(IsReportedAsDamaged());
}

TEST_F(SqliteStorageFile, DatabaseOfAnotherProgram_IsDamaged)
{
    RunSql(File(), "CREATE TABLE bookmark (url)");
    EXPECT_THAT(ReasonOfOpening(), testing::AllOf(HasSubstr(File().string()), HasSubstr("another program")));
    EXPECT_TRUE(IsReportedAsDamaged());
}

TEST_F(SqliteStorageFile, UnknownOlderSchema_IsDamaged)
{
    MakeWithOneTicket();
    RunSql(File(), "PRAGMA user_version = 0");
    EXPECT_TRUE(IsReportedAsDamaged());
}

TEST_F(SqliteStorageFile, NewerSchema_IsRefusedAndLeftAsItIs)
{
    MakeWithOneTicket();
    RunSql(File(), "PRAGMA user_version = 2");
    std::string const before = ContentOf(File());
    EXPECT_FALSE([this] { return ReasonOfOpening(); }().empty());
    EXPECT_THAT(ReasonOfOpening(), testing::AllOf(HasSubstr(File().string()), HasSubstr("newer version")));
    EXPECT_EQ(ContentOf(File()), before);
    bool damaged = true;
    try
    {
        damaged = IsReportedAsDamaged();
    }
    catch (StorageError const&)
    {
        damaged = false;
    }
    EXPECT_FALSE(damaged);
}

TEST_F(SqliteStorageFile, MissingTable_IsDamaged)
{
    MakeWithOneTicket();
    RunSql(File(), "DROP TABLE user");
    EXPECT_TRUE(IsReportedAsDamaged());
}

TEST_F(SqliteStorageFile, CutAnywhere_IsDamaged)
{
    MakeWithOneTicket();
    std::string const whole = ContentOf(File());
    for (std::size_t size = 2; size < whole.size(); size += 511)  // one byte counts as an empty file
    {
        WriteFile(File(), whole.substr(0, size));
        EXPECT_TRUE(IsReportedAsDamaged()) << size << " of " << whole.size();
    }
}

TEST_F(SqliteStorageFile, OverwrittenPage_IsDamaged)
{
    MakeWithOneTicket();
    std::string const whole = ContentOf(File());
    std::size_t const page = 4096;
    ASSERT_GE(whole.size(), 2 * page);
    for (std::size_t first = 0; first + page <= whole.size(); first += page)
    {
        std::string broken = whole;
        broken.replace(first, page, page, 'x');
        WriteFile(File(), broken);
        EXPECT_TRUE(IsReportedAsDamaged()) << first;
        EXPECT_EQ(ContentOf(File()), broken);
    }
}

TEST_F(SqliteStorageFile, ValueThatDoesNotFitItsType_IsToldAsDamaged)
{
    MakeWithOneTicket();
    RunSql(File(), "UPDATE parameter SET value = 'text'");
    SqliteStorage storage(File(), Nothing);
    EXPECT_THROW(ValuesOf(storage, Job), DamagedStorage);
}

TEST_F(SqliteStorageFile, BelowAFileInsteadOfAFolder_SaysWhichFileAndWhatToDo)
{
    WriteFile(folder / "file", "");
    EXPECT_THAT(ReasonOf([this] { SqliteStorage(folder / "file" / "site.db", Nothing); }),
                testing::AllOf(HasSubstr("file/site.db"), HasSubstr("Not a directory"),
                               HasSubstr("; make its folder")));
}

TEST_F(SqliteStorageFile, DiskFull_FailsClearlyAndLosesNothing)
{
    ChildProcess child(
        [this](ChildProcess::Report const& report)
        {
            SqliteStorage storage(File(), Nothing);
            storage.Apply({Create(Job), Put(Job, "Key", 0, Integer(PARAM_INT, 1))});
            std::signal(SIGXFSZ, SIG_IGN);
            rlimit limit{};
            getrlimit(RLIMIT_FSIZE, &limit);
            limit.rlim_cur = 256ul * 1024;
            setrlimit(RLIMIT_FSIZE, &limit);
            std::string const large(1024ul * 1024, 'x');
            std::string const reason = ReasonOf(
                [&] {
                    storage.Apply(
                        {Put(Job, "Key", 0, Double(2)), Put(Job, "Large", 0, Bytes(PARAM_STRING, large))});
                });
            report(reason.find("free space") != std::string::npos &&
                   reason.find(File().string()) != std::string::npos);
            report(ValuesOf(storage, Job).size() == 1 &&
                   ValuesOf(storage, Job).at({"Key", 0}).value.integer == 1);
            limit.rlim_cur = limit.rlim_max;
            setrlimit(RLIMIT_FSIZE, &limit);
            storage.Apply({Put(Job, "Large", 0, Bytes(PARAM_STRING, large))});
            report(ValuesOf(storage, Job).size() == 2);
        });
    for (int i = 0; i < 3; ++i)
    {
        EXPECT_EQ(child.Next(), true) << i;
    }
    EXPECT_EQ(child.Wait(), 0);
    SqliteStorage storage(File(), Nothing);
    EXPECT_EQ(ValuesOf(storage, Job).size(), 2u);
}

// Every change writes one number to five places. Whenever the process dies, the five agree, and they are
// not behind what was acknowledged.
TEST_F(SqliteStorageFile, KilledAtAnyInstant_KeepsAcknowledgedChangesWhole)
{
    std::mt19937_64 random(4711);
    std::vector<std::string> const keys{"A", "B", "C", "D", "E"};
    std::int64_t last = 0;
    for (int round = 0; round < (IsSanitized ? 15 : 60); ++round)
    {
        ChildProcess child(
            [&](ChildProcess::Report const& report)
            {
                SqliteStorage storage(File(), [] { return StorageContent{{Create(Job)}, {}}; });
                for (std::int64_t number = last + 1;; ++number)
                {
                    StoredValue const value = Integer(PARAM_INT64, number);
                    storage.Apply({Put(Job, keys[0], 0, value), Put(Job, keys[1], 0, value),
                                   Put(Job, keys[2], 0, value), Put(Job, keys[3], 0, value),
                                   Put(Job, keys[4], 0, value)});
                    report(number);
                }
            });
        std::this_thread::sleep_for(std::chrono::microseconds(random() % 40000));
        child.Kill();
        std::int64_t const acknowledged = child.Last(last);

        SqliteStorage storage(File(), [] { return StorageContent{{Create(Job)}, {}}; });
        Values const found = ValuesOf(storage, Job);
        ASSERT_TRUE(found.size() == keys.size() || (found.empty() && acknowledged == 0)) << round;
        for (auto const& [place, kept] : found)
            ASSERT_EQ(kept.value.integer, found.begin()->second.value.integer) << round << " " << place.first;
        last = found.empty() ? 0 : found.begin()->second.value.integer;
        ASSERT_GE(last, acknowledged) << round;
        ASSERT_LE(last, acknowledged + 1) << round;
    }
    EXPECT_GT(last, 0) << "no child has lived long enough to write";
}
