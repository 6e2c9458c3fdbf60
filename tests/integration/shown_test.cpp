// What the examples make of a text before they print it.
#include "examples/Shown.h"

#include <gtest/gtest.h>

namespace
{
using namespace std::string_view_literals;

struct SHOWN_FACT
{
    char const* name;
    std::string_view text;
    char const* shown;
};

class ShownText : public testing::TestWithParam<SHOWN_FACT>
{
};
}  // namespace

TEST_P(ShownText, IsHarmless) { EXPECT_EQ(Shown(GetParam().text), GetParam().shown); }

TEST_P(ShownText, ShownAgain_StaysAsItIs) { EXPECT_EQ(Shown(GetParam().shown), GetParam().shown); }

INSTANTIATE_TEST_SUITE_P(
    Facts, ShownText,
    testing::Values(SHOWN_FACT{"Nothing", "", ""}, SHOWN_FACT{"Ascii", "A~ \\\"", "A~ \\\""},
                    SHOWN_FACT{"Umlaut", "Gr\xC3\xBCn", "Gr\xC3\xBCn"},
                    SHOWN_FACT{"LineEnds", "a\nb\r\n\tc", "a\\nb\\r\\n\\tc"},
                    SHOWN_FACT{"Escape", "\x1B[31m", "\\x1B[31m"}, SHOWN_FACT{"Zero", "a\0b"sv, "a\\x00b"},
                    SHOWN_FACT{"LastBeforeSpace", "\x1F ", "\\x1F "}, SHOWN_FACT{"Delete", "\x7F", "\\u007F"},
                    SHOWN_FACT{"FirstC1", "\xC2\x80", "\\u0080"},
                    SHOWN_FACT{"LastC1", "\xC2\x9F\xC2\xA0", "\\u009F\xC2\xA0"},
                    SHOWN_FACT{"LineSeparator", "\xE2\x80\xA7\xE2\x80\xA8", "\xE2\x80\xA7\\u2028"},
                    SHOWN_FACT{"RightToLeftOverride", "\xE2\x80\xAE\xE2\x80\xAF\xE2\x80\xAC",
                               "\\u202E\xE2\x80\xAF\\u202C"},
                    SHOWN_FACT{"Isolates", "\xE2\x81\xA6\xE2\x81\xA9", "\\u2066\\u2069"},
                    SHOWN_FACT{"FourBytes", "\xF0\x9F\x96\xA8", "\xF0\x9F\x96\xA8"},
                    SHOWN_FACT{"LoneByte", "a\xFF\x80z", "a\\xFF\\x80z"},
                    SHOWN_FACT{"CutOff", "\xE2\x80", "\\xE2\\x80"},
                    SHOWN_FACT{"FollowedByAscii", "\xC3Z", "\\xC3Z"},
                    SHOWN_FACT{"LongFormOfEscape", "\xE0\x80\x9B", "\\xE0\\x80\\x9B"},
                    SHOWN_FACT{"Surrogate", "\xED\xA0\x80", "\\xED\\xA0\\x80"},
                    SHOWN_FACT{"PastTheLast", "\xF4\x90\x80\x80", "\\xF4\\x90\\x80\\x80"}),
    [](auto const& fact) { return std::string(fact.param.name); });
