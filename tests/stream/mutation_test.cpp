// Broken streams: every truncation and every change of one byte of small streams, read by the library and by
// the oracle.
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "tests/support/HexText.h"
#include "tests/support/StreamOracle.h"
#include <gtest/gtest.h>

using namespace StreamOracle;

namespace
{
struct SMALL_STREAM
{
    char const* name;
    std::vector<RECORD> records;
};

// Says what it holds instead of its bytes.
void PrintTo(SMALL_STREAM const& stream, std::ostream* out) { *out << stream.name; }

// A vector that is longer than what the reader takes at once, of integers and then doubles.
std::vector<RECORD> ManyNumbers()
{
    std::vector<RECORD> records;
    for (int pos = 0; pos < 66; ++pos)
        records.push_back(Int("n", pos % 7 ? 50 - pos : 40000, pos));
    for (int pos = 66; pos < 133; ++pos)
        records.push_back(Double("n", pos % 9 ? pos / 2.0 : 0.1, pos));
    return records;
}

class BrokenStream : public testing::TestWithParam<SMALL_STREAM>
{
protected:
    // Whether the reading was like the oracle's; false ends the test.
    static bool IsReadLikeTheOracle(std::string const& stream)
    {
        ExactBytes const bytes(stream);
        for (bool const fixPositions : {false, true})
        {
            READING const expected = Decode(stream, fixPositions);
            SETMULTIPAR_LIST list(false);
            bool const isGood = STICKET_BINSTREAM::Read(list, bytes.Data(), bytes.Size(), fixPositions);
            EXPECT_EQ(isGood, expected.isGood) << HexOf(stream);
            EXPECT_EQ(RecordsOf(list.Table(false)), expected.records) << HexOf(stream);
            if (HasFailure())
                return false;
        }
        return true;
    }

    std::string const stream = Encode(GetParam().records).value();
};

INSTANTIATE_TEST_SUITE_P(
    Streams, BrokenStream,
    testing::Values(SMALL_STREAM{"OfTheWholeSet",
                                 {Int("Job/Copies", 3), Text("Job/Name", "A4"), Double("Job/Scale", 1.5),
                                  Int("Job/Tray", 300, 0), Int("Job/Tray", -1, 1), Delete("Job/X")}},
                    SMALL_STREAM{"OfNumbers",
                                 {Int("n", 0, 0), Int("n", 1, 1), Int("n", 1000, 2), Int("n", 100000, 3),
                                  Double("n", 0.5, 4), Double("n", 0.1, 5), Int64("n", 9007199254740993, 6),
                                  Unsigned64("n", 1ull << 63, 7)}},
                    SMALL_STREAM{"OfManyNumbers", ManyNumbers()},
                    SMALL_STREAM{"OfTexts",
                                 {Text("", "under no key"), Text("Texts", "", 0),
                                  Text("Text", "a text of 20 bytes..", 20),
                                  Bytes("Bytes", std::string("a\0b", 3), -2), Bytes("Bytes", "", -2)}},
                    SMALL_STREAM{"OfLongKeys",
                                 {Int(std::string(130, 'k'), 1), Int(std::string(130, 'k') + "a", 2, 0),
                                  Delete("k", 0)}},
                    SMALL_STREAM{"OfAValueWithoutAKey", {Text("", "", -1)}}),
    [](auto const& stream) { return std::string(stream.param.name); });
}  // namespace

TEST_P(BrokenStream, Whole_IsGood)
{
    EXPECT_TRUE(Decode(stream, false).isGood);
    EXPECT_TRUE(IsReadLikeTheOracle(stream));
}

TEST_P(BrokenStream, CutAnywhere_IsReadAsFarAsItGoes)
{
    for (std::size_t size = 0; size <= stream.size(); ++size)
        if (!IsReadLikeTheOracle(stream.substr(0, size)))
            return;
}

TEST_P(BrokenStream, OneByteChanged_IsReadLikeTheOracle)
{
    std::string changed = stream;
    for (std::size_t at = 0; at < stream.size(); ++at)
    {
        for (int byte = 0; byte < 256; ++byte)
        {
            changed[at] = static_cast<char>(byte);
            if (!IsReadLikeTheOracle(changed))
                return;
        }
        changed[at] = stream[at];
    }
}

TEST_P(BrokenStream, OneByteLost_IsReadLikeTheOracle)
{
    for (std::size_t at = 0; at < stream.size(); ++at)
        if (!IsReadLikeTheOracle(stream.substr(0, at) + stream.substr(at + 1)))
            return;
}
