#include "tests/tools/Streams.h"
#include "tools/ticketstream/Trouble.h"
#include "tools/ticketstream/json.h"
#include "tools/ticketstream/make.h"
#include <gtest/gtest.h>

using namespace ticketstream;

namespace
{
std::string Made(std::string const& record)
{
    return HexOf(MakeStream("{\"stream\": \"STICKET_1\", \"records\": [" + record + "]}").substr(10));
}

std::string Wrong(std::string const& json)
try
{
    return "no error: " + HexOf(MakeStream(json));
}
catch (WrongJson const& wrong)
{
    return wrong.what();
}

std::string WrongRecord(std::string const& record)
{
    return Wrong(R"({"stream": "STICKET_1", "records": [{"key": "a", "type": "int", "value": 1}, )" + record +
                 "]}");
}

std::string WrongOperation(std::string const& members)
{
    return Wrong(R"({"stream": "MTICKET_1", "operations": [{"ticketType": 1, "ticketId": 2, )" + members +
                 "}]}");
}

std::string Again(std::string const& stream)
{
    tools::Output out;
    PrintJson(stream, out);
    return MakeStream(out.Text());
}
}  // namespace

TEST(Make, OfTheJsonOfWrittenStreams_GivesTheSameBytes)
{
    EXPECT_EQ(HexOf(Again(Streams::Job())), HexOf(Streams::Job()));
    EXPECT_EQ(HexOf(Again(Streams::Container())), HexOf(Streams::Container()));
    EXPECT_EQ(Again(""), "");
    EXPECT_EQ(Again("MTICKET_1"), "MTICKET_1");
}

TEST(Make, OfEachType_KeepsTheTypeThatAReaderGives)
{
    EXPECT_EQ(Made(R"({"key": "a", "type": "int", "value": 2})"), "01 61 41 02");
    EXPECT_EQ(Made(R"({"key": "a", "type": "double", "value": 2})"), "01 61 45 69 40 00 00 00");
    EXPECT_EQ(Made(R"({"key": "a", "type": "double", "value": -0.0})"), "01 61 45 69 80 00 00 00");
    EXPECT_EQ(Made(R"({"key": "a", "type": "double", "value": 0.1})"), "01 61 48 3F B9 99 99 99 99 99 9A");
    EXPECT_EQ(Made(R"({"key": "a", "type": "double", "value": 1e300})"), "01 61 48 7E 37 E4 3C 88 00 75 9C");
    EXPECT_EQ(Made(R"({"key": "a", "type": "double", "value": "NaN"})"), "01 61 48 7F F8 00 00 00 00 00 00");
    EXPECT_EQ(Made(R"({"key": "a", "type": "int64", "value": "2"})"), "01 61 49 64 00 00 00 00 00 00 00 02");
    EXPECT_EQ(Made(R"({"key": "a", "type": "int64", "value": -2})"), "01 61 49 64 FF FF FF FF FF FF FF FE");
    EXPECT_EQ(Made(R"({"key": "a", "type": "unsigned64", "value": "18446744073709551615"})"),
              "01 61 49 75 FF FF FF FF FF FF FF FF");
    EXPECT_EQ(Made(R"({"key": "a", "type": "string", "value": "b\u0000c"})"), "01 61 63 62 00 63");
    EXPECT_EQ(Made(R"({"key": "a", "type": "string", "value": {"hex": "Ff"}})"), "01 61 61 FF");
    EXPECT_EQ(Made(R"({"key": "a", "type": "binstring", "value": {"hex": ""}})"), "01 61 80");
    EXPECT_EQ(Made(R"({"key": "a", "type": "none", "pos": -2})"), "01 61 A0 C0");
}

TEST(Make, OfKeys_CompressesThemUnlessTheyHoldAZeroByte)
{
    EXPECT_EQ(Made(R"({"key": "ab", "type": "none"}, {"key": "ac", "type": "none"})"),
              "02 61 62 C0 22 01 63 C0");
    EXPECT_EQ(Made(R"({"key": "a\u0000b", "type": "none"}, {"key": "a\u0000", "type": "none"})"),
              "03 61 00 62 C0 02 61 00 C0");
    EXPECT_EQ(Made(R"({"key": null, "type": "none"}, {"key": "", "type": "none"})"), "C0 00 C0");
    EXPECT_EQ(Made(R"({"key": null, "type": "none"}, {"key": "STICKET_1", "type": "none"})"),
              "C0 09 53 54 49 43 4B 45 54 5F 31 C0");
}

TEST(Make, OfMembersInAnyOrder_GivesTheSame)
{
    std::string const record = R"([{"pos": 0, "value": 1, "type": "int", "key": "a"}])";
    EXPECT_EQ(HexOf(MakeStream("{\"records\": " + record + ", \"stream\": \"STICKET_1\"}").substr(10)),
              "01 61 A2 41 01");
    EXPECT_EQ(MakeStream(R"({"operations": [{"records": )" + record +
                         R"(, "operation": 98, "ticketId": 2, "ticketType": 1}], "stream": "MTICKET_1"})"),
              BytesOf("4D 54 49 43 4B 45 54 5F 31 00 00 00 01 00 00 00 02 00 00 00 62 00 00 00 0F") +
                  Streams::Signature() + BytesOf("01 61 A2 41 01"));
}

TEST(Make, OfOperationsWithRecords_StartsEachPayloadAfresh)
{
    std::string const operation =
        R"({"ticketType": 1, "ticketId": 2, "operation": 98, "records": [{"key": "a", "type": "none", "pos": 0}]})";
    std::string const stream =
        MakeStream(R"({"stream": "MTICKET_1", "operations": [)" + operation + ", " + operation + "]}");
    EXPECT_EQ(stream.substr(9, 30), stream.substr(39));
}

TEST(Make, OfWrongRecords_NamesThePlace)
{
    EXPECT_EQ(WrongRecord("5"), "/records/1: an object is needed here");
    EXPECT_EQ(WrongRecord("[]"), "/records/1: an object is needed here");
    EXPECT_EQ(WrongRecord("{}"), "/records/1: \"key\" is missing");
    EXPECT_EQ(WrongRecord(R"({"key": "a"})"), "/records/1: \"type\" is missing");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "type": "int"})"), "/records/1: \"value\" is missing");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "type": "none", "value": 1})"),
              "/records/1/value: a record of type none has no value");
    EXPECT_EQ(WrongRecord(R"({"kez": "a"})"),
              "/records/1: unknown member \"kez\"; known are \"key\", \"type\", \"pos\", \"value\"");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "key": "b"})"), "/records/1/key: given twice");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "type": "float", "value": 1})"),
              "/records/1/type: int, double, string, binstring, int64, unsigned64 or none is needed here");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "type": "int", "value": 2147483648})"),
              "/records/1/value: an integer of 32 bits is needed here");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "type": "int", "value": "1"})"),
              "/records/1/value: an integer of 32 bits is needed here");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "type": "int64", "value": "9223372036854775808"})"),
              "/records/1/value: an integer of 64 bits is needed here");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "type": "unsigned64", "value": -1})"),
              "/records/1/value: an integer of 64 bits that is not negative is needed here");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "type": "double", "value": "Infinity"})"),
              "/records/1/value: a number or \"NaN\" is needed here");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "type": "binstring", "value": {"hex": "0"}})"),
              "/records/1/value: bytes are told as {\"hex\": \"00ff\"}, two digits a byte");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "type": "string", "value": {"hex": [1]}})"),
              "/records/1/value/hex: a number or a text is needed here");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "type": "none", "pos": -3})"),
              "/records/1/pos: no stream can hold it: Tag size overflow");
    EXPECT_EQ(WrongRecord(R"({"key": null, "type": "none"})"),
              "/records/1/key: only records before the first key can have none");
}

TEST(Make, OfLargestAndSmallestIntegers_TakesThemAndNoMore)
{
    EXPECT_EQ(Made(R"({"key": "a", "type": "int", "value": -2147483648})"), "01 61 44 80 00 00 00");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "type": "int", "value": -2147483649})"),
              "/records/1/value: an integer of 32 bits is needed here");
    EXPECT_EQ(Made(R"({"key": "a", "type": "int64", "value": "-9223372036854775808"})"),
              "01 61 49 64 80 00 00 00 00 00 00 00");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "type": "int64", "value": "-9223372036854775809"})"),
              "/records/1/value: an integer of 64 bits is needed here");
    EXPECT_EQ(WrongRecord(R"({"key": "a", "type": "unsigned64", "value": "18446744073709551616"})"),
              "/records/1/value: an integer of 64 bits that is not negative is needed here");
}

TEST(Make, OfWrongOperations_NamesThePlace)
{
    EXPECT_EQ(WrongOperation(R"("operation": 102)"),
              "/operations/0/operation: this code does not travel in container streams");
    EXPECT_EQ(WrongOperation(R"("operation": 98, "keys": ["a"])"), "/operations/0: no payload for this code");
    EXPECT_EQ(WrongOperation(R"("operation": 98, "keys": [], "records": [])"),
              "/operations/0: only one of \"records\", \"keys\" and \"payload\" may be there");
    EXPECT_EQ(WrongOperation(R"("operation": 3, "keys": ["a", "b\u0000c"])"),
              "/operations/0/keys/1: a key ends at its zero byte in such a table");
    EXPECT_EQ(WrongOperation(R"("operation": 98, "records": [{"key": "a", "type": "none", "pos": 0.5}])"),
              "/operations/0/records/0/pos: an integer of 32 bits is needed here");
    EXPECT_EQ(WrongOperation(R"("operation": 7, "payload": "text")"),
              "/operations/0/payload: bytes are told as {\"hex\": \"00ff\"}, two digits a byte");
}

TEST(Make, OfWrongDocuments_SaysWhatIsWrong)
{
    EXPECT_EQ(Wrong("5"), "the document: an object is needed here");
    EXPECT_EQ(Wrong("[]"), "the document: an object is needed here");
    EXPECT_EQ(Wrong("{}"), "the document: \"stream\" is missing");
    EXPECT_EQ(Wrong(R"({"stream": "STICKET_1"})"), "the document: \"records\" is missing");
    EXPECT_EQ(Wrong(R"({"stream": "STICKET_2", "records": []})"),
              "/stream: STICKET_1 or MTICKET_1 is needed here");
    EXPECT_EQ(Wrong(R"({"stream": "STICKET_1", "records": [], "operations": []})"),
              "/operations: a stream of the kind STICKET_1 has none");
    EXPECT_EQ(Wrong(R"({"stream": "STICKET_1", "records": 5})"), "/records: a list is needed here");
    EXPECT_EQ(Wrong("{\n  \"stream\": }"),
              "the document: parse error at line 2, column 13: syntax error while parsing "
              "value - unexpected '}'; expected '[', '{', or a literal");
    EXPECT_EQ(Wrong(std::string(100000, '[')), "the document: an object is needed here");
}
