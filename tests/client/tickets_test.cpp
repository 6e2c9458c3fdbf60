// Tickets through the kit: reading, writing, snapshots.
#include "tests/client/Client.h"

#include "comgui/ticket/MTICKET_ACCESS.h"
#include <algorithm>
#include <gmock/gmock.h>

using namespace comgui;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

namespace
{
class TicketsOfAClient : public Client
{
protected:
    TicketsOfAClient() { LogIn(); }

    std::string TextOf(TicketAddress ticket, char const* key) const
    {
        return tickets.ReadAs<std::string>(ticket, key).ValueOr("(none)");
    }
};

class EveryValue : public TicketsOfAClient, public testing::WithParamInterface<Value>
{
};

using comgui::List;
}  // namespace

TEST_P(EveryValue, IsReadAsItWasWritten)
{
    TicketAddress const ticket = NewTicket();
    Value const& value = GetParam();
    ASSERT_TRUE(tickets.Write(ticket, "Some/Key", value));
    EXPECT_EQ(*tickets.Read(ticket, "Some/Key"), value);
    EXPECT_EQ(*tickets.ReadAll(ticket)->Find("Some/Key"), value);
}

TEST_P(EveryValue, ReplacesAnotherOne)
{
    TicketAddress const ticket = NewTicket();
    ASSERT_TRUE(tickets.Write(ticket, "Key", MakeList<int>({1, 2, 3, 4, 5, 6, 7, 8, 9})));
    ASSERT_TRUE(tickets.Write(ticket, "Key", GetParam()));
    EXPECT_EQ(*tickets.Read(ticket, "Key"), GetParam());
}

TEST_P(EveryValue, GoesWithOthersInOneTable)
{
    TicketAddress const ticket = NewTicket();
    auto const outcomes = tickets.WriteAll(ticket, {{"A", 1}, {"B", GetParam()}, {"C", "c"}});
    EXPECT_EQ(std::count_if(outcomes.begin(), outcomes.end(), [](auto const& each) { return each.IsGood(); }),
              3);
    EXPECT_EQ(*tickets.Read(ticket, "B"), GetParam());
}

INSTANTIATE_TEST_SUITE_P(
    Types, EveryValue,
    testing::Values(Value(-7), Value(0.1), Value("text"), Value(""), Value(Bytes{std::string("\0\xFF", 2)}),
                    Value(1LL << 40), Value(4000000000U), Value(1ULL << 63), Value(Pointer{&errno}),
                    Value(MakeList<int>({1, 2, 3})), Value(MakeList<std::string>({"", "b"})),
                    Value(List{{0, 1}, {1, "two"}, {2, 3.0}}), Value(List{{0, 1}, {5, 2}}),
                    Value(List{{3, 1}, {5, 2}})),
    [](auto const& value) { return NameOf(value.param.Type()) + std::to_string(value.index); });

TEST_F(TicketsOfAClient, Listing_IsInOrder)
{
    TicketAddress const first = NewTicket();
    TicketAddress const second = NewTicket();
    EXPECT_THAT(*tickets.List(JobTickets),
                ElementsAre(TicketAddress{JobTickets, 1}, TicketAddress{JobTickets, 2}, first, second));
    EXPECT_THAT(*tickets.Types(), Contains(JobTickets));
    EXPECT_THAT(*tickets.Types(), Not(Contains(99)));
    EXPECT_THAT(*tickets.List(99), ElementsAre());
}

TEST_F(TicketsOfAClient, Deleted_IsGone)
{
    TicketAddress const ticket = NewTicket();
    EXPECT_TRUE(tickets.Exists(ticket));
    EXPECT_TRUE(tickets.Delete(ticket));
    EXPECT_FALSE(tickets.Exists(ticket));
    EXPECT_EQ(CodeOf(tickets.Delete(ticket)), NoSuchTicket);
    EXPECT_EQ(CodeOf(tickets.Read(ticket, "Key")), NoSuchTicket);
    EXPECT_EQ(CodeOf(tickets.Keys(ticket)), NoSuchTicket);
    EXPECT_EQ(CodeOf(tickets.ReadAll(ticket)), NoSuchTicket);
    EXPECT_EQ(CodeOf(tickets.Write(ticket, "Key", 1)), NoSuchTicket);
    EXPECT_EQ(CodeOf(tickets.ToXml(ticket)), 108);
}

TEST_F(TicketsOfAClient, Keys_HaveTypeAndCount)
{
    TicketAddress const ticket = NewTicket();
    (void)tickets.WriteAll(ticket, {{"B", MakeList<double>({1, 2})}, {"A", "x"}, {"C", List{{4, 1}}}});
    auto const keys = *tickets.Keys(ticket);
    ASSERT_EQ(keys.size(), 3u);
    EXPECT_EQ(keys[0].key, "A");
    EXPECT_EQ(keys[0].type, PARAM_STRING);
    EXPECT_EQ(keys[0].count, 1);
    EXPECT_EQ(keys[1].type, PARAM_COUNT);
    EXPECT_EQ(keys[1].elementType, PARAM_DOUBLE);
    EXPECT_EQ(keys[1].count, 2);
    EXPECT_EQ(keys[2].type, PARAM_COUNT);
    EXPECT_EQ(keys[2].elementType, PARAM_INT);
}

TEST_F(TicketsOfAClient, ReadAs_ConvertsWithoutLoss)
{
    TicketAddress const ticket = NewTicket();
    ASSERT_TRUE(tickets.Write(ticket, "Key", 7LL));
    EXPECT_EQ(*tickets.ReadAs<int>(ticket, "Key"), 7);
    EXPECT_EQ(*tickets.ReadAs<double>(ticket, "Key"), 7.0);
    EXPECT_EQ(*tickets.ReadAs<std::string>(ticket, "Key"), "7");
    EXPECT_EQ(*tickets.ReadAs<std::vector<int>>(ticket, "Key"), std::vector{7});
    ASSERT_TRUE(tickets.Write(ticket, "Key", 1LL << 40));
    EXPECT_EQ(CodeOf(tickets.ReadAs<int>(ticket, "Key")), OutOfRange);
    ASSERT_TRUE(tickets.Write(ticket, "Key", "text"));
    EXPECT_EQ(CodeOf(tickets.ReadAs<int>(ticket, "Key")), WrongType);
    EXPECT_EQ(CodeOf(tickets.ReadAs<int>(ticket, "Other")), NoSuchKey);
}

TEST_F(TicketsOfAClient, OneValueOfAList_IsReadAndWritten)
{
    TicketAddress const ticket = NewTicket();
    ASSERT_TRUE(tickets.Write(ticket, "List", MakeList<int>({1, 2, 3})));
    ASSERT_TRUE(tickets.Write(ticket, "List", 9, 1));
    EXPECT_EQ(*tickets.ReadAs<int>(ticket, "List", 1), 9);
    ASSERT_TRUE(tickets.Write(ticket, "List", Value(), 0));
    EXPECT_EQ(*tickets.Read(ticket, "List"), Value(List{{1, 9}, {2, 3}}));
    EXPECT_EQ(CodeOf(tickets.Read(ticket, "List", 0)), NoSuchKey);
}

TEST_F(TicketsOfAClient, NoValue_DeletesTheKey)
{
    TicketAddress const ticket = NewTicket();
    ASSERT_TRUE(tickets.Write(ticket, "Key", 1));
    EXPECT_TRUE(tickets.Write(ticket, "Key", Value()));
    EXPECT_EQ(CodeOf(tickets.Read(ticket, "Key")), NoSuchKey);
    ASSERT_TRUE(tickets.Write(ticket, "Key", MakeList<int>({1, 2})));
    EXPECT_TRUE(tickets.Write(ticket, "Key", List{}));
    EXPECT_EQ(CodeOf(tickets.Read(ticket, "Key")), NoSuchKey);
}

TEST_F(TicketsOfAClient, ValueThatNoTicketHolds_IsRefusedHere)
{
    TicketAddress const ticket = NewTicket();
    for (Value const& value :
         {Value(List{{0, List{}}}), Value(List{{0, Value()}}), Value(List{{1, 1}, {1, 2}}),
          Value(List{{2, 1}, {1, 2}}), Value(List{{-1, 1}})})
        EXPECT_EQ(CodeOf(tickets.Write(ticket, "Key", value)), NotWritable);
    EXPECT_EQ(CodeOf(tickets.Write(ticket, "Key", MakeList<int>({1}), 0)), NotWritable);
    auto const outcomes = tickets.WriteAll(ticket, {{"A", 1}, {"B", List{{0, List{}}}}, {"C", 3}});
    EXPECT_TRUE(outcomes[0]);
    EXPECT_EQ(CodeOf(outcomes[1]), NotWritable);
    EXPECT_TRUE(outcomes[2]);
    EXPECT_EQ(tickets.ReadAll(ticket)->Entries().size(), 2u);
}

TEST_F(TicketsOfAClient, WriteOfAUserWithoutTheRight_IsRefusedWithAReason)
{
    ASSERT_TRUE(connection.LogIn(Here(), Operator()));
    Outcome const refused = tickets.Write(System, "System/Name", "mine");
    ASSERT_EQ(CodeOf(refused), WriteRefused);
    EXPECT_NE(refused.GetError().reason, "");
    EXPECT_THAT(refused.GetError().Text(), HasSubstr("0/0 System/Name"));
}

// --- texts of users

TEST_F(TicketsOfAClient, TypedText_IsWrittenByTheTypeThatIsThere)
{
    TicketAddress const ticket = NewTicket();
    (void)tickets.WriteAll(ticket, {{"Int", 1}, {"List", MakeList<int>({1, 2})}, {"Text", "x"}});
    EXPECT_TRUE(tickets.WriteText(ticket, "Int", " 42"));
    EXPECT_TRUE(tickets.WriteText(ticket, "List", "3, 4, 5"));
    EXPECT_TRUE(tickets.WriteText(ticket, "Text", "42"));
    EXPECT_EQ(*tickets.Read(ticket, "Int"), Value(42));
    EXPECT_EQ(*tickets.Read(ticket, "List"), Value(MakeList<int>({3, 4, 5})));
    EXPECT_EQ(*tickets.Read(ticket, "Text"), Value("42"));
    EXPECT_TRUE(tickets.WriteText(ticket, "List", "9", 1));
    EXPECT_EQ(*tickets.ReadAs<std::vector<int>>(ticket, "List"), (std::vector{3, 9, 5}));
}

TEST_F(TicketsOfAClient, TypedText_ThatDoesNotFit_WritesNothing)
{
    TicketAddress const ticket = NewTicket();
    (void)tickets.WriteAll(ticket, {{"Int", 1}, {"List", MakeList<int>({1, 2})}});
    EXPECT_EQ(CodeOf(tickets.WriteText(ticket, "Int", "many")), NotANumber);
    EXPECT_EQ(CodeOf(tickets.WriteText(ticket, "Int", "3000000000")), OutOfRange);
    EXPECT_EQ(CodeOf(tickets.WriteText(ticket, "List", "1, \"2")), BadList);
    EXPECT_EQ(CodeOf(tickets.WriteText(ticket, "Other", "1")), NoSuchKey);
    EXPECT_EQ(TextOf(ticket, "Int"), "1");
    EXPECT_EQ(TextOf(ticket, "List"), "1, 2");
}

// --- folder paths

TEST_F(TicketsOfAClient, FolderPath_IsShownResolved_AndWrittenBackWithItsVariable)
{
    TicketAddress const ticket = NewTicket();
    ASSERT_TRUE(tickets.Write(ticket, "File", "$(TEMP)/page.pdf"));
    std::string const shown = TextOf(ticket, "File");
    EXPECT_EQ(shown, (site.Folder() / "temp/page.pdf").string());
    EXPECT_EQ(*tickets.Read(ticket, "File", WholeKey, Paths::AsStored), Value("$(TEMP)/page.pdf"));
    ASSERT_TRUE(tickets.WriteText(ticket, "File", shown));
    EXPECT_EQ(*tickets.Read(ticket, "File", WholeKey, Paths::AsStored), Value("$(TEMP)/page.pdf"));
    ASSERT_TRUE(tickets.Write(ticket, "File", shown, WholeKey, Paths::AsStored));
    EXPECT_EQ(*tickets.Read(ticket, "File", WholeKey, Paths::AsStored), Value(shown));
}

TEST_F(TicketsOfAClient, FolderPaths_InListsAndTables_AreTranslatedToo)
{
    TicketAddress const ticket = NewTicket();
    std::string const temp = tickets.Resolved("$(TEMP)/x");
    (void)tickets.WriteAll(ticket, {{"Files", MakeList<std::string>({temp, "plain", "/elsewhere/x"})}});
    EXPECT_EQ(*tickets.Read(ticket, "Files", WholeKey, Paths::AsStored),
              Value(MakeList<std::string>({"$(TEMP)/x", "plain", "/elsewhere/x"})));
    EXPECT_EQ(*tickets.ReadAll(ticket)->Find("Files"),
              Value(MakeList<std::string>({temp, "plain", "/elsewhere/x"})));
    EXPECT_EQ(tickets.ReadAll(ticket, Paths::AsStored)->Find("Files")->IsList(), true);
    EXPECT_EQ(tickets.Portable(temp), "$(TEMP)/x");
    EXPECT_EQ(tickets.Portable("no path"), "no path");
    EXPECT_EQ(tickets.Resolved("$(UNKNOWN)/x"), "$(UNKNOWN)/x");
}

// --- snapshots

TEST_F(TicketsOfAClient, Snapshots_Differ)
{
    TicketAddress const ticket = NewTicket();
    (void)tickets.WriteAll(ticket, {{"A", 1}, {"B", 2}, {"C", 3}});
    Snapshot const before = *tickets.ReadAll(ticket);
    (void)tickets.WriteAll(ticket, {{"A", Value()}, {"B", "2"}, {"D", 4}});
    auto const difference = Difference(before, *tickets.ReadAll(ticket));
    ASSERT_EQ(difference.size(), 3u);
    EXPECT_EQ(difference[0].key, "A");
    EXPECT_EQ(difference[0].before, Value(1));
    EXPECT_FALSE(difference[0].after);
    EXPECT_EQ(difference[1].before, Value(2));
    EXPECT_EQ(difference[1].after, Value("2"));
    EXPECT_FALSE(difference[2].before);
    EXPECT_EQ(difference[2].key, "D");
    EXPECT_TRUE(Difference(before, before).empty());
}

TEST(SnapshotOfEntries, IsSortedAndSearched)
{
    Snapshot const snapshot({{"b", 2}, {"a", 1}, {"a/b", 3}});
    EXPECT_EQ(snapshot.Entries()[0].key, "a");
    EXPECT_EQ(snapshot.Entries()[2].key, "b");
    EXPECT_EQ(*snapshot.Find("a/b"), Value(3));
    EXPECT_EQ(snapshot.Find("c"), nullptr);
}

TEST_F(TicketsOfAClient, Xml_IsThatOfATicketFile)
{
    TicketAddress const ticket = NewTicket();
    ASSERT_TRUE(tickets.Write(ticket, "Key", "some text"));
    EXPECT_THAT(*tickets.ToXml(ticket), testing::AllOf(HasSubstr("<ticket"), HasSubstr("some text")));
}

TEST_F(TicketsOfAClient, TextWithAZeroByte_IsNoText)
{
    TicketAddress const ticket = NewTicket();
    std::string const text("a\0b", 3);
    EXPECT_EQ(CodeOf(tickets.Write(ticket, "Key", text)), NotWritable);
    EXPECT_EQ(CodeOf(tickets.Write(ticket, "Key", MakeList<std::string>({"a", text}))), NotWritable);
    EXPECT_EQ(CodeOf(tickets.Write(ticket, "Key", text, 0)), NotWritable);
    EXPECT_EQ(CodeOf(tickets.Read(ticket, "Key")), NoSuchKey);
    EXPECT_TRUE(tickets.Write(ticket, "Key", Bytes{text}));
}

TEST_F(TicketsOfAClient, KeyWithAZeroByte_IsNoKey)
{
    TicketAddress const ticket = NewTicket();
    std::string const key("a\0b", 3);
    ASSERT_TRUE(tickets.Write(ticket, "a", 1));
    EXPECT_EQ(CodeOf(tickets.Write(ticket, key, 2)), NotWritable);
    EXPECT_EQ(CodeOf(tickets.WriteAll(ticket, {{key, 2}}).at(0)), NotWritable);
    EXPECT_EQ(CodeOf(tickets.WriteText(ticket, key, "2")), NoSuchKey);
    EXPECT_EQ(CodeOf(tickets.Read(ticket, key)), NoSuchKey);
    EXPECT_EQ(CodeOf(tickets.ReadAs<int>(ticket, key)), NoSuchKey);
    EXPECT_EQ(*tickets.ReadAs<int>(ticket, "a"), 1);
}

TEST_F(TicketsOfAClient, ListReadAsANumber_IsOfTheWrongType)
{
    TicketAddress const ticket = NewTicket();
    auto const isWrong = [&](auto number)
    {
        using T = decltype(number);
        ASSERT_TRUE(tickets.Write(ticket, "List", MakeList<T>({T{7}, T{8}})));
        EXPECT_EQ(CodeOf(tickets.ReadAs<T>(ticket, "List")), WrongType);
        EXPECT_EQ(*tickets.ReadAs<T>(ticket, "List", 0), T{7});
        EXPECT_EQ(*tickets.ReadAs<T>(ticket, "List", 1), T{8});
        ASSERT_TRUE(tickets.Write(ticket, "One", Value(T{9})));
        EXPECT_EQ(*tickets.ReadAs<T>(ticket, "One"), T{9});
    };
    isWrong(1);
    isWrong(1.0);
    isWrong(1LL);
    isWrong(1U);
    isWrong(1ULL);
    isWrong(1L);
    isWrong(1UL);
}

TEST_F(TicketsOfAClient, KeyAndValue_MayBePartsOfTexts)
{
    TicketAddress const ticket = NewTicket();
    std::string_view const both = "Some/Key=a text";
    ASSERT_TRUE(tickets.Write(ticket, both.substr(0, 8), both.substr(9)));
    EXPECT_EQ(*tickets.ReadAs<std::string>(ticket, "Some/Key"), "a text");
    EXPECT_EQ(*tickets.Read(ticket, both.substr(0, 8)), Value("a text"));
    ASSERT_TRUE(tickets.Write(ticket, "Here", Pointer{&errno}));
    EXPECT_EQ(tickets.ReadAs<Pointer>(ticket, "Here")->address, &errno);
}

TEST_F(TicketsOfAClient, ShownText_IsWrittenBackAsWhatWasThere)
{
    TicketAddress const ticket = NewTicket();
    for (Value const& value : {Value(List{{0, 0.5}, {1, 3}}), Value(List{{0, 1}, {1, "two"}}),
                               Value(List{{0, Bytes{"\x01"}}, {4, 2ULL}}), Value(Pointer{&errno}),
                               Value(List{{0, Pointer{&errno}}, {1, "0x1"}})})
    {
        ASSERT_TRUE(tickets.Write(ticket, "Key", value));
        EXPECT_TRUE(tickets.WriteText(ticket, "Key", TextOf(ticket, "Key"))) << ToText(value);
        EXPECT_EQ(*tickets.Read(ticket, "Key"), value);
    }
    EXPECT_EQ(CodeOf(tickets.WriteText(ticket, "Key", "0x2, 0x1")), WrongType);
}

TEST_F(TicketsOfAClient, NewPositionOfATypedList_HasTheTypeBeforeIt)
{
    TicketAddress const ticket = NewTicket();
    ASSERT_TRUE(tickets.Write(ticket, "Key", List{{0, 0.5}, {1, 3}}));
    ASSERT_TRUE(tickets.WriteText(ticket, "Key", "1, 4, 5"));
    EXPECT_EQ(*tickets.Read(ticket, "Key"), Value(List{{0, 1.0}, {1, 4}, {2, 5}}));
    EXPECT_EQ(CodeOf(tickets.WriteText(ticket, "Key", "1, 4.5")), NotANumber);
    ASSERT_TRUE(tickets.Write(ticket, "Key", List{{2, 0.5}, {3, 3}}));
    ASSERT_TRUE(tickets.WriteText(ticket, "Key", "1, , 2, 3"));
    EXPECT_EQ(*tickets.Read(ticket, "Key"), Value(List{{0, 1.0}, {2, 2.0}, {3, 3}}));
}

TEST_F(TicketsOfAClient, TableThatIsRefused_HasTheReasonAtEachKey)
{
    ASSERT_TRUE(connection.LogIn(Here(), Operator()));
    auto const outcomes = tickets.WriteAll(System, {{"System/A", 1}, {"System/B", 2}, {"System/C", 3}});
    ASSERT_EQ(outcomes.size(), 3u);
    for (Outcome const& outcome : outcomes)
    {
        ASSERT_EQ(CodeOf(outcome), WriteRefused);
        EXPECT_NE(outcome.GetError().reason, "");
        EXPECT_EQ(outcome.GetError().reason, outcomes[0].GetError().reason);
    }
    EXPECT_EQ(outcomes[1].GetError().about, "0/0 System/B");
}

TEST_F(TicketsOfAClient, TableForATicketThatIsNotThere_IsRefusedForThat)
{
    TicketAddress const ticket = NewTicket();
    ASSERT_TRUE(tickets.Delete(ticket));
    for (Outcome const& outcome : tickets.WriteAll(ticket, {{"A", 1}, {"B", 2}}))
        EXPECT_EQ(CodeOf(outcome), NoSuchTicket);
}
