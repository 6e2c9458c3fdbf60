#include "desk/model/TicketStream.h"

#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/testing/TicketFake.h"
#include "comgui/ticket/BIN_STRING.h"
#include "desk/model/FileContent.h"
#include "tests/desk/FileFacts.h"
#include "tests/support/HexText.h"
#include <gtest/gtest.h>

using comgui::test::TicketFake;

using namespace comgui;
using namespace desk;

namespace
{
std::string StreamIn(FileResult<std::string> const& result) { return std::get<std::string>(result); }

std::string HexOfTicket(std::vector<SnapshotEntry> entries)
{
    return HexOf(StreamIn(StreamOf(Snapshot(std::move(entries)))));
}

// In a block of exactly its size.
FileResult<Snapshot> Read(std::string_view stream)
{
    ExactBytes const bytes(stream);
    return TicketOfStream({static_cast<char const*>(bytes.Data()), bytes.Size()}, "job.stream");
}

std::string const Head = "09 53 54 49 43 4B 45 54 5F 31 ";  // the signature

FileResult<Snapshot> ReadHex(std::string const& items) { return Read(BytesOf(Head + items)); }

Value OnlyValueOf(std::string const& items)
{
    auto const read = ReadHex(items);
    return std::get<Snapshot>(read).Entries().at(0).value;
}
}  // namespace

TEST(TicketStream, IsWhatTheLibraryWritesOfATicket)
{
    TicketFake fake;
    auto const* const access = fake.Access();
    int const copies = 3;
    double const scale = 1.5;
    unsigned long long const serial = 1ULL << 63;
    BIN_STRING const mark("\0x", 2);
    SETMULTIPAR table[] = {{"Job/Copies", PARAM_INT, 0, &copies, -1, false, {}},
                           {"Job/Inks", PARAM_STRING, 0, "Cyan", -1, false, {}},
                           {"Job/Inks", PARAM_STRING, 0, "Black", 1, false, {}},
                           {"Job/Inks", PARAM_STRING, 0, "Spot", 5, false, {}},
                           {"Job/Mark", PARAM_BINSTRING, 0, &mark, -1, false, {}},
                           {"Job/Scale", PARAM_DOUBLE, 0, &scale, -1, false, {}},
                           {"Job/Serial", PARAM_UNSIGNED64, 0, &serial, -1, false, {}},
                           {}};
    ASSERT_NE(access->SSETMULTIPAR(access->Instance, table), 0);
    std::string expected;
    ASSERT_GT(STICKET_BINSTREAM::Write(expected, access, 0), 60U);
    Snapshot const same({{"Job/Copies", copies},
                         {"Job/Inks", comgui::List{{0, "Cyan"}, {1, "Black"}, {5, "Spot"}}},
                         {"Job/Mark", Bytes{std::string("\0x", 2)}},
                         {"Job/Scale", scale},
                         {"Job/Serial", serial}});
    EXPECT_EQ(HexOf(StreamIn(StreamOf(same))), HexOf(expected));
}

TEST(TicketStream, ReadsBackWhatItWrote)
{
    auto const read = Read(StreamIn(StreamOf(PlainTicket())));
    ASSERT_EQ(TroubleOf(read), std::nullopt) << FaultOf(read).detail;
    for (auto const& difference : Difference(PlainTicket(), std::get<Snapshot>(read)))
        ADD_FAILURE() << difference.key;
}

TEST(TicketStream, OfNothing_HasNoBytes) { EXPECT_EQ(HexOfTicket({}), ""); }

TEST(TicketStream, WhatItCannotHold_IsLeftOut)
{
    int here = 0;
    EXPECT_EQ(HexOfTicket({{"a", Pointer{&here}},
                           {"b", Value()},
                           {"c", comgui::List{}},
                           {"d", comgui::List{{0, comgui::List{{0, 1}}}}},
                           {"e", comgui::List{{-1, 1}, {-2, 2}, {LargestPosition + 1, 3}}},
                           {"", 1},
                           {std::string("f\0g", 3), 1},
                           {std::string(LongestKey + 1, 'h'), 1}}),
              "");
}

TEST(TicketStream, PositionsOutOfOrder_AreLeftOut)
{
    EXPECT_EQ(HexOfTicket({{"a", comgui::List{{3, 1}, {3, 2}, {2, 3}, {4, 4}}}}),
              Head + "01 61 A5 41 01 41 04");
}

TEST(TicketStream, LargerThanAFileMayBe_IsRefused)
{
    std::string const half(LargestFile / 2, 'x');
    EXPECT_EQ(TroubleOf(StreamOf(Snapshot({{"a", half}}))), std::nullopt);
    EXPECT_EQ(TroubleOf(StreamOf(Snapshot({{"a", half}, {"b", half}}))), FileTrouble::TooLarge);
    EXPECT_EQ(TroubleOf(StreamOf(Snapshot({{"a", Bytes{half + half + "x"}}}))), FileTrouble::TooLarge);
}

TEST(TicketStream, APlainValue_StandsAtAnyFirstPosition)
{
    EXPECT_EQ(OnlyValueOf("01 61 41 05"), Value(5));     // -1
    EXPECT_EQ(OnlyValueOf("01 61 A2 41 05"), Value(5));  // 0
    EXPECT_EQ(OnlyValueOf("01 61 A3 41 05"), Value(comgui::List{{1, 5}}));
}

TEST(TicketStream, AKeyThatComesTwice_TakesTheLaterValue)
{
    EXPECT_EQ(OnlyValueOf("01 61 41 05 01 61 41 06"), Value(6));
}

struct NUMBER_FACT
{
    char const* name;
    char const* item;
    Value value;
};
class StreamNumber : public testing::TestWithParam<NUMBER_FACT>
{
};
TEST_P(StreamNumber, IsThat)
{
    EXPECT_EQ(OnlyValueOf(std::string("01 61 ") + GetParam().item), GetParam().value);
}
INSTANTIATE_TEST_SUITE_P(Facts, StreamNumber,
                         testing::Values(NUMBER_FACT{"Zero", "40", 0}, NUMBER_FACT{"Int8", "41 FF", -1},
                                         NUMBER_FACT{"Int16", "42 80 00", -32768},
                                         NUMBER_FACT{"Int32", "44 00 01 00 00", 65536},
                                         NUMBER_FACT{"Single", "45 69 3F C0 00 00", 1.5},
                                         NUMBER_FACT{"Double", "48 3F F8 00 00 00 00 00 00", 1.5},
                                         NUMBER_FACT{"Infinity", "48 7F F0 00 00 00 00 00 00", std::nan("")},
                                         NUMBER_FACT{"Int64", "49 64 80 00 00 00 00 00 00 00",
                                                     std::numeric_limits<long long>::min()},
                                         NUMBER_FACT{"Unsigned64", "49 75 FF FF FF FF FF FF FF FF",
                                                     std::numeric_limits<unsigned long long>::max()},
                                         NUMBER_FACT{"LongTag", "58 00 00 01 07", 7}),
                         [](auto const& fact) { return std::string(fact.param.name); });

struct BROKEN_FACT
{
    char const* name;
    char const* items;
    FileTrouble trouble;
    std::size_t byte;  // where the wrong item begins
};
class BrokenStream : public testing::TestWithParam<BROKEN_FACT>
{
};
TEST_P(BrokenStream, IsRefusedWithItsPlace)
{
    auto const [name, items, trouble, byte] = GetParam();
    auto const read = ReadHex(items);
    ASSERT_EQ(TroubleOf(read), trouble);
    EXPECT_EQ(FaultOf(read).byte, byte);
    EXPECT_EQ(FaultOf(read).line, std::nullopt);
    EXPECT_EQ(FaultOf(read).file, "job.stream");
}
INSTANTIATE_TEST_SUITE_P(
    Facts, BrokenStream,
    testing::Values(BROKEN_FACT{"UnknownClass", "01 61 41 05 E0", FileTrouble::BrokenStream, 14},
                    BROKEN_FACT{"CutValue", "01 61 62 41", FileTrouble::BrokenStream, 12},
                    BROKEN_FACT{"CutKey", "05 61", FileTrouble::BrokenStream, 10},
                    BROKEN_FACT{"CutTag", "01 61 58 00", FileTrouble::BrokenStream, 12},
                    BROKEN_FACT{"HugeText", "01 61 7F FF FF FF", FileTrouble::BrokenStream, 12},
                    BROKEN_FACT{"UnknownForm", "01 61 43 00 00 00", FileTrouble::BrokenStream, 12},
                    BROKEN_FACT{"UnknownLetter", "01 61 49 78 00 00 00 00 00 00 00 00",
                                FileTrouble::BrokenStream, 12},
                    BROKEN_FACT{"CompressedKeyWithoutShare", "01 61 20", FileTrouble::BrokenStream, 12},
                    BROKEN_FACT{"Deletion", "01 61 41 05 C0", FileTrouble::HoldsDeletion, 14},
                    BROKEN_FACT{"Append", "01 61 A0 41 05", FileTrouble::BadPosition, 13},
                    BROKEN_FACT{"FarPosition", "01 61 B9 00 00 02 41 05", FileTrouble::BadPosition, 16},
                    BROKEN_FACT{"EmptyKey", "00 41 05", FileTrouble::BadKey, 11},
                    BROKEN_FACT{"ZeroByteInKey", "03 61 00 62 41 05", FileTrouble::BadKey, 14},
                    BROKEN_FACT{"ZeroByteInText", "01 61 63 61 00 62", FileTrouble::BadText, 12}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(TicketStream, WithoutTheSignature_IsBroken)
{
    EXPECT_EQ(TroubleOf(Read("")), FileTrouble::Empty);
    EXPECT_EQ(FaultOf(Read("hello")).byte, 0U);
    EXPECT_EQ(TroubleOf(Read(BytesOf("09 53 54 49 43 4B 45 54 5F 32"))), FileTrouble::BrokenStream);
}

TEST(TicketStream, OfASignatureAlone_IsATicketWithNothingInIt)
{
    EXPECT_TRUE(std::get<Snapshot>(ReadHex("")).Entries().empty());
}

TEST(TicketStream, CutAnywhere_IsBrokenOrHasTheFirstValues)
{
    std::string const stream = StreamIn(StreamOf(PlainTicket()));
    std::size_t broken = 0;
    for (std::size_t size = 1; size < stream.size(); ++size)
    {
        auto const read = Read(stream.substr(0, size));
        // The library's reader has the last word on what is a stream.
        ASSERT_EQ(TroubleOf(read).has_value(), !STICKET_BINSTREAM::Check(stream.data(), size)) << size;
        if (TroubleOf(read))
            ++broken;
        else
            ASSERT_LE(std::get<Snapshot>(read).Entries().size(), PlainTicket().Entries().size());
    }
    EXPECT_GT(broken, stream.size() / 2);
}

TEST(TicketStream, WithAnyBitChanged_IsReadOrRefused)
{
    std::string const stream = StreamIn(StreamOf(PlainTicket()));
    std::size_t refused = 0;
    for (std::size_t bit = 0; bit < 8 * std::min<std::size_t>(stream.size(), 600); ++bit)
    {
        std::string changed = stream;
        changed[bit / 8] = static_cast<char>(changed[bit / 8] ^ (1 << bit % 8));
        auto const read = Read(changed);
        bool const isStream = STICKET_BINSTREAM::Check(changed.data(), changed.size());
        ASSERT_TRUE(isStream || TroubleOf(read)) << bit;
        refused += TroubleOf(read) ? 1 : 0;
    }
    EXPECT_GT(refused, 100U);
}

TEST(TicketStream, AKeyThatGrowsWithoutEnd_IsRefused)
{
    // Each item shares all of the key before, and adds 15 bytes.
    std::string stream = BytesOf(Head + "01 61");
    for (int i = 0; i < 100000; ++i)
        stream += BytesOf("30 13 FF FF FF FF") + std::string(15, 'k');
    EXPECT_EQ(TroubleOf(Read(stream)), FileTrouble::BadKey);
}

TEST(TicketStream, ALongKeyRepeatedWithoutEnd_IsRefused)
{
    std::string stream = BytesOf(Head + "18 00 EA 60") + std::string(60000, 'k');
    for (int i = 0; i < 1000000; ++i)
        stream += "\x24\xFF\xFF\xFF\xFF";  // shares everything
    EXPECT_EQ(TroubleOf(Read(stream)), FileTrouble::TooLarge);
}

TEST(TicketStream, ManyValuesOfAByte_AreRefusedBeforeTheyFillTheMemory)
{
    std::string const stream = BytesOf(Head + "01 61 A2") + std::string(8 << 20, '\x40');
    EXPECT_EQ(TroubleOf(Read(stream)), FileTrouble::TooLarge);
}

TEST(TicketStream, OfHundredThousandKeys_ComesBack)
{
    std::vector<SnapshotEntry> entries;
    for (int i = 0; i < 100000; ++i)
        entries.push_back({"Key/" + std::to_string(1000000 + i), i});
    Snapshot const ticket(std::move(entries));
    auto const read = Read(StreamIn(StreamOf(ticket)));
    ASSERT_EQ(TroubleOf(read), std::nullopt);
    EXPECT_TRUE(Difference(ticket, std::get<Snapshot>(read)).empty());
}
