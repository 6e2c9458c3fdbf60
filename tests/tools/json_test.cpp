#include "tests/tools/Streams.h"
#include "tools/ticketstream/Trouble.h"
#include "tools/ticketstream/json.h"
#include <gmock/gmock.h>

using namespace ticketstream;
using testing::HasSubstr;

namespace
{
std::string JsonOf(std::string const& stream)
{
    tools::Output out;
    PrintJson(stream, out);
    return out.Text();
}

std::string RecordOf(std::string const& hexBehindTheSignature)
{
    std::string const json = JsonOf(Streams::Signature() + BytesOf(hexBehindTheSignature));
    std::size_t const begin = json.find("\n{") + 1;
    return json.substr(begin, json.find('\n', begin) - begin);
}
}  // namespace

TEST(Json, OfTheJob_LineByLine)
{
    EXPECT_EQ(JsonOf(Streams::Job()), R"({"stream": "STICKET_1", "records": [
{"key": "Job/Copies", "type": "int", "pos": -1, "value": 3},
{"key": "Job/Name", "type": "string", "pos": -1, "value": "A4"},
{"key": "Job/Scale", "type": "double", "pos": -1, "value": 1.5},
{"key": "Job/Tray", "type": "int", "pos": 0, "value": 300},
{"key": "Job/Tray", "type": "int", "pos": 1, "value": -1},
{"key": "Job/X", "type": "none", "pos": -1}
]}
)");
}

TEST(Json, OfAContainer_TellsPayloadsByWhatTheyAre)
{
    std::string const json = JsonOf(Streams::Container());
    EXPECT_THAT(json, HasSubstr(R"({"stream": "MTICKET_1", "operations": [
{"ticketType": 3, "ticketId": 1, "operation": 98, "records": [
{"key": "Job/Copies")"));
    EXPECT_THAT(json, HasSubstr(R"({"key": "Job/X", "type": "none", "pos": -1}
]},
{"ticketType": 3, "ticketId": -1, "operation": 3, "keys": ["Job/*", "", "System/Use"]},
{"ticketType": 3, "ticketId": 2, "operation": 105, "keys": []},
{"ticketType": 3, "ticketId": 2, "operation": 106},
{"ticketType": 3, "ticketId": 2, "operation": 7, "payload": {"hex": "00ff"}}
]}
)"));
}

TEST(Json, OfNoBytes_IsAStreamWithoutRecords)
{
    EXPECT_EQ(JsonOf(""), "{\"stream\": \"STICKET_1\", \"records\": [\n]}\n");
}

TEST(Json, OfNumbers_IsExact)
{
    EXPECT_EQ(RecordOf("01 61 49 64 00 20 00 00 00 00 00 01"),
              R"({"key": "a", "type": "int64", "pos": -1, "value": "9007199254740993"})");
    EXPECT_EQ(RecordOf("01 61 49 75 FF FF FF FF FF FF FF FF"),
              R"({"key": "a", "type": "unsigned64", "pos": -1, "value": "18446744073709551615"})");
    EXPECT_EQ(RecordOf("01 61 49 64 80 00 00 00 00 00 00 00"),
              R"({"key": "a", "type": "int64", "pos": -1, "value": "-9223372036854775808"})");
    EXPECT_EQ(RecordOf("01 61 48 3F B9 99 99 99 99 99 9A"),
              R"({"key": "a", "type": "double", "pos": -1, "value": 0.1})");
    EXPECT_EQ(RecordOf("01 61 45 69 80 00 00 00"),
              R"({"key": "a", "type": "double", "pos": -1, "value": -0.0})");
}

TEST(Json, OfNaNAndInfinity_IsNaN)
{
    EXPECT_EQ(RecordOf("01 61 48 7F F8 00 00 00 00 00 00"),
              R"({"key": "a", "type": "double", "pos": -1, "value": "NaN"})");
    EXPECT_EQ(RecordOf("01 61 48 FF F0 00 00 00 00 00 00"),
              R"({"key": "a", "type": "double", "pos": -1, "value": "NaN"})");
}

TEST(Json, OfTexts_LosesNothing)
{
    EXPECT_EQ(RecordOf("02 C3 A4 63 61 00 62"),
              "{\"key\": \"\xC3\xA4\", \"type\": \"string\", \"pos\": -1, \"value\": \"a\\u0000b\"}");
    EXPECT_EQ(RecordOf("01 FF 61 C3"),
              R"({"key": {"hex": "ff"}, "type": "string", "pos": -1, "value": {"hex": "c3"}})");
    EXPECT_EQ(RecordOf("63 ED A0 80"),
              R"({"key": null, "type": "string", "pos": -1, "value": {"hex": "eda080"}})");
}

TEST(Json, OfAFirstValueWithoutAKey_TellsThatThereWasNone)
{
    EXPECT_EQ(RecordOf("40"), R"({"key": null, "type": "int", "pos": -1, "value": 0})");
    EXPECT_EQ(RecordOf("00 40"), R"({"key": "", "type": "int", "pos": -1, "value": 0})");
}

TEST(Json, OfBrokenStreams_ThrowsAndPrintsNothing)
{
    tools::Output out;
    EXPECT_THROW(PrintJson(Streams::Job().substr(0, 50), out), BrokenStream);
    EXPECT_THROW(PrintJson(Streams::Container().substr(0, 50), out), BrokenStream);
    EXPECT_THROW(PrintJson("hello", out), BrokenStream);
    EXPECT_EQ(out.Text(), "");
}
