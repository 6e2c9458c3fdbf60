#include "desk/model/TicketXml.h"

#include "desk/model/FileContent.h"
#include "standin/server/tickets/TicketXml.h"
#include "tests/desk/FileFacts.h"
#include "tests/support/HexText.h"
#include <gtest/gtest.h>

using namespace comgui;
using namespace desk;

namespace
{
// In a block of exactly its size.
FileResult<TicketOfFile> Read(std::string_view xml)
{
    ExactBytes const bytes(xml);
    return TicketOfXml({static_cast<char const*>(bytes.Data()), bytes.Size()}, "job.xml");
}

std::string Ticket(std::string const& content)
{
    return "<ticket version=\"1\">\n" + content + "</ticket>\n";
}

Value OnlyValueOf(std::string const& parameter)
{
    auto const read = Read(Ticket(parameter));
    if (auto const* const fault = std::get_if<FileFault>(&read))
        throw std::runtime_error("refused: " + fault->detail);
    return std::get<TicketOfFile>(read).ticket.Entries().at(0).value;
}

// What the plug-in writes of a ticket.
std::string Written(Snapshot const& ticket)
{
    standin::TicketXml xml;
    xml.address = {3, 7};
    auto const put = [&xml](std::string const& key, int pos, Value const& value)
    {
        standin::StoredValue stored;
        stored.type = value.Type();
        if (auto const* const text = std::get_if<std::string>(&value))
            stored.bytes = *text;
        else if (auto const* const bytes = std::get_if<Bytes>(&value))
            stored.bytes = bytes->bytes;
        else if (auto const* const number = std::get_if<double>(&value))
            stored.number = *number;
        else if (auto const* const large = std::get_if<unsigned long long>(&value))
            stored.integer = static_cast<long long>(*large);
        else
            stored.integer = *As<long long>(value);
        xml.Put(key, pos, stored);
    };
    for (auto const& [key, value] : ticket.Entries())
        if (auto const* const list = std::get_if<comgui::List>(&value))
            for (Element const& element : *list)
                put(key, element.pos, element.value);
        else
            put(key, 0, value);
    return xml.Text();
}
}  // namespace

TEST(TicketXml, ReadsWhatThePlugInWrites)
{
    auto const read = Read(Written(PlainTicket()));
    ASSERT_EQ(TroubleOf(read), std::nullopt) << FaultOf(read).detail;
    auto const& [address, ticket] = std::get<TicketOfFile>(read);
    EXPECT_EQ(address, (TicketAddress{3, 7}));
    for (auto const& difference : Difference(PlainTicket(), ticket))
        ADD_FAILURE() << difference.key;
}

TEST(TicketXml, KeepsTypesAndNumbersThatStreamsDoNot)
{
    constexpr double Infinity = std::numeric_limits<double>::infinity();
    Snapshot const ticket(
        {{"a", 7U}, {"b", 3.0}, {"c", 7LL}, {"d", 7ULL}, {"e", Infinity}, {"f", -Infinity}, {"g", -0.0}});
    auto const read = Read(Written(ticket));
    ASSERT_EQ(TroubleOf(read), std::nullopt);
    EXPECT_TRUE(Difference(ticket, std::get<TicketOfFile>(read).ticket).empty());
    EXPECT_TRUE(std::signbit(std::get<double>(*std::get<TicketOfFile>(read).ticket.Find("g"))));
}

TEST(TicketXml, WithoutAddress_HasNone)
{
    auto const read = Read(Ticket(""));
    EXPECT_EQ(std::get<TicketOfFile>(read).address, std::nullopt);
    EXPECT_TRUE(std::get<TicketOfFile>(read).ticket.Entries().empty());
}

struct VALUE_FACT
{
    char const* name;
    char const* parameter;
    Value value;
};
class XmlValue : public testing::TestWithParam<VALUE_FACT>
{
};
TEST_P(XmlValue, IsThat) { EXPECT_EQ(OnlyValueOf(GetParam().parameter), GetParam().value); }
INSTANTIATE_TEST_SUITE_P(
    Facts, XmlValue,
    testing::Values(
        VALUE_FACT{"SpaceAroundANumber", "<parameter key='a' type='int'>\n 5 </parameter>", 5},
        VALUE_FACT{"SpaceInAText", "<parameter key='a' type='string'> 5\n</parameter>", " 5\n"},
        VALUE_FACT{"EmptyText", "<parameter key='a' type='string'/>", ""},
        VALUE_FACT{"LineEnds", "<parameter key='a' type='string'>1\r\n2</parameter>", "1\n2"},
        VALUE_FACT{"References",
                   "<parameter key='a' type='string'>&lt;&amp;&gt;&quot;&apos;&#65;&#x1F5A8;</parameter>",
                   "<&>\"'A\xF0\x9F\x96\xA8"},
        VALUE_FACT{"ReferenceOfAReference", "<parameter key='a' type='string'>&amp;lt;</parameter>", "&lt;"},
        VALUE_FACT{"CharacterData", "<parameter key='a' type='string'>x<![CDATA[&lt;<]]>y</parameter>",
                   "x&lt;<y"},
        VALUE_FACT{"Comment", "<parameter key='a' type='string'>x<!-- & -->y</parameter>", "xy"},
        VALUE_FACT{"Base64", "<parameter key='a' type='string' encoding='base64'>/w==</parameter>", "\xFF"},
        VALUE_FACT{"Base64InLines", "<parameter key='a' type='binary'>\n /w\n D/ \n</parameter>",
                   Bytes{std::string("\xFF\x00\xFF", 3)}},
        VALUE_FACT{
            "List",
            "<parameter key='a' type='int'><value pos='1'>5</value><value pos='0' type='string'>x</value>"
            "</parameter>",
            comgui::List{{0, "x"}, {1, 5}}},
        VALUE_FACT{"Infinity", "<parameter key='a' type='double'>-inf</parameter>",
                   -std::numeric_limits<double>::infinity()}),
    [](auto const& fact) { return std::string(fact.param.name); });

struct WRONG_FACT
{
    char const* name;
    std::string xml;
    FileTrouble trouble;
    std::size_t line;
};
class WrongXml : public testing::TestWithParam<WRONG_FACT>
{
};
TEST_P(WrongXml, IsRefusedWithItsLine)
{
    auto const& [name, xml, trouble, line] = GetParam();
    auto const read = Read(xml);
    ASSERT_EQ(TroubleOf(read), trouble);
    EXPECT_EQ(FaultOf(read).line, line);
    EXPECT_EQ(FaultOf(read).byte, std::nullopt);
    EXPECT_EQ(FaultOf(read).file, "job.xml");
    EXPECT_LE(FaultOf(read).detail.size(), 40U);
}
namespace
{
WRONG_FACT Wrong(char const* name, std::string const& parameter, FileTrouble trouble)
{
    return {name, Ticket(parameter), trouble, 2};
}
std::string Valued(char const* type, std::string const& value)
{
    return std::string("<parameter key='a' type='") + type + "'>" + value + "</parameter>";
}

// Ten entities, each ten times the one before.
std::string Laughs()
{
    std::string xml = "<!DOCTYPE ticket [<!ENTITY l0 \"lol\">";
    for (char i = '1'; i <= '9'; ++i)
    {
        xml += std::string("<!ENTITY l") + i + " \"";
        for (int k = 0; k < 10; ++k)
            xml += std::string("&l") + static_cast<char>(i - 1) + ";";
        xml += "\">";
    }
    return xml + "]>\n" + Ticket(Valued("string", "&l9;"));
}
}  // namespace
INSTANTIATE_TEST_SUITE_P(
    Facts, WrongXml,
    testing::Values(
        WRONG_FACT{"Nothing", "<!-- nothing -->", FileTrouble::NotATicket, 1},
        WRONG_FACT{"AnotherRoot", "\n<site version='1'/>", FileTrouble::NotATicket, 2},
        WRONG_FACT{"TwoRoots", Ticket("") + "<ticket version='1'/>", FileTrouble::NotATicket, 3},
        WRONG_FACT{"TextBehind", Ticket("") + "x", FileTrouble::StrayText, 3},
        WRONG_FACT{"NoVersion", "<ticket/>", FileTrouble::MissingAttribute, 1},
        WRONG_FACT{"NewerVersion", "<ticket version='2'/>", FileTrouble::UnknownVersion, 1},
        WRONG_FACT{"TypeWithoutId", "<ticket version='1' type='3'/>", FileTrouble::MissingAttribute, 1},
        WRONG_FACT{"TypeTooLarge", "<ticket version='1' type='100' id='1'/>", FileTrouble::OutOfRange, 1},
        WRONG_FACT{"NegativeId", "<ticket version='1' type='3' id='-1'/>", FileTrouble::OutOfRange, 1},
        WRONG_FACT{"Doctype", "<!DOCTYPE ticket SYSTEM 'file:///etc/passwd'>" + Ticket(""),
                   FileTrouble::DocumentType, 1},
        WRONG_FACT{"BillionLaughs", Laughs(), FileTrouble::DocumentType, 1},
        Wrong("UnknownElement", "<value pos='0'>1</value>", FileTrouble::UnknownElement),
        Wrong("ElementInValue", Valued("int", "<value pos='0'><b/></value>"), FileTrouble::UnknownElement),
        Wrong("StrayText", "x", FileTrouble::StrayText),
        Wrong("TextBesideValues", Valued("int", "x<value pos='0'>1</value>"), FileTrouble::StrayText),
        Wrong("UnknownAttribute", "<parameter key='a' type='int' size='1'>1</parameter>",
              FileTrouble::UnknownAttribute),
        Wrong("RepeatedAttribute", "<parameter key='a' key='b' type='int'>1</parameter>",
              FileTrouble::RepeatedAttribute),
        Wrong("NoKey", "<parameter type='int'>1</parameter>", FileTrouble::MissingAttribute),
        Wrong("NoType", "<parameter key='a'>1</parameter>", FileTrouble::MissingAttribute),
        Wrong("NoPosition", Valued("int", "<value>1</value>"), FileTrouble::MissingAttribute),
        Wrong("EmptyKey", "<parameter key='' type='int'>1</parameter>", FileTrouble::BadKey),
        Wrong("ZeroByteInKey", "<parameter key='YQBi' key-encoding='base64' type='int'>1</parameter>",
              FileTrouble::BadKey),
        Wrong("LongKey", "<parameter key='" + std::string(LongestKey + 1, 'k') + "' type='int'>1</parameter>",
              FileTrouble::BadKey),
        Wrong("RepeatedKey", Valued("int", "1") + Valued("int", "2"), FileTrouble::RepeatedKey),
        Wrong("RepeatedPosition", Valued("int", "<value pos='1'>1</value><value pos='1'>1</value>"),
              FileTrouble::RepeatedPosition),
        Wrong("NegativePosition", Valued("int", "<value pos='-1'>1</value>"), FileTrouble::OutOfRange),
        Wrong("FarPosition", Valued("int", "<value pos='16777216'>1</value>"), FileTrouble::OutOfRange),
        Wrong("UnknownType", Valued("pointer", "1"), FileTrouble::UnknownType),
        Wrong("NoNumber", Valued("int", "one"), FileTrouble::NotANumber),
        Wrong("EmptyNumber", Valued("double", ""), FileTrouble::NotANumber),
        Wrong("LargeNumber", Valued("int", "2147483648"), FileTrouble::OutOfRange),
        Wrong("NegativeUnsigned", Valued("unsigned", "-1"), FileTrouble::OutOfRange),
        Wrong("NoBase64", Valued("binary", "=x="), FileTrouble::NotBase64),
        Wrong("CutBase64", Valued("binary", "/w="), FileTrouble::NotBase64),
        Wrong("UnknownEncoding", "<parameter key='a' type='string' encoding='hex'>1</parameter>",
              FileTrouble::UnknownEncoding),
        Wrong("EncodedNumber", "<parameter key='a' type='int' encoding='base64'>MQ==</parameter>",
              FileTrouble::UnknownEncoding),
        Wrong("EncodedList",
              "<parameter key='a' type='string' encoding='base64'><value pos='0'>1</value></parameter>",
              FileTrouble::UnknownAttribute),
        Wrong("ZeroByteInText", "<parameter key='a' type='string' encoding='base64'>YQBi</parameter>",
              FileTrouble::BadText),
        Wrong("UnknownEntity", Valued("string", "&lol;"), FileTrouble::BadReference),
        Wrong("LoneAmpersand", Valued("string", "a & b"), FileTrouble::BadReference),
        Wrong("ReferenceToZero", Valued("string", "&#0;"), FileTrouble::BadReference),
        Wrong("ReferenceTooLarge", Valued("string", "&#4294967361;"), FileTrouble::BadReference),
        Wrong("ReferenceToASurrogate", Valued("string", "&#xD800;"), FileTrouble::BadReference),
        Wrong("ControlCharacter", Valued("string", "\x01"), FileTrouble::ControlCharacter),
        Wrong("ZeroByte", Valued("string", std::string(1, '\0')), FileTrouble::ControlCharacter),
        Wrong("NoUtf8", Valued("string", "\xFF"), FileTrouble::NotUtf8),
        Wrong("OverlongUtf8", Valued("string", "\xC0\xAF"), FileTrouble::NotUtf8),
        Wrong("Unbalanced", "<parameter key='a' type='int'>1</value>", FileTrouble::BrokenXml)),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(TicketXml, CutAnywhere_IsRefused)
{
    std::string const xml =
        Written(Snapshot({{"Job/Copies", 3}, {"Job/Name", "Grün"}, {"x", comgui::List{{1, 2.5}}}}));
    std::size_t const end = xml.rfind('>');
    ASSERT_EQ(TroubleOf(Read(xml.substr(0, end + 1))), std::nullopt);
    for (std::size_t size = 0; size <= end; ++size)
        ASSERT_NE(TroubleOf(Read(xml.substr(0, size))), std::nullopt) << size;
}

TEST(TicketXml, AMillionElementsDeep_IsRefused)
{
    std::string xml = "<ticket version='1'>";
    for (int i = 0; i < 1000000; ++i)
        xml += "<a>";
    EXPECT_NE(TroubleOf(Read(xml)), std::nullopt);
    for (int i = 0; i < 1000000; ++i)
        xml += "</a>";
    EXPECT_EQ(TroubleOf(Read(xml + "</ticket>")), FileTrouble::UnknownElement);
}

TEST(TicketXml, MoreElementsThanFitIntoMemory_AreRefusedBeforeTheyAreParsed)
{
    std::string xml = "<ticket version='1'>";
    for (int i = 0; i < 9 << 20; ++i)
        xml += "<a/>";
    EXPECT_EQ(TroubleOf(Read(xml + "</ticket>")), FileTrouble::TooLarge);
}

TEST(TicketXml, OfHundredThousandKeys_ComesBack)
{
    std::vector<SnapshotEntry> entries;
    for (int i = 0; i < 100000; ++i)
        entries.push_back({"Key/" + std::to_string(1000000 + i), i});
    Snapshot const ticket(std::move(entries));
    auto const read = Read(Written(ticket));
    ASSERT_EQ(TroubleOf(read), std::nullopt);
    EXPECT_TRUE(Difference(ticket, std::get<TicketOfFile>(read).ticket).empty());
}
