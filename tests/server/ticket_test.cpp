// What tickets promise beyond the plain rules of reads and writes: what reaches the storage and when, how
// long a text lives, and who may change what.
#include "tests/server/ServerTest.h"

#include "comgui/ticket/BIN_STRING.h"
#include "tests/server/StoredValues.h"
#include <cmath>
#include <limits>

using standin::StoredValue;
using standin::SystemTicket;

namespace
{
// A table of integer writes that ends itself.
struct INT_TABLE
{
    std::vector<int> values;
    std::vector<SETMULTIPAR> records;

    explicit INT_TABLE(std::vector<std::pair<char const*, int>> const& writes) : values(writes.size())
    {
        for (std::size_t i = 0; i < writes.size(); ++i)
        {
            values[i] = static_cast<int>(i) + 10;
            records.push_back({writes[i].first, PARAM_INT, 0, &values[i], writes[i].second, true, {}});
        }
        records.emplace_back();
    }
};
}  // namespace

class Tickets : public ServerTest
{
};

TEST_F(Tickets, Opening_LoadsNoParameters)
{
    Server();
    EXPECT_TRUE(Server().Exists(Job));
    EXPECT_EQ(storage.loads, 0);
}

TEST_F(Tickets, FirstRead_LoadsItsTicketOnce)
{
    storage.Put(Job, "K", 0, Integer(PARAM_INT, 7));
    EXPECT_EQ(Int(Job, "K"), 7);
    EXPECT_EQ(Int(Job, "K"), 7);
    EXPECT_EQ(Int(Job, "Missing"), std::nullopt);
    EXPECT_EQ(storage.loads, 1);
}

TEST_F(Tickets, StoredValues_ComeBackWithTypeAndBits)
{
    storage.Put(Job, "I", 0, Integer(PARAM_INT, -7));
    storage.Put(Job, "U", 0, Integer(PARAM_UNSIGNED, 4294967295));
    storage.Put(Job, "L", 0, Integer(PARAM_UNSIGNED64, -1));
    storage.Put(Job, "D", 0, Double(-0.0));
    storage.Put(Job, "B", 2, Bytes(PARAM_BINSTRING, std::string_view("a\0b", 3)));
    auto& session = As("admin");
    unsigned u = 0;
    unsigned long long l = 0;
    double d = 1;
    BIN_STRING b;
    EXPECT_EQ(Int(Job, "I"), -7);
    EXPECT_TRUE(Server().Get(session, Job, "U", PARAM_UNSIGNED, &u, -1));
    EXPECT_TRUE(Server().Get(session, Job, "L", PARAM_UNSIGNED64, &l, -1));
    EXPECT_TRUE(Server().Get(session, Job, "D", PARAM_DOUBLE, &d, -1));
    EXPECT_TRUE(Server().Get(session, Job, "B", PARAM_BINSTRING, &b, 2));
    EXPECT_EQ(u, 4294967295u);
    EXPECT_EQ(l, std::numeric_limits<unsigned long long>::max());
    EXPECT_TRUE(d == 0 && std::signbit(d));
    EXPECT_EQ(std::string(static_cast<char const*>(b.data), b.size), std::string("a\0b", 3));
}

TEST_F(Tickets, EveryType_SurvivesARestart)
{
    auto& session = As("admin");
    int i = -1;
    unsigned u = 4000000000;
    long long l = -5000000000;
    unsigned long long ul = 18000000000000000000u;
    double d = 0.1;
    BIN_STRING b("\0x", 2);
    EXPECT_TRUE(Server().Set(session, Job, "V", PARAM_INT, &i, -1));
    EXPECT_TRUE(Server().Set(session, Job, "V", PARAM_UNSIGNED, &u, -2));
    EXPECT_TRUE(Server().Set(session, Job, "V", PARAM_INT64, &l, -2));
    EXPECT_TRUE(Server().Set(session, Job, "V", PARAM_UNSIGNED64, &ul, -2));
    EXPECT_TRUE(Server().Set(session, Job, "V", PARAM_DOUBLE, &d, -2));
    EXPECT_TRUE(Server().Set(session, Job, "V", PARAM_BINSTRING, &b, -2));
    EXPECT_TRUE(Server().Set(session, Job, "V", PARAM_STRING, "text", -2));
    Restart();
    auto& again = As("admin");
    i = 0, u = 0, l = 0, ul = 0, d = 0, b = {};
    EXPECT_TRUE(Server().Get(again, Job, "V", PARAM_INT, &i, 0) && i == -1);
    EXPECT_TRUE(Server().Get(again, Job, "V", PARAM_UNSIGNED, &u, 1) && u == 4000000000);
    EXPECT_TRUE(Server().Get(again, Job, "V", PARAM_INT64, &l, 2) && l == -5000000000);
    EXPECT_TRUE(Server().Get(again, Job, "V", PARAM_UNSIGNED64, &ul, 3) && ul == 18000000000000000000u);
    EXPECT_TRUE(Server().Get(again, Job, "V", PARAM_DOUBLE, &d, 4) && d == 0.1);
    EXPECT_TRUE(Server().Get(again, Job, "V", PARAM_BINSTRING, &b, 5) && b.size == 2);
    EXPECT_STREQ(Text(Job, "V", 6), "text");
}

TEST_F(Tickets, APointer_LivesInMemoryOnlyAndTakesThePlaceOfWhatWasStored)
{
    Set(Job, "P", 7);
    int target = 0;
    EXPECT_TRUE(Server().Set(As("admin"), Job, "P", PARAM_POINTER, &target, -1));
    void* read = nullptr;
    EXPECT_TRUE(Server().Get(As("admin"), Job, "P", PARAM_POINTER, &read, -1));
    EXPECT_EQ(read, &target);
    EXPECT_TRUE(storage.tickets[Job].empty());
}

TEST_F(Tickets, ATable_IsOneTransaction)
{
    INT_TABLE table({{"A", -1}, {"B", -1}, {"A", 1}});
    EXPECT_TRUE(Server().SetTable(As("admin"), Job, table.records.data()));
    EXPECT_EQ(storage.transactions, 1);
    EXPECT_EQ(Int(Job, "A", 1), 12);
}

TEST_F(Tickets, AppendsOfOneTable_StandOneBehindTheOther)
{
    INT_TABLE table({{"A", 3}, {"A", -2}, {"B", -2}, {"A", -2}});
    EXPECT_TRUE(Server().SetTable(As("admin"), Job, table.records.data()));
    EXPECT_EQ(Int(Job, "A", 4), 11);
    EXPECT_EQ(Int(Job, "A", 5), 13);
    EXPECT_EQ(Int(Job, "B", 0), 12);
}

TEST_F(Tickets, AnInvalidRecord_FailsAloneAndTheRestIsWritten)
{
    INT_TABLE table({{"A", -1}, {"B", -3}, {"C", -1}});
    EXPECT_TRUE(Server().SetTable(As("admin"), Job, table.records.data()));
    EXPECT_TRUE(table.records[0].ok);
    EXPECT_FALSE(table.records[1].ok);
    EXPECT_TRUE(table.records[2].ok);
    EXPECT_EQ(Int(Job, "C"), 12);
}

TEST_F(Tickets, AFailedTransaction_LeavesMemoryAndOkBytesFalseAndSaysSo)
{
    Set(Job, "A", 1);
    Set(Job, "B", "old");
    INT_TABLE table({{"A", -1}, {"B", -1}, {"C", -1}});
    storage.fail = true;
    testing::internal::CaptureStderr();
    EXPECT_FALSE(Server().SetTable(As("admin"), Job, table.records.data()));
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "site.db: told to fail: tell it not to\n");
    for (std::size_t i = 0; i < 3; ++i)
        EXPECT_FALSE(table.records[i].ok);
    EXPECT_EQ(Int(Job, "A"), 1);
    EXPECT_STREQ(Text(Job, "B"), "old");
    EXPECT_EQ(Int(Job, "C"), std::nullopt);
}

TEST_F(Tickets, ATicketThatCannotBeLoaded_FailsToReadAndIsTriedAgain)
{
    storage.Put(Job, "K", 0, Integer(PARAM_INT, 7));
    As("admin");
    storage.fail = true;
    testing::internal::CaptureStderr();
    EXPECT_EQ(Int(Job, "K"), std::nullopt);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "site.db: told to fail: tell it not to\n");
    storage.fail = false;
    EXPECT_EQ(Int(Job, "K"), 7);
}

TEST_F(Tickets, AWriteThatAppendsPastTheLargestPosition_IsRefused)
{
    EXPECT_TRUE(Set(Job, "A", 1, standin::LargestPosition));
    EXPECT_FALSE(Set(Job, "A", 1, -2));
    EXPECT_FALSE(Set(Job, "A", 1, standin::LargestPosition + 1));
    EXPECT_TRUE(Set(Job, "A", 2, standin::LargestPosition));
    EXPECT_EQ(Int(Job, "A", standin::LargestPosition), 2);
}

TEST_F(Tickets, AMissingTicket_RefusesWritesAndReads)
{
    standin::TicketAddress const missing{3, 99};
    INT_TABLE empty({});
    EXPECT_FALSE(Set(missing, "A", 1));
    EXPECT_FALSE(Server().SetTable(As("admin"), missing, empty.records.data()));
    EXPECT_EQ(Int(missing, "A"), std::nullopt);
    EXPECT_FALSE(Server().Exists(missing));
}

TEST_F(Tickets, Create_MakesAnEmptyTicketThatLasts)
{
    standin::TicketAddress const fresh{12, 16777215};
    EXPECT_TRUE(Server().Create(As("operator"), fresh));
    EXPECT_FALSE(Server().Create(As("operator"), fresh));
    EXPECT_TRUE(Set(fresh, "A", 1));
    Restart();
    EXPECT_EQ(Int(fresh, "A"), 1);
}

TEST_F(Tickets, Create_OutOfRange_IsRefused)
{
    for (auto const address : {standin::TicketAddress{100, 0}, {-1, 0}, {3, -1}, {3, 16777216}, {3, -4}})
        EXPECT_FALSE(Server().Create(As("admin"), address));
}

TEST_F(Tickets, Delete_TakesTicketAndParametersForGood)
{
    Set(Job, "A", 1);
    EXPECT_TRUE(Server().Delete(As("operator"), Job));
    EXPECT_FALSE(Server().Exists(Job));
    EXPECT_EQ(Int(Job, "A"), std::nullopt);
    EXPECT_FALSE(Server().Delete(As("operator"), Job));
    EXPECT_TRUE(Server().Create(As("operator"), Job));
    EXPECT_EQ(Int(Job, "A"), std::nullopt);
    Restart();
    EXPECT_EQ(Int(Job, "A"), std::nullopt);
}

TEST_F(Tickets, Delete_OfTheSystemTicket_IsRefusedToEverybody)
{
    EXPECT_FALSE(Server().Delete(As("admin"), SystemTicket));
    EXPECT_TRUE(Server().Exists(SystemTicket));
}

TEST_F(Tickets, Delete_OfAUsersTicket_IsForAdministrators)
{
    EXPECT_FALSE(Server().Delete(As("operator"), OperatorsTicket));
    EXPECT_TRUE(Server().Delete(As("admin"), OperatorsTicket));
}

TEST_F(Tickets, Delete_ThatTheStorageRefuses_LeavesTheTicket)
{
    Set(Job, "A", 1);
    storage.fail = true;
    testing::internal::CaptureStderr();
    EXPECT_FALSE(Server().Delete(As("admin"), Job));
    EXPECT_NE(testing::internal::GetCapturedStderr(), "");
    EXPECT_EQ(Int(Job, "A"), 1);
}

TEST_F(Tickets, NextTicket_WalksATypeInAscendingOrder)
{
    Server().Create(As("admin"), {3, 0});
    Server().Create(As("admin"), {3, 500});
    EXPECT_EQ(Server().NextTicket(3, -1), 0);
    EXPECT_EQ(Server().NextTicket(3, 0), 1);
    EXPECT_EQ(Server().NextTicket(3, 1), 500);
    EXPECT_EQ(Server().NextTicket(3, 500), -1);
    EXPECT_EQ(Server().NextTicket(100, -1), -1);
    EXPECT_EQ(Server().NextTicket(-1, -1), -1);
}

TEST_F(Tickets, Visit_HandsOutByKeyAndPosition)
{
    Set(Job, "b", 1);
    Set(Job, "a", "x", 2);
    Set(Job, "a", 3, 0);
    std::string seen;
    EXPECT_TRUE(Server().Visit(As("guest"), Job,
                               [&](std::string_view key, int pos, StoredValue const& value) {
                                   seen += std::string(key) + std::to_string(pos) + ':' +
                                           std::to_string(value.type) + ' ';
                               }));
    EXPECT_EQ(seen, "a0:2 a2:4 b0:2 ");
    EXPECT_FALSE(Server().Visit(As("guest"), {3, 99}, [](auto, auto, auto const&) {}));
}

TEST_F(Tickets, SystemTicket_IsForAdministratorsToWriteAndForAllToRead)
{
    int value = 7;
    INT_TABLE table({{"K", -1}});
    EXPECT_FALSE(Server().Set(As("operator"), SystemTicket, "K", PARAM_INT, &value, -1));
    EXPECT_FALSE(Server().SetTable(As("guest"), SystemTicket, table.records.data()));
    EXPECT_FALSE(table.records[0].ok);
    EXPECT_TRUE(Set(SystemTicket, "K", 7));
    value = 0;
    EXPECT_TRUE(Server().Get(As("guest"), SystemTicket, "K", PARAM_INT, &value, -1));
    EXPECT_EQ(value, 7);
}

TEST_F(Tickets, AnAdministratorsRole_Is16AndNoOther)
{
    int value = 7;
    EXPECT_EQ(As("guest").Who().role, 17);  // the bit of 16 is set, and means nothing
    EXPECT_FALSE(Server().Set(As("guest"), SystemTicket, "K", PARAM_INT, &value, -1));
}

TEST_F(Tickets, AUsersTicket_IsForItsUserAndAdministratorsToWrite)
{
    int value = 7;
    EXPECT_TRUE(Server().Set(As("operator"), OperatorsTicket, "K", PARAM_INT, &value, -1));
    EXPECT_TRUE(Server().Set(As("admin"), OperatorsTicket, "K", PARAM_INT, &value, -1));
    EXPECT_FALSE(Server().Set(As("guest"), OperatorsTicket, "K", PARAM_INT, &value, -1));
    EXPECT_FALSE(Server().Create(As("operator"), {standin::UserTicketType, 77}));
}

TEST_F(Tickets, AChangeOfTheSystemTicket_IsToldAndNoOther)
{
    Set(SystemTicket, "K", 1);
    EXPECT_EQ(systemTicketChanges, 1);
    Set(Job, "K", 1);
    EXPECT_FALSE(Set(SystemTicket, "K", 1, -3));
    EXPECT_EQ(systemTicketChanges, 1);
}

TEST_F(Tickets, ATextThatWasRead_OutlivesItsReplacementAndItsTicket)
{
    Set(Job, "K", "first text, too long for any short string");
    char const* const first = Text(Job, "K");
    Set(Job, "K", "second");
    char const* const second = Text(Job, "K");
    EXPECT_TRUE(Server().Delete(As("admin"), Job));
    EXPECT_STREQ(first, "first text, too long for any short string");
    EXPECT_STREQ(second, "second");
    EXPECT_EQ(Server().RetiredTexts(), 2u);
}

TEST_F(Tickets, ATextThatNobodyRead_GoesAtOnce)
{
    Set(Job, "K", "first");
    Set(Job, "K", "second");
    EXPECT_EQ(Server().RetiredTexts(), 0u);
}

TEST_F(Tickets, ARetiredText_GoesWithTheLastSessionThatCanHoldIt)
{
    As("operator");
    Set(Job, "K", "first");
    Text(Job, "K");
    Set(Job, "K", "second");
    As("guest");  // came later, and cannot have seen it
    Server().Logout(As("admin"));
    EXPECT_EQ(Server().RetiredTexts(), 1u);
    Server().Logout(As("operator"));
    EXPECT_EQ(Server().RetiredTexts(), 0u);
}

TEST_F(Tickets, AHundredThousandTickets_OpenWithoutLoading)
{
    for (int id = 0; id < 100000; ++id)
        storage.Put({3, id}, "K", 0, Integer(PARAM_INT, id));
    EXPECT_EQ(Int({3, 54321}, "K"), 54321);
    EXPECT_EQ(storage.loads, 1);
    EXPECT_EQ(Server().NextTicket(3, 99998), 99999);
}
