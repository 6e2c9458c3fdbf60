// What tickets promise beyond the plain rules of reads and writes: what reaches the store and when, how
// long a text lives, and who may change what.
#include "tests/server/ServerTest.h"

#include "comgui/ticket/BIN_STRING.h"
#include "tests/server/StoredValues.h"
#include "tests/support/Files.h"
#include <atomic>
#include <cmath>
#include <gmock/gmock.h>
#include <limits>
#include <thread>

using standin::SystemTicket;
using testing::HasSubstr;

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

class TicketPromises : public ServerTest
{
};

TEST_F(TicketPromises, Opening_LoadsNoParameters)
{
    Server();
    EXPECT_TRUE(Exists(Job));
    EXPECT_EQ(site->Loads(), 0);
}

TEST_F(TicketPromises, FirstRead_LoadsItsTicketOnce)
{
    site->Put(Job, "K", 0, Integer(PARAM_INT, 7));
    EXPECT_EQ(Int(Job, "K"), 7);
    EXPECT_EQ(Int(Job, "K"), 7);
    EXPECT_EQ(Int(Job, "Missing"), std::nullopt);
    EXPECT_EQ(site->Loads(), 1);
}

TEST_F(TicketPromises, StoredValues_ComeBackWithTypeAndBits)
{
    site->Put(Job, "I", 0, Integer(PARAM_INT, -7));
    site->Put(Job, "U", 0, Integer(PARAM_UNSIGNED, 4294967295));
    site->Put(Job, "L", 0, Integer(PARAM_UNSIGNED64, -1));
    site->Put(Job, "D", 0, Double(-0.0));
    site->Put(Job, "B", 2, Bytes(PARAM_BINSTRING, std::string_view("a\0b", 3)));
    auto& session = As("admin");
    unsigned u = 0;
    unsigned long long l = 0;
    double d = 1;
    BIN_STRING b;
    EXPECT_EQ(Int(Job, "I"), -7);
    EXPECT_TRUE(Get(session, Job, "U", PARAM_UNSIGNED, &u, -1));
    EXPECT_TRUE(Get(session, Job, "L", PARAM_UNSIGNED64, &l, -1));
    EXPECT_TRUE(Get(session, Job, "D", PARAM_DOUBLE, &d, -1));
    EXPECT_TRUE(Get(session, Job, "B", PARAM_BINSTRING, &b, 2));
    EXPECT_EQ(u, 4294967295u);
    EXPECT_EQ(l, std::numeric_limits<unsigned long long>::max());
    EXPECT_TRUE(d == 0 && std::signbit(d));
    EXPECT_EQ(std::string(static_cast<char const*>(b.data), b.size), std::string("a\0b", 3));
}

TEST_F(TicketPromises, EveryType_SurvivesARestart)
{
    auto& session = As("admin");
    int i = -1;
    unsigned u = 4000000000;
    long long l = -5000000000;
    unsigned long long ul = 18000000000000000000u;
    double d = 0.1;
    BIN_STRING b("\0x", 2);
    EXPECT_TRUE(Set(session, Job, "V", PARAM_INT, &i, -1));
    EXPECT_TRUE(Set(session, Job, "V", PARAM_UNSIGNED, &u, -2));
    EXPECT_TRUE(Set(session, Job, "V", PARAM_INT64, &l, -2));
    EXPECT_TRUE(Set(session, Job, "V", PARAM_UNSIGNED64, &ul, -2));
    EXPECT_TRUE(Set(session, Job, "V", PARAM_DOUBLE, &d, -2));
    EXPECT_TRUE(Set(session, Job, "V", PARAM_BINSTRING, &b, -2));
    EXPECT_TRUE(Set(session, Job, "V", PARAM_STRING, "text", -2));
    Restart();
    auto& again = As("admin");
    i = 0, u = 0, l = 0, ul = 0, d = 0, b = {};
    EXPECT_TRUE(Get(again, Job, "V", PARAM_INT, &i, 0) && i == -1);
    EXPECT_TRUE(Get(again, Job, "V", PARAM_UNSIGNED, &u, 1) && u == 4000000000);
    EXPECT_TRUE(Get(again, Job, "V", PARAM_INT64, &l, 2) && l == -5000000000);
    EXPECT_TRUE(Get(again, Job, "V", PARAM_UNSIGNED64, &ul, 3) && ul == 18000000000000000000u);
    EXPECT_TRUE(Get(again, Job, "V", PARAM_DOUBLE, &d, 4) && d == 0.1);
    EXPECT_TRUE(Get(again, Job, "V", PARAM_BINSTRING, &b, 5) && b.size == 2);
    EXPECT_STREQ(Text(Job, "V", 6), "text");
}

TEST_F(TicketPromises, APointer_LivesInMemoryOnlyAndTakesThePlaceOfWhatWasStored)
{
    Set(Job, "P", 7);
    int target = 0;
    EXPECT_TRUE(Set(As("admin"), Job, "P", PARAM_POINTER, &target, -1));
    void* read = nullptr;
    EXPECT_TRUE(Get(As("admin"), Job, "P", PARAM_POINTER, &read, -1));
    EXPECT_EQ(read, &target);
    EXPECT_THAT(PlacesInStore(Job), testing::IsEmpty());
}

TEST_F(TicketPromises, ATable_IsOneTransaction)
{
    INT_TABLE table({{"A", -1}, {"B", -1}, {"A", 1}});
    EXPECT_TRUE(SetTable(As("admin"), Job, table.records.data()));
    EXPECT_EQ(site->Commits(), 1);
    EXPECT_EQ(Int(Job, "A", 1), 12);
}

TEST_F(TicketPromises, AppendsOfOneTable_StandOneBehindTheOther)
{
    INT_TABLE table({{"A", 3}, {"A", -2}, {"B", -2}, {"A", -2}});
    EXPECT_TRUE(SetTable(As("admin"), Job, table.records.data()));
    EXPECT_EQ(Int(Job, "A", 4), 11);
    EXPECT_EQ(Int(Job, "A", 5), 13);
    EXPECT_EQ(Int(Job, "B", 0), 12);
}

TEST_F(TicketPromises, AnInvalidRecord_FailsAloneAndTheRestIsWritten)
{
    INT_TABLE table({{"A", -1}, {"B", -3}, {"C", -1}});
    EXPECT_TRUE(SetTable(As("admin"), Job, table.records.data()));
    EXPECT_TRUE(table.records[0].ok);
    EXPECT_FALSE(table.records[1].ok);
    EXPECT_TRUE(table.records[2].ok);
    EXPECT_EQ(Int(Job, "C"), 12);
}

TEST_F(TicketPromises, AFailedTransaction_LeavesMemoryAndOkBytesFalseAndSaysSo)
{
    Set(Job, "A", 1);
    Set(Job, "B", "old");
    INT_TABLE table({{"A", -1}, {"B", -1}, {"C", -1}});
    testing::internal::CaptureStderr();
    site->FailAll(true);
    EXPECT_FALSE(SetTable(As("admin"), Job, table.records.data()));
    EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr("told to fail; tell it not to"));
    for (std::size_t i = 0; i < 3; ++i)
        EXPECT_FALSE(table.records[i].ok);
    EXPECT_EQ(Int(Job, "A"), 1);
    EXPECT_STREQ(Text(Job, "B"), "old");
    EXPECT_EQ(Int(Job, "C"), std::nullopt);
}

TEST_F(TicketPromises, ATicketThatCannotBeLoaded_FailsToReadAndIsTriedAgain)
{
    site->Put(Job, "K", 0, Integer(PARAM_INT, 7));
    As("admin");
    testing::internal::CaptureStderr();
    site->FailAll(true);
    EXPECT_EQ(Int(Job, "K"), std::nullopt);
    EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr("told to fail; tell it not to"));
    site->FailAll(false);
    EXPECT_EQ(Int(Job, "K"), 7);
}

TEST_F(TicketPromises, AWriteThatAppendsPastTheLargestPosition_IsRefused)
{
    EXPECT_TRUE(Set(Job, "A", 1, standin::LargestPosition));
    EXPECT_FALSE(Set(Job, "A", 1, -2));
    EXPECT_FALSE(Set(Job, "A", 1, standin::LargestPosition + 1));
    EXPECT_TRUE(Set(Job, "A", 2, standin::LargestPosition));
    EXPECT_EQ(Int(Job, "A", standin::LargestPosition), 2);
}

TEST_F(TicketPromises, AMissingTicket_RefusesWritesAndReads)
{
    standin::TicketAddress const missing{3, 99};
    INT_TABLE empty({});
    EXPECT_FALSE(Set(missing, "A", 1));
    EXPECT_FALSE(SetTable(As("admin"), missing, empty.records.data()));
    EXPECT_EQ(Int(missing, "A"), std::nullopt);
    EXPECT_FALSE(Exists(missing));
}

TEST_F(TicketPromises, Create_MakesAnEmptyTicketThatLasts)
{
    standin::TicketAddress const fresh{12, 16777215};
    EXPECT_TRUE(Tickets().Create(As("operator"), fresh));
    EXPECT_FALSE(Tickets().Create(As("operator"), fresh));
    EXPECT_TRUE(Set(fresh, "A", 1));
    Restart();
    EXPECT_EQ(Int(fresh, "A"), 1);
}

TEST_F(TicketPromises, Create_OutOfRange_IsRefused)
{
    for (auto const address : {standin::TicketAddress{100, 0}, {-1, 0}, {3, -1}, {3, 16777216}, {3, -4}})
        EXPECT_FALSE(Tickets().Create(As("admin"), address));
}

TEST_F(TicketPromises, Delete_TakesTicketAndParametersForGood)
{
    Set(Job, "A", 1);
    EXPECT_TRUE(Tickets().Delete(As("operator"), Job));
    EXPECT_FALSE(Exists(Job));
    EXPECT_EQ(Int(Job, "A"), std::nullopt);
    EXPECT_FALSE(Tickets().Delete(As("operator"), Job));
    EXPECT_TRUE(Tickets().Create(As("operator"), Job));
    EXPECT_EQ(Int(Job, "A"), std::nullopt);
    Restart();
    EXPECT_EQ(Int(Job, "A"), std::nullopt);
}

TEST_F(TicketPromises, Delete_OfTheSystemTicket_IsRefusedToEverybody)
{
    EXPECT_FALSE(Tickets().Delete(As("admin"), SystemTicket));
    EXPECT_TRUE(Exists(SystemTicket));
}

TEST_F(TicketPromises, Delete_OfAUsersTicket_IsForAdministrators)
{
    EXPECT_FALSE(Tickets().Delete(As("operator"), OperatorsTicket));
    EXPECT_TRUE(Tickets().Delete(As("admin"), OperatorsTicket));
}

TEST_F(TicketPromises, Delete_ThatTheStoreRefuses_LeavesTheTicket)
{
    Set(Job, "A", 1);
    testing::internal::CaptureStderr();
    site->FailAll(true);
    EXPECT_FALSE(Tickets().Delete(As("admin"), Job));
    EXPECT_NE(testing::internal::GetCapturedStderr(), "");
    EXPECT_EQ(Int(Job, "A"), 1);
}

TEST_F(TicketPromises, NextTicket_WalksATypeInAscendingOrder)
{
    Tickets().Create(As("admin"), {3, 0});
    Tickets().Create(As("admin"), {3, 500});
    EXPECT_EQ(Tickets().NextTicket(3, -1), 0);
    EXPECT_EQ(Tickets().NextTicket(3, 0), 1);
    EXPECT_EQ(Tickets().NextTicket(3, 1), 500);
    EXPECT_EQ(Tickets().NextTicket(3, 500), -1);
    EXPECT_EQ(Tickets().NextTicket(100, -1), -1);
    EXPECT_EQ(Tickets().NextTicket(-1, -1), -1);
}

TEST_F(TicketPromises, CreateNext_GivesTheIdAboveTheLargest)
{
    EXPECT_EQ(Tickets().CreateNext(As("operator"), 12), 1);
    EXPECT_EQ(Tickets().CreateNext(As("operator"), 12), 2);
    EXPECT_TRUE(Tickets().Create(As("operator"), {12, 50}));
    EXPECT_EQ(Tickets().CreateNext(As("operator"), 12), 51);
    EXPECT_TRUE(Tickets().Create(As("operator"), {12, standin::LargestId}));
    EXPECT_EQ(Tickets().CreateNext(As("operator"), 12), 0);  // the smallest that is free
    EXPECT_EQ(Tickets().CreateNext(As("operator"), 12), 3);
    EXPECT_EQ(Tickets().CreateNext(As("operator"), standin::UserTicketType), -1);
    EXPECT_EQ(Tickets().CreateNext(As("operator"), SystemTicket.type), -1);
    EXPECT_EQ(Tickets().CreateNext(As("admin"), 100), -1);
}

TEST_F(TicketPromises, LargestId_IsTheLargestOfTheTypeThatIsThere)
{
    EXPECT_EQ(Tickets().LargestId(12), 0);
    EXPECT_TRUE(Tickets().Create(As("operator"), {12, 77}));
    EXPECT_TRUE(Tickets().Create(As("operator"), {12, 70000}));
    EXPECT_EQ(Tickets().LargestId(12), 70000);
    EXPECT_TRUE(Tickets().Delete(As("operator"), {12, 70000}));
    EXPECT_EQ(Tickets().LargestId(12), 77);
}

TEST_F(TicketPromises, Values_ComeByKeyAndPosition)
{
    Set(Job, "b", 1);
    Set(Job, "a", "x", 2);
    Set(Job, "a", 3, 0);
    auto const shown = [this](standin::TicketAddress address, std::string_view prefix)
    {
        std::string seen;
        auto const walked = Tickets().Values(As("guest"), address, 0, prefix);
        for (standin::WalkedValues::Value const& value : walked->Values())
            seen += walked->KeyOf(value) + std::to_string(value.element.pos) + ':' +
                    std::to_string(value.element.type) + ' ';
        return seen;
    };
    EXPECT_EQ(shown(Job, ""), "a0:2 a2:4 b0:2 ");
    EXPECT_EQ(shown(Job, "b"), "b0:2 ");
    EXPECT_EQ(shown(Job, "c"), "");
    EXPECT_FALSE(Tickets().Values(As("guest"), {3, 99}, 0, ""));
}

TEST_F(TicketPromises, AnotherTicketWithTheAddress_IsNotTheOneThatWasMeant)
{
    standin::Incarnation const first = Tickets().IncarnationOf(Job);
    EXPECT_TRUE(Tickets().Delete(As("admin"), Job));
    EXPECT_TRUE(Tickets().Create(As("admin"), Job));
    standin::Incarnation const second = Tickets().IncarnationOf(Job);
    int value = 7;
    EXPECT_NE(first, second);
    EXPECT_FALSE(Set(As("admin"), Job, "K", PARAM_INT, &value, -1, first));
    EXPECT_TRUE(Set(As("admin"), Job, "K", PARAM_INT, &value, -1, second));
    EXPECT_FALSE(Get(As("admin"), Job, "K", PARAM_INT, &value, -1, first));
    EXPECT_TRUE(Get(As("admin"), Job, "K", PARAM_INT, &value, -1, second));
    EXPECT_FALSE(Tickets().Values(As("admin"), Job, first, ""));
}

// One writer keeps two keys equal, in one table each time.
TEST_F(TicketPromises, ATableThatIsRead_IsOfOneMoment)
{
    auto& session = As("operator");
    std::atomic<bool> done{false};
    std::thread writer(
        [&]
        {
            for (int number = 0; number < 3000; ++number)
            {
                SETMULTIPAR table[] = {{"A", PARAM_INT, 0, &number, -1, true, {}},
                                       {"B", PARAM_INT, 0, &number, -1, true, {}},
                                       {}};
                SetTable(session, Job, table);
            }
            done = true;
        });
    int reads = 0;
    int torn = 0;
    for (bool last = false; !last; ++reads)
    {
        last = done;
        int a = -1;
        int b = -1;
        GETMULTIPAR table[] = {
            {"A", PARAM_INT, 0, &a, -1, true, {}}, {"B", PARAM_INT, 0, &b, -1, true, {}}, {}};
        GetTable(session, Job, table);
        torn += a != b ? 1 : 0;
    }
    writer.join();
    EXPECT_EQ(torn, 0) << "of " << reads;
    EXPECT_EQ(Int(Job, "A"), 2999);
}

TEST_F(TicketPromises, SystemTicket_IsForAdministratorsToWriteAndForAllToRead)
{
    int value = 7;
    INT_TABLE table({{"K", -1}});
    EXPECT_FALSE(Set(As("operator"), SystemTicket, "K", PARAM_INT, &value, -1));
    EXPECT_FALSE(SetTable(As("guest"), SystemTicket, table.records.data()));
    EXPECT_FALSE(table.records[0].ok);
    EXPECT_TRUE(Set(SystemTicket, "K", 7));
    value = 0;
    EXPECT_TRUE(Get(As("guest"), SystemTicket, "K", PARAM_INT, &value, -1));
    EXPECT_EQ(value, 7);
}

TEST_F(TicketPromises, AnAdministratorsRole_Is16AndNoOther)
{
    int value = 7;
    EXPECT_EQ(As("guest").Who().role, 17);  // the bit of 16 is set, and means nothing
    EXPECT_FALSE(Set(As("guest"), SystemTicket, "K", PARAM_INT, &value, -1));
}

TEST_F(TicketPromises, AUsersTicket_IsForItsUserAndAdministratorsToWrite)
{
    int value = 7;
    EXPECT_TRUE(Set(As("operator"), OperatorsTicket, "K", PARAM_INT, &value, -1));
    EXPECT_TRUE(Set(As("admin"), OperatorsTicket, "K", PARAM_INT, &value, -1));
    EXPECT_FALSE(Set(As("guest"), OperatorsTicket, "K", PARAM_INT, &value, -1));
    EXPECT_FALSE(Tickets().Create(As("operator"), {standin::UserTicketType, 77}));
}

TEST_F(TicketPromises, AChangeOfTheSystemTicket_RaisesItsRevisionAndIsCopied_AndNoOther)
{
    std::filesystem::path const copy = folder / "tickets/SYS_0000.xml";
    standin::Sequence const before = Tickets().SystemTicketRevision();
    Set(SystemTicket, "TheKey", 1);
    standin::Sequence const after = Tickets().SystemTicketRevision();
    EXPECT_GT(after, before);
    EXPECT_THAT(ContentOf(copy), HasSubstr("TheKey"));
    std::filesystem::remove(copy);
    Set(Job, "K", 1);
    EXPECT_FALSE(Set(SystemTicket, "K", 1, -3));
    EXPECT_EQ(Tickets().SystemTicketRevision(), after);
    EXPECT_FALSE(std::filesystem::exists(copy));
}

TEST_F(TicketPromises, ATextThatWasRead_OutlivesItsReplacementAndItsTicket)
{
    Set(Job, "K", "first text, too long for any short string");
    char const* const first = Text(Job, "K");
    Set(Job, "K", "second");
    char const* const second = Text(Job, "K");
    EXPECT_TRUE(Tickets().Delete(As("admin"), Job));
    EXPECT_STREQ(first, "first text, too long for any short string");
    EXPECT_STREQ(second, "second");
    EXPECT_EQ(RetiredTexts(), 2u);
}

TEST_F(TicketPromises, ATextThatNobodyRead_GoesAtOnce)
{
    Set(Job, "K", "first");
    Set(Job, "K", "second");
    EXPECT_EQ(RetiredTexts(), 0u);
}

// In the action or in another thread, which is the same to the walk.
TEST_F(TicketPromises, TextsOfAWalk_StayToItsEndThoughTheSessionEnds)
{
    Set(Job, "A", "first text, too long for any short string");
    Set(Job, "B", "second text, too long for any short string");
    standin::FolderTranslator folders(Tickets());
    auto const numbers = std::make_shared<standin::WalkedNumbers>();
    standin::Gate const gate(Tickets(), standin::Troubles::None(), As("admin"));
    standin::OpenTicket const ticket(Tickets(), As("admin"), gate, folders, numbers, Job,
                                     Tickets().IncarnationOf(Job));
    As("operator");
    struct Walk
    {
        std::function<void(char const*)> onText;
        int calls = 0;
    } walk;
    walk.onText = [&](char const* text)
    {
        std::thread([&] { Logout("admin"); }).join();
        char const* const news = "other";
        EXPECT_TRUE(Set(As("operator"), Job, "A", PARAM_STRING, news, -1));
        EXPECT_TRUE(Set(As("operator"), Job, "B", PARAM_STRING, news, -1));
        EXPECT_EQ(RetiredTexts(), 2u);
        EXPECT_STREQ(text, "first text, too long for any short string");
        EXPECT_TRUE(As("admin").Reader().IsWalking());
    };
    auto const action = [](void* context, char const*, PARAM_TYPE, void const* value, int)
    {
        auto& now = *static_cast<Walk*>(context);
        ++now.calls;
        now.onText(static_cast<char const*>(value));
        return true;
    };
    EXPECT_EQ(ticket.Access()->SWALKPARAMETERS(ticket.Access()->Instance, action, &walk, "", 8000), 1);
    EXPECT_EQ(walk.calls, 1);
    EXPECT_FALSE(As("admin").Reader().IsWalking());
    EXPECT_EQ(RetiredTexts(), 0u);
}

TEST_F(TicketPromises, ARetiredText_GoesWithTheLastSessionThatHasReadIt)
{
    As("guest");  // reads nothing
    Set(Job, "K", "first");
    Text(Job, "K");
    char const* text = nullptr;
    EXPECT_TRUE(Get(As("operator"), Job, "K", PARAM_STRING, &text, -1));
    Set(Job, "K", "second");
    EXPECT_EQ(RetiredTexts(), 1u);
    Logout("admin");
    EXPECT_EQ(RetiredTexts(), 1u);
    EXPECT_STREQ(text, "first");
    Logout("operator");
    EXPECT_EQ(RetiredTexts(), 0u);
}

TEST_F(TicketPromises, AHundredThousandTickets_OpenWithoutLoading)
{
    for (int id = 0; id < 100000; ++id)
        site->Put({3, id}, "K", 0, Integer(PARAM_INT, id));
    EXPECT_EQ(Int({3, 54321}, "K"), 54321);
    EXPECT_EQ(site->Loads(), 1);
    EXPECT_EQ(Tickets().NextTicket(3, 99998), 99999);
}
