// The folders by variable, and how the server keeps them such that clients come to an end with them.
#include "standin/server/tickets/FolderTable.h"

#include "tests/server/FolderClient.h"
#include "tests/server/ServerTest.h"
#include <gmock/gmock.h>
#include <random>

using namespace standin;

namespace
{
constexpr std::size_t Install = 0;
constexpr std::size_t Temp = 1;
constexpr std::size_t JobRow = 11;
constexpr std::size_t Analytics = 27;

FolderSettings Settings(int use, std::initializer_list<std::pair<std::size_t, char const*>> values)
{
    FolderSettings settings;
    settings.use = use;
    for (auto const& [row, value] : values)
        settings.values[row] = value;
    return settings;
}
}  // namespace

TEST(FolderTable, Folder_LeansOnThoseAboveIt)
{
    FolderTable const table(
        Settings(3, {{Install, "/site/"}, {Temp, "$(INSTALL)/temp"}, {JobRow, "$(TEMP)\\jobs\\"}}).values);
    EXPECT_EQ(table.FolderOf("INSTALL"), "/site");
    EXPECT_EQ(table.FolderOf("TEMP"), "/site/temp");
    EXPECT_EQ(table.FolderOf("JOB"), "/site/temp/jobs");
    EXPECT_TRUE(table.Unresolved().empty());
}

TEST(FolderTable, UnknownVariable_AndOneWithoutValue_HaveNoFolder)
{
    FolderTable const table(Settings(3, {{Install, "/site"}}).values);
    EXPECT_EQ(table.FolderOf("NOPE"), std::nullopt);
    EXPECT_EQ(table.FolderOf("install"), std::nullopt);
    EXPECT_EQ(table.FolderOf(""), std::nullopt);
    EXPECT_EQ(table.FolderOf("TEMP"), std::nullopt);
}

TEST(FolderTable, WhatLeansOnAFolderBelow_IsUnresolved_AndSoIsWhatLeansOnThat)
{
    FolderTable const table(
        Settings(3, {{Install, "/site"}, {Temp, "$(JOB)/x"}, {JobRow, "/job"}, {Analytics, "$(TEMP)"}})
            .values);
    EXPECT_THAT(table.Unresolved(), testing::ElementsAre(Temp, Analytics));
    EXPECT_EQ(table.FolderOf("TEMP"), std::nullopt);
    EXPECT_EQ(table.FolderOf("JOB"), "/job");
}

TEST(FolderTable, ValueWithoutAnEndOfItsVariable_IsUnresolved)
{
    EXPECT_FALSE(FolderTable(Settings(3, {{Temp, "$(INSTALL/x"}}).values).Unresolved().empty());
    EXPECT_FALSE(FolderTable(Settings(3, {{Temp, "$()/x"}}).values).Unresolved().empty());
    EXPECT_FALSE(FolderTable(Settings(3, {{Temp, "$(TEMP)/x"}}).values).Unresolved().empty());
    EXPECT_TRUE(
        FolderTable(Settings(3, {{Temp, "$()"}}).values).Unresolved().empty());  // no variable to a client
}

struct READING_FACT
{
    char const* name;
    int use;
    char const* temp;
    bool canBeRead;
};
class Reading : public testing::TestWithParam<READING_FACT>
{
};

TEST_P(Reading, CanBeRead_IsWhatAClientFinds)
{
    FolderSettings const settings = Settings(GetParam().use, {{Install, "/site"}, {Temp, GetParam().temp}});
    EXPECT_EQ(settings.CanBeRead(), GetParam().canBeRead);
    EXPECT_EQ(FoldersOfAClient(settings).has_value(), GetParam().canBeRead);
}

INSTANTIATE_TEST_SUITE_P(Facts, Reading,
                         testing::Values(READING_FACT{"Plain", 3, "/temp", true},
                                         READING_FACT{"LeansOnOneAbove", 3, "$(INSTALL)/temp", true},
                                         READING_FACT{"LeansOnOneBelow", 3, "$(JOB)/temp", false},
                                         READING_FACT{"LeansOnItself", 1, "$(TEMP)", false},
                                         READING_FACT{"Off", 0, "$(JOB)/temp", true},
                                         READING_FACT{"OffByItsLowBits", 4, "$(JOB)/temp", true},
                                         READING_FACT{"WriteOnlyAndPlain", 2, "/temp", true},
                                         READING_FACT{"WriteOnlyAndAVariable", 2, "$(INSTALL)/temp", false},
                                         READING_FACT{"WriteOnlyByItsLowBits", 6, "$(INSTALL)/temp", false},
                                         READING_FACT{"VariableInTheMiddle", 3, "/temp/$(JOB)", true}),
                         [](auto const& fact) { return std::string(fact.param.name); });

TEST(Reading, RandomFolders_CanBeReadJustWhenAClientComesToAnEnd)
{
    std::mt19937_64 random(28);
    std::vector<std::string> const parts{"$(", "INSTALL", "TEMP",       ")",        "/",
                                         "\\", "a",       "$(INSTALL)", "$(TEMP)/b"};
    int readable = 0;
    for (int round = 0; round < 20000; ++round)
    {
        FolderSettings settings;
        settings.use = static_cast<int>(random() % 4);
        for (std::size_t const row : {Install, Temp, JobRow})
            for (auto count = random() % 5; count > 0; --count)
                settings.values[row] += parts[random() % parts.size()];
        bool const canBeRead = settings.CanBeRead();
        readable += canBeRead ? 1 : 0;
        ASSERT_EQ(canBeRead, FoldersOfAClient(settings).has_value())
            << settings.use << " " << settings.values[Install] << " | " << settings.values[Temp] << " | "
            << settings.values[JobRow];
    }
    EXPECT_GT(readable, 2000);
    EXPECT_LT(readable, 18000);
}

class FolderWrites : public ServerTest
{
protected:
    FolderWrites()
    {
        Set(SystemTicket, "System/UseFolderVariables", 3);
        Set(SystemTicket, "System/InstallFolder", "/site");
        Set(SystemTicket, "System/Folders/Temp", "$(INSTALL)/temp");
    }

    FolderTable Folders() { return FolderTable(Tickets().Folders().values); }
};

TEST_F(FolderWrites, WriteThatClientsCannotResolve_IsRefused)
{
    EXPECT_FALSE(Set(SystemTicket, "System/Folders/Temp", "$(JOB)/x"));
    EXPECT_FALSE(Set(SystemTicket, "System/Folders/Temp", "$(JOB)/x", 0));
    EXPECT_FALSE(Set(SystemTicket, "System/Folders/Thumbnail", "$(THUMBNAIL)"));
    EXPECT_FALSE(Set(SystemTicket, "System/Folders/Thumbnail", "$(oops/x", -2));  // appended: its first value
    EXPECT_STREQ(Text(SystemTicket, "System/Folders/Temp"), "$(INSTALL)/temp");
    EXPECT_EQ(Text(SystemTicket, "System/Folders/Thumbnail"), nullptr);
    EXPECT_THAT(PlacesInStore(SystemTicket),
                testing::Not(testing::Contains(std::pair("System/Folders/Thumbnail", 0))));
}

TEST_F(FolderWrites, WriteThatResolves_IsDone)
{
    EXPECT_TRUE(Set(SystemTicket, "System/Folders/Job", "$(TEMP)/job"));
    EXPECT_EQ(Folders().FolderOf("JOB"), "/site/temp/job");
    EXPECT_TRUE(Set(SystemTicket, "System/Folders/Temp", "/elsewhere"));
    EXPECT_EQ(Folders().FolderOf("JOB"), "/elsewhere/job");
}

TEST_F(FolderWrites, LaterPositions_AreNotRead_AndMayHoldAnything)
{
    EXPECT_TRUE(Set(SystemTicket, "System/Folders/Temp", "$(JOB)/x", 1));
}

TEST_F(FolderWrites, FolderThatOthersLeanOn_CannotBeTakenAway)
{
    EXPECT_FALSE(Set(As("admin"), SystemTicket, "System/InstallFolder", PARAM_NONE, nullptr, -1));
    EXPECT_FALSE(Set(As("admin"), SystemTicket, "System/InstallFolder", PARAM_NONE, nullptr, 0));
    EXPECT_FALSE(Set(SystemTicket, "System/InstallFolder", ""));
    EXPECT_FALSE(Set(SystemTicket, "System/InstallFolder", 7));  // no text: clients read nothing
    EXPECT_STREQ(Text(SystemTicket, "System/InstallFolder"), "/site");
    EXPECT_TRUE(Set(As("admin"), SystemTicket, "System/Folders/Temp", PARAM_NONE, nullptr, -1));
    EXPECT_TRUE(Set(As("admin"), SystemTicket, "System/InstallFolder", PARAM_NONE, nullptr, -1));
}

TEST_F(FolderWrites, UseWithoutResolving_IsRefusedWhileAFolderHasAVariable)
{
    EXPECT_FALSE(Set(SystemTicket, "System/UseFolderVariables", 2));
    EXPECT_TRUE(Set(SystemTicket, "System/UseFolderVariables", 0));
    EXPECT_TRUE(Set(SystemTicket, "System/Folders/Temp", "$(NOPE)"));  // nobody looks at it
    EXPECT_FALSE(Set(SystemTicket, "System/UseFolderVariables", 1));
    EXPECT_TRUE(Set(SystemTicket, "System/Folders/Temp", "/temp"));
    EXPECT_TRUE(Set(SystemTicket, "System/UseFolderVariables", 2));
    EXPECT_FALSE(Set(SystemTicket, "System/Folders/Temp", "$(INSTALL)/temp"));
}

TEST_F(FolderWrites, Table_IsJudgedRecordByRecord)
{
    SETMULTIPAR table[5] = {};
    auto const put = [&table](int index, char const* key, char const* value)
    {
        table[index].key = key;
        table[index].type = PARAM_STRING;
        table[index].value = value;
        table[index].pos = -1;
    };
    put(0, "System/Folders/Print", "$(THUMBNAIL)/print");  // too early
    put(1, "System/Folders/Thumbnail", "/thumbnail");
    put(2, "System/Folders/RemoteIn", "$(THUMBNAIL)/in");  // now it is there
    put(3, "System/Folders/Thumbnail", "$(NOPE)");
    EXPECT_TRUE(SetTable(As("admin"), SystemTicket, table));
    EXPECT_FALSE(table[0].ok);
    EXPECT_TRUE(table[1].ok);
    EXPECT_TRUE(table[2].ok);
    EXPECT_FALSE(table[3].ok);
    EXPECT_EQ(Folders().FolderOf("REMOTE_IN"), "/thumbnail/in");
    EXPECT_EQ(Folders().FolderOf("PRINT"), std::nullopt);
}

TEST_F(FolderWrites, OtherTickets_MayHoldSuchKeys)
{
    EXPECT_TRUE(Set(Job, "System/Folders/Temp", "$(NOPE)"));
}
