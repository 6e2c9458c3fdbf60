#include "tests/tools/Streams.h"
#include "tools/ticketstream/Trouble.h"
#include "tools/ticketstream/diff.h"
#include <gtest/gtest.h>

using namespace ticketstream;
using StreamOracle::Int;
using StreamOracle::Text;
using Streams::Written;

namespace
{
// What is printed; checks that the answer says the same.
std::string DiffOf(std::string const& left, std::string const& right)
{
    tools::Output out;
    bool const isSame = Diff(left, right, out);
    EXPECT_EQ(isSame, out.Text().empty());
    return out.Text();
}

std::string Operation(int id, int code, std::string const& payload)
{
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutOperation(3, id, Streams::Code(code), payload);
    std::string stream;
    writer.GetAndClear(stream);
    return stream;
}
}  // namespace

TEST(Diff, OfTheSame_IsEmpty)
{
    EXPECT_EQ(DiffOf(Streams::Job(), Streams::Job()), "");
    EXPECT_EQ(DiffOf(Streams::Container(), Streams::Container()), "");
}

TEST(Diff, OfKeysInAnotherOrder_IsEmpty)
{
    EXPECT_EQ(DiffOf(Written({Int("a", 1), Int("b", 2), Int("a", 3, 1)}),
                     Written({Int("b", 2), Int("a", 1), Int("a", 3, 1)})),
              "");
}

TEST(Diff, OfValuesInAnotherOrder_TellsThem)
{
    EXPECT_EQ(DiffOf(Written({Int("a", 1), Int("a", 2)}), Written({Int("a", 2), Int("a", 1)})),
              "- \"a\"  int  -1  1\n- \"a\"  int  -1  2\n+ \"a\"  int  -1  2\n+ \"a\"  int  -1  1\n");
}

TEST(Diff, OfAChangedValue_TellsThatAlone)
{
    EXPECT_EQ(DiffOf(Written({Int("a", 1, 0), Int("a", 2, 1), Int("a", 3, 2)}),
                     Written({Int("a", 1, 0), Int("a", 5, 1), Int("a", 3, 2)})),
              "- \"a\"  int  1  2\n+ \"a\"  int  1  5\n");
}

TEST(Diff, OfTypePositionAndKey_TellsEach)
{
    EXPECT_EQ(DiffOf(Written({Int("a", 1)}), Written({Text("a", "1")})),
              "- \"a\"  int  -1  1\n+ \"a\"  string  -1  \"1\"\n");
    EXPECT_EQ(DiffOf(Written({Int("a", 1)}), Written({Int("a", 1, 0)})),
              "- \"a\"  int  -1  1\n+ \"a\"  int  0  1\n");
    EXPECT_EQ(DiffOf(Written({Int("a", 1)}), Written({Int("b", 1)})),
              "- \"a\"  int  -1  1\n+ \"b\"  int  -1  1\n");
    EXPECT_EQ(DiffOf(Written({StreamOracle::Delete("a")}), ""), "- \"a\"  none  -1\n");
}

TEST(Diff, OfOtherBytesWithTheSameMeaning_IsEmpty)
{
    std::string const longForm = Streams::Signature() + BytesOf("18 00 00 01 61 44 00 00 00 01");
    EXPECT_EQ(DiffOf(Written({Int("a", 1)}), longForm), "");
    EXPECT_EQ(DiffOf("", Streams::Signature()), "");
    EXPECT_EQ(DiffOf("", "MTICKET_1"), "");
}

TEST(Diff, OfNumbersThatComparisonDoesNotTellApart_TellsThem)
{
    std::string const zero = Streams::Signature() + BytesOf("01 61 45 69 00 00 00 00");
    std::string const minusZero = Streams::Signature() + BytesOf("01 61 45 69 80 00 00 00");
    std::string const notANumber = Streams::Signature() + BytesOf("01 61 48 7F F8 00 00 00 00 00 00");
    EXPECT_EQ(DiffOf(zero, minusZero), "- \"a\"  double  -1  0.0\n+ \"a\"  double  -1  -0.0\n");
    EXPECT_EQ(DiffOf(notANumber, notANumber), "");
}

TEST(Diff, OfLongValuesThatDifferAtTheirEnd_ShowsThemWhole)
{
    std::string const text(1000, 'x');
    EXPECT_EQ(DiffOf(Written({Text("a", text + 'y')}), Written({Text("a", text + 'z')})),
              "- \"a\"  string  -1  \"" + text + "y\"\n+ \"a\"  string  -1  \"" + text + "z\"\n");
}

TEST(Diff, OfOperations_TellsWhichAndWhat)
{
    EXPECT_EQ(DiffOf(Operation(1, 98, Written({Int("a", 1)})), Operation(1, 98, Written({Int("a", 2)}))),
              "operation 1\n- \"a\"  int  -1  1\n+ \"a\"  int  -1  2\n");
    EXPECT_EQ(DiffOf(Operation(1, 106, ""), Operation(2, 106, "")),
              "operation 1\n- ticket 3/1  code 106\n+ ticket 3/2  code 106\n");
    EXPECT_EQ(DiffOf(Operation(1, 106, ""), Operation(1, 106, "") + Operation(2, 2, "").substr(9)),
              "operation 2\n+ ticket 3/2  code 2\n");
    EXPECT_EQ(DiffOf(Operation(1, 7, "a"), Operation(1, 7, "b")),
              "operation 1\n- payload hex:61\n+ payload hex:62\n");
    EXPECT_EQ(DiffOf(Operation(1, 3, std::string("TICKET_PARTIAL_1\0a\0", 19)),
                     Operation(1, 3, std::string("TICKET_PARTIAL_1\0b\0", 19))),
              "operation 1\n- keys \"a\"\n+ keys \"b\"\n");
}

TEST(Diff, OfPayloadsThatMeanTheSame_IsEmpty)
{
    EXPECT_EQ(DiffOf(Operation(1, 98, ""), Operation(1, 98, Streams::Signature())), "");
    EXPECT_EQ(DiffOf(Operation(1, 3, ""), Operation(1, 3, std::string("TICKET_PARTIAL_1\0tail", 21))), "");
}

TEST(Diff, OfTwoKinds_SaysSo)
{
    EXPECT_EQ(DiffOf(Streams::Job(), Streams::Container()),
              "a single-ticket stream and a container stream\n");
    EXPECT_EQ(DiffOf(Streams::Container(), Streams::Job()),
              "a container stream and a single-ticket stream\n");
}

TEST(Diff, OfABrokenStream_Throws)
{
    tools::Output out;
    EXPECT_THROW(Diff(Streams::Job(), Streams::Job().substr(0, 30), out), BrokenStream);
    EXPECT_THROW(Diff(Streams::Container().substr(0, 30), Streams::Job(), out), BrokenStream);
}
