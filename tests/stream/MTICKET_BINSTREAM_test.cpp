#include "comgui/stream/MTICKET_BINSTREAM.h"

#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "tests/stream/ContainerBytes.h"
#include "tests/support/HexText.h"
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <vector>

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
constexpr auto OK = MTICKET_BINSTREAM::GET_TICKET_OK;
constexpr auto END = MTICKET_BINSTREAM::GET_TICKET_END;
constexpr auto ERROR = MTICKET_BINSTREAM::GET_TICKET_ERROR;

int Detected(std::string const& bytes)
{
    ExactBytes const block(bytes);
    return MTICKET_BINSTREAM::Detect(block.Data(), block.Size());
}

std::string Taken(MTICKET_BINSTREAM::Write& writer)
{
    std::string out;
    writer.GetAndClear(out);
    return out;
}

// The stream of two records, "a" at -1 and the vector "b" at 0 and 1.
std::string TicketStream()
{
    SETMULTIPAR_LIST list(false);
    list.SetParameter("a", 7, -1);
    list.SetParameter("b", 8, 0);
    list.SetParameter("b", 9, 1);
    std::string stream;
    STICKET_BINSTREAM::Write(stream, list.Table(false), 0);
    return stream;
}

std::vector<std::string> Records(SETMULTIPAR_LIST& list)
{
    std::vector<std::string> records;
    for (SETMULTIPAR const* record = list.Table(false); record && record->key; ++record)
        records.push_back(std::string(record->key) + " " + std::to_string(record->pos));
    return records;
}

// A reader over bytes of its own, and what its last call told.
class Walk
{
public:
    explicit Walk(std::string const& bytes, bool fixPositions = false)
        : m_block(bytes), reader(m_block.Data(), m_block.Size(), fixPositions)
    {
    }

    MTICKET_BINSTREAM::eGetTicketResult Next() { return reader.ParseOperation(type, id, op); }

    MTICKET_BINSTREAM::eGetTicketResult Keys()
    {
        keys.clear();
        char const* const* table = nullptr;
        auto const result = reader.GetPartialTable(table);
        isNull = table == nullptr;
        for (; table && *table; ++table)
            keys.push_back(*table);
        return result;
    }

private:
    ExactBytes m_block;

public:
    MTICKET_BINSTREAM::Read reader;
    int type = 42;
    int id = 42;
    TICKET_OP op = STICKET_OP_WHOAMI;  // one that never comes out of a stream
    std::vector<std::string> keys;
    bool isNull = false;
};

// What GetPartialTable makes of a payload.
struct TABLE
{
    MTICKET_BINSTREAM::eGetTicketResult result;
    std::vector<std::string> keys;
    bool isNull;
};

TABLE TableOf(std::string const& payload)
{
    Walk walk(Signature + Operation(3, payload));
    EXPECT_EQ(walk.Next(), OK);
    auto const result = walk.Keys();
    return {result, walk.keys, walk.isNull};
}
}  // namespace

TEST(Detect, Null_IsNeither) { EXPECT_EQ(MTICKET_BINSTREAM::Detect(nullptr, 100), 0); }

TEST(Detect, NoBytes_AreNeither) { EXPECT_EQ(Detected(""), 0); }

TEST(Detect, ContainerSignature_Is2)
{
    EXPECT_EQ(Detected("MTICKET_1"), 2);
    EXPECT_EQ(Detected("MTICKET_1 and more"), 2);
}

TEST(Detect, ContainerSignatureCutOrChanged_IsNeither)
{
    EXPECT_EQ(Detected("MTICKET_"), 0);
    EXPECT_EQ(Detected("MTICKET_2 and more"), 0);
}

TEST(Detect, TicketSignatureWithItsTag_Is1)
{
    EXPECT_EQ(Detected("\x09STICKET_1"), 1);
    EXPECT_EQ(Detected(TicketStream()), 1);
}

TEST(Detect, TicketSignatureCutOrChanged_IsNeither)
{
    EXPECT_EQ(Detected("\x09STICKET_"), 0);
    EXPECT_EQ(Detected("\x09STICKET_2"), 0);
    EXPECT_EQ(Detected("STICKET_1 without its tag"), 0);
}

TEST(ContainerWrite, Nothing_GivesNoBytes)
{
    MTICKET_BINSTREAM::Write writer(0);
    EXPECT_EQ(Taken(writer), "");
}

TEST(ContainerWrite, VoidOperation_IsSignatureAndFourNumbers)
{
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutVoidOperation(5, 1, MTICKET_OP_DELETE);
    EXPECT_EQ(Taken(writer), "MTICKET_1"
                             "\0\0\0\x05"
                             "\0\0\0\x01"
                             "\0\0\0\x6A"
                             "\0\0\0\0"s);
}

TEST(ContainerWrite, Signature_IsWrittenOnce)
{
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutVoidOperation(5, 1, MTICKET_OP_DELETE);
    writer.PutOperation(5, 1, STICKET_OP_SET_PARTIAL, "pay\0load"s);
    EXPECT_EQ(Taken(writer), Signature + Operation(106) + Operation(3, "pay\0load"s));
}

TEST(ContainerWrite, NegativeNumbers_AreWrittenInTwosComplement)
{
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutVoidOperation(-1, -4, MTICKET_OP_DELETE);
    EXPECT_EQ(Taken(writer), Signature + "\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFC\0\0\0\x6A\0\0\0\0"s);
}

TEST(ContainerWrite, LargePayload_HasItsSizeInFourBytes)
{
    MTICKET_BINSTREAM::Write writer(0);
    std::string const payload(0x012345, 'x');
    writer.PutOperation(5, 1, MTICKET_OP_DELETE, payload);
    EXPECT_EQ(Taken(writer), Signature + Number(5) + Number(1) + Number(106) + "\0\x01\x23\x45"s + payload);
}

TEST(ContainerWrite, AnyCode_IsWritten)
{
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutVoidOperation(5, 1, MTICKET_OP_OPEN);
    EXPECT_EQ(Taken(writer), Signature + Operation(102));
}

TEST(ContainerWrite, ParameterTable_BecomesATicketStream)
{
    SETMULTIPAR_LIST list(false);
    list.SetParameter("a", 7, -1);
    list.xSetParameter("p", PARAM_POINTER, &list, -1);
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutSetMultipar(5, 1, list.Table(false), 100);
    EXPECT_EQ(Taken(writer), Signature + Operation(98, "\x09STICKET_1\x01"
                                                       "a\x41\x07"));
    EXPECT_TRUE(list.Table(false)[0].ok);
    EXPECT_FALSE(list.Table(false)[1].ok);
}

TEST(ContainerWrite, EmptyOrNullParameterTable_AddsNothing)
{
    SETMULTIPAR terminator{};
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutSetMultipar(5, 1, &terminator, 0);
    writer.PutSetMultipar(5, 1, nullptr, 0);
    EXPECT_EQ(Taken(writer), "");
    writer.PutVoidOperation(5, 1, MTICKET_OP_DELETE);
    writer.PutSetMultipar(5, 1, &terminator, 0);
    EXPECT_EQ(Taken(writer), Signature + Operation(106));
}

TEST(ContainerWrite, ParameterTableThatCannotBeWritten_AddsNothing)
{
    SETMULTIPAR_LIST list(false);
    list.SetParameter("a", 7, -1);
    list.SetParameter("a", 7, -3);
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutSetMultipar(5, 1, list.Table(false), 0);
    EXPECT_EQ(Taken(writer), "");
    EXPECT_FALSE(list.Table(false)[1].ok);
}

TEST(ContainerWrite, TicketStream_IsTakenAsItIs)
{
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutSetMultipar(5, 1, "any bytes"s);
    writer.PutSetMultipar(5, 1, ""s);
    EXPECT_EQ(Taken(writer), Signature + Operation(98, "any bytes"));
}

TEST(ContainerWrite, KeyTable_IsARowOfTextsUnderTheCallersCode)
{
    char const* const keys[] = {"Job/*", "", "System/Use", nullptr};
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutPartialTableOperation(5, 1, STICKET_OP_SET_PARTIAL, keys);
    EXPECT_EQ(Taken(writer), Signature + Operation(3, PartialHeader + "Job/*\0\0System/Use\0"s));
}

TEST(ContainerWrite, NullOrEmptyKeyTable_IsTheHeaderAlone)
{
    char const* const keys[] = {nullptr};
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutPartialTableOperation(5, 1, MTICKET_OP_DELETE, nullptr);
    writer.PutPartialTableOperation(5, 1, MTICKET_OP_DELETE, keys);
    EXPECT_EQ(Taken(writer), Signature + Operation(106, PartialHeader) + Operation(106, PartialHeader));
    EXPECT_EQ(PartialHeader.size(), 17u);
}

TEST(ContainerWrite, GetAndClear_BeginsANewStream)
{
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutVoidOperation(5, 1, MTICKET_OP_DELETE);
    EXPECT_EQ(Taken(writer), Signature + Operation(106));
    EXPECT_EQ(Taken(writer), "");
    writer.PutVoidOperation(5, 1, MTICKET_OP_DELETE);
    EXPECT_EQ(Taken(writer), Signature + Operation(106));
}

TEST(ContainerWrite, GetAndClear_DropsWhatItGotInReturn)
{
    MTICKET_BINSTREAM::Write writer(0);
    std::string out = "old contents";
    writer.GetAndClear(out);
    EXPECT_EQ(out, "");
    EXPECT_EQ(Taken(writer), "");
}

TEST(ContainerWrite, Reserve_IsMadeForEachStream)
{
    MTICKET_BINSTREAM::Write writer(10000);
    EXPECT_GE(Taken(writer).capacity(), 10000u);
    EXPECT_GE(Taken(writer).capacity(), 10000u);
}

TEST(ContainerWrite, PutUnsigned_AppendsFourBytes)
{
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutVoidOperation(5, 1, MTICKET_OP_DELETE);
    writer.PutUnsigned(0x01020304);
    EXPECT_EQ(Taken(writer), Signature + Operation(106) + "\x01\x02\x03\x04");
}

TEST(ContainerWrite, FirstOperation_ReplacesBytesPutBefore_ByDesign)
{
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutUnsigned(0x01020304);
    writer.PutVoidOperation(5, 1, MTICKET_OP_DELETE);
    EXPECT_EQ(Taken(writer), Signature + Operation(106));
}

TEST(ParseOperation, NoBytes_AreTheEnd)
{
    EXPECT_EQ(Walk("").Next(), END);
    int type;
    int id;
    TICKET_OP op = STICKET_OP_INVALID;
    EXPECT_EQ(MTICKET_BINSTREAM::Read(nullptr, 0, false).ParseOperation(type, id, op), END);
}

TEST(ParseOperation, NoSignature_IsAnError)
{
    EXPECT_EQ(Walk("MTICK").Next(), ERROR);
    EXPECT_EQ(Walk("MTICKET_").Next(), ERROR);
    EXPECT_EQ(Walk("twenty bytes of text").Next(), ERROR);
    EXPECT_EQ(Walk("MTICKET_2" + Operation(106)).Next(), ERROR);
    EXPECT_EQ(Walk(TicketStream()).Next(), ERROR);
}

TEST(ParseOperation, NoSignature_StaysAnError)
{
    Walk walk("twenty bytes of text");
    EXPECT_EQ(walk.Next(), ERROR);
    EXPECT_EQ(walk.Next(), ERROR);
    EXPECT_EQ(walk.type, -1);
    EXPECT_EQ(walk.id, -1);
}

TEST(ParseOperation, SignatureAlone_IsTheEnd)
{
    Walk walk(Signature);
    EXPECT_EQ(walk.Next(), END);
    EXPECT_EQ(walk.type, -1);
    EXPECT_EQ(walk.id, -1);
    EXPECT_EQ(walk.op.GetInt(), STICKET_OP_WHOAMI);
}

TEST(ParseOperation, Operations_ComeOneAfterTheOther)
{
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutVoidOperation(3, 70000, MTICKET_OP_DELETE);
    writer.PutSetMultipar(-1, -4, TicketStream());
    Walk walk(Taken(writer));
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.type, 3);
    EXPECT_EQ(walk.id, 70000);
    EXPECT_EQ(walk.op.GetInt(), MTICKET_OP_DELETE);
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.type, -1);
    EXPECT_EQ(walk.id, -4);
    EXPECT_EQ(walk.op.GetInt(), STICKET_OP_SET_MULTIPAR);
    EXPECT_EQ(walk.Next(), END);
    EXPECT_EQ(walk.type, -1);
    EXPECT_EQ(walk.id, -1);
}

TEST(ParseOperation, CodesThatTravelInStreams_AreAccepted)
{
    for (int const code : {2, 3, 7, 98, 105, 106, 108})
    {
        Walk walk(Signature + Operation(code));
        EXPECT_EQ(walk.Next(), OK) << code;
        EXPECT_EQ(walk.op.GetInt(), code);
    }
}

TEST(ParseOperation, OtherCodes_AreErrors)
{
    std::vector<int> codes = {-1, 1 << 30, 2 << 24, 99, 102, 104, 107, 110, 256 + 106};
    for (int code = 0; code < 200; ++code)
        if (std::string(" 2 3 7 98 105 106 108 ").find(" " + std::to_string(code) + " ") == std::string::npos)
            codes.push_back(code);
    for (int const code : codes)
    {
        Walk walk(Signature + Operation(code));
        EXPECT_EQ(walk.Next(), ERROR) << code;
        EXPECT_EQ(walk.op.GetInt(), STICKET_OP_INVALID) << code;
        EXPECT_EQ(walk.type, 5);
        EXPECT_EQ(walk.id, 1);
    }
}

TEST(ParseOperation, RefusedCode_ClearsThePayloadBefore)
{
    Walk walk(Signature + Operation(3, "another text\0"s) + Operation(99));
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.Keys(), ERROR);
    EXPECT_EQ(walk.Next(), ERROR);
    EXPECT_EQ(walk.Keys(), OK);
    EXPECT_TRUE(walk.isNull);
}

TEST(ParseOperation, PayloadLargerThanWhatIsLeft_IsAnErrorWithoutPayload)
{
    Walk walk(Signature + Operation(3, "x\0"s, 3));
    EXPECT_EQ(walk.Next(), ERROR);
    EXPECT_EQ(walk.type, 5);
    EXPECT_EQ(walk.id, 1);
    EXPECT_EQ(walk.op.GetInt(), STICKET_OP_WHOAMI);  // the code was not looked at
    EXPECT_EQ(walk.Keys(), OK);
    EXPECT_TRUE(walk.isNull);
}

TEST(ParseOperation, LargestPayloadSize_IsAnError)
{
    EXPECT_EQ(Walk(Signature + Operation(3, "x\0"s, 0x7FFFFFFF)).Next(), ERROR);
}

TEST(ParseOperation, CutHeader_IsAnError)
{
    for (unsigned long size = 1; size < 16; ++size)
        EXPECT_EQ(Walk(Signature + Operation(106).substr(0, size)).Next(), ERROR) << size;
}

TEST(ParseOperation, CutHeader_TellsTheNumbersThatWereThere)
{
    Walk walk(Signature + Operation(106).substr(0, 7));
    EXPECT_EQ(walk.Next(), ERROR);
    EXPECT_EQ(walk.type, 5);
    EXPECT_EQ(walk.id, -1);
}

TEST(ParseOperation, CutHeader_LeavesTheCursorBehindItsLastNumber_ByDesign)
{
    Walk whole(Signature + Operation(106).substr(0, 8));
    EXPECT_EQ(whole.Next(), ERROR);
    EXPECT_EQ(whole.Next(), END);
    Walk cut(Signature + Operation(106).substr(0, 7));
    EXPECT_EQ(cut.Next(), ERROR);
    EXPECT_EQ(cut.Next(), ERROR);
}

TEST(ParseOperation, NegativePayloadSize_MovesTheCursorBack_ByDesign)
{
    Walk walk(Signature + Operation(2) + Operation(3, "x\0"s, -32));
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.op.GetInt(), 2);
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.op.GetInt(), 3);
    EXPECT_EQ(walk.Next(), OK);  // 32 bytes back: the first operation again
    EXPECT_EQ(walk.op.GetInt(), 2);
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.op.GetInt(), 3);
}

// A payload of no bytes would be good. This one is looked at, and refused for its first text and its first
// tag (a text of one byte), both within the buffer.
TEST(ParseOperation, NegativePayloadSize_MakesAHugePayload_ByDesign)
{
    Walk walk(Signature + Operation(3, "a\0"s, -16));
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.Keys(), ERROR);
    SETMULTIPAR_LIST list(false);
    EXPECT_EQ(walk.reader.GetSetMultipar(list), ERROR);
}

TEST(ParseOperation, End_LeavesTheLastPayload_ByDesign)
{
    Walk walk(Signature + Operation(3, PartialHeader + "a\0"s));
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.Next(), END);
    EXPECT_EQ(walk.Keys(), OK);
    EXPECT_THAT(walk.keys, ElementsAre("a"));
}

TEST(GetSetMultipar, TicketStream_FillsTheListAnew)
{
    Walk walk(Signature + Operation(98, TicketStream()));
    SETMULTIPAR_LIST list(false);
    list.SetParameter("old", 1, -1);
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.reader.GetSetMultipar(list), OK);
    EXPECT_THAT(Records(list), ElementsAre("a -1", "b 0", "b 1"));
    EXPECT_EQ(walk.reader.GetSetMultipar(list), OK);
    EXPECT_EQ(list.Size(), 3u);
}

TEST(GetSetMultipar, FixPositions_IsPassedOn)
{
    Walk walk(Signature + Operation(98, TicketStream()), true);
    SETMULTIPAR_LIST list(false);
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.reader.GetSetMultipar(list), OK);
    EXPECT_THAT(Records(list), ElementsAre("a -1", "b -1", "b 1"));
}

TEST(GetSetMultipar, BrokenTicketStream_KeepsWhatWasReadBefore)
{
    std::string const stream = TicketStream();
    Walk walk(Signature + Operation(98, stream.substr(0, stream.size() - 1)));
    SETMULTIPAR_LIST list(false);
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.reader.GetSetMultipar(list), ERROR);
    EXPECT_THAT(Records(list), ElementsAre("a -1", "b 0"));
}

TEST(GetSetMultipar, NoPayload_ClearsTheListAndIsGood)
{
    Walk walk(Signature + Operation(98));
    SETMULTIPAR_LIST list(false);
    list.SetParameter("old", 1, -1);
    EXPECT_EQ(walk.reader.GetSetMultipar(list), OK);  // before the first operation
    EXPECT_EQ(list.Size(), 0u);
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.reader.GetSetMultipar(list), OK);
    EXPECT_EQ(list.Size(), 0u);
}

TEST(GetPartialTable, Keys_ComeBackAsTheyWereWritten)
{
    char const* const keys[] = {"", "Job/*", "", "System/Use", nullptr};
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutPartialTableOperation(5, 1, STICKET_OP_SET_PARTIAL, keys);
    Walk walk(Taken(writer));
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.Keys(), OK);
    EXPECT_THAT(walk.keys, ElementsAre("", "Job/*", "", "System/Use"));
}

TEST(GetPartialTable, Keys_PointIntoTheBuffer)
{
    std::string const bytes = Signature + Operation(3, PartialHeader + "Job/*\0"s);
    MTICKET_BINSTREAM::Read reader(bytes.data(), bytes.size(), false);
    int type;
    int id;
    TICKET_OP op = STICKET_OP_INVALID;
    char const* const* keys = nullptr;
    ASSERT_EQ(reader.ParseOperation(type, id, op), OK);
    ASSERT_EQ(reader.GetPartialTable(keys), OK);
    ASSERT_NE(keys, nullptr);
    EXPECT_EQ(keys[0], bytes.data() + bytes.size() - 6);
    EXPECT_EQ(keys[1], nullptr);
}

TEST(GetPartialTable, HeaderAlone_IsGoodAndNull)
{
    TABLE const table = TableOf(PartialHeader);
    EXPECT_EQ(table.result, OK);
    EXPECT_TRUE(table.isNull);
}

TEST(GetPartialTable, NoPayload_IsGoodAndNull)
{
    TABLE const table = TableOf("");
    EXPECT_EQ(table.result, OK);
    EXPECT_TRUE(table.isNull);
    Walk walk(Signature);
    EXPECT_EQ(walk.Keys(), OK);  // before the first operation
    EXPECT_TRUE(walk.isNull);
}

TEST(GetPartialTable, AnotherFirstText_IsAnError)
{
    for (std::string const& payload : {"\0"s, "TICKET_PARTIAL_2\0a\0"s, "TICKET_PARTIAL_\0"s,
                                       "TICKET_PARTIAL_12\0"s, "\0TICKET_PARTIAL_1\0"s})
    {
        TABLE const table = TableOf(payload);
        EXPECT_EQ(table.result, ERROR) << payload;
        EXPECT_TRUE(table.isNull) << payload;
    }
}

TEST(GetPartialTable, BytesBehindTheLastZero_AreIgnored)
{
    EXPECT_THAT(TableOf(PartialHeader + "a\0bc"s).keys, ElementsAre("a"));
    EXPECT_TRUE(TableOf(PartialHeader + "bc").isNull);
    EXPECT_EQ(TableOf(PartialHeader + "bc").result, OK);
}

TEST(GetPartialTable, NoZeroByteAtAll_IsGoodAndNull_ByDesign)
{
    for (std::string const payload : {"any text", "TICKET_PARTIAL_1"})
    {
        TABLE const table = TableOf(payload);
        EXPECT_EQ(table.result, OK) << payload;
        EXPECT_TRUE(table.isNull) << payload;
    }
}

TEST(GetPartialTable, NextCall_ForgetsTheTableBefore)
{
    Walk walk(Signature + Operation(3, PartialHeader + "a\0b\0"s) + Operation(3, PartialHeader + "c\0"s) +
              Operation(3, "x\0"s));
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.Keys(), OK);
    EXPECT_EQ(walk.Keys(), OK);
    EXPECT_THAT(walk.keys, ElementsAre("a", "b"));
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.Keys(), OK);
    EXPECT_THAT(walk.keys, ElementsAre("c"));
    EXPECT_EQ(walk.Next(), OK);
    EXPECT_EQ(walk.Keys(), ERROR);
    EXPECT_TRUE(walk.isNull);
}

TEST(GetInt, TakesFourBytes)
{
    Walk walk(Signature + "\x01\x02\x03\x04\xFF\xFF\xFF\xFE");
    int value;
    walk.reader.GetInt(value);
    EXPECT_EQ(value, 0x01020304);
    walk.reader.GetInt(value);
    EXPECT_EQ(value, -2);
}

TEST(GetInt, FewerThanFourBytes_ThrowTheError)
{
    int value = 42;
    try
    {
        Walk(Signature + "\x01\x02\x03").reader.GetInt(value);
        FAIL() << "nothing was thrown";
    }
    catch (MTICKET_BINSTREAM::eGetTicketResult result)
    {
        EXPECT_EQ(result, ERROR);
    }
    EXPECT_EQ(value, 42);
}

TEST(GetInt, NoSignature_ThrowsTheError)
{
    int value;
    EXPECT_THROW(Walk("twenty bytes of text").reader.GetInt(value), MTICKET_BINSTREAM::eGetTicketResult);
}

TEST(eGetTicketResult, Numbers_AreFixed)
{
    EXPECT_EQ(static_cast<int>(OK), 0);
    EXPECT_EQ(static_cast<int>(END), 1);
    EXPECT_EQ(static_cast<int>(ERROR), 2);
    EXPECT_EQ(sizeof(MTICKET_BINSTREAM::eGetTicketResult), 4u);
}
