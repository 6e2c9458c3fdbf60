#include "comgui/folders/folder_paths.h"

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

TEST(MatchLength, FolderOrWhatIsInside_IsTheFoldersLength)
{
    EXPECT_EQ(MatchLength("/a/b", "/a/b"), 4u);
    EXPECT_EQ(MatchLength("/a/b", "/a/b/"), 4u);
    EXPECT_EQ(MatchLength("/a/b", "/a/b/c"), 4u);
    EXPECT_EQ(MatchLength("a", "a"), 1u);
    EXPECT_EQ(MatchLength("/", "//a"), 1u);
}

TEST(MatchLength, AnythingElse_Is0)
{
    EXPECT_EQ(MatchLength("/a/b", "/a"), 0u);
    EXPECT_EQ(MatchLength("/a/b", "/a/bc"), 0u);
    EXPECT_EQ(MatchLength("/a/b", "/a/c"), 0u);
    EXPECT_EQ(MatchLength("/a/b", "/A/b"), 0u);
    EXPECT_EQ(MatchLength("/a/b", ""), 0u);
    EXPECT_EQ(MatchLength("/", "/a"), 0u);
}

TEST(MatchLength, EmptyFolder_MatchesNothing)
{
    for (char const* path : {"", "/", "/a"})
        EXPECT_EQ(MatchLength("", path), 0u) << path;
}

TEST(MatchLength, BackslashOfThePath_IsASlashAndOneOfTheFolderIsNot)
{
    EXPECT_EQ(MatchLength("/a/b", "\\a/b\\c"), 4u);
    EXPECT_EQ(MatchLength("/a/b", "\\a\\b"), 4u);
    EXPECT_EQ(MatchLength("\\a", "\\a"), 0u);
    EXPECT_EQ(MatchLength("\\a", "/a"), 0u);
}
