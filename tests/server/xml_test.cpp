#include "standin/server/tickets/TicketXml.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/tickets/TicketXmlText.h"
#include "tests/server/MemoryFolder.h"
#include "tests/server/StoredValues.h"
#include "tests/support/ChildProcess.h"
#include "tests/support/Files.h"
#include "tests/support/sanitizers.h"
#include <atomic>
#include <bit>
#include <csignal>
#include <cstdint>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <limits>
#include <map>
#include <random>
#include <sys/resource.h>
#include <sys/stat.h>
#include <thread>
#include <unistd.h>
#include <utility>

using namespace standin;
using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::UnorderedElementsAreArray;

namespace
{
std::string OnlyTextOf(std::string const& parameter)
{
    std::string text;
    TicketXml::Parse("<ticket version=\"1\">" + parameter + "</ticket>", "file")
        .Walk([&text](std::string_view, int, StoredValue const& value) { text = value.bytes; });
    return text;
}

std::string ReasonOf(std::string const& text)
{
    try
    {
        TicketXml::Parse(text, "file");
    }
    catch (XmlError const& error)
    {
        return error.what();
    }
    return "accepted";
}

// The reason why a ticket with that parameter in its second line is refused.
std::string ReasonOfParameter(std::string const& parameter)
{
    return ReasonOf("<ticket version=\"1\">\n" + parameter + "\n</ticket>\n");
}

void ExpectComesBack(StoredValue const& value, std::string const& key = "Key")
{
    TicketXml ticket;
    ticket.Put(key, 0, value);
    int count = 0;
    TicketXml::Parse(ticket.Text(), "file")
        .Walk(
            [&](std::string_view foundKey, int pos, StoredValue const& found)
            {
                ++count;
                EXPECT_EQ(foundKey, key);
                EXPECT_EQ(pos, 0);
                EXPECT_TRUE(SameValue(found, value)) << ticket.Text();
            });
    EXPECT_EQ(count, 1) << ticket.Text();
}

constexpr char const* Example = R"(<?xml version="1.0" encoding="UTF-8"?>
<ticket version="1" type="3" id="1">
    <parameter key="Job/Copies" type="int">2</parameter>
    <parameter key="Job/InkCoverage" type="double">
        <value pos="0">0.1</value>
        <value pos="1">-0</value>
        <value pos="2">nan</value>
        <value pos="4">-inf</value>
    </parameter>
    <parameter key="Job/Name" type="string">K&amp;R &lt;2&gt;  </parameter>
    <parameter key="Job/Thumbnail" type="binary">AP8=</parameter>
    <parameter key="job" type="string">
        <value pos="0" encoding="base64">AQ==</value>
        <value pos="1" type="unsigned64">18446744073709551615</value>
    </parameter>
</ticket>
)";
}  // namespace

TEST(TicketXml, Text_IsReadableAndSortedByKeyBytewiseAndPosition)
{
    TicketXml ticket;
    ticket.address = TicketAddress{3, 1};
    ticket.Put("job", 1, Integer(PARAM_UNSIGNED64, -1));
    ticket.Put("job", 0, Bytes(PARAM_STRING, "\x01"));
    ticket.Put("Job/Thumbnail", 0, Bytes(PARAM_BINSTRING, std::string_view("\0\xFF", 2)));
    ticket.Put("Job/Name", 0, Bytes(PARAM_STRING, "K&R <2>  "));
    ticket.Put("Job/InkCoverage", 4, Double(-std::numeric_limits<double>::infinity()));
    ticket.Put("Job/InkCoverage", 2, Double(std::numeric_limits<double>::quiet_NaN()));
    ticket.Put("Job/InkCoverage", 1, Double(-0.0));
    ticket.Put("Job/InkCoverage", 0, Double(0.1));
    ticket.Put("Job/Copies", 0, Integer(PARAM_INT, 2));
    EXPECT_EQ(ticket.Text(), Example);
}

TEST(TicketXml, Parse_ThenText_IsTheSameFile)
{
    EXPECT_EQ(TicketXml::Parse(Example, "file").Text(), Example);
}

TEST(TicketXml, Parse_WithoutAddress_HasNone)
{
    EXPECT_FALSE(TicketXml::Parse("<ticket version=\"1\"/>", "file").address);
    EXPECT_TRUE((TicketXml::Parse(Example, "file").address == TicketAddress{3, 1}));
}

TEST(TicketXml, Parse_PutsUpWithEditorsHabits)
{
    EXPECT_EQ(OnlyTextOf("<parameter key='K' type='string'>a<!-- c -->b<![CDATA[<&]]></parameter>"), "ab<&");
    EXPECT_EQ(ReasonOf("\xEF\xBB\xBF<?xml version='1.0'?>\r\n<!-- c -->\r\n<ticket version='1'>\r\n"
                       "<parameter key='K' type='int'>\r\n 5\r\n</parameter></ticket>\r\n"),
              "accepted");
}

TEST(TicketXml, EveryKindOfNumber_ComesBack)
{
    using Limits = std::numeric_limits<double>;
    for (long long const number : {std::numeric_limits<int>::min(), -1, 0, std::numeric_limits<int>::max()})
        ExpectComesBack(Integer(PARAM_INT, number));
    for (long long const number :
         {std::numeric_limits<long long>::min(), std::numeric_limits<long long>::max()})
        ExpectComesBack(Integer(PARAM_INT64, number));
    ExpectComesBack(Integer(PARAM_UNSIGNED, std::numeric_limits<unsigned>::max()));
    ExpectComesBack(Integer(PARAM_UNSIGNED64, -1));
    for (double const number :
         {0.0, -0.0, 0.1, 1e300, -1.0 / 3, 5.0, Limits::denorm_min(), Limits::min(), Limits::max(),
          Limits::lowest(), Limits::infinity(), -Limits::infinity(), Limits::quiet_NaN()})
        ExpectComesBack(Double(number));
}

TEST(TicketXml, EveryByteInAString_ComesBack)
{
    for (int byte = 1; byte < 256; ++byte)
    {
        std::string const one(1, static_cast<char>(byte));
        ExpectComesBack(Bytes(PARAM_STRING, one));
        ExpectComesBack(Bytes(PARAM_STRING, "a" + one + "b"));
        ExpectComesBack(Bytes(PARAM_BINSTRING, one));
        ExpectComesBack(Integer(PARAM_INT, byte), "a" + one + "b");
    }
}

TEST(TicketXml, WhiteSpaceAndMarkupInAString_ComeBack)
{
    for (char const* const text :
         {"", " ", "\n", "\t", "\r", "\r\n", "  x  ", "\n x \n", "<a>&amp;</a>", "]]>", "&#0;", "<!-- -->",
          "\"'", "\xC3\xA4\xE2\x82\xAC\xF0\x9F\x8E\xA8", "\xEF\xBF\xBF", "\xED\xA0\x80", "\xC0\x80"})
    {
        ExpectComesBack(Bytes(PARAM_STRING, text));
        ExpectComesBack(Bytes(PARAM_STRING, "x"), "K" + std::string(text));
    }
}

TEST(TicketXml, ReadableText_IsNotHiddenInBase64)
{
    TicketXml ticket;
    ticket.Put("Key", 0, Bytes(PARAM_STRING, "two\nlines \xC3\xA4"));
    EXPECT_THAT(ticket.Text(), HasSubstr(">two\nlines \xC3\xA4<"));
}

TEST(TicketXml, BytesWithZeros_ComeBack)
{
    std::string bytes;
    for (int i = 0; i < 300; ++i)
    {
        bytes.push_back(static_cast<char>(i));
        ExpectComesBack(Bytes(PARAM_BINSTRING, bytes));
    }
    ExpectComesBack(Bytes(PARAM_BINSTRING, ""));
}

TEST(TicketXml, GapsOfAVector_StayGaps)
{
    TicketXml ticket;
    ticket.Put("Key", 7, Double(1));
    ticket.Put("Key", 2, Double(2));
    std::vector<int> positions;
    TicketXml::Parse(ticket.Text(), "file")
        .Walk([&positions](std::string_view, int pos, StoredValue const&) { positions.push_back(pos); });
    EXPECT_THAT(positions, ElementsAre(2, 7));
}

TEST(TicketXml, Pointer_TakesThePlaceAndIsNotWritten)
{
    TicketXml ticket;
    StoredValue pointer;
    pointer.type = PARAM_POINTER;
    pointer.pointer = &ticket;
    ticket.Put("Key", 0, Double(1));
    ticket.Put("Key", 0, pointer);
    EXPECT_EQ(ticket.Text().find("Key"), std::string::npos);
}

TEST(TicketXml, RandomTickets_ComeBack)
{
    std::mt19937_64 random(815);
    auto const below = [&random](unsigned limit) { return static_cast<int>(random() % limit); };
    for (int round = 0; round < (IsSanitized ? 100 : 500); ++round)
    {
        TicketXml ticket;
        if (below(2) == 0)
            ticket.address = TicketAddress{below(100), below(1 << 24)};
        for (int count = below(20); count > 0; --count)
        {
            std::string key, text;
            for (int size = 1 + below(3); size > 0; --size)
                key.push_back(static_cast<char>(1 + below(255)));
            for (int size = below(10); size > 0; --size)
                text.push_back(static_cast<char>(1 + below(255)));
            auto const bits = static_cast<long long>(random());
            auto const number = std::bit_cast<double>(bits);
            StoredValue const choices[] = {Integer(PARAM_INT, static_cast<int>(bits)),
                                           Integer(PARAM_INT64, bits),
                                           Integer(PARAM_UNSIGNED, static_cast<unsigned>(bits)),
                                           Integer(PARAM_UNSIGNED64, bits),
                                           Double(number == number ? number : 0.5),
                                           Bytes(PARAM_STRING, text),
                                           Bytes(PARAM_BINSTRING, text)};
            ticket.Put(key, below(3), choices[below(7)]);
        }
        TicketXml const again = TicketXml::Parse(ticket.Text(), "file");
        ASSERT_EQ(again.address, ticket.address);
        ASSERT_EQ(again.Text(), ticket.Text());
        std::map<std::pair<std::string, int>, StoredValue> found;
        again.Walk(
            [&found](std::string_view key, int pos, StoredValue const& value) {
                found[{std::string(key), pos}] = value;
            });
        ticket.Walk(
            [&found](std::string_view key, int pos, StoredValue const& value)
            {
                auto const same = found.find({std::string(key), pos});
                ASSERT_TRUE(same != found.end() && SameValue(same->second, value));
                found.erase(same);
            });
        ASSERT_TRUE(found.empty());
    }
}

struct BadText
{
    char const* name;
    std::string text;
    std::string reason;
};
void PrintTo(BadText const& bad, std::ostream* stream) { *stream << bad.name; }
class TicketXmlParse : public testing::TestWithParam<BadText>
{
};
TEST_P(TicketXmlParse, IsRefusedWithFileLineAndReason)
{
    EXPECT_EQ(ReasonOf(GetParam().text), "file:" + GetParam().reason);
}
INSTANTIATE_TEST_SUITE_P(
    Of, TicketXmlParse,
    testing::Values(
        BadText{"Nothing", "", "1: no <ticket> in it"},
        BadText{"NoXml", "\nhello", "1: text where none is expected: hello"},
        BadText{"WrongRoot", "\n<site version='1'/>", "2: <ticket> expected, not <site>"},
        BadText{"TwoRoots", "<ticket version='1'/>\n<ticket version='1'/>",
                "2: a second <ticket> behind the end"},
        BadText{"TextBehindTheEnd", "<ticket version='1'/>\nmore", "1: text where none is expected: more"},
        BadText{"NoVersion", "<ticket/>", "1: the attribute version is missing in <ticket>"},
        BadText{"NewerVersion", "<ticket version='2'/>",
                "1: version 1 expected; a newer version of the program may have written this"},
        BadText{"TypeWithoutId", "<ticket version='1' type='3'/>",
                "1: the attribute id is missing in <ticket>"},
        BadText{"TypePastTheLast", "<ticket version='1' type='100' id='1'/>", "1: type is out of range: 100"},
        BadText{"IdPastTheLast", "<ticket version='1' type='3' id='16777216'/>",
                "1: id is out of range: 16777216"},
        BadText{"NegativeId", "<ticket version='1' type='3' id='-1'/>", "1: id is out of range: -1"},
        BadText{"IdThatIsNoNumber", "<ticket version='1' type='3' id='one'/>", "1: id is not a number: one"},
        BadText{"UnknownAttribute", "<ticket version='1' name='x'/>", "1: unknown attribute name"},
        BadText{"AttributeTwice", "<ticket version='1' version='1'/>",
                "1: the attribute version stands twice"},
        BadText{"BytesThatAreNoUtf8", "<ticket version='1'>\n\xE4</ticket>",
                "2: not UTF-8, or a control character; such a value is written as base64"},
        BadText{"ZeroByte", std::string("<ticket version='1'>\n\n\0</ticket>", 32),
                "3: not UTF-8, or a control character; such a value is written as base64"}),
    [](auto const& fact) { return std::string(fact.param.name); });

class TicketXmlParameter : public testing::TestWithParam<BadText>
{
};
TEST_P(TicketXmlParameter, IsRefusedWithFileLineAndReason)
{
    EXPECT_EQ(ReasonOfParameter(GetParam().text), "file:" + GetParam().reason);
}
INSTANTIATE_TEST_SUITE_P(
    Of, TicketXmlParameter,
    testing::Values(
        BadText{"UnknownElement", "<param key='K' type='int'>1</param>", "2: unknown element <param>"},
        BadText{"TextBetween", "hello", "1: text where none is expected: hello"},
        BadText{"NoKey", "<parameter type='int'>1</parameter>",
                "2: the attribute key is missing in <parameter>"},
        BadText{"NoType", "<parameter key='K'>1</parameter>",
                "2: the attribute type is missing in <parameter>"},
        BadText{"UnknownType", "<parameter key='K' type='float'>1</parameter>", "2: unknown type float"},
        BadText{"PointerType", "<parameter key='K' type='pointer'>1</parameter>", "2: unknown type pointer"},
        BadText{"KeyTwice",
                "<parameter key='K' type='int'>1</parameter>\n<parameter key='K' type='int'>1</parameter>",
                "3: the key K stands twice"},
        BadText{"KeyTwiceInTwoSpellings",
                "<parameter key='K' type='int'>1</parameter>"
                "<parameter key='Sw==' key-encoding='base64' type='int'>1</parameter>",
                "2: the key Sw== stands twice"},
        BadText{
            "PositionTwice",
            "<parameter key='K' type='int'>\n<value pos='3'>1</value>\n<value pos='3'>1</value></parameter>",
            "4: position 3 stands twice"},
        BadText{"NoPosition", "<parameter key='K' type='int'><value>1</value></parameter>",
                "2: the attribute pos is missing in <value>"},
        BadText{"NegativePosition", "<parameter key='K' type='int'><value pos='-1'>1</value></parameter>",
                "2: pos is out of range: -1"},
        BadText{"PositionTooFar", "<parameter key='K' type='int'><value pos='16777216'>1</value></parameter>",
                "2: pos is out of range: 16777216"},
        BadText{"EmptyKey", "<parameter key='' type='int'>1</parameter>",
                "2: a key is a text of at least one byte, without a zero byte"},
        BadText{"ZeroByteInAKey", "<parameter key='AEE=' key-encoding='base64' type='int'>1</parameter>",
                "2: a key is a text of at least one byte, without a zero byte"},
        BadText{"TextBesideValues", "<parameter key='K' type='string'>a<value pos='0'>1</value></parameter>",
                "2: text where none is expected: a"},
        BadText{"ElementInAValue", "<parameter key='K' type='string'><value pos='0'><b/></value></parameter>",
                "2: unknown element <b>"},
        BadText{"UnknownElementInAParameter", "<parameter key='K' type='string'><item/></parameter>",
                "2: unknown element <item>"},
        BadText{"NotANumber", "<parameter key='K' type='int'>two</parameter>",
                "2: not a number of type int: two"},
        BadText{"NumberWithATail", "<parameter key='K' type='int'>2x</parameter>",
                "2: not a number of type int: 2x"},
        BadText{"NoNumber", "<parameter key='K' type='int'/>", "2: not a number of type int: "},
        BadText{"FractionInAnInt", "<parameter key='K' type='int'>2.5</parameter>",
                "2: not a number of type int: 2.5"},
        BadText{"IntTooLarge", "<parameter key='K' type='int'>2147483648</parameter>",
                "2: out of range of type int: 2147483648"},
        BadText{"IntTooSmall", "<parameter key='K' type='int'>-2147483649</parameter>",
                "2: out of range of type int: -2147483649"},
        BadText{"UnsignedBelowZero", "<parameter key='K' type='unsigned'>-1</parameter>",
                "2: not a number of type unsigned: -1"},
        BadText{"UnsignedTooLarge", "<parameter key='K' type='unsigned'>4294967296</parameter>",
                "2: out of range of type unsigned: 4294967296"},
        BadText{"Int64TooLarge", "<parameter key='K' type='int64'>9223372036854775808</parameter>",
                "2: out of range of type int64: 9223372036854775808"},
        BadText{"Unsigned64TooLarge", "<parameter key='K' type='unsigned64'>18446744073709551616</parameter>",
                "2: out of range of type unsigned64: 18446744073709551616"},
        BadText{"DoubleTooLarge", "<parameter key='K' type='double'>1e999</parameter>",
                "2: out of range of type double: 1e999"},
        BadText{"DoubleWithAComma", "<parameter key='K' type='double'>1,5</parameter>",
                "2: not a number of type double: 1,5"},
        BadText{"BadBase64", "<parameter key='K' type='binary'>A?==</parameter>", "2: not base64: A?=="},
        BadText{"UnknownEncoding", "<parameter key='K' type='string' encoding='hex'>41</parameter>",
                "2: unknown encoding hex"},
        BadText{"UnknownKeyEncoding", "<parameter key='K' key-encoding='hex' type='int'>1</parameter>",
                "2: unknown encoding hex"},
        BadText{"EncodedNumber", "<parameter key='K' type='int' encoding='base64'>MQ==</parameter>",
                "2: a number has no encoding"},
        BadText{"EncodedVector",
                "<parameter key='K' type='string' encoding='base64'><value pos='0'>MQ==</value></parameter>",
                "2: encoding belongs to each <value> where there are any"},
        BadText{"ZeroByteInAString", "<parameter key='K' type='string' encoding='base64'>AEE=</parameter>",
                "2: a zero byte in a string; type binary may hold it"},
        BadText{"LineEndsInNoNumber", "<parameter key='K' type='int'>\ntwo\r\nlines\n</parameter>",
                "2: not a number of type int: ?two?lines?"},
        BadText{"LineEndInAnAttribute", "<parameter key='K' type='a&#10;b'>1</parameter>",
                "2: unknown type a?b"},
        BadText{"ReferenceToZero", "<parameter key='K' type='string'>a&#x00;b</parameter>",
                "2: no number of a character that XML allows; such a value is written as base64"}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(TicketXmlParse, ReferenceToWhatIsNoCharacter_IsRefused)
{
    auto const reason = [](std::string const& reference)
    {
        return ReasonOf("<ticket version='1'><parameter key='K' type='string'>a" + reference +
                        "b</parameter></ticket>");
    };
    for (char const* const wrong :
         {"&#0;", "&#00;", "&#x0;", "&#1;", "&#x1F;", "&#xD800;", "&#xDFFF;", "&#xFFFE;", "&#xFFFF;",
          "&#x110000;", "&#4294967296;", "&#x100000000;", "&#4294967361;", "&#18446744073709551616;",
          "&#99999999999999999999999999;"})
        EXPECT_THAT(reason(wrong), HasSubstr("no number of a character")) << wrong;
    for (char const* const right : {"&#9;", "&#10;", "&#13;", "&#32;", "&#x41;", "&#xD7FF;", "&#xE000;",
                                    "&#xFFFD;", "&#x10000;", "&#x10FFFF;"})
        EXPECT_EQ(reason(right), "accepted") << right;
}

TEST(TicketXmlParse, EveryPrefix_IsRefused)
{
    std::string text = Example;
    text.pop_back();  // what follows the last bracket is white space and may be missing
    for (std::size_t size = 0; size < text.size(); ++size)
        ASSERT_NE(ReasonOf(text.substr(0, size)), "accepted") << size;
    EXPECT_EQ(ReasonOf(text), "accepted");
}

TEST(TicketXmlParse, EveryChangedBit_IsRefusedOrRead)
{
    std::string const text = Example;
    for (std::size_t bit = 0; bit < text.size() * 8; bit += IsSanitized ? 5 : 1)
    {
        std::string changed = text;
        changed[bit / 8] = static_cast<char>(changed[bit / 8] ^ 1 << bit % 8);
        std::string const reason = ReasonOf(changed);
        ASSERT_TRUE(reason == "accepted" || reason.starts_with("file:")) << reason;
    }
}

TEST(TicketXmlParse, TooLarge_IsRefusedBeforeItIsParsed)
{
    std::string text(TicketXml::SizeLimit + 1, ' ');
    EXPECT_EQ(ReasonOf(text), "file:1: larger than 64 MiB");
}

TEST(TicketXmlParse, DeepNesting_IsRefusedWithoutHarm)
{
    std::string text = "<ticket version='1'>";
    for (int i = 0; i < 200000; ++i)
        text += "<a>";
    EXPECT_NE(ReasonOf(text), "accepted");
    for (int i = 0; i < 200000; ++i)
        text += "</a>";
    EXPECT_EQ(ReasonOf(text + "</ticket>"), "file:1: unknown element <a>");
}

TEST(TicketXmlFile, Write_ThenRead_IsTheSameTicket)
{
    MemoryFolder folder;
    TicketXml::Parse(Example, "file").Write(folder / "ticket.xml");
    EXPECT_EQ(TicketXml::Read(folder / "ticket.xml").Text(), Example);
}

TEST(TicketXmlFile, Read_NamesTheFileAndTheLine)
{
    MemoryFolder folder;
    WriteFile(folder / "ticket.xml", "\n<site/>");
    try
    {
        TicketXml::Read(folder / "ticket.xml");
        FAIL() << "accepted";
    }
    catch (XmlError const& error)
    {
        EXPECT_THAT(error.what(),
                    AllOf(HasSubstr((folder / "ticket.xml").string() + ":2: "), HasSubstr("<site>")));
    }
}

TEST(TicketXmlFile, Read_OfAMissingFile_NamesItAndTheReason)
{
    MemoryFolder folder;
    try
    {
        TicketXml::Read(folder / "ticket.xml");
        FAIL() << "accepted";
    }
    catch (FileError const& error)
    {
        EXPECT_THAT(error.what(), AllOf(HasSubstr((folder / "ticket.xml").string()),
                                        HasSubstr("No such file or directory")));
    }
}

TEST(TicketXmlFile, Read_OfAnEndlessFile_EndsAtTheLimit)
{
    EXPECT_THROW(TicketXml::Read("/dev/zero"), XmlError);
}

TEST(Base64, KnownTexts_BothWays)
{
    for (auto const& [bytes, text] : std::map<std::string, std::string>{{"", ""},
                                                                        {"f", "Zg=="},
                                                                        {"fo", "Zm8="},
                                                                        {"foo", "Zm9v"},
                                                                        {"foob", "Zm9vYg=="},
                                                                        {"\xFB\xFF", "+/8="}})
    {
        EXPECT_EQ(EncodeBase64(bytes), text);
        EXPECT_EQ(DecodeBase64(text), bytes);
    }
    EXPECT_EQ(DecodeBase64(" Zm9v\n\tYg = = "), "foob");
}

TEST(Base64, WhatIsNone_GivesNothing)
{
    for (char const* const text :
         {"Z", "Zg", "Zg=", "Zg===", "=", "====", "Zg==Zg==", "Zg=g", "Z=g=", "Zm9v====", "Zm9\xC3"})
        EXPECT_FALSE(DecodeBase64(text)) << text;
}

TEST(ReplaceFile, MakesAFileThatIsNotThere)
{
    MemoryFolder folder;
    ReplaceFile(folder / "file", "new");
    EXPECT_EQ(ContentOf(folder / "file"), "new");
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("file"));
}

TEST(ReplaceFile, PutsANewFileInThePlaceOfTheOld)
{
    MemoryFolder folder;
    WriteFile(folder / "file", "the old content");
    int const reader = open((folder / "file").c_str(), O_RDONLY | O_CLOEXEC);
    ReplaceFile(folder / "file", "new");
    EXPECT_EQ(ContentOf(folder / "file"), "new");
    char old[32];
    EXPECT_EQ(read(reader, old, sizeof(old)), 15) << "who reads the old file goes on reading it";
    close(reader);
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("file"));
}

TEST(ReplaceFile, KeepsThePermissions)
{
    MemoryFolder folder;
    WriteFile(folder / "file", "old");
    chmod((folder / "file").c_str(), 0640);
    ReplaceFile(folder / "file", "new");
    struct stat found = {};
    stat((folder / "file").c_str(), &found);
    EXPECT_EQ(found.st_mode & 07777, 0640u);
}

// Not even while it is written.
TEST(ReplaceFile, OfAPrivateFile_ShowsItToNobody)
{
    MemoryFolder folder;
    WriteFile(folder / "file", "old");
    std::filesystem::permissions(folder / "file", std::filesystem::perms::owner_all);
    std::atomic<int> seen{0};
    std::atomic<int> open{0};
    std::jthread looker(
        [&](std::stop_token const& end)
        {
            while (!end.stop_requested())
                for (std::string const& name : NamesIn(folder.Path()))
                {
                    struct stat found = {};
                    if (name == "file" || stat((folder / name).c_str(), &found) != 0)
                        continue;
                    ++seen;
                    open += (found.st_mode & 077) != 0 ? 1 : 0;
                }
        });
    for (int round = 0; round < 10'000 && seen < 20; ++round)
        ReplaceFile(folder / "file", std::string(1'000'000, 'x'));
    looker.request_stop();
    looker.join();
    EXPECT_GT(seen, 0);
    EXPECT_EQ(open, 0);
}

TEST(ReplaceFile, OfAnotherUsersFile_StaysHis)
{
    if (geteuid() != 0)
        GTEST_SKIP() << "only an administrator has files of others";
    MemoryFolder folder;
    WriteFile(folder / "file", "old");
    ASSERT_EQ(chown((folder / "file").c_str(), 1234, 5678), 0);
    chmod((folder / "file").c_str(), 0640);
    ReplaceFile(folder / "file", "new");
    struct stat found = {};
    ASSERT_EQ(stat((folder / "file").c_str(), &found), 0);
    EXPECT_EQ(found.st_uid, 1234u);
    EXPECT_EQ(found.st_gid, 5678u);
    EXPECT_EQ(found.st_mode & 07777, 0640u);
}

TEST(ReplaceFile, IsNotLedAwayByALinkOfAnOldName)
{
    MemoryFolder folder;
    WriteFile(folder / "victim", "victim");
    for (int number = 0; number < 20; ++number)
        std::filesystem::create_symlink(folder / "victim", folder / ("file." + std::to_string(getpid()) +
                                                                     "-" + std::to_string(number) + ".tmp"));
    ReplaceFile(folder / "file", "new");
    EXPECT_EQ(ContentOf(folder / "victim"), "victim");
    EXPECT_EQ(ContentOf(folder / "file"), "new");
}

TEST(ReplaceFile, ThroughALink_ReplacesWhatItPointsAt)
{
    MemoryFolder folder;
    WriteFile(folder / "file", "old");
    std::filesystem::create_symlink("file", folder / "link");
    ReplaceFile(folder / "link", "new");
    EXPECT_TRUE(std::filesystem::is_symlink(folder / "link"));
    EXPECT_EQ(ContentOf(folder / "file"), "new");
}

TEST(ReplaceFile, WithoutItsFolder_NamesFileReasonAndRemedy)
{
    MemoryFolder folder;
    try
    {
        ReplaceFile(folder / "none" / "file", "new");
        FAIL() << "written";
    }
    catch (FileError const& error)
    {
        EXPECT_EQ(error.what(),
                  (folder / "none" / "file").string() +
                      ": cannot be written: No such file or directory; make the file or folder, or "
                      "correct its path");
    }
}

TEST(ReplaceFile, OfAFolder_FailsAndLeavesIt)
{
    MemoryFolder folder;
    std::filesystem::create_directories(folder / "file" / "sub");
    EXPECT_THROW(ReplaceFile(folder / "file", "new"), FileError);
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("file"));
    EXPECT_TRUE(std::filesystem::is_directory(folder / "file" / "sub"));
}

TEST(ReplaceFile, DiskFull_KeepsTheOldContentAndLeavesNothingElse)
{
    MemoryFolder folder;
    WriteFile(folder / "file", "old");
    ChildProcess child(
        [&folder](ChildProcess::Report const& report)
        {
            std::signal(SIGXFSZ, SIG_IGN);
            rlimit const limit{64ul * 1024, 64ul * 1024};
            setrlimit(RLIMIT_FSIZE, &limit);
            try
            {
                ReplaceFile(folder / "file", std::string(128ul * 1024, 'x'));
            }
            catch (FileError const& error)
            {
                report(std::string(error.what()).find("; free some space") != std::string::npos);
            }
        });
    EXPECT_EQ(child.Wait(), 0);
    EXPECT_EQ(child.Last(-1), 1);
    EXPECT_EQ(ContentOf(folder / "file"), "old");
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("file"));
}

TEST(ReplaceFile, KilledAtAnyInstant_HasTheOldContentOrTheNew)
{
    MemoryFolder folder;
    std::mt19937_64 random(99);
    ReplaceFile(folder / "file", std::string(100000, 'a'));
    for (int round = 0; round < (IsSanitized ? 10 : 50); ++round)
    {
        ChildProcess child(
            [&folder](ChildProcess::Report const&)
            {
                for (char letter = 'a';; letter = letter == 'z' ? 'a' : static_cast<char>(letter + 1))
                    ReplaceFile(folder / "file", std::string(100000, letter));
            });
        usleep(static_cast<useconds_t>(random() % 10000));
        child.Kill();
        std::string const content = ContentOf(folder / "file");
        ASSERT_EQ(content.size(), 100000u);
        ASSERT_EQ(content.find_first_not_of(content[0]), std::string::npos);
    }
    RemoveLeftovers(folder / "file");
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("file"));
}

TEST(RemoveLeftovers, OfProcessesThatAreGone_GoAndNothingElseDoes)
{
    MemoryFolder folder;
    std::vector<std::string> kept = {"file",
                                     "file.tmp",
                                     "file.0123456789abcde.tmp",
                                     "file.0123456789abcdef0.tmp",
                                     "file.0123456789abcdeF.tmp",
                                     "file.0123456789abcdef.tmp.old",
                                     "file-0123456789abcdef.tmp",
                                     "file.xml.0123456789abcdef.tmp",
                                     "other.0123456789abcdef.tmp"};
    for (std::string const& name : kept)
        WriteFile(folder / name, "kept");
    std::filesystem::create_directory(folder / "file.000000000000000f.tmp");
    std::filesystem::create_symlink(folder / "file", folder / "file.000000000000001f.tmp");
    kept.insert(kept.end(), {"file.000000000000000f.tmp", "file.000000000000001f.tmp"});
    WriteFile(folder / "file.0123456789abcdef.tmp", "half");
    WriteFile(folder / "file.fedcba9876543210.tmp", "half");
    RemoveLeftovers(folder / "file");
    EXPECT_THAT(NamesIn(folder.Path()), UnorderedElementsAreArray(kept));
}

// Whether a process lives is told by its lock, which is good on another machine and in another container.
TEST(RemoveLeftovers, WhileFilesAreReplaced_DisturbNobody)
{
    MemoryFolder folder;
    std::jthread const cleaner(
        [&](std::stop_token const& end)
        {
            while (!end.stop_requested())
                RemoveLeftovers(folder / "file");
        });
    std::vector<std::jthread> writers;
    for (char const letter : {'a', 'b'})
        writers.emplace_back(
            [&folder, letter]
            {
                for (int round = 0; round < 300; ++round)
                    EXPECT_NO_THROW(ReplaceFile(folder / "file", std::string(1000, letter)));
            });
    writers.clear();
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre("file"));
}

TEST(RemoveLeftovers, OfALongName_GoToo)
{
    MemoryFolder folder;
    std::string const name(255, 'n');
    ReplaceFile(folder / name, "content");
    EXPECT_EQ(ContentOf(folder / name), "content");
    WriteFile(folder / (name.substr(0, 255 - 21) + ".0123456789abcdef.tmp"), "half");
    RemoveLeftovers(folder / name);
    EXPECT_THAT(NamesIn(folder.Path()), ElementsAre(name));
}

TEST(RemoveLeftovers, InNoFolder_IsNothingToDo)
{
    MemoryFolder folder;
    EXPECT_NO_THROW(RemoveLeftovers(folder / "none" / "file"));
}
