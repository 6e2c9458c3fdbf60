// From the variable form to a path.
#include "tests/folders/FolderServer.h"
#include <gtest/gtest.h>

namespace
{
// TEMP is /srv/temp.
class Decode : public testing::Test
{
protected:
    Decode() { folders->SetFolderVariable("TEMP", "/srv/temp"); }

    std::string Slashes(std::string const& path) { return folders->Decode(path, false); }
    std::string Backslashes(std::string const& path) { return folders->Decode(path, true); }

    void ExpectUnchanged(std::string const& path)
    {
        EXPECT_EQ(Slashes(path), path);
        EXPECT_EQ(Backslashes(path), path);
    }

    std::unique_ptr<clFOLDER_VARIABLES> folders = EmptyTranslator();
};
}  // namespace

TEST_F(Decode, VariableAlone_IsItsFolder)
{
    EXPECT_EQ(Slashes("$(TEMP)"), "/srv/temp");
    EXPECT_EQ(Backslashes("$(TEMP)"), "\\srv\\temp");
}

TEST_F(Decode, Rest_FollowsTheFolder)
{
    EXPECT_EQ(Slashes("$(TEMP)/a/b"), "/srv/temp/a/b");
    EXPECT_EQ(Slashes("$(TEMP)/"), "/srv/temp/");
}

TEST_F(Decode, RestWithoutSeparator_IsGluedOn) { EXPECT_EQ(Slashes("$(TEMP)x"), "/srv/tempx"); }

TEST_F(Decode, Separators_AreThoseAskedForInFolderAndRest)
{
    folders->SetFolderVariable("MIXED", "C:\\a/b");
    EXPECT_EQ(Slashes("$(MIXED)\\c/d"), "C:/a/b/c/d");
    EXPECT_EQ(Backslashes("$(MIXED)\\c/d"), "C:\\a\\b\\c\\d");
}

TEST_F(Decode, UnknownVariable_LeavesThePathWithItsSeparators)
{
    ExpectUnchanged("$(NOPE)/x\\y");
    ExpectUnchanged("$(temp)/x\\y");
    ExpectUnchanged("$(TEM)/x");
    ExpectUnchanged("$(TEMPO)/x");
    ExpectUnchanged("$( TEMP)/x");
}

TEST_F(Decode, ThreeBytes_AreNoVariable) { ExpectUnchanged("$()"); }

TEST_F(Decode, TwoParenthesesWithoutName_LeaveThePath)
{
    ExpectUnchanged("$()/");
    ExpectUnchanged("$()x\\y");
}

TEST_F(Decode, EmptyName_IsNoVariableEvenIfOneIsMapped)
{
    folders->SetFolderVariable("", "/empty");
    ExpectUnchanged("$()/x\\y");
}

TEST_F(Decode, NoClosingParenthesis_LeavesThePath)
{
    ExpectUnchanged("$(TEMP");
    ExpectUnchanged("$(TEMP/x\\y");
}

TEST_F(Decode, VariableFurtherBehind_IsOrdinaryText)
{
    EXPECT_EQ(Slashes("/x/$(TEMP)/y"), "/x/$(TEMP)/y");
    EXPECT_EQ(Backslashes("/x/$(TEMP)/y"), "\\x\\$(TEMP)\\y");
    EXPECT_EQ(Slashes("$(TEMP)/$(TEMP)"), "/srv/temp/$(TEMP)");
}

TEST_F(Decode, FolderInVariableForm_IsNotDecodedAgain)
{
    folders->SetFolderVariable("OUTER", "$(TEMP)/outer");
    EXPECT_EQ(Slashes("$(OUTER)/x"), "$(TEMP)/outer/x");
}

TEST_F(Decode, Name_EndsAtTheFirstParenthesisAndMayHoldAnything)
{
    folders->SetFolderVariable("a/b$(c\\", "/odd");
    EXPECT_EQ(Slashes("$(a/b$(c\\)/x)"), "/odd/x)");
    folders->SetFolderVariable("d)", "/never");
    ExpectUnchanged("$(d))/x");
}

TEST_F(Decode, PlainPath_GetsTheSeparatorsAskedFor)
{
    EXPECT_EQ(Slashes("/x\\y"), "/x/y");
    EXPECT_EQ(Backslashes("/x\\y"), "\\x\\y");
    EXPECT_EQ(Slashes("\\"), "/");
    EXPECT_EQ(Backslashes("/"), "\\");
    EXPECT_EQ(Slashes("$[TEMP]\\x"), "$[TEMP]/x");
}

TEST_F(Decode, PathWithoutSeparators_ComesBack)
{
    ExpectUnchanged("");
    ExpectUnchanged("name");
    ExpectUnchanged("$");
    ExpectUnchanged("$(");
    ExpectUnchanged("$(X");
}

TEST_F(Decode, RemovedVariable_IsNotDecodedAnyMore)
{
    folders->SetFolderVariable("TEMP", nullptr);
    ExpectUnchanged("$(TEMP)/x");
}

TEST_F(Decode, ZeroBytes_AreBytesLikeOthers)
{
    EXPECT_EQ(Slashes(std::string("$(TEMP)\0x\\", 10)), std::string("/srv/temp\0x/", 12));
}

TEST_F(Decode, WithEncodingAlone_GivesEveryPathUnchanged)
{
    FolderServer server(2);
    server.SetFolder("System/Folders/Temp", "/srv/temp");
    folders = server.Translator();
    ExpectUnchanged("$(TEMP)/x");
    ExpectUnchanged("/x\\y");
}

TEST_F(Decode, WithDecodingAlone_Decodes)
{
    FolderServer server(1);
    server.SetFolder("System/Folders/Temp", "/srv/temp");
    folders = server.Translator();
    EXPECT_EQ(Slashes("$(TEMP)\\x"), "/srv/temp/x");
    EXPECT_EQ(Slashes("/x\\y"), "/x/y");
}
