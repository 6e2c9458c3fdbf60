// Values and their texts.
#include "comgui/client/Value.h"

#include <cmath>
#include <cstdint>
#include <gtest/gtest.h>
#include <limits>
#include <memory>

using namespace comgui;

namespace
{
template <typename T>
int CodeOf(Result<T> const& result)
{
    return result ? 0 : result.GetError().code;
}

constexpr auto BiggestInt64 = std::numeric_limits<long long>::max();
constexpr auto SmallestInt64 = std::numeric_limits<long long>::min();

struct TEXT_FACT
{
    char const* name;
    PARAM_TYPE type;
    Value value;
    char const* text;
};

class ValueText : public testing::TestWithParam<TEXT_FACT>
{
};

using List = comgui::List;
}  // namespace

TEST_P(ValueText, IsThat) { EXPECT_EQ(ToText(GetParam().value), GetParam().text); }

TEST_P(ValueText, IsReadBack)
{
    auto const& [name, type, value, text] = GetParam();
    auto const* const list = std::get_if<List>(&value);
    auto const read =
        FromText(text, type, list && !list->empty() ? list->front().value.Type() : PARAM_STRING);
    ASSERT_TRUE(read) << read.GetError().Text();
    EXPECT_EQ(*read, value);
}

INSTANTIATE_TEST_SUITE_P(
    Facts, ValueText,
    testing::Values(
        TEXT_FACT{"Int", PARAM_INT, -5, "-5"},
        TEXT_FACT{"SmallestInt", PARAM_INT, std::numeric_limits<int>::min(), "-2147483648"},
        TEXT_FACT{"Double", PARAM_DOUBLE, 0.1, "0.1"}, TEXT_FACT{"WholeDouble", PARAM_DOUBLE, 3.0, "3"},
        TEXT_FACT{"SmallDouble", PARAM_DOUBLE, 5e-324, "5e-324"},
        TEXT_FACT{"NoNumber", PARAM_DOUBLE, std::nan(""), "nan"},
        TEXT_FACT{"Text", PARAM_STRING, " a, \"b\" ", " a, \"b\" "},
        TEXT_FACT{"EmptyText", PARAM_STRING, "", ""},
        TEXT_FACT{"Bytes", PARAM_BINSTRING, Bytes{std::string("\0A\xFF", 3)}, "0041ff"},
        TEXT_FACT{"Int64", PARAM_INT64, SmallestInt64, "-9223372036854775808"},
        TEXT_FACT{"Unsigned", PARAM_UNSIGNED, 4294967295U, "4294967295"},
        TEXT_FACT{"Unsigned64", PARAM_UNSIGNED64, 18446744073709551615ULL, "18446744073709551615"},
        TEXT_FACT{"List", PARAM_COUNT, MakeList<int>({1, -2, 3}), "1, -2, 3"},
        TEXT_FACT{"EmptyList", PARAM_COUNT, List{}, ""},
        TEXT_FACT{"ListWithGaps", PARAM_COUNT, List{{1, 7}, {4, 8}}, ", 7, , , 8"},
        TEXT_FACT{"ListOfTexts", PARAM_COUNT, MakeList<std::string>({"a", "b,c", "d\"e", "", " f"}),
                  "a, \"b,c\", \"d\"\"e\", \"\", \" f\""},
        TEXT_FACT{"ListOfOneEmptyText", PARAM_COUNT, MakeList<std::string>({""}), "\"\""},
        TEXT_FACT{"ListOfEmptyBytes", PARAM_COUNT, MakeList<Bytes>({Bytes{}, Bytes{"A"}}), "\"\", 41"}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(Value, Index_IsTheTypeOnTheWire)
{
    EXPECT_EQ(Value().Type(), PARAM_NONE);
    EXPECT_EQ(Value(Pointer{}).Type(), PARAM_POINTER);
    EXPECT_EQ(Value(1).Type(), PARAM_INT);
    EXPECT_EQ(Value(1.0).Type(), PARAM_DOUBLE);
    EXPECT_EQ(Value("text").Type(), PARAM_STRING);
    EXPECT_EQ(Value(Bytes{}).Type(), PARAM_BINSTRING);
    EXPECT_EQ(Value(List{}).Type(), PARAM_COUNT);
    EXPECT_EQ(Value(1LL).Type(), PARAM_INT64);
    EXPECT_EQ(Value(1U).Type(), PARAM_UNSIGNED);
    EXPECT_EQ(Value(1ULL).Type(), PARAM_UNSIGNED64);
}

TEST(Value, OfAnotherTypeOrNumber_IsAnother)
{
    EXPECT_NE(Value(1), Value(1LL));
    EXPECT_NE(Value(1), Value(2));
    EXPECT_NE(Value(MakeList<int>({1})), Value(List{{1, 1}}));
    EXPECT_NE(Value(std::nan("")), Value(1.0));
    EXPECT_EQ(Value(std::nan("")), Value(std::nan("")));
}

TEST(Value, Pointer_HasATextThatCannotBeTyped)
{
    EXPECT_EQ(ToText(Pointer{reinterpret_cast<void*>(0x1F)}), "0x1f");
    EXPECT_EQ(CodeOf(FromText("0x1f", PARAM_POINTER)), WrongType);
}

// --- what a user types

TEST(ValueFromText, OutOfRange_IsNamedApartFromNoNumber)
{
    EXPECT_EQ(CodeOf(FromText("2147483648", PARAM_INT)), OutOfRange);
    EXPECT_EQ(CodeOf(FromText("-1", PARAM_UNSIGNED)), OutOfRange);
    EXPECT_EQ(CodeOf(FromText("4294967296", PARAM_UNSIGNED)), OutOfRange);
    EXPECT_EQ(CodeOf(FromText("-1", PARAM_UNSIGNED64)), OutOfRange);
    EXPECT_EQ(CodeOf(FromText("1e999", PARAM_DOUBLE)), OutOfRange);
    EXPECT_EQ(CodeOf(FromText("1.5", PARAM_INT)), NotANumber);
    EXPECT_EQ(CodeOf(FromText("", PARAM_INT)), NotANumber);
    EXPECT_EQ(CodeOf(FromText("-", PARAM_UNSIGNED)), NotANumber);
    EXPECT_EQ(CodeOf(FromText("+-1", PARAM_INT)), NotANumber);
    EXPECT_EQ(CodeOf(FromText("1 2", PARAM_INT)), NotANumber);
    EXPECT_EQ(CodeOf(FromText("0x10", PARAM_INT)), NotANumber);
}

TEST(ValueFromText, SpacesAndAPlus_AreAllowedAroundNumbers)
{
    EXPECT_EQ(*FromText("  +42 ", PARAM_INT), Value(42));
    EXPECT_EQ(*FromText(" -0.5", PARAM_DOUBLE), Value(-0.5));
}

TEST(ValueFromText, Bytes_ArePairsOfDigits)
{
    EXPECT_EQ(*FromText("Ab", PARAM_BINSTRING), Value(Bytes{"\xAB"}));
    EXPECT_EQ(CodeOf(FromText("A", PARAM_BINSTRING)), NotANumber);
    EXPECT_EQ(CodeOf(FromText("0g", PARAM_BINSTRING)), NotANumber);
}

TEST(ValueFromText, QuotesThatDoNotMatch_AreABadList)
{
    for (char const* const text : {"\"a", "a\"", "\"a\"b, c", "a \"b\"", "\"\"\""})
        EXPECT_EQ(CodeOf(FromText(text, PARAM_COUNT)), BadList) << text;
}

TEST(ValueFromText, ListWithABadValue_HasItsError)
{
    EXPECT_EQ(CodeOf(FromText("1, x", PARAM_COUNT, PARAM_INT)), NotANumber);
    EXPECT_EQ(CodeOf(FromText("1, 99999999999", PARAM_COUNT, PARAM_INT)), OutOfRange);
}

// --- values as other types

TEST(ValueAs, NumbersChangeTheirType_IfNothingIsLost)
{
    EXPECT_EQ(*As<int>(Value(7LL)), 7);
    EXPECT_EQ(*As<double>(Value(7)), 7.0);
    EXPECT_EQ(*As<long long>(Value(-3.0)), -3);
    EXPECT_EQ(*As<unsigned int>(Value(3)), 3U);
    EXPECT_EQ(CodeOf(As<unsigned int>(Value(-3))), OutOfRange);
    EXPECT_EQ(CodeOf(As<unsigned long long>(Value(-1LL))), OutOfRange);
    EXPECT_EQ(CodeOf(As<int>(Value(2147483648LL))), OutOfRange);
    EXPECT_EQ(CodeOf(As<int>(Value(0.5))), OutOfRange);
    EXPECT_EQ(CodeOf(As<long long>(Value(std::nan("")))), OutOfRange);
    EXPECT_EQ(CodeOf(As<long long>(Value(9223372036854775808.0))), OutOfRange);
    EXPECT_EQ(*As<long long>(Value(-9223372036854775808.0)), SmallestInt64);
    EXPECT_EQ(CodeOf(As<unsigned long long>(Value(18446744073709551616.0))), OutOfRange);
    EXPECT_EQ(CodeOf(As<double>(Value(BiggestInt64))), OutOfRange);
    EXPECT_EQ(*As<double>(Value(SmallestInt64)), -9223372036854775808.0);
}

TEST(ValueAs, Text_IsToTextOfAnyValue)
{
    EXPECT_EQ(*As<std::string>(Value(1.5)), "1.5");
    EXPECT_EQ(*As<std::string>(Value(MakeList<int>({1, 2}))), "1, 2");
    EXPECT_EQ(CodeOf(As<int>(Value("7"))), WrongType);
    EXPECT_EQ(CodeOf(As<Bytes>(Value("7"))), WrongType);
}

TEST(ValueAs, Vector_IsAListWithoutGaps_OrASingleValue)
{
    EXPECT_EQ(*As<std::vector<int>>(Value(MakeList<int>({4, 5}))), (std::vector{4, 5}));
    EXPECT_EQ(*As<std::vector<double>>(Value(MakeList<int>({4, 5}))), (std::vector{4.0, 5.0}));
    EXPECT_EQ(*As<std::vector<int>>(Value(6)), std::vector{6});
    EXPECT_EQ(CodeOf(As<std::vector<int>>(Value(List{{1, 4}}))), WrongType);
    EXPECT_EQ(CodeOf(As<std::vector<int>>(Value(MakeList<std::string>({"a"})))), WrongType);
    EXPECT_EQ(CodeOf(As<int>(Value(MakeList<int>({4})))), WrongType);
}

TEST(ValueText, OfAFarPosition_IsShort)
{
    List const far{{16777215, 7}};
    EXPECT_EQ(ToText(far), "[16777215] 7");
    EXPECT_EQ(*FromText("[16777215] 7", PARAM_COUNT, PARAM_INT), Value(far));
    List const last{{0, 1}, {std::numeric_limits<int>::max(), 2}};
    EXPECT_EQ(ToText(last), "1, [2147483647] 2");
    EXPECT_EQ(*FromText(ToText(last), PARAM_COUNT, PARAM_INT), Value(last));
}

TEST(ValueText, OfTextsLikeAPosition_IsReadBack)
{
    List const texts{{0, "[99] a"}, {99, "b, c"}, {100, "[1]"}, {101, "[x"}};
    EXPECT_EQ(ToText(texts), "\"[99] a\", [99] \"b, c\", \"[1]\", \"[x\"");
    EXPECT_EQ(*FromText(ToText(texts), PARAM_COUNT), Value(texts));
    EXPECT_EQ(*FromText("[x, [], [1 a, [9]", PARAM_COUNT),
              Value(MakeList<std::string>({"[x", "[]", "[1 a", "[9]"})));
}

TEST(ValueFromText, PositionThatDoesNotAscend_IsABadList)
{
    EXPECT_EQ(CodeOf(FromText("1, 2, [1] 3", PARAM_COUNT, PARAM_INT)), BadList);
    EXPECT_EQ(CodeOf(FromText("[5] 1, [5] 3", PARAM_COUNT, PARAM_INT)), BadList);
    EXPECT_EQ(CodeOf(FromText("[2147483648] 1", PARAM_COUNT, PARAM_INT)), OutOfRange);
    EXPECT_EQ(CodeOf(FromText("[2147483647] 1, 2", PARAM_COUNT, PARAM_INT)), OutOfRange);
}

TEST(ValueAs, EveryInteger_OfTheLanguage)
{
    EXPECT_EQ(*As<std::int64_t>(Value(SmallestInt64)), SmallestInt64);
    EXPECT_EQ(*As<std::uint64_t>(Value(7)), 7U);
    EXPECT_EQ(*As<long>(Value(7)), 7);
    EXPECT_EQ(*As<std::size_t>(Value(7.0)), 7U);
    EXPECT_EQ(CodeOf(As<unsigned long>(Value(-1))), OutOfRange);
    EXPECT_EQ(*As<std::vector<long>>(Value(MakeList<int>({1, 2}))), (std::vector{1L, 2L}));
    EXPECT_EQ(Value(1L).Type(), PARAM_INT64);
    EXPECT_EQ(MakeList<unsigned long>({1})[0].value, Value(1ULL));
}

TEST(ValueAs, Pointer_IsOne)
{
    int here = 0;
    EXPECT_EQ(As<Pointer>(Value(Pointer{&here}))->address, &here);
    EXPECT_EQ(MakeList<Pointer>({Pointer{&here}})[0].value, Value(Pointer{&here}));
    EXPECT_EQ(CodeOf(As<Pointer>(Value(1))), WrongType);
}

TEST(ValueAs, NoValue_IsNoVectorOfOne)
{
    EXPECT_EQ(CodeOf(As<std::vector<std::string>>(Value())), WrongType);
    EXPECT_EQ(CodeOf(As<std::vector<int>>(Value())), WrongType);
}

TEST(Value, TakesAPartOfAText) { EXPECT_EQ(Value(std::string_view("a text").substr(2)), Value("text")); }

TEST(ResultOfACall, ThatIsATemporary_GivesItsValueAway)
{
    using Only = std::unique_ptr<int>;
    EXPECT_EQ(*Result<Only>(std::make_unique<int>(3)).ValueOr(nullptr), 3);
    EXPECT_EQ(*Result<Only>(Error{}).ValueOr(std::make_unique<int>(4)), 4);
}
