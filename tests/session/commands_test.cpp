// Commands by name, and the test of a server that goes by one.
#include "comgui/session/ComGUIManager.h"

#include "comgui/session/TCommandRecord.h"
#include "tests/session/FakeModule.h"
#include <algorithm>
#include <cstring>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using testing::ElementsAre;

namespace
{
class Commands : public WithManager
{
protected:
    Commands()
    {
        module.onCommand = [this](char const* name, int length, void* bytes)
        {
            command = name;
            size = length;
            data = bytes;
            return code;
        };
    }

    TLogin record = {};
    int code = 0;  // what the plug-in answers

    std::string command;  // what it saw
    int size = -1;
    void* data = nullptr;
};

// The commands that carry a folder, whose size is taken from its text.
class FolderCommand : public Commands, public testing::WithParamInterface<std::string>
{
protected:
    std::string name = GetParam();
    char folder[17] = "/previews\0behind";
};

// The test of the server that is a command, with what the server makes of its record.
class AliveCommand : public WithManager
{
protected:
    AliveCommand()
    {
        module.onCommand = [this](char const* name, int length, void* bytes)
        {
            command = name;
            size = length;
            auto& record = *static_cast<TCommandRecord*>(bytes);
            sent = record;
            if (answers)
                record.iResult = result;
            return code;
        };
    }

    bool answers = true;
    int result = 0;
    int code = 0;

    std::string command;
    int size = -1;
    TCommandRecord sent = {};
};
}  // namespace

TEST_F(Commands, SendCommand_PassesNameSizeAndDataAsTheyAre)
{
    for (std::string name : {"local.set.nonsense", "remote.nonsense", "", "local.set.previewfolders",
                             "LOCAL.SET.PREVIEWFOLDER", "remote.set.previewfolder"})
    {
        manager.SendCommand(name.data(), -7, &record);
        EXPECT_EQ(command, name);
        EXPECT_EQ(size, -7);
        EXPECT_EQ(data, &record);
    }
}

TEST_F(Commands, SendCommandOfARecord_PassesNameSizeAndDataAsTheyAre)
{
    char name[] = "remote.nonsense";
    manager.SendCommand(&record, name, -7, &code);
    EXPECT_EQ(command, name);
    EXPECT_EQ(size, -7);
    EXPECT_EQ(data, &code);
}

TEST_F(Commands, SendCommand_GivesThePlugInsCode)
{
    char name[] = "remote.nonsense";
    code = -77;
    EXPECT_EQ(manager.SendCommand(name, 0, nullptr), -77);
    EXPECT_EQ(manager.SendCommand(&record, name, 0, nullptr), -77);
}

TEST_F(Commands, AreSentLoggedInOrNot)
{
    char name[] = "remote.nonsense";
    auto const sendAll = [&]
    {
        manager.SendCommand(name, 0, nullptr);
        manager.SendCommand(&record, name, 0, nullptr);
        manager.IsAlive(nullptr, 0);
        manager.PrepareJob("a", 0, 0, 0, 0, 0);
    };
    sendAll();
    LogIn();
    sendAll();
    manager.Logout();
    sendAll();
    EXPECT_EQ(std::count(module.calls.begin(), module.calls.end(), "SendCommandEntry"), 12);
}

TEST_P(FolderCommand, SendCommand_PassesTheTextsLengthWhateverTheSize)
{
    for (int const given : {0, 3, 16, -1})
    {
        EXPECT_EQ(manager.SendCommand(name.data(), given, folder), 0);
        EXPECT_EQ(size, 9);
        EXPECT_EQ(command, name);
        EXPECT_EQ(data, folder);
    }
}

TEST_P(FolderCommand, SendCommand_OfAnEmptyFolder_PassesSize0)
{
    char nothing[] = "";
    manager.SendCommand(name.data(), 5, nothing);
    EXPECT_EQ(size, 0);
}

TEST_P(FolderCommand, SendCommandOfARecord_PassesTheSize_ByDesign)
{
    for (TLogin* const login : {&record, static_cast<TLogin*>(nullptr)})
        for (int const given : {0, 3})
        {
            manager.SendCommand(login, name.data(), given, folder);
            EXPECT_EQ(size, given);
            EXPECT_EQ(data, folder);
        }
}

INSTANTIATE_TEST_SUITE_P(Both, FolderCommand,
                         testing::Values("local.set.previewfolder", "local.set.thumbnailfolder"),
                         [](auto const& fact)
                         { return fact.param == "local.set.previewfolder" ? "Preview" : "Thumbnail"; });

TEST_F(AliveCommand, IsAlive_SendsARecordThatIsZeroButForItsMarks)
{
    manager.IsAlive(nullptr, 0);
    EXPECT_EQ(command, "remote.system.isalive");
    EXPECT_EQ(size, 540);
    TCommandRecord expected = {};
    expected.nMagic = 0x49494949;
    expected.nSize = 540;
    expected.iArgB = 1;
    expected.iResult = -1;
    EXPECT_EQ(std::memcmp(&sent, &expected, sizeof sent), 0);
}

TEST_F(AliveCommand, IsAlive_IgnoresItsArguments)
{
    char text[] = "host";
    manager.IsAlive(nullptr, 0);
    TCommandRecord const first = sent;
    EXPECT_EQ(manager.IsAlive(text, 4711), 0);
    EXPECT_EQ(std::memcmp(&sent, &first, sizeof sent), 0);
    EXPECT_THAT(module.calls, ElementsAre("SendCommandEntry", "SendCommandEntry"));
}

TEST_F(AliveCommand, AnswerOf0OrMore_IsAlive)
{
    for (int const answer : {0, 1, 2147483647})
    {
        result = answer;
        EXPECT_EQ(manager.IsAlive(nullptr, 0), 0);
        EXPECT_TRUE(manager.IsServerOnline());
    }
}

TEST_F(AliveCommand, NegativeAnswer_IsMinus2005)
{
    result = -2;
    EXPECT_EQ(manager.IsAlive(nullptr, 0), -2005);
    EXPECT_FALSE(manager.IsServerOnline());
}

TEST_F(AliveCommand, NoAnswer_IsMinus2005)
{
    answers = false;
    EXPECT_EQ(manager.IsAlive(nullptr, 0), -2005);
    EXPECT_FALSE(manager.IsServerOnline());
}

TEST_F(AliveCommand, AnyCode_IsMinus2005WhateverTheAnswer)
{
    for (int const failure : {1, -1})
    {
        code = failure;
        EXPECT_EQ(manager.IsAlive(nullptr, 0), -2005);
        EXPECT_FALSE(manager.IsServerOnline());
    }
}
