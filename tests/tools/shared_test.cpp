#include "tools/shared/text.h"
#include <gtest/gtest.h>

namespace
{
using namespace tools;

TEST(ShownName, OfAnOrdinaryFile_IsTheName)
{
    for (char const* const name :
         {"a", "with a space", "\"quoted\"", "Gr\xC3\xBCn", "\xE2\x82\xAC", "back\\slash"})
        EXPECT_EQ(ShownName(name), name);
}

TEST(ShownName, OfADash_IsStandardInput) { EXPECT_EQ(ShownName("-"), "standard input"); }

TEST(ShownName, ThatBreaksTheLineOrMovesTheTerminal_IsQuoted)
{
    EXPECT_EQ(ShownName(""), "\"\"");
    EXPECT_EQ(ShownName("a\nb"), "\"a\\nb\"");
    EXPECT_EQ(ShownName("a\x7F"), "\"a\\u007f\"");
    EXPECT_EQ(ShownName("a\x1B[2J"), "\"a\\u001b[2J\"");
    EXPECT_EQ(ShownName("a\xC2\x9B"
                        "2J"),
              "\"a\\u009b2J\"");  // the same in one character
    EXPECT_EQ(ShownName("a\xC2\x80"), "\"a\\u0080\"");
    EXPECT_EQ(ShownName("a\xC2\xA0"), "a\xC2\xA0");  // the first that is none
}

TEST(ShownName, ThatIsNoUtf8_IsHex)
{
    EXPECT_EQ(ShownName("a\xFF"), "hex:61ff");
    EXPECT_EQ(ShownName("a\xC2"), "hex:61c2");
}
}  // namespace
