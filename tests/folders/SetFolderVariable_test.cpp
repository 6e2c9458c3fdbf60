// Mappings that come and go at run time.
#include "tests/folders/FolderServer.h"
#include <gtest/gtest.h>

TEST(SetFolderVariable, UnknownVariable_IsAddedBehindTheOthers)
{
    auto const folders = EmptyTranslator();
    folders->SetFolderVariable("FIRST", "/a");
    folders->SetFolderVariable("SECOND", "/a");
    EXPECT_EQ(folders->Encode("/a"), "$(FIRST)");
    EXPECT_EQ(folders->Decode("$(SECOND)", false), "/a");
}

TEST(SetFolderVariable, KnownVariable_GetsTheNewFolderAndKeepsItsPlace)
{
    auto const folders = EmptyTranslator();
    folders->SetFolderVariable("FIRST", "/old");
    folders->SetFolderVariable("SECOND", "/a");
    folders->SetFolderVariable("FIRST", "/a");
    EXPECT_EQ(folders->Encode("/a/x"), "$(FIRST)/x");
    EXPECT_EQ(folders->Encode("/old/x"), "/old/x");
}

TEST(SetFolderVariable, NullFolder_RemovesTheMappingAndKeepsTheOrderOfTheOthers)
{
    auto const folders = EmptyTranslator();
    for (char const* variable : {"A", "B", "C"})
        folders->SetFolderVariable(variable, "/a");
    folders->SetFolderVariable("A", nullptr);
    EXPECT_EQ(folders->Encode("/a"), "$(B)");
    EXPECT_EQ(folders->Decode("$(A)", false), "$(A)");
    folders->SetFolderVariable("B", nullptr);
    EXPECT_EQ(folders->Encode("/a"), "$(C)");
}

TEST(SetFolderVariable, NullFolderOfAnUnknownVariable_DoesNothing)
{
    auto const folders = EmptyTranslator();
    folders->SetFolderVariable("A", "/a");
    folders->SetFolderVariable("NOPE", nullptr);
    EXPECT_EQ(folders->Encode("/a"), "$(A)");
    EXPECT_EQ(folders->Decode("$(NOPE)", false), "$(NOPE)");
}

TEST(SetFolderVariable, NullVariable_DoesNothing)
{
    auto const folders = EmptyTranslator();
    folders->SetFolderVariable(nullptr, "/a");
    folders->SetFolderVariable(nullptr, nullptr);
    EXPECT_EQ(folders->Encode("/a"), "/a");
}

TEST(SetFolderVariable, Folder_IsStoredAsItIs_ByDesign)
{
    auto const folders = EmptyTranslator();
    folders->SetFolderVariable("A", "C:\\a\\");
    EXPECT_EQ(folders->Encode("C:/a/x"), "C:/a/x");
    EXPECT_EQ(folders->Decode("$(A)x", true), "C:\\a\\x");
    EXPECT_EQ(folders->Decode("$(A)x", false), "C:/a/x");
}

TEST(SetFolderVariable, Case_Counts)
{
    auto const folders = EmptyTranslator();
    folders->SetFolderVariable("A", "/upper");
    folders->SetFolderVariable("a", "/lower");
    EXPECT_EQ(folders->Decode("$(A)", false), "/upper");
    EXPECT_EQ(folders->Decode("$(a)", false), "/lower");
}

TEST(SetFolderVariable, LoadedMapping_IsChangedAndRemovedLikeAnyOther)
{
    FolderServer server;
    server.SetFolder("System/Folders/Temp", "/srv/temp");
    auto const folders = server.Translator();
    folders->SetFolderVariable("TEMP", "/other");
    EXPECT_EQ(folders->Encode("System/Folders/Temp", "x"), "$(TEMP)/x");
    EXPECT_EQ(folders->Decode("$(TEMP)/x", false), "/other/x");
    folders->SetFolderVariable("TEMP", nullptr);
    EXPECT_EQ(folders->Encode("System/Folders/Temp", "x"), "x");
}

TEST(SetFolderVariable, ADisabledTranslator_StaysDisabled)
{
    FolderServer server(0);
    auto const folders = server.Translator();
    folders->SetFolderVariable("A", "/a");
    EXPECT_FALSE(folders->IsEnabled());
    EXPECT_EQ(folders->Encode("/a"), "/a");
}
