// Memory that runs out at every place where it can.
#include "comgui/stream/MTICKET_BINSTREAM.h"
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/testing/TemporaryFolder.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "tests/support/Allocations.h"
#include "tests/support/StreamOracle.h"
#include <algorithm>
#include <gtest/gtest.h>
#include <new>

using comgui::test::TemporaryFolder;

using namespace StreamOracle;

namespace
{
// A key too long to lie inside a string, and more bytes than are gathered before they are handed on.
std::vector<RECORD> const Sample = {Int("System/Folders/Temporary", 1, 0),
                                    Text("System/Folders/Text", std::string(3000, 'x')),
                                    Text("System/Folders/Text", std::string(3000, 'y'), 0),
                                    Bytes("Bytes", std::string(40, 'z')),
                                    Double("Double", 0.1),
                                    Int64("Int64", 1LL << 60),
                                    Unsigned64("Unsigned64", 1ull << 63),
                                    Delete("Last key of all")};

// What the slot of a ticket was given.
int tables;
std::vector<RECORD> given;

void Forget()
{
    tables = 0;
    std::vector<RECORD>().swap(given);
}

STICKET_ACCESS Ticket()
{
    STICKET_ACCESS access = {};
    access.SSETMULTIPAR = [](void*, SETMULTIPAR* table)
    {
        FailingAllocation::Stop();
        ++tables;
        given = RecordsOf(table);
        return 1;
    };
    return access;
}
}  // namespace

TEST(NoMemory, Counting_SeesTheLibrarysOwnAllocations)
{
    long const before = LiveAllocations();
    SETMULTIPAR_LIST list(false);
    list.SetParameter("k", 1, -1);
    EXPECT_GT(LiveAllocations(), before);
}

TEST(ClearedList, GivesItsMemoryBack)
{
    SETMULTIPAR_LIST list(false);
    long const before = LiveAllocations();
    for (int round = 0; round < 3; ++round)
    {
        for (int i = 0; i < 1000; ++i)
            list.SetParameter(std::to_string(i).c_str(), std::to_string(-i), i);
        list.Table(true);
        EXPECT_GT(LiveAllocations(), before);
        list.Clear();
        EXPECT_EQ(LiveAllocations(), before);
    }
}

TEST(NoMemory, WriteTable_LeavesOutAsItWas)
{
    std::string const expected = Encode(Sample).value();
    TABLE table(Sample);
    for (unsigned long const reserve : {0ul, 100ul, 100000ul})
    {
        unsigned long size = 0;
        bool isStream = false;
        bool isUntouched = false;
        int const failures = FailEachAllocation(
            [&]
            {
                std::string out = "before";
                size = STICKET_BINSTREAM::Write(out, table.Records(), reserve);
                isStream = out == expected && size == expected.size();
                isUntouched = out == "before" && size == 6;
            },
            [&](bool hasHappened)
            {
                EXPECT_TRUE(isStream || (hasHappened && isUntouched));
                bool isOk = true;
                for (std::size_t i = 0; i < Sample.size(); ++i)
                    isOk = isOk && table.Records()[i].ok;
                EXPECT_EQ(isOk, isStream);
            });
        EXPECT_GT(failures, 0);
    }
}

TEST(NoMemory, WriteSmallTable_TellsItByAnOk)
{
    RECORD refused = Int("k", 3);
    refused.type = PARAM_POINTER;
    TABLE table({Int("a", 1), Int("k", 2), Text("k", "some text of no great length"), refused});
    bool isEmpty = false;
    int const failures = FailEachAllocation(
        [&]
        {
            std::string out;
            isEmpty = STICKET_BINSTREAM::Write(out, table.Records(), 0) == 0;
        },
        [&](bool hasHappened)
        {
            EXPECT_EQ(isEmpty, hasHappened);
            EXPECT_EQ(table.Records()[2].ok, !hasHappened);
            EXPECT_FALSE(table.Records()[3].ok);
        });
    EXPECT_GT(failures, 0);
}

TEST(NoMemory, WriteLongVector_LeavesWhatWasPutBeforeOk)
{
    std::vector<RECORD> records;
    records.reserve(20000);
    for (int i = 0; i < 20000; ++i)
        records.push_back(Int("k", 1000, i));
    TABLE table(records, KEYS::SHARED);
    auto const isOk = [](SETMULTIPAR const& record) { return record.ok; };
    int const failures = FailEachAllocation(
        [&]
        {
            std::string out;
            STICKET_BINSTREAM::Write(out, table.Records(), 0);
        },
        [&](bool hasHappened)
        {
            SETMULTIPAR const* const begin = table.Records();
            SETMULTIPAR const* const end = begin + records.size();
            EXPECT_TRUE(begin->ok);
            EXPECT_EQ(end[-1].ok, !hasHappened);
            EXPECT_TRUE(std::is_partitioned(begin, end, isOk));
        });
    EXPECT_GT(failures, 3);
}

TEST(NoMemory, WriteOneByOne_FailsTheWriterForGood)
{
    TABLE table(Sample);
    bool hasFailed = false;
    bool isAnyOkBehindAFailure = false;
    int const failures = FailEachAllocation(
        [&]
        {
            STICKET_BINSTREAM::WRITE writer(0);
            bool isOk = true;
            isAnyOkBehindAFailure = false;
            for (SETMULTIPAR const* record = table.Records(); record->key; ++record)
            {
                bool const isWritten =
                    writer.SetParameter(record->key, record->type, record->value, record->pos);
                isAnyOkBehindAFailure = isAnyOkBehindAFailure || (isWritten && !isOk);
                isOk = isOk && isWritten;
            }
            hasFailed = writer.Failed();
            EXPECT_EQ(isOk, !hasFailed);
        },
        [&](bool hasHappened)
        {
            EXPECT_EQ(hasFailed, hasHappened);
            EXPECT_FALSE(isAnyOkBehindAFailure);
        });
    EXPECT_GT(failures, 3);
}

TEST(NoMemory, WriteFile_LeavesTheOlderFileAlone)
{
    TemporaryFolder const folder;
    std::string const path = (folder.Path() / "stream").string();
    TABLE table(Sample);
    bool isWritten = false;
    FailEachAllocation([&] { isWritten = STICKET_BINSTREAM::Write(path.c_str(), table.Records(), 0); },
                       [&](bool hasHappened)
                       {
                           EXPECT_EQ(isWritten, !hasHappened);
                           EXPECT_EQ(std::filesystem::exists(path), isWritten);
                       });
}

TEST(NoMemory, ReadIntoAList_IsFalseAndKeepsWhatWasRead)
{
    std::string const stream = Encode(Sample).value();
    std::vector<RECORD> const expected = ReadBack(Sample, false);
    bool isGood = false;
    bool isBeginning = false;
    bool isWhole = false;
    int const failures = FailEachAllocation(
        [&]
        {
            SETMULTIPAR_LIST list(false);
            isGood = STICKET_BINSTREAM::Read(list, stream.data(), stream.size(), false);
            FailingAllocation::Stop();
            std::vector<RECORD> const records = RecordsOf(list.Table(false));
            isWhole = records == expected;
            isBeginning = records.size() < expected.size() &&
                          std::equal(records.begin(), records.end(), expected.begin());
        },
        [&](bool hasHappened)
        {
            EXPECT_EQ(isGood, !hasHappened);
            EXPECT_TRUE(isGood ? isWhole : isBeginning);
        });
    EXPECT_GT(failures, 3);
}

TEST(NoMemory, ReadIntoATicket_IsFalseAndDoesNotTouchIt)
{
    std::string const stream = Encode(Sample).value();
    std::vector<RECORD> const expected = ReadBack(Sample, true);
    STICKET_ACCESS const ticket = Ticket();
    bool isGood = false;
    int const failures = FailEachAllocation(
        [&]
        {
            Forget();
            isGood = STICKET_BINSTREAM::Read(&ticket, stream.data(), stream.size(), true);
            FailingAllocation::Stop();
            EXPECT_EQ(tables, isGood ? 1 : 0);
            EXPECT_TRUE(!isGood || given == expected);
            Forget();
        },
        [&](bool hasHappened) { EXPECT_EQ(isGood, !hasHappened); });
    EXPECT_GT(failures, 3);
}

TEST(NoMemory, ReadFileIntoATicket_IsTrueAndDoesNotTouchIt_ByDesign)
{
    TemporaryFolder const folder;
    std::string const path = folder.Write("stream", Encode(Sample).value()).string();
    STICKET_ACCESS const ticket = Ticket();
    bool isGood = false;
    int calls = 0;
    int const failures = FailEachAllocation(
        [&]
        {
            Forget();
            isGood = STICKET_BINSTREAM::Read(&ticket, path.c_str());
            calls = tables;
            Forget();
        },
        [&](bool hasHappened)
        {
            EXPECT_TRUE(isGood);
            EXPECT_EQ(calls, hasHappened ? 0 : 1);
        });
    EXPECT_GT(failures, 3);
}

TEST(NoMemory, AddToAList_ThrowsAndLeavesTheRecordsAsTheyWere)
{
    TABLE table(Sample);
    bool hasThrown = false;
    int thrown = 0;
    int const failures = FailEachAllocation(
        [&]
        {
            SETMULTIPAR_LIST list(false);
            std::size_t added = 0;
            hasThrown = false;
            try
            {
                for (; added < Sample.size(); ++added)
                {
                    SETMULTIPAR const& record = table.Records()[added];
                    list.xSetParameter(record.key, record.type, record.value, record.pos);
                    list.Table(true);
                }
            }
            catch (std::bad_alloc const&)
            {
                hasThrown = true;
                ++thrown;
            }
            FailingAllocation::Stop();
            for (std::size_t i = list.Size(); i < Sample.size(); ++i)
            {
                SETMULTIPAR const& record = table.Records()[i];
                list.xSetParameter(record.key, record.type, record.value, record.pos);
            }
            std::vector<RECORD> sorted = Sample;
            std::stable_sort(sorted.begin(), sorted.end(),
                             [](RECORD const& left, RECORD const& right) { return left.key < right.key; });
            EXPECT_TRUE(RecordsOf(list.Table(true)) == sorted);
        },
        // A sort also asks for memory that it can do without.
        [&](bool hasHappened) { EXPECT_LE(hasThrown, hasHappened); });
    EXPECT_GT(thrown, 3);
    EXPECT_GT(failures, thrown);
}

// The length of the texts shifts the place at which the list's memory comes to an end.
TEST(NoMemory, AddManyToAList_KeepsEachValueOnceAllTheSame)
{
    for (std::size_t length = 1; length <= 40; ++length)
    {
        std::vector<std::string> texts;
        texts.reserve(100);
        for (int i = 0; i < 100; ++i)
            texts.push_back(std::string(length, 'x') + std::to_string(i));
        bool hasThrown = false;
        int const failures = FailEachAllocation(
            [&]
            {
                SETMULTIPAR_LIST list(false);
                hasThrown = false;
                for (std::size_t i = 0; i < 2 * texts.size(); ++i)
                {
                    std::string const& text = texts[i % texts.size()];
                    try
                    {
                        list.SetParameter(text.c_str(), text, -1);
                    }
                    catch (std::bad_alloc const&)
                    {
                        hasThrown = true;
                        FailingAllocation::Stop();
                        list.SetParameter(text.c_str(), text, -1);
                    }
                }
                FailingAllocation::Stop();
                SETMULTIPAR const* const table = list.Table(false);
                for (std::size_t i = 0; i < texts.size(); ++i)
                {
                    EXPECT_EQ(table[i].key, texts[i]);
                    EXPECT_EQ(static_cast<char const*>(table[i].value), texts[i]);
                    EXPECT_EQ(table[i + texts.size()].key, table[i].key);
                    EXPECT_EQ(table[i + texts.size()].value, table[i].value);
                }
            },
            [&](bool hasHappened) { EXPECT_EQ(hasThrown, hasHappened); });
        EXPECT_GT(failures, 3);
    }
}

TEST(NoMemory, SortedTable_ThatWasNotMade_DoesNotCountAsSorted)
{
    bool hasThrown = false;
    int const failures = FailEachAllocation(
        [&]
        {
            SETMULTIPAR_LIST list(false);
            hasThrown = false;
            try
            {
                list.SetParameter("b", 1, -1);
                list.Table(true);
            }
            catch (std::bad_alloc const&)
            {
                hasThrown = true;
            }
            FailingAllocation::Stop();
            list.SetParameter("a", 1, -1);
            list.Table(false);
            EXPECT_STREQ(list.Table(true)->key, "a");
        },
        [&](bool hasHappened) { EXPECT_EQ(hasThrown, hasHappened); });
    EXPECT_GT(failures, 1);
}

TEST(NoMemory, WriteIntoAContainerStream_LeavesTheOperationOut)
{
    char const* const keys[] = {"System/Folders/*", "Job/Copies", nullptr};
    std::string const payload(100, 'x');
    TABLE table(Sample);
    bool isEveryOperationThere = false;
    int const failures = FailEachAllocation(
        [&]
        {
            MTICKET_BINSTREAM::Write writer(0);
            int expected = 0;
            auto const put = [&](auto operation)
            {
                try
                {
                    operation();
                    ++expected;
                }
                catch (std::bad_alloc const&)
                {
                }
            };
            put([&] { writer.PutOperation(5, 1, MTICKET_OP_DELETE, payload); });
            put([&] { writer.PutVoidOperation(5, 1, MTICKET_OP_DELETE); });
            put([&] { writer.PutPartialTableOperation(5, 1, STICKET_OP_SET_PARTIAL, keys); });
            put([&] { writer.PutSetMultipar(5, 1, table.Records(), 0); });
            FailingAllocation::Stop();
            std::string stream;
            writer.GetAndClear(stream);
            EXPECT_TRUE(MTICKET_BINSTREAM::Check(stream.data(), stream.size()));
            MTICKET_BINSTREAM::Read reader(stream.data(), stream.size(), false);
            int type;
            int id;
            TICKET_OP op = STICKET_OP_INVALID;
            int operations = 0;
            while (reader.ParseOperation(type, id, op) == MTICKET_BINSTREAM::GET_TICKET_OK)
                ++operations;
            int const unwritten = table.Records()[Sample.size() - 1].ok ? 0 : 1;  // left out without a word
            EXPECT_EQ(operations, expected - unwritten);
            isEveryOperationThere = operations == 4;
        },
        [&](bool hasHappened) { EXPECT_EQ(isEveryOperationThere, !hasHappened); });
    EXPECT_GT(failures, 3);
}

TEST(NoMemory, ReadKeysOfAContainerStream_ThrowsAndCanBeAskedForAgain)
{
    char const* const keys[] = {"a", "b", "c", "d", "e", nullptr};
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutPartialTableOperation(5, 1, STICKET_OP_SET_PARTIAL, keys);
    std::string stream;
    writer.GetAndClear(stream);
    bool hasThrown = false;
    int const failures = FailEachAllocation(
        [&]
        {
            MTICKET_BINSTREAM::Read reader(stream.data(), stream.size(), false);
            int type;
            int id;
            TICKET_OP op = STICKET_OP_INVALID;
            reader.ParseOperation(type, id, op);
            char const* const* table = keys;
            hasThrown = false;
            try
            {
                reader.GetPartialTable(table);
            }
            catch (std::bad_alloc const&)
            {
                hasThrown = true;
            }
            FailingAllocation::Stop();
            EXPECT_EQ(table == nullptr, hasThrown);
            EXPECT_EQ(reader.GetPartialTable(table), MTICKET_BINSTREAM::GET_TICKET_OK);
            for (int i = 0; i < 5; ++i)
                EXPECT_STREQ(table[i], keys[i]);
            EXPECT_EQ(table[5], nullptr);
        },
        [&](bool hasHappened) { EXPECT_EQ(hasThrown, hasHappened); });
    EXPECT_GT(failures, 1);
}
