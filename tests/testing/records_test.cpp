// Tables of records as values.
#include "comgui/testing.h"
#include <gmock/gmock.h>

using comgui::plugin::Bytes;
using comgui::test::Parameter;
using comgui::test::RecordsOf;
using comgui::test::TextOf;
using comgui::test::Value;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::PrintToString;

namespace
{
SETMULTIPAR Written(char const* key, PARAM_TYPE type, void const* value, int pos = -1)
{
    SETMULTIPAR record{};
    record.key = key;
    record.type = type;
    record.value = value;
    record.pos = pos;
    return record;
}
}  // namespace

TEST(RecordsOfATable, AreItsValues_UpToTheNullKey)
{
    int const number = -7;
    double const real = 0.5;
    long long const large = 1LL << 40;
    unsigned const positive = 7;
    unsigned long long const largest = ~0ULL;
    BIN_STRING const bytes("a\0b", 3);
    int place = 0;
    SETMULTIPAR const table[] = {
        Written("I", PARAM_INT, &number),          Written("D", PARAM_DOUBLE, &real, 0),
        Written("S", PARAM_STRING, "text", -2),    Written("B", PARAM_BINSTRING, &bytes),
        Written("L", PARAM_INT64, &large),         Written("U", PARAM_UNSIGNED, &positive),
        Written("UL", PARAM_UNSIGNED64, &largest), Written("P", PARAM_POINTER, &place),
        Written("N", PARAM_NONE, nullptr, 3),      {}};
    EXPECT_THAT(RecordsOf(table),
                ElementsAre(Parameter{"I", -7, -1}, Parameter{"D", 0.5, 0},
                            Parameter{"S", std::string("text"), -2},
                            Parameter{"B", Bytes{std::string("a\0b", 3)}, -1}, Parameter{"L", large, -1},
                            Parameter{"U", 7u, -1}, Parameter{"UL", ~0ULL, -1},
                            Parameter{"P", static_cast<void*>(&place), -1}, Parameter{"N", {}, 3}));
}

TEST(RecordsOfATable, OfNoTable_AreNone)
{
    EXPECT_THAT(RecordsOf(static_cast<SETMULTIPAR const*>(nullptr)), IsEmpty());
    EXPECT_THAT(RecordsOf(static_cast<GETMULTIPAR const*>(nullptr)), IsEmpty());
}

TEST(RecordsOfATable, ThatWasRead_HaveValuesWhereTheyAreOk)
{
    comgui::test::TicketFake ticket;
    ticket.container.Put(0, 0, "A", 7);
    ticket.container.Put(0, 0, "B", "text");
    int number = 0;
    int missing = 5;
    char const* text = nullptr;
    GETMULTIPAR table[4]{};
    struct
    {
        char const* key;
        PARAM_TYPE type;
        void* place;
    } const wanted[] = {{"A", PARAM_INT, &number}, {"C", PARAM_INT, &missing}, {"B", PARAM_STRING, &text}};
    for (std::size_t i = 0; i < 3; ++i)
    {
        table[i].key = wanted[i].key;
        table[i].type = wanted[i].type;
        table[i].value = wanted[i].place;
        table[i].pos = -1;
    }
    STICKET_ACCESS const* const access = ticket.Access();
    access->SGETMULTIPAR(access->Instance, table);
    EXPECT_THAT(RecordsOf(table), ElementsAre(Parameter{"A", 7, -1}, Parameter{"C", {}, -1},
                                              Parameter{"B", std::string("text"), -1}));
}

TEST(RecordsOfATicket, AreAllItsValues)
{
    comgui::test::TicketFake ticket;
    ticket.container.Put(0, 0, "A", 7);
    ticket.container.Put(0, 0, "L", 1, 0);
    ticket.container.Put(0, 0, "L", 2, 1);
    EXPECT_THAT(RecordsOf(ticket.Access()),
                ElementsAre(Parameter{"A", 7, 0}, Parameter{"L", 1, 0}, Parameter{"L", 2, 1}));
}

TEST(TextOfAValue, TellsTypeAndValue)
{
    EXPECT_EQ(TextOf(Value()), "none");
    EXPECT_EQ(TextOf(3), "int 3");
    EXPECT_EQ(TextOf(0.5), "double 0.5");
    EXPECT_EQ(TextOf(std::string("draft")), "text 'draft'");
    EXPECT_EQ(TextOf(Bytes{std::string("\0\xFF", 2)}), "bytes 00FF");
    EXPECT_EQ(TextOf(3LL), "int64 3");
    EXPECT_EQ(TextOf(3u), "unsigned 3");
    EXPECT_EQ(TextOf(3ULL), "unsigned64 3");
    int place = 0;
    EXPECT_EQ(TextOf(static_cast<void*>(&place)), "pointer");
    EXPECT_EQ(TextOf(static_cast<void*>(nullptr)), "null pointer");
    EXPECT_EQ(PrintToString(Parameter{"Job/Copies", 3, -1}), "Job/Copies[-1]=int 3");
}
