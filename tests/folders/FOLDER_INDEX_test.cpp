#include "comgui/folders/FOLDER_INDEX.h"

#include <gtest/gtest.h>
#include <initializer_list>
#include <random>
#include <string>
#include <vector>

using namespace comgui::detail;

namespace
{
// Mappings of those folders, whose variables are 0, 1, 2 ...
std::vector<FOLDER_MAPPING> Mappings(std::initializer_list<std::string> folders)
{
    std::vector<FOLDER_MAPPING> mappings;
    for (std::string const& folder : folders)
        mappings.emplace_back(std::string(), std::to_string(mappings.size()), folder);
    return mappings;
}

// The variable of the folder that the path lies in.
std::string Holding(std::vector<FOLDER_MAPPING> const& mappings, std::string const& path)
{
    FOLDER_MAPPING const* const found = FOLDER_INDEX(mappings).Holding(path);
    return found ? found->variable : "none";
}

bool IsIn(std::string const& folder, std::string const& path)
{
    return Holding(Mappings({folder}), path) == "0";
}
}  // namespace

TEST(FOLDER_INDEX, FolderOrWhatIsInside_IsHeld)
{
    EXPECT_TRUE(IsIn("/a/b", "/a/b"));
    EXPECT_TRUE(IsIn("/a/b", "/a/b/"));
    EXPECT_TRUE(IsIn("/a/b", "/a/b/c"));
    EXPECT_TRUE(IsIn("a", "a"));
    EXPECT_TRUE(IsIn("/", "//a"));
}

TEST(FOLDER_INDEX, AnythingElse_IsNot)
{
    EXPECT_FALSE(IsIn("/a/b", "/a"));
    EXPECT_FALSE(IsIn("/a/b", "/a/bc"));
    EXPECT_FALSE(IsIn("/a/b", "/a/c"));
    EXPECT_FALSE(IsIn("/a/b", "/A/b"));
    EXPECT_FALSE(IsIn("/a/b", ""));
    EXPECT_FALSE(IsIn("/", "/a"));
}

TEST(FOLDER_INDEX, EmptyFolder_HoldsNothing)
{
    for (char const* path : {"", "/", "/a"})
        EXPECT_FALSE(IsIn("", path)) << path;
}

TEST(FOLDER_INDEX, BackslashOfThePath_IsASlashAndOneOfTheFolderIsNot)
{
    EXPECT_TRUE(IsIn("/a/b", "\\a/b\\c"));
    EXPECT_TRUE(IsIn("/a/b", "\\a\\b"));
    EXPECT_FALSE(IsIn("\\a", "\\a"));
    EXPECT_FALSE(IsIn("\\a", "/a"));
}

TEST(FOLDER_INDEX, LongestFolder_Wins_AndOfEqualOnesTheFirst)
{
    EXPECT_EQ(Holding(Mappings({"/a", "/a/b/c", "/a/b", "/a/b/c"}), "/a/b/c/d"), "1");
    EXPECT_EQ(Holding(Mappings({"/a/b", "/a"}), "/a/b"), "0");
    EXPECT_EQ(Holding(Mappings({"/a/b", "/a"}), "/a/bc"), "1");
}

TEST(FOLDER_INDEX, Variable_IsFound_AndOfEqualOnesTheFirst)
{
    std::vector<FOLDER_MAPPING> const mappings = {
        {"K0", "TEMP", "/a"}, {"K1", "", "/b"}, {"K2", "TEMP", "/c"}};
    FOLDER_INDEX const index(mappings);
    EXPECT_EQ(index.Of("TEMP"), &mappings[0]);
    EXPECT_EQ(index.Of(""), &mappings[1]);
    EXPECT_EQ(index.Of("TEM"), nullptr);
    EXPECT_EQ(index.Of("TEMPO"), nullptr);
}

TEST(FOLDER_INDEX, NoFolders_HoldNothing)
{
    EXPECT_EQ(Holding({}, "/a"), "none");
    EXPECT_EQ(FOLDER_INDEX({}).Of("TEMP"), nullptr);
}

// Longer than what is looked at on the stack.
TEST(FOLDER_INDEX, VeryLongPath_IsHeldAsAShortOneIs)
{
    for (std::size_t const size : {511u, 512u, 513u, 5000u})
    {
        std::string const folder = "/" + std::string(size - 3, 'f');
        EXPECT_TRUE(IsIn(folder, "\\" + folder.substr(1) + "\\x")) << size;
        EXPECT_FALSE(IsIn(folder, "\\" + folder.substr(1) + "x\\")) << size;
    }
}

// Folders that begin alike, whatever their sizes, against a walk from the first to the last.
TEST(FOLDER_INDEX, RandomFolders_HoldWhatTheRuleSays)
{
    std::mt19937 random(4711);
    auto const text = [&](std::size_t most)
    {
        std::string result;
        for (std::size_t size = random() % (most + 1); size > 0; --size)
            result += "/\\aaaa"[random() % 6];
        return result;
    };
    for (int round = 0; round < 2000; ++round)
    {
        std::string const beginning = text(40);
        std::vector<FOLDER_MAPPING> mappings;
        for (int i = 0; i < 12; ++i)
            mappings.emplace_back(std::string(), std::to_string(i), beginning + text(8));
        std::string const path = beginning + text(30);
        std::string slashed = path;
        for (char& c : slashed)
            c = c == '\\' ? '/' : c;

        std::string expected = "none";
        std::size_t longest = 0;
        for (auto const& [key, variable, folder] : mappings)
            if (folder.size() > longest && slashed.compare(0, folder.size(), folder) == 0 &&
                (folder.size() == slashed.size() || slashed[folder.size()] == '/'))
            {
                expected = variable;
                longest = folder.size();
            }
        ASSERT_EQ(Holding(mappings, path), expected) << path;
    }
}

TEST(TEXT_TABLE, EqualTexts_TakeOneSlot)
{
    TEXT_TABLE table(1);
    HASH const hash = HashOfBytes("a", 1, table.Seed());
    for (std::size_t i = 0; i < 100; ++i)
        table.Add("a", hash, i);
    EXPECT_EQ(table.Find("a", hash), 0u);
    EXPECT_EQ(table.Find("b", hash), TEXT_TABLE::None);
}
