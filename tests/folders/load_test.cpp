// What comes from the server, and what a translator is without one.
#include "tests/folders/FolderRows.h"
#include "tests/folders/FolderServer.h"
#include <climits>
#include <gmock/gmock.h>

using comgui::test::CALL;
using comgui::test::SLOT;

using testing::ElementsAre;
using testing::SizeIs;

namespace
{
struct FLAGS_FACT
{
    int value;
    bool decodes;
    bool encodes;
};

class LoadFlags : public testing::TestWithParam<FLAGS_FACT>
{
};

// How that value of a folder is stored.
std::string Stored(std::string const& value)
{
    FolderServer server;
    server.SetFolder("System/Folders/Temp", value);
    return server.Translator()->Decode("$(TEMP)", false);
}
}  // namespace

TEST(WithoutContainer, IsEnabledBothWaysAndEmpty)
{
    auto const folders = EmptyTranslator();
    EXPECT_TRUE(folders->IsEnabled());
    EXPECT_EQ(folders->Encode("/a\\b"), "/a\\b");
    EXPECT_EQ(folders->Decode("$(TEMP)\\b", false), "$(TEMP)\\b");
    folders->SetFolderVariable("A", "/a");
    EXPECT_EQ(folders->Encode("/a\\b"), "$(A)/b");
    EXPECT_EQ(folders->Decode("$(A)/b", false), "/a/b");
}

TEST(WithoutContainer, Load_ForgetsEverythingAndDisables_ByDesign)
{
    auto const folders = EmptyTranslator();
    folders->SetFolderVariable("A", "/a");
    folders->Load();
    EXPECT_FALSE(folders->IsEnabled());
    EXPECT_EQ(folders->Encode("/a/b"), "/a/b");
    EXPECT_EQ(folders->Decode("$(A)/b", false), "$(A)/b");
    EXPECT_EQ(folders->Decode("/x\\y", false), "/x\\y");
    EXPECT_EQ(folders->EncodeV("A", "x\\y"), "x\\y");
}

TEST(Load, ContainerThatOpensNothing_LeavesItDisabled)
{
    FolderServer server;
    server.SetFolder("System/Folders/Temp", "/srv/temp");
    server.container.FailCall(0);
    auto const folders = server.Translator();
    EXPECT_FALSE(folders->IsEnabled());
    EXPECT_EQ(folders->Decode("$(TEMP)", false), "$(TEMP)");
    folders->Load();
    EXPECT_TRUE(folders->IsEnabled());
    server.container.FailCall(0);
    folders->Load();
    EXPECT_FALSE(folders->IsEnabled());
    EXPECT_EQ(folders->Decode("$(TEMP)", false), "$(TEMP)");
}

TEST(Load, OpensTheSystemTicketAndReadsEveryFolderInOrder)
{
    FolderServer server;
    auto const folders = server.Translator();

    ASSERT_THAT(server.container.calls, SizeIs(1));  // it is not closed either
    CALL const& open = server.container.calls[0];
    EXPECT_EQ(open.slot, SLOT::OPERATION);
    EXPECT_EQ(std::pair(open.type, open.id), std::pair(0, 0));
    EXPECT_EQ(open.op, MTICKET_OP_OPEN);

    std::vector<CALL> expected{{SLOT::GET, 0, 0, "System/UseFolderVariables", PARAM_INT, -1}};
    for (FOLDER_ROW const& row : FolderRows)
        expected.push_back({SLOT::GET, 0, 0, row.key, PARAM_STRING, -1});
    EXPECT_EQ(server.systemTicket.container.calls, expected);
    EXPECT_THAT(server.systemTicket.options, SizeIs(0));
}

TEST(Load, EveryRow_IsMappedToItsVariable)
{
    FolderServer server;
    for (FOLDER_ROW const& row : FolderRows)
        server.SetFolder(row.key, std::string("/srv/") + row.variable);
    auto const folders = server.Translator();
    for (FOLDER_ROW const& row : FolderRows)
    {
        std::string const form = std::string("$(") + row.variable + ")/x";
        std::string const path = std::string("/srv/") + row.variable + "/x";
        EXPECT_EQ(folders->Encode(path), form);
        EXPECT_EQ(folders->Encode(row.key, "x"), form);
        EXPECT_EQ(folders->Decode(form, false), path);
    }
}

TEST(Load, OfEqualFolders_TheEarlierRowWins)
{
    FolderServer server;
    for (FOLDER_ROW const& row : FolderRows)
        server.SetFolder(row.key, "/same");
    auto const folders = server.Translator();
    for (FOLDER_ROW const& row : FolderRows)
    {
        EXPECT_EQ(folders->Encode("/same"), std::string("$(") + row.variable + ")");
        folders->SetFolderVariable(row.variable, nullptr);
    }
    EXPECT_EQ(folders->Encode("/same"), "/same");
}

TEST_P(LoadFlags, TakesTheTwoLowestBits)
{
    FolderServer server(GetParam().value);
    server.SetFolder("System/Folders/Temp", "/srv/temp");
    auto const folders = server.Translator();
    EXPECT_EQ(folders->IsEnabled(), GetParam().decodes || GetParam().encodes);
    EXPECT_EQ(folders->Decode("$(TEMP)", false), GetParam().decodes ? "/srv/temp" : "$(TEMP)");
    EXPECT_EQ(folders->Encode("/srv/temp"), GetParam().encodes ? "$(TEMP)" : "/srv/temp");
}

INSTANTIATE_TEST_SUITE_P(Facts, LoadFlags,
                         testing::Values(FLAGS_FACT{0, false, false}, FLAGS_FACT{1, true, false},
                                         FLAGS_FACT{2, false, true}, FLAGS_FACT{3, true, true},
                                         FLAGS_FACT{4, false, false}, FLAGS_FACT{5, true, false},
                                         FLAGS_FACT{-1, true, true}, FLAGS_FACT{-2, false, true},
                                         FLAGS_FACT{INT_MIN, false, false}),
                         [](auto const& fact) { return "Case" + std::to_string(fact.index); });

TEST(Load, FlagsThatAreMissing_CountAsZero)
{
    FolderServer server;
    server.SetFolder("System/Folders/Temp", "/srv/temp");
    server.systemTicket.container.FailCall(0);
    EXPECT_FALSE(server.Translator()->IsEnabled());
}

TEST(Load, WithFlagsZero_ReadsNoFolder)
{
    FolderServer server(4);
    server.Translator();
    EXPECT_THAT(server.systemTicket.container.calls, SizeIs(1));
}

TEST(Load, EmptyMissingOrNullFolder_IsSkipped)
{
    FolderServer server;
    server.SetFolder("System/Folders/Temp", "");
    server.SetFolder("System/Folders/Log", "/srv/log");
    auto const folders = server.Translator();
    EXPECT_EQ(folders->Decode("$(TEMP)x", false), "$(TEMP)x");
    EXPECT_EQ(folders->Decode("$(JOB)x", false), "$(JOB)x");
    EXPECT_EQ(folders->Decode("$(LOG)x", false), "/srv/logx");
    EXPECT_EQ(folders->Encode("System/Folders/Temp", "x\\y"), "x\\y");
    server.systemTicket.container.nullTexts = true;
    folders->Load();
    EXPECT_TRUE(folders->IsEnabled());
    EXPECT_EQ(folders->Decode("$(LOG)x", false), "$(LOG)x");
}

TEST(Load, Folder_GetsSlashesAndLosesOneAtTheEnd)
{
    EXPECT_EQ(Stored("/a"), "/a");
    EXPECT_EQ(Stored("/a/"), "/a");
    EXPECT_EQ(Stored("/a//"), "/a/");
    EXPECT_EQ(Stored("C:\\a\\b\\"), "C:/a/b");
    EXPECT_EQ(Stored("a"), "a");
}

TEST(Load, FolderThatIsASlash_IsEmptyAndMatchesNothing)
{
    FolderServer server;
    server.SetFolder("System/Folders/Temp", "/");
    auto const folders = server.Translator();
    EXPECT_EQ(folders->Encode("/"), "/");
    EXPECT_EQ(folders->Encode("/a"), "/a");
    EXPECT_EQ(folders->Decode("$(TEMP)/a", false), "/a");
    EXPECT_EQ(folders->Encode("System/Folders/Temp", "a"), "$(TEMP)/a");
}

TEST(Load, FolderInTermsOfEarlierOnes_IsResolved)
{
    FolderServer server;
    server.SetFolder("System/InstallFolder", "C:\\print\\");
    server.SetFolder("System/Folders/Temp", "$(INSTALL)\\temp\\");
    server.SetFolder("System/Folders/Log", "$(TEMP)/log");
    server.SetFolder("System/Folders/Job", "$(LOG)");
    auto const folders = server.Translator();
    EXPECT_EQ(folders->Decode("$(TEMP)", false), "C:/print/temp");
    EXPECT_EQ(folders->Decode("$(LOG)", false), "C:/print/temp/log");
    EXPECT_EQ(folders->Decode("$(JOB)", false), "C:/print/temp/log");
}

TEST(Load, WhatAVariableGives_IsResolvedUntilNoVariableBegins)
{
    FolderServer server;
    server.SetFolder("System/InstallFolder", "/print");
    server.SetFolder("System/Folders/Temp", "/");  // stored empty: the rest comes to the beginning
    server.SetFolder("System/Folders/Log", "$(TEMP)$(TEMP)$(INSTALL)/log");
    EXPECT_EQ(server.Translator()->Decode("$(LOG)", false), "/print/log");
}

TEST(Load, WithDecodingAlone_ResolvesToo)
{
    FolderServer server(1);
    server.SetFolder("System/InstallFolder", "/print");
    server.SetFolder("System/Folders/Temp", "$(INSTALL)/temp");
    EXPECT_EQ(server.Translator()->Decode("$(TEMP)", false), "/print/temp");
}

TEST(Load, AnotherTime_StartsFromScratch)
{
    FolderServer server;
    server.SetFolder("System/Folders/Temp", "/old");
    auto const folders = server.Translator();
    folders->SetFolderVariable("MINE", "/mine");
    server.SetFolder("System/Folders/Temp", "/new");
    EXPECT_EQ(folders->Decode("$(TEMP)", false), "/old");  // a snapshot
    folders->Load();
    EXPECT_EQ(folders->Decode("$(TEMP)", false), "/new");
    EXPECT_EQ(folders->Decode("$(MINE)", false), "$(MINE)");
    server.SetFlags(0);
    folders->Load();
    EXPECT_FALSE(folders->IsEnabled());
    server.SetFlags(3);
    folders->SetFolderVariable("TEMP", "/set");
    EXPECT_EQ(folders->Decode("$(TEMP)", false), "$(TEMP)");
}
