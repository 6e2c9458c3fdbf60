// From a path to its variable form.
#include "tests/folders/FolderServer.h"
#include <gtest/gtest.h>

namespace
{
class Encode : public testing::Test
{
protected:
    void Map(char const* variable, char const* folder) { folders->SetFolderVariable(variable, folder); }

    std::string Path(std::string const& path) { return folders->Encode(path); }

    std::unique_ptr<clFOLDER_VARIABLES> folders = EmptyTranslator();
};

// The two folders that the server knows here are /srv/temp and /srv/log.
class EncodeRelative : public testing::Test
{
protected:
    EncodeRelative()
    {
        server.SetFolder("System/Folders/Temp", "/srv/temp");
        server.SetFolder("System/Folders/Log", "/srv/log/");
        server.SetFolder("System/Folders/Job", "");
        folders = server.Translator();
    }

    std::string Key(char const* key, std::string const& relative) { return folders->Encode(key, relative); }
    std::string Variable(char const* variable, std::string const& relative)
    {
        return folders->EncodeV(variable, relative);
    }

    FolderServer server;
    std::unique_ptr<clFOLDER_VARIABLES> folders;
};
}  // namespace

TEST_F(Encode, TheFolderItself_IsTheBareVariable)
{
    Map("X", "/a/b");
    EXPECT_EQ(Path("/a/b"), "$(X)");
}

TEST_F(Encode, TheFolderWithASlashBehind_KeepsIt)
{
    Map("X", "/a/b");
    EXPECT_EQ(Path("/a/b/"), "$(X)/");
    EXPECT_EQ(Path("/a/b\\"), "$(X)/");
}

TEST_F(Encode, PathInside_KeepsItsRest)
{
    Map("X", "/a/b");
    EXPECT_EQ(Path("/a/b/c.d/e"), "$(X)/c.d/e");
    EXPECT_EQ(Path("/a/b//c"), "$(X)//c");
}

TEST_F(Encode, Backslashes_CountAsSlashesAndBecomeThem)
{
    Map("X", "C:/a/b");
    EXPECT_EQ(Path("C:\\a\\b\\c"), "$(X)/c");
    EXPECT_EQ(Path("C:\\a/b\\c\\d/e"), "$(X)/c/d/e");
    EXPECT_EQ(Path("C:\\a\\b"), "$(X)");
}

TEST_F(Encode, PathOutside_ComesBackWithItsSeparators)
{
    Map("X", "C:/other");
    EXPECT_EQ(Path("C:\\a\\b\\c"), "C:\\a\\b\\c");
    EXPECT_EQ(Path("C:\\a/b"), "C:\\a/b");
    EXPECT_EQ(Path(""), "");
}

TEST_F(Encode, LongestFolder_WinsWhateverTheOrder)
{
    Map("OUTER", "/a");
    Map("INNER", "/a/b");
    EXPECT_EQ(Path("/a/b/c"), "$(INNER)/c");
    EXPECT_EQ(Path("/a/c"), "$(OUTER)/c");

    folders = EmptyTranslator();
    Map("INNER", "/a/b");
    Map("OUTER", "/a");
    EXPECT_EQ(Path("/a/b/c"), "$(INNER)/c");
    EXPECT_EQ(Path("/a/c"), "$(OUTER)/c");
}

TEST_F(Encode, OfEqualFolders_TheFirstWins)
{
    Map("Z", "/a");
    Map("A", "/a");
    EXPECT_EQ(Path("/a/b"), "$(Z)/b");
}

TEST_F(Encode, PartOfAName_IsNoFolder)
{
    Map("X", "/a/b");
    EXPECT_EQ(Path("/a/bc"), "/a/bc");
    EXPECT_EQ(Path("/a/b c"), "/a/b c");
    EXPECT_EQ(Path("/a"), "/a");
    EXPECT_EQ(Path("x/a/b"), "x/a/b");
}

TEST_F(Encode, Case_Counts)
{
    Map("X", "/a/b");
    EXPECT_EQ(Path("/A/b"), "/A/b");
    EXPECT_EQ(Path("/a/B/c"), "/a/B/c");
}

TEST_F(Encode, EveryByteOfTheFolder_IsCompared)
{
    std::string const folder = "/srv/print/f0";
    Map("X", folder.c_str());
    for (std::size_t i = 0; i < folder.size(); ++i)
    {
        std::string path = folder + "/x";
        path[i] = '~';
        EXPECT_EQ(Path(path), path);
    }
}

TEST_F(Encode, EmptyFolder_NeverWins)
{
    Map("X", "");
    for (char const* path : {"", "/", "/a", "a"})
        EXPECT_EQ(Path(path), path);
}

TEST_F(Encode, FolderWithASlashAtItsEnd_MatchesOnlyWithOneSlashMore_ByDesign)
{
    Map("X", "/a/b/");
    EXPECT_EQ(Path("/a/b/"), "$(X)");
    EXPECT_EQ(Path("/a/b//c"), "$(X)/c");
    EXPECT_EQ(Path("/a/b/c"), "/a/b/c");
}

TEST_F(Encode, FolderWithBackslashes_IsNeverMatched_ByDesign)
{
    Map("X", "C:\\a");
    EXPECT_EQ(Path("C:\\a\\b"), "C:\\a\\b");
    EXPECT_EQ(Path("C:/a/b"), "C:/a/b");
}

TEST_F(Encode, Variable_IsTakenAsItIs)
{
    Map("a\\b)", "/a");
    EXPECT_EQ(Path("/a\\c"), "$(a\\b))/c");
}

TEST_F(Encode, ZeroBytes_AreBytesLikeOthers)
{
    Map("X", "/a");
    EXPECT_EQ(Path(std::string("/a/\0b", 5)), std::string("$(X)/\0b", 7));
    EXPECT_EQ(Path(std::string("/a\0b", 4)), std::string("/a\0b", 4));
}

TEST_F(EncodeRelative, KeyOfALoadedFolder_GivesItsVariable)
{
    EXPECT_EQ(Key("System/Folders/Temp", "sub/dir"), "$(TEMP)/sub/dir");
    EXPECT_EQ(Key("System/Folders/Log", "sub/dir"), "$(LOG)/sub/dir");
}

TEST_F(EncodeRelative, Backslashes_BecomeSlashes)
{
    EXPECT_EQ(Key("System/Folders/Temp", "sub\\dir"), "$(TEMP)/sub/dir");
    EXPECT_EQ(Variable("X", "sub\\dir"), "$(X)/sub/dir");
    EXPECT_EQ(Key("System/Folders/Temp", "\\sub"), "$(TEMP)/sub");
    EXPECT_EQ(Variable("X", "\\sub"), "$(X)/sub");
}

TEST_F(EncodeRelative, ASlashOfItsOwn_IsNotDoubled)
{
    EXPECT_EQ(Key("System/Folders/Temp", "/sub"), "$(TEMP)/sub");
    EXPECT_EQ(Variable("X", "/sub"), "$(X)/sub");
    EXPECT_EQ(Variable("X", "//sub"), "$(X)//sub");
}

TEST_F(EncodeRelative, EmptyPath_GivesTheBareVariable)
{
    EXPECT_EQ(Key("System/Folders/Temp", ""), "$(TEMP)");
    EXPECT_EQ(Variable("X", ""), "$(X)");
}

TEST_F(EncodeRelative, KeyThatIsNotLoaded_GivesThePathUnchanged)
{
    EXPECT_EQ(Key("System/Folders/Job", "sub\\dir"), "sub\\dir");
    EXPECT_EQ(Key("System/Folders/Print", "sub\\dir"), "sub\\dir");
    EXPECT_EQ(Key("system/folders/temp", "sub\\dir"), "sub\\dir");
    EXPECT_EQ(Key("TEMP", "sub\\dir"), "sub\\dir");
    EXPECT_EQ(Key("", "sub\\dir"), "sub\\dir");
}

TEST_F(EncodeRelative, UnknownVariable_IsTakenAsItIsAndNotDecoded)
{
    EXPECT_EQ(Variable("JOB", "sub\\dir"), "$(JOB)/sub/dir");
    EXPECT_EQ(folders->Decode("$(JOB)/sub/dir", true), "$(JOB)/sub/dir");
    EXPECT_EQ(Variable("", "a"), "$()/a");
    EXPECT_EQ(Variable("a\\b", "a"), "$(a\\b)/a");
}

TEST_F(EncodeRelative, NullKeyOrVariable_GivesThePathUnchanged)
{
    EXPECT_EQ(Key(nullptr, "sub\\dir"), "sub\\dir");
    EXPECT_EQ(Variable(nullptr, "sub\\dir"), "sub\\dir");
}

TEST_F(EncodeRelative, EmptyKey_FindsTheFirstFolderThatWasSet_ByDesign)
{
    folders->SetFolderVariable("MINE", "/mine");
    folders->SetFolderVariable("OTHER", "/other");
    EXPECT_EQ(Key("", "a"), "$(MINE)/a");
}

TEST_F(EncodeRelative, WithDecodingAlone_EveryFormGivesItsPathUnchanged)
{
    server.SetFlags(1);
    folders->Load();
    EXPECT_EQ(folders->Encode("/srv/temp\\x"), "/srv/temp\\x");
    EXPECT_EQ(Key("System/Folders/Temp", "sub\\dir"), "sub\\dir");
    EXPECT_EQ(Variable("TEMP", "sub\\dir"), "sub\\dir");
}

TEST_F(EncodeRelative, WithEncodingAlone_EveryFormEncodes)
{
    server.SetFlags(2);
    folders->Load();
    EXPECT_EQ(folders->Encode("/srv/temp\\x"), "$(TEMP)/x");
    EXPECT_EQ(Key("System/Folders/Temp", "sub\\dir"), "$(TEMP)/sub/dir");
    EXPECT_EQ(Variable("TEMP", "sub\\dir"), "$(TEMP)/sub/dir");
}
