#include "tests/tools/Streams.h"
#include "tools/ticketstream/dump.h"
#include <gmock/gmock.h>

using namespace ticketstream;
using testing::EndsWith;
using testing::HasSubstr;

namespace
{
std::string DumpOf(std::string const& stream)
{
    tools::Output out;
    Dump(stream, out);
    return out.Text();
}
}  // namespace

TEST(Dump, OfTheJob_LineByLine)
{
    EXPECT_EQ(DumpOf(Streams::Job()), R"(       0  signature   "STICKET_1"
      10  key         "Job/Copies"
      21  number      "Job/Copies"  int  -1  3
      23  key         "Job/Name"
      29  text        "Job/Name"  string  -1  "A4"
      32  key         "Job/Scale"
      39  number      "Job/Scale"  double  -1  1.5
      45  key         "Job/Tray"
      51  position    0
      52  number      "Job/Tray"  int  0  300
      55  number      "Job/Tray"  int  1  -1
      57  key         "Job/X"
      60  position    -1
      61  delete      "Job/X"  none  -1
)");
}

TEST(Dump, OfAContainer_ShowsWhatThePayloadsHold)
{
    std::string const dump = DumpOf(Streams::Container());
    EXPECT_THAT(dump,
                HasSubstr("       9  operation   ticket 3/1  code 98 (set parameters)  payload 62 bytes\n"
                          "      25    signature   \"STICKET_1\"\n"
                          "      35    key         \"Job/Copies\"\n"));
    EXPECT_THAT(dump, HasSubstr("      87  operation   ticket 3/-1  code 3 (set partial)  payload 35 bytes\n"
                                "     103    signature   \"TICKET_PARTIAL_1\"\n"
                                "     120    key         \"Job/*\"\n"
                                "     126    key         \"\"\n"
                                "     127    key         \"System/Use\"\n"));
    EXPECT_THAT(dump,
                HasSubstr("     171  operation   ticket 3/2  code 106 (delete ticket)  payload 0 bytes\n"));
    EXPECT_THAT(dump, EndsWith("     203    bytes       hex:00ff\n"));
}

TEST(Dump, OfNoBytes_IsEmptyAndGood)
{
    tools::Output out;
    EXPECT_FALSE(Dump("", out));
    EXPECT_EQ(out.Text(), "");
}

TEST(Dump, OfACutStream_ShowsTheRecordsBeforeAndTheBreak)
{
    tools::Output out;
    auto const broken = Dump(Streams::Job().substr(0, 43), out);
    ASSERT_TRUE(broken);
    EXPECT_EQ(broken->Offset(), 39u);
    EXPECT_THAT(out.Text(), HasSubstr("\"Job/Name\"  string  -1  \"A4\"\n"));
    EXPECT_THAT(out.Text(), EndsWith("      39  broken      Unexpected EOF\n"));
}

TEST(Dump, OfABrokenPayload_GoesOnWithTheNextOperation)
{
    std::string stream = Streams::Container();
    stream[46] = '\x43';  // a number of a size that does not exist
    tools::Output out;
    auto const broken = Dump(stream, out);
    ASSERT_TRUE(broken);
    EXPECT_EQ(broken->Offset(), 46u);
    EXPECT_THAT(out.Text(), HasSubstr("Check refuses this stream; it is shown as far as it is safe\n"));
    EXPECT_THAT(out.Text(), HasSubstr("      46    broken      Invalid number size\n      87  operation"));
}

TEST(Dump, OfHostilePayloadSizes_StopsThereAndSaysSo)
{
    std::string const head = "4D 54 49 43 4B 45 54 5F 31 00 00 00 05 00 00 00 01 00 00 00 6A ";
    EXPECT_THAT(DumpOf(BytesOf(head + "FF FF FF F0")),
                EndsWith("       9  broken      negative payload size -16\n"));
    EXPECT_THAT(DumpOf(BytesOf(head + "80 00 00 00")),
                EndsWith("       9  broken      negative payload size -2147483648\n"));
    EXPECT_THAT(DumpOf(BytesOf(head + "7F FF FF FF")),
                EndsWith("       9  broken      payload size 2147483647, but only 0 bytes are left\n"));
    EXPECT_THAT(DumpOf(BytesOf(head + "00 00 00 02 00")),
                EndsWith("       9  broken      payload size 2, but only 1 bytes are left\n"));
    EXPECT_THAT(
        DumpOf(BytesOf(head + "00 00 00")),
        EndsWith("       9  broken      the header of an operation takes 16 bytes, but only 15 are left\n"));
}

TEST(Dump, OfACodeThatDoesNotTravel_StopsThereAndSaysSo)
{
    EXPECT_THAT(DumpOf(BytesOf("4D 54 49 43 4B 45 54 5F 31 00 00 00 05 00 00 00 01 00 00 00 66 00 00 00 00")),
                EndsWith("       9  broken      operation code 102 does not travel in container streams\n"));
}

TEST(Dump, OfAKeyTableWithATail_SaysThatTheTailCountsForNothing)
{
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutOperation(3, 1, STICKET_OP_SET_PARTIAL, std::string("TICKET_PARTIAL_1\0a\0bc", 21));
    std::string stream;
    writer.GetAndClear(stream);
    EXPECT_THAT(DumpOf(stream),
                EndsWith("      42    key         \"a\"\n"
                         "      44    ignored     what no zero byte ends counts for nothing\n"));
}

TEST(Dump, OfTextsThatATerminalWouldObey_EscapesThem)
{
    std::string const dump =
        DumpOf(Streams::Written({StreamOracle::Text("a\x1B[2J\n", "\xC2\x9B\x7F\xC3\xA4\xE2\x82\xAC")}));
    EXPECT_THAT(dump, HasSubstr(R"("a\u001b[2J\n"  string  -1  "\u009b\u007f)"
                                "\xC3\xA4\xE2\x82\xAC\"\n"));
}

TEST(Dump, OfTextsThatAreNoUtf8_ShowsTheirBytes)
{
    EXPECT_THAT(DumpOf(Streams::Written({StreamOracle::Text("k\xFF", "\xC3")})),
                HasSubstr("text        hex:6bff  string  -1  hex:c3\n"));
}

TEST(Dump, OfLongValues_CutsThemBetweenCharactersAndTellsTheirSize)
{
    std::string const text = std::string(199, 'x') + "\xC3\xA4" + std::string(99, 'y');
    std::string const dump = DumpOf(
        Streams::Written({StreamOracle::Text("t", text), StreamOracle::Bytes("b", std::string(300, '\1'))}));
    EXPECT_THAT(dump, HasSubstr("  \"" + std::string(199, 'x') + "\" ... 300 bytes\n"));
    EXPECT_THAT(dump, HasSubstr("0101 ... 300 bytes\n"));
}
