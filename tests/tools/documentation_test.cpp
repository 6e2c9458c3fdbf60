// What docs/stream-formats.md shows is what the library and the tool do.
#include "tests/tools/Streams.h"
#include "tools/ticketstream/ItemWalk.h"
#include "tools/ticketstream/OperationWalk.h"
#include "tools/ticketstream/json.h"
#include "tools/ticketstream/make.h"
#include <fstream>
#include <gtest/gtest.h>
#include <sstream>

using namespace ticketstream;

namespace
{
std::string Page()
{
    std::ifstream file(STREAM_FORMATS);
    std::stringstream text;
    text << file.rdbuf();
    return text.str();
}

// What stands behind the words, to the end of the paragraph.
std::string Behind(std::string const& words)
{
    std::string const page = Page();
    std::size_t const from = page.find(words);
    if (from == std::string::npos)
        throw std::runtime_error("the page does not say: " + words);
    return page.substr(from + words.size(), page.find("\n\n", from + words.size()) - from - words.size());
}

bool IsByte(std::string const& word)
{
    return word.size() == 2 && word.find_first_not_of("0123456789ABCDEF") == std::string::npos;
}

// The bytes at the head of a line.
std::string BytesIn(std::istream& line)
{
    std::string hex;
    for (std::string word; line >> word && IsByte(word);)
        hex += word;
    return BytesOf(hex);
}

std::string BytesOfAllLines(std::string const& text)
{
    std::string bytes;
    std::istringstream lines(text);
    for (std::string line; std::getline(lines, line);)
    {
        std::istringstream words(line);
        bytes += BytesIn(words);
    }
    return bytes;
}
}  // namespace

TEST(StreamFormats, TicketByteByByte_IsTheStreamOfTheTests)
{
    std::string const listing = Behind("    offset  bytes                               what it says\n");
    std::string stream;
    std::istringstream lines(listing);
    for (std::string line; std::getline(lines, line);)
    {
        std::istringstream words(line);
        std::size_t offset;
        ASSERT_TRUE(words >> offset) << line;
        EXPECT_EQ(offset, stream.size());
        stream += BytesIn(words);
    }
    EXPECT_EQ(HexOf(stream), HexOf(Streams::Job()));
}

TEST(StreamFormats, OperationThatDeletes_IsWhatTheWriterMakes)
{
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutVoidOperation(3, 12, MTICKET_OP_DELETE);
    std::string stream;
    writer.GetAndClear(stream);
    EXPECT_EQ(stream.size(), 25u);
    EXPECT_EQ(HexOf(BytesOfAllLines(Behind("the nine of the signature, then\n"))), HexOf(stream.substr(9)));
}

TEST(StreamFormats, TableOfKeys_IsWhatTheWriterMakes)
{
    char const* const keys[] = {"Job/*", "System/Name", nullptr};
    MTICKET_BINSTREAM::Write writer(0);
    writer.PutPartialTableOperation(3, 1, STICKET_OP_SET_PARTIAL, keys);
    std::string stream;
    writer.GetAndClear(stream);
    EXPECT_EQ(HexOf(BytesOfAllLines(Behind("`Job/*` and `System/Name` take 35 bytes:\n"))),
              HexOf(stream.substr(25)));
}

TEST(StreamFormats, Json_IsTakenByMakeAndPrintedAlike)
{
    std::string const samples = Behind("```json\n");
    std::size_t const second = samples.find("{\"stream\": \"MTICKET_1\"");
    std::string const ticket = samples.substr(0, second);
    std::string const container = samples.substr(second, samples.find("```") - second);

    tools::Output out;
    PrintJson(MakeStream(ticket), out);
    EXPECT_EQ(out.Text(), ticket);

    std::string const stream = MakeStream(container);
    OperationWalk walk(stream);
    std::vector<int> codes;
    while (walk.Next())
        codes.push_back(walk.Current().code);
    EXPECT_EQ(codes, (std::vector<int>{98, 3, 7, 106}));
}
