#include "comgui/folders/folder_paths.h"

#include "comgui/ticket/folder_variables.h"
#include <gtest/gtest.h>

using namespace comgui::detail;

TEST(MakeSlash, TurnsEveryBackslash)
{
    std::string text = "\\a/b\\\\";
    MakeSlash(text);
    EXPECT_EQ(text, "/a/b//");
}

TEST(MakeBackslash, TurnsEverySlash)
{
    std::string text = "\\a/b//";
    MakeBackslash(text);
    EXPECT_EQ(text, "\\a\\b\\\\");
}

TEST(NeedsDecode, LooksAtTheLengthAndTheFirstTwoBytesOnly)
{
    for (char const* text : {"$(()", "$(ab", "$()x", "$(TEMP)/x"})
        EXPECT_TRUE(NeedsDecode(text)) << text;
    for (char const* text : {"", "$", "$(", "$()", "$(a", " $(a)", "$[a)", "((a)", "abcd"})
        EXPECT_FALSE(NeedsDecode(text)) << text;
}
