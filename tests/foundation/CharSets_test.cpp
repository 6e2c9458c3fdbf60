#include "comgui/foundation/CharSets.h"

#include "tests/support/Allocations.h"
#include "tests/support/HexText.h"
#include <algorithm>
#include <cstdlib>
#include <gtest/gtest.h>
#include <memory>
#include <new>
#include <random>
#include <sys/mman.h>
#include <unistd.h>

using CharSets::FilterString;
namespace DBCS = CharSets::DBCS;

namespace
{
// Every byte value once, from 0 on.
std::string AllBytes()
{
    std::string bytes;
    for (int c = 0; c < 256; ++c)
        bytes += static_cast<char>(c);
    return bytes;
}

std::string Escaped(std::string text)
{
    CharSets::ReplaceConflictingXMLDataInString(text);
    return text;
}

std::string Replaced(std::string text, char from, char to)
{
    DBCS::ReplaceAll(text, from, to);
    return text;
}
}  // namespace

namespace
{
struct CONVERSION
{
    char const* name;
    void (*toBuffer)(char*, char const*, unsigned long);
    std::string (*toString)(std::string const&);
};

class Conversion : public testing::TestWithParam<CONVERSION>
{
protected:
    std::string ToBuffer(char const* text, unsigned long size)
    {
        std::string buffer = "########";
        GetParam().toBuffer(buffer.data(), text, size);
        return buffer;
    }
};
}  // namespace

TEST_P(Conversion, OverlongText_IsCutAtAByteAndTerminated)
{
    EXPECT_EQ(ToBuffer("abcdef", 4), std::string("abc\0####", 8));
    EXPECT_EQ(ToBuffer("\xC3\xA4\xC3\xA4", 4), std::string("\xC3\xA4\xC3\0####", 8));
}

TEST_P(Conversion, ShortText_IsFollowedByZerosToTheEnd)
{
    EXPECT_EQ(ToBuffer("ab", 6), std::string("ab\0\0\0\0##", 8));
}

TEST_P(Conversion, SizeZero_TouchesNothing) { EXPECT_EQ(ToBuffer("abc", 0), "########"); }

TEST_P(Conversion, NullText_GivesAnAllZeroBuffer)
{
    EXPECT_EQ(ToBuffer(nullptr, 4), std::string("\0\0\0\0####", 8));
}

TEST_P(Conversion, String_IsCopiedByteForByte)
{
    EXPECT_EQ(GetParam().toString(AllBytes()), AllBytes());
    EXPECT_EQ(GetParam().toString(""), "");
}

INSTANTIATE_TEST_SUITE_P(Facts, Conversion,
                         testing::Values(CONVERSION{"Win2Utf8", CharSets::Win2Utf8, CharSets::Win2Utf8},
                                         CONVERSION{"Win2Utf8Decomposed", CharSets::Win2Utf8Decomposed,
                                                    CharSets::Win2Utf8Decomposed},
                                         CONVERSION{"Utf82Win", CharSets::Utf82Win, CharSets::Utf82Win}),
                         [](auto const& fact) { return std::string(fact.param.name); });

TEST(NeedsConversion, AnyText_IsFalse)
{
    for (char const* text : {"", "abc", "\xC4", "\xC3\xA4"})
    {
        EXPECT_FALSE(CharSets::NeedsConversion(text));
        EXPECT_FALSE(CharSets::NeedsConversion(std::string(text)));
    }
}

TEST(RequiredBufferSize, AnyText_IsZero)
{
    for (char const* text : {"", "abc", "\xC4", "\xC3\xA4"})
    {
        EXPECT_EQ(CharSets::RequiredBufferSize(text), 0u);
        EXPECT_EQ(CharSets::RequiredBufferSize(std::string(text)), 0u);
    }
}

TEST(DuplicateAndConvert, NullText_GivesNullForEveryMethod)
{
    using namespace CharSets;
    for (int const method : {0, 1, 2, -1})
        EXPECT_EQ(DuplicateAndConvert(nullptr, WIN_TO_UTF8, static_cast<ALLOC_METHOD>(method)), nullptr);
}

// An address sanitizer also sees that each copy comes from where it is given back.
TEST(DuplicateAndConvert, EitherDirection_Copies)
{
    using namespace CharSets;
    for (DIRECTION const direction : {WIN_TO_UTF8, UTF8_TO_WIN})
    {
        std::unique_ptr<char, void (*)(void*)> const fromMalloc(
            DuplicateAndConvert("\xC4 text", direction, ALLOC_MALLOC), std::free);
        EXPECT_STREQ(fromMalloc.get(), "\xC4 text");
        for (int const method : {1, 2, -1})
        {
            std::unique_ptr<char[]> const fromNew(
                DuplicateAndConvert("\xC4 text", direction, static_cast<ALLOC_METHOD>(method)));
            EXPECT_STREQ(fromNew.get(), "\xC4 text");
        }
    }
}

TEST(DuplicateAndConvert, EmptyText_IsOneByte)
{
    std::unique_ptr<char[]> const copy(
        CharSets::DuplicateAndConvert("", CharSets::WIN_TO_UTF8, CharSets::ALLOC_NEW));
    EXPECT_STREQ(copy.get(), "");
}

TEST(DuplicateAndConvert, WithoutMemory_GivesNull)
{
    FailingAllocation const failing(0);
    char* const copy = CharSets::DuplicateAndConvert("text", CharSets::WIN_TO_UTF8, CharSets::ALLOC_NEW);
    FailingAllocation::Stop();
    EXPECT_EQ(copy, nullptr);
    EXPECT_TRUE(failing.HasHappened());
}

TEST(DuplicateAndConvert, Methods_HaveTheirNumbers)
{
    EXPECT_EQ(static_cast<int>(CharSets::ALLOC_MALLOC), 0);
    EXPECT_NE(static_cast<int>(CharSets::ALLOC_NEW), 0);
}

namespace
{
struct UTF8_FACT
{
    char const* name;
    char const* bytes;
    bool isCoded;
};

class IsUtf8Coded : public testing::TestWithParam<UTF8_FACT>
{
};
}  // namespace

TEST_P(IsUtf8Coded, OneGoodSequence_IsEnough)
{
    std::string const text = BytesOf(GetParam().bytes);
    EXPECT_EQ(CharSets::IsUtf8Coded(text.c_str()), GetParam().isCoded);
    EXPECT_EQ(CharSets::IsUtf8Coded(text), GetParam().isCoded);
}

INSTANTIATE_TEST_SUITE_P(
    Facts, IsUtf8Coded,
    testing::Values(
        UTF8_FACT{"Empty", "", false}, UTF8_FACT{"Ascii", "61 62 63", false},
        UTF8_FACT{"OneByte", "C3", false}, UTF8_FACT{"TwoBytes", "C3 A4", true},
        UTF8_FACT{"TwoBytesCutByAscii", "C3 61", false}, UTF8_FACT{"LowestLeadOfTwo", "C0 80", true},
        UTF8_FACT{"HighestLeadOfTwo", "DF BF", true}, UTF8_FACT{"BelowTheLeadsOfTwo", "BF 80", false},
        UTF8_FACT{"FollowerTooHigh", "C3 C0", false}, UTF8_FACT{"FollowerTooLow", "C3 7F", false},
        UTF8_FACT{"ThreeBytesBehindAscii", "61 62 63 E2 82 AC", true},
        UTF8_FACT{"ThreeBytesCutByTheEnd", "E2 82", false},
        UTF8_FACT{"ThreeBytesSecondIsNone", "E2 41 82", false},
        UTF8_FACT{"ThreeBytesThirdIsNone", "E2 82 41", false},
        UTF8_FACT{"LowestLeadOfThree", "E0 80 80", true}, UTF8_FACT{"HighestLeadOfThree", "EF BF BF", true},
        UTF8_FACT{"StrayHighByteBefore", "FF C3 A4", true}, UTF8_FACT{"StrayHighBytes", "80 A4 FF BF", false},
        UTF8_FACT{"FourBytes", "F0 9F 98 80", true}, UTF8_FACT{"FourBytesCutByTheEnd", "F0 9F 98", false},
        UTF8_FACT{"FourBytesSecondIsNone", "F0 41 98 80", false},
        UTF8_FACT{"FourBytesThirdIsNone", "F0 9F 41 80", false},
        UTF8_FACT{"FourBytesFourthIsNone", "F0 9F 98 41", false},
        UTF8_FACT{"GoodSequenceInsideABadOne", "E2 C3 A4", true},
        UTF8_FACT{"OverlongFormsAndSurrogatesToo", "ED A0 80", true}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(IsUtf8CodedLead, OfFourBytes_IsAnyEvenByteFromF0OnAndNoOddOne_ByDesign)
{
    for (int lead = 0xF0; lead <= 0xFF; ++lead)
        EXPECT_EQ(CharSets::IsUtf8Coded(static_cast<char>(lead) + std::string("\x80\x80\x80")), lead % 2 == 0)
            << lead;
}

TEST(IsUtf8CodedString, EndsAtItsFirstZeroByte)
{
    EXPECT_FALSE(CharSets::IsUtf8Coded(std::string("\0\xC3\xA4", 3)));
    EXPECT_FALSE(CharSets::IsUtf8Coded(std::string("\xC3\0\xA4", 3)));
}

TEST(IsUtf8CodedText, IsNotReadBehindItsTerminator)
{
    for (char const* bytes : {"C3 00", "E2 00", "E2 82 00", "F0 00", "F0 9F 00", "F0 9F 98 00"})
    {
        ExactBytes const text(BytesOf(bytes));
        EXPECT_FALSE(CharSets::IsUtf8Coded(static_cast<char const*>(text.Data()))) << bytes;
    }
}

#ifdef __linux__
// A text of 2 GiB: one block of memory, shown again and again.
TEST(IsUtf8CodedLength, OfTwoGiB_IsNegativeAndSoFalse_ByDesign)
{
    constexpr std::size_t Block = 64ul << 20;
    constexpr std::size_t Length = 1ul << 31;
    int const file = memfd_create("text", 0);
    ASSERT_EQ(ftruncate(file, Block), 0);
    std::size_t const size = Length + Block;  // of the last block only the terminator is used
    void* const memory =
        mmap(nullptr, size, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    ASSERT_NE(memory, MAP_FAILED);
    auto* const text = static_cast<char*>(memory);
    for (std::size_t at = 0; at < Length; at += Block)
        ASSERT_NE(mmap(text + at, Block, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_FIXED, file, 0),
                  MAP_FAILED);
    std::fill_n(text, Block, '\xC4');
    text[Block - 1] = '\x80';  // in front of it the last of many leading bytes
    EXPECT_TRUE(CharSets::IsUtf8Coded(text + 1));
    EXPECT_FALSE(CharSets::IsUtf8Coded(text));
    munmap(memory, size);
    close(file);
}
#endif

TEST(FilterString, Bypass_LetsEveryByteButZeroPass_ByDesign)
{
    EXPECT_EQ(HexOf(FilterString(true)(AllBytes())), HexOf(AllBytes().substr(1)));
    for (int c = 0; c < 256; ++c)
        EXPECT_EQ(FilterString(true)(static_cast<char>(c)), static_cast<char>(c));
}

TEST(FilterString, WithoutBypass_RemovesEveryByte)
{
    EXPECT_EQ(FilterString(false)(AllBytes()), "");
    for (int c = 0; c < 256; ++c)
        EXPECT_EQ(FilterString(false)(static_cast<char>(c)), '\0');
}

TEST(FilterString, EmptyText_StaysEmpty) { EXPECT_EQ(FilterString(true)(""), ""); }

TEST(FilterString, setRemove_OfAList_RemovesItsBytes)
{
    FilterString filter(true);
    filter.setRemove("ab");
    EXPECT_EQ(filter("abcab"), "c");
    EXPECT_EQ(filter('a'), '\0');
    EXPECT_EQ(filter('c'), 'c');
}

TEST(FilterString, setRemove_OfARange_RemovesBothEndsAndWhatIsBetween)
{
    FilterString filter(true);
    filter.setRemove('b', 'd');
    EXPECT_EQ(filter("abcde"), "ae");
}

TEST(FilterString, setBypass_OfARange_KeepsBothEndsAndWhatIsBetween)
{
    FilterString filter(false);
    filter.setBypass('0', '9');
    EXPECT_EQ(filter("/0a5 9:"), "059");
}

TEST(FilterString, setBypass_OfAList_KeepsItsBytes)
{
    FilterString filter(false);
    filter.setBypass("xz");
    EXPECT_EQ(filter("xyzzy"), "xzz");
}

TEST(FilterString, setReplace_PutsTheOtherByte)
{
    FilterString filter(true);
    filter.setReplace('a', 'c', '-');
    filter.setReplace("xz", '+');
    EXPECT_EQ(filter("abcdxyz"), "---d+y+");
}

TEST(FilterString, setReplace_ByZero_Removes)
{
    FilterString filter(true);
    filter.setReplace('a', 'c', '\0');
    filter.setReplace("xz", '\0');
    EXPECT_EQ(filter("abcdxyz"), "dy");
}

TEST(FilterString, Range_IsOfUnsignedBytes)
{
    FilterString filter(false);
    filter.setBypass('\x7F', '\x80');
    EXPECT_EQ(filter(AllBytes()), "\x7F\x80");
    filter.setBypass('\xFE', '\xFF');
    EXPECT_EQ(filter(AllBytes()), "\x7F\x80\xFE\xFF");
}

TEST(FilterString, RangeThatEndsBeforeItBegins_ChangesNothing)
{
    FilterString passing(true);
    passing.setRemove('z', 'a');
    passing.setReplace('z', 'a', '-');
    passing.setRemove('\x80', '\x7F');
    EXPECT_EQ(passing("a\x7F\x80z"), "a\x7F\x80z");
    FilterString removing(false);
    removing.setBypass('z', 'a');
    EXPECT_EQ(removing("az"), "");
}

TEST(FilterString, NullOrEmptyList_ChangesNothing)
{
    for (char const* list : {static_cast<char const*>(nullptr), ""})
    {
        FilterString passing(true);
        passing.setRemove(list);
        passing.setReplace(list, '-');
        EXPECT_EQ(passing("abc"), "abc");
        FilterString removing(false);
        removing.setBypass(list);
        EXPECT_EQ(removing("abc"), "");
    }
}

TEST(FilterString, ByteZero_CanBeNamedInARangeOnly)
{
    FilterString filter(false);
    filter.setReplace('\0', '\0', '0');
    EXPECT_EQ(filter(std::string("a\0b\0", 4)), "00");
}

TEST(FilterString, LaterRule_Overrides)
{
    FilterString filter(true);
    filter.setRemove('a', 'z');
    filter.setBypass("m");
    filter.setReplace("mn", '-');
    filter.setBypass('n', 'n');
    EXPECT_EQ(filter("lmno"), "-n");
}

TEST(FilterString, Copy_HasRulesOfItsOwn)
{
    FilterString original(true);
    FilterString copy = original;
    copy.setRemove("a");
    EXPECT_EQ(original("ab"), "ab");
    EXPECT_EQ(copy("ab"), "b");
}

TEST(FilterString, Result_IsAllocatedOnce)
{
    FilterString const filter(true);
    std::string const text(1000, 'a');
    auto const filterIt = [&]
    {
        try
        {
            filter(text);
        }
        catch (std::bad_alloc const&)
        {
        }
    };
    EXPECT_EQ(FailEachAllocation(filterIt, [](bool) {}), 1);
}

TEST(FilterString, RandomTextAndRules_GiveWhatOneByteAfterTheOtherGives)
{
    std::mt19937 random(20);
    for (int run = 0; run < 200; ++run)
    {
        FilterString filter(random() % 2 == 0);
        for (int rule = 0; rule < 4; ++rule)
            filter.setReplace(static_cast<char>(random()), static_cast<char>(random()),
                              static_cast<char>(random() % 3));
        std::string text(random() % 100, '\0');
        std::string expected;
        for (char& c : text)
        {
            c = static_cast<char>(random());
            if (filter(c) != '\0')
                expected += filter(c);
        }
        EXPECT_EQ(HexOf(filter(text)), HexOf(expected));
    }
}

namespace
{
struct ESCAPE_FACT
{
    char const* name;
    char byte;
    char const* text;
};

class EscapedByte : public testing::TestWithParam<ESCAPE_FACT>
{
};
}  // namespace

TEST_P(EscapedByte, IsReplacedWhereverItStands)
{
    auto const& [name, byte, text] = GetParam();
    EXPECT_EQ(Escaped(std::string(1, byte)), text);
    EXPECT_EQ(Escaped(std::string("a") + byte + byte + "b" + byte),
              std::string("a") + text + text + "b" + text);
}

INSTANTIATE_TEST_SUITE_P(
    Facts, EscapedByte,
    testing::Values(ESCAPE_FACT{"DoubleQuote", '"', "&quot;"}, ESCAPE_FACT{"Ampersand", '&', "&amp;"},
                    ESCAPE_FACT{"Apostrophe", '\'', "&apos;"}, ESCAPE_FACT{"LessThan", '<', "&lt;"},
                    ESCAPE_FACT{"GreaterThan", '>', "&gt;"}, ESCAPE_FACT{"CapitalA", '\xC4', "&#196;"},
                    ESCAPE_FACT{"CapitalO", '\xD6', "&#214;"}, ESCAPE_FACT{"CapitalU", '\xDC', "&#220;"},
                    ESCAPE_FACT{"SharpS", '\xDF', "&#223;"}, ESCAPE_FACT{"SmallA", '\xE4', "&#228;"},
                    ESCAPE_FACT{"SmallO", '\xF6', "&#246;"}, ESCAPE_FACT{"SmallU", '\xFC', "&#252;"}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(XmlEscaping, AllOtherBytes_Stay)
{
    std::string others = AllBytes();
    for (char const c : std::string("\"&'<>\xC4\xD6\xDC\xDF\xE4\xF6\xFC"))
        others.erase(others.find(c), 1);
    EXPECT_EQ(others.size(), 244u);
    EXPECT_EQ(HexOf(Escaped(others)), HexOf(others));
    EXPECT_EQ(Escaped(""), "");
    EXPECT_EQ(Escaped("a&b"), "a&amp;b");
}

TEST(XmlEscaping, KindsInTheOrderOfTheirBytes_AreAllReplaced)
{
    EXPECT_EQ(Escaped("\"&'<>\xC4\xD6\xDC\xDF\xE4\xF6\xFC"),
              "&quot;&amp;&apos;&lt;&gt;&#196;&#214;&#220;&#223;&#228;&#246;&#252;");
}

TEST(XmlEscaping, WhatLiesBeforeTheLastFindOfALowerByte_StaysRaw_ByDesign)
{
    EXPECT_EQ(Escaped("a>b<c"), "a>b&lt;c");
    EXPECT_EQ(Escaped("<&>"), "<&amp;&gt;");
    EXPECT_EQ(Escaped("&\""), "&&quot;");
    EXPECT_EQ(Escaped("\"&\""), "&quot;&&quot;");
    EXPECT_EQ(Escaped("&'\""), "&'&quot;");  // nor does the & take the scan back
    EXPECT_EQ(Escaped("\xFC\"\xFC&\xFC"), "\xFC&quot;\xFC&amp;&#252;");
}

TEST(XmlEscaping, AnInsertedAmpersand_IsNotEscapedAgain)
{
    EXPECT_EQ(Escaped("\""), "&quot;");
    EXPECT_EQ(Escaped("\"\"&&"), "&quot;&quot;&amp;&amp;");
}

TEST(XmlEscaping, LeadingByteInUtf8_IsReplacedWithItsFollowerLeftBehind_ByDesign)
{
    EXPECT_EQ(Escaped("\xC4\x80"), "&#196;\x80");
}

TEST(XmlEscaping, ZeroBytes_AreBytesLikeOthers)
{
    EXPECT_EQ(HexOf(Escaped(std::string("\0&\0<\0", 5))), HexOf(std::string("\0&amp;\0&lt;\0", 12)));
}

// Nothing but these bytes, so that each kind stands before and behind each other.
TEST(XmlEscaping, RandomText_IsEscapedAsByOneReplacementAfterTheOther)
{
    constexpr std::pair<char, char const*> Kinds[] = {
        {'"', "&quot;"},    {'&', "&amp;"},     {'\'', "&apos;"},   {'<', "&lt;"},
        {'>', "&gt;"},      {'\xC4', "&#196;"}, {'\xD6', "&#214;"}, {'\xDC', "&#220;"},
        {'\xDF', "&#223;"}, {'\xE4', "&#228;"}, {'\xF6', "&#246;"}, {'\xFC', "&#252;"},
    };
    std::mt19937 random(21);
    for (int run = 0; run < 2000; ++run)
    {
        std::string text(random() % 10, '\0');
        for (char& c : text)
            c = Kinds[random() % std::size(Kinds)].first;
        std::string expected = text;
        std::size_t scan = 0;
        for (auto const& [byte, escape] : Kinds)
            for (std::size_t i; (i = expected.find(byte, scan)) != std::string::npos; scan = i + 1)
                expected.replace(i, 1, escape);
        EXPECT_EQ(HexOf(Escaped(text)), HexOf(expected)) << HexOf(text);
    }
}

TEST(ReplaceAll, EveryByteOfTheKind_IsReplacedInPlace)
{
    EXPECT_EQ(Replaced("\\a\\\\b\\", '\\', '/'), "/a//b/");
    EXPECT_EQ(Replaced("abc", 'x', 'y'), "abc");
    EXPECT_EQ(Replaced("\xC4\xE4", '\xC4', 'A'), "A\xE4");
    EXPECT_EQ(Replaced(std::string("a\0b\0", 4), '\0', '-'), "a-b-");
    EXPECT_EQ(Replaced("", 'a', 'b'), "");
}

TEST(LastAsciiPos, IsTheLastByte_AndNoPositionInAnEmptyText)
{
    EXPECT_EQ(DBCS::LastAsciiPos("abc"), 2u);
    EXPECT_EQ(DBCS::LastAsciiPos("\xC3\xA4"), 1u);
    EXPECT_EQ(DBCS::LastAsciiPos(""), std::string::npos);
}

TEST(FindLastOf, IsThatOfTheStandardString)
{
    EXPECT_EQ(DBCS::find_last_of("a/b\\c", "\\/", std::string::npos), 3u);
    EXPECT_EQ(DBCS::find_last_of("a/b\\c", "\\/", 2), 1u);
    EXPECT_EQ(DBCS::find_last_of("a/b\\c", "\\/", 3), 3u);
    EXPECT_EQ(DBCS::find_last_of("abc", "\\/", std::string::npos), std::string::npos);
    EXPECT_EQ(DBCS::find_last_of("a/b", "", std::string::npos), std::string::npos);
    EXPECT_EQ(DBCS::find_last_of("", "/", 0), std::string::npos);
}
