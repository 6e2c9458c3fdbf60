#include "comgui/stream/MTICKET_BINSTREAM.h"

#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "tests/stream/ContainerBytes.h"
#include "tests/support/HexText.h"
#include <gtest/gtest.h>
#include <set>
#include <sys/resource.h>

namespace
{
std::string const GoodTicket = "\x09STICKET_1\x01"
                               "a\x41\x07";
std::string const GoodTable = PartialHeader + "Job/*\0"s;

bool Checked(std::string const& bytes)
{
    ExactBytes const block(bytes);
    return MTICKET_BINSTREAM::Check(block.Data(), block.Size());
}

// Walks to the end as a client would, reading every payload in either way. Whether all that had to be good
// was; a sanitizer sees whatever lies outside of the block.
bool WalksToTheEnd(std::string const& bytes)
{
    ExactBytes const block(bytes);
    MTICKET_BINSTREAM::Read reader(block.Data(), block.Size(), true);
    SETMULTIPAR_LIST list(false);
    for (;;)
    {
        int type;
        int id;
        TICKET_OP op = STICKET_OP_INVALID;
        auto const result = reader.ParseOperation(type, id, op);
        if (result != MTICKET_BINSTREAM::GET_TICKET_OK)
            return result == MTICKET_BINSTREAM::GET_TICKET_END;
        auto const parameters = reader.GetSetMultipar(list);
        char const* const* keys = nullptr;
        auto const table = reader.GetPartialTable(keys);
        if (op.GetInt() == STICKET_OP_SET_MULTIPAR && parameters != MTICKET_BINSTREAM::GET_TICKET_OK)
            return false;
        if (op.GetInt() == STICKET_OP_SET_PARTIAL && table != MTICKET_BINSTREAM::GET_TICKET_OK)
            return false;
    }
}

long PeakKilobytes()
{
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_maxrss;
}
}  // namespace

TEST(Check, NoBytes_AreGood)
{
    EXPECT_TRUE(Checked(""));
    EXPECT_TRUE(MTICKET_BINSTREAM::Check(nullptr, 0));
}

TEST(Check, NullWithASize_IsNot) { EXPECT_FALSE(MTICKET_BINSTREAM::Check(nullptr, 100)); }

TEST(Check, SignatureAlone_IsGood) { EXPECT_TRUE(Checked(Signature)); }

TEST(Check, NoSignature_IsNot)
{
    EXPECT_FALSE(Checked("M"));
    EXPECT_FALSE(Checked("MTICKET_2"));
    EXPECT_FALSE(Checked(GoodTicket));
}

TEST(Check, EveryPrefixOfAGoodStream_IsGoodBetweenOperationsOnly)
{
    std::set<unsigned long> ends = {0, Signature.size()};
    std::string stream = Signature;
    for (std::string const& operation : {Operation(106), Operation(98, GoodTicket), Operation(3, GoodTable),
                                         Operation(105, GoodTable), Operation(98), Operation(3)})
        ends.insert((stream += operation).size());
    for (unsigned long size = 0; size <= stream.size(); ++size)
        EXPECT_EQ(Checked(stream.substr(0, size)), ends.count(size) == 1) << size;
    EXPECT_TRUE(WalksToTheEnd(stream));
}

TEST(Check, EverySingleBitChange_IsRefusedOrWalksToTheEnd)
{
    std::string const stream =
        Signature + Operation(98, GoodTicket) + Operation(3, GoodTable) + Operation(106);
    ASSERT_TRUE(Checked(stream));
    int refused = 0;
    for (unsigned long bit = 0; bit < stream.size() * 8; ++bit)
    {
        std::string changed = stream;
        changed[bit / 8] = static_cast<char>(changed[bit / 8] ^ 1 << bit % 8);
        if (!Checked(changed))
            ++refused;
        else
            EXPECT_TRUE(WalksToTheEnd(changed)) << bit;
    }
    EXPECT_GT(refused, 0);
}

TEST(Check, NegativePayloadSizes_AreNotGood)
{
    for (int const size : {-1, -16, -25, -32, -2147483647 - 1})
        EXPECT_FALSE(Checked(Signature + Operation(106) + Operation(106, "", size))) << size;
}

TEST(Check, PayloadSizeBeyondTheEnd_IsNotGood)
{
    EXPECT_FALSE(Checked(Signature + Operation(106, "abc", 4)));
    EXPECT_FALSE(Checked(Signature + Operation(106, "abc", 0x7FFFFFFF)));
    EXPECT_TRUE(Checked(Signature + Operation(106, "abc", 3)));
}

TEST(Check, CodesThatTheReaderRefuses_AreNotGood)
{
    for (int const code : {-1, 0, 1, 10, 99, 102, 107})
        EXPECT_FALSE(Checked(Signature + Operation(code))) << code;
}

TEST(Check, ParametersThatCannotBeRead_AreNotGood)
{
    EXPECT_TRUE(Checked(Signature + Operation(98, GoodTicket)));
    EXPECT_FALSE(Checked(Signature + Operation(98, GoodTicket + "\xE5")));
    EXPECT_FALSE(Checked(Signature + Operation(98, GoodTable)));
    EXPECT_FALSE(Checked(Signature + Operation(98, GoodTicket + "\xE5") + Operation(106)));
}

TEST(Check, TablesOfKeysThatCannotBeRead_AreNotGood)
{
    EXPECT_TRUE(Checked(Signature + Operation(3, GoodTable)));
    EXPECT_TRUE(Checked(Signature + Operation(3, "no zero byte")));  // as GetPartialTable has it
    EXPECT_FALSE(Checked(Signature + Operation(3, "another text\0"s)));
    EXPECT_FALSE(Checked(Signature + Operation(3, GoodTicket + "\0"s)));
}

TEST(Check, PayloadsOfOtherCodes_MayBeAnything)
{
    for (int const code : {2, 7, 105, 106, 108})
        for (std::string const& payload : {""s, GoodTable, GoodTicket, GoodTicket + "\xE5", "text\0"s})
            EXPECT_TRUE(Checked(Signature + Operation(code, payload))) << code << payload;
}

// As a list they would take about a gigabyte: each key is 16000 bytes, told in five.
TEST(Check, KeysThatExpandToAGigabyte_TakeLittleMemory)
{
    std::string ticket = "\x09STICKET_1\x18\0\x3E\x80"s + std::string(16000, 'a') + "\x40";
    for (int key = 0; key < 0x10000; ++key)
        ticket += {'\x24', '\xBE', '\x80', static_cast<char>(key >> 8), static_cast<char>(key), '\x40'};
    std::string const stream = Signature + Operation(98, ticket);
    long const before = PeakKilobytes();
    EXPECT_TRUE(MTICKET_BINSTREAM::Check(stream.data(), stream.size()));
    EXPECT_LT(PeakKilobytes() - before, 50000);
}

TEST(TicketCheck, Answer_IsThatOfRead)
{
    std::string const good = "\x09STICKET_1\x01"
                             "a\xA2\x41\x07\x40\x42\1\2\x21\x01\x62xy\x82\0\1\x44\1\2\3\4\x45i\1\2\3\4"
                             "\x48\1\2\3\4\5\6\7\x08\x49"
                             "d\1\2\3\4\5\6\7\x08\xC0"s;
    ASSERT_TRUE(STICKET_BINSTREAM::Check(good.data(), good.size()));
    ASSERT_TRUE(STICKET_BINSTREAM::Check(nullptr, 0));
    auto const isSame = [](std::string const& bytes)
    {
        ExactBytes const block(bytes);
        SETMULTIPAR_LIST list(false);
        return STICKET_BINSTREAM::Check(block.Data(), block.Size()) ==
               STICKET_BINSTREAM::Read(list, block.Data(), block.Size(), false);
    };
    for (unsigned long size = 0; size <= good.size(); ++size)
        EXPECT_TRUE(isSame(good.substr(0, size))) << size;
    for (unsigned long bit = 0; bit < good.size() * 8; ++bit)
    {
        std::string changed = good;
        changed[bit / 8] = static_cast<char>(changed[bit / 8] ^ 1 << bit % 8);
        EXPECT_TRUE(isSame(changed)) << bit;
    }
}
