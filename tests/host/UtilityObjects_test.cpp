#include "comgui/host/UtilityObjects.h"

#include "comgui/testing/TemporaryFolder.h"
#include <atomic>
#include <cstdio>
#include <filesystem>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <string>
#include <thread>

using comgui::test::TemporaryFolder;

namespace
{
namespace fs = std::filesystem;

std::string PlugInsPath(wchar_t const* bundleName = L"ComGUI.Bundle")
{
    wxString path = "left over";
    UtilityObjects::GetPlugInsPath(path, bundleName);
    return path.ToStdString(wxConvUTF8);
}

// Leaves no folder set behind.
class SetPlugInsFolder : public testing::Test
{
protected:
    void TearDown() override { UtilityObjects::SetPlugInsFolder(""); }
};

TEST_F(SetPlugInsFolder, AnyFolder_HoldsEveryBundleFromThenOn)
{
    UtilityObjects::SetPlugInsFolder("/opt/print/PlugIns");
    EXPECT_EQ(PlugInsPath(), "/opt/print/PlugIns/ComGUI.Bundle");
    EXPECT_EQ(PlugInsPath(L"Other.Bundle"), "/opt/print/PlugIns/Other.Bundle");
}

TEST_F(SetPlugInsFolder, SecondFolder_TakesThePlaceOfTheFirst)
{
    UtilityObjects::SetPlugInsFolder("/opt/first");
    UtilityObjects::SetPlugInsFolder("/opt/second");
    EXPECT_EQ(PlugInsPath(), "/opt/second/ComGUI.Bundle");
}

TEST_F(SetPlugInsFolder, SlashAtTheEnd_MakesNoDifference)
{
    UtilityObjects::SetPlugInsFolder("/opt/print/");
    EXPECT_EQ(PlugInsPath(), "/opt/print/ComGUI.Bundle");
}

TEST_F(SetPlugInsFolder, RelativeFolder_IsTakenFromTheFolderCurrentThen)
{
    TemporaryFolder const folder;
    fs::current_path(folder.Path());
    UtilityObjects::SetPlugInsFolder("plug-ins");
    fs::current_path("/");
    EXPECT_EQ(PlugInsPath(), (folder.Path() / "plug-ins/ComGUI.Bundle").string());
}

TEST_F(SetPlugInsFolder, MayBeCalledWhileOthersAsk)
{
    std::atomic<bool> isOver{false};
    std::thread asking(
        [&]
        {
            while (!isOver)
                EXPECT_THAT(PlugInsPath(), testing::EndsWith("/ComGUI.Bundle"));
        });
    for (int i = 0; i < 1000; ++i)
        UtilityObjects::SetPlugInsFolder(i % 2 == 0 ? "/opt/a-folder-with-quite-a-long-name" : "");
    isOver = true;
    asking.join();
}

TEST_F(SetPlugInsFolder, NamesBeyondAscii_AreUTF8)
{
    UtilityObjects::SetPlugInsFolder(wxString::FromUTF8("/opt/Drucker-\xC3\x84rger"));
    EXPECT_EQ(PlugInsPath(L"\u00DC.Bundle"), "/opt/Drucker-\xC3\x84rger/\xC3\x9C.Bundle");
}

TEST_F(SetPlugInsFolder, EmptyText_TakesTheFolderBack)
{
    std::string const before = PlugInsPath();
    UtilityObjects::SetPlugInsFolder("/opt/print/PlugIns");
    ASSERT_NE(PlugInsPath(), before);
    UtilityObjects::SetPlugInsFolder("");
    EXPECT_EQ(PlugInsPath(), before);
}

// A program in a folder of its own that prints what GetPlugInsPath gives there.
class GetPlugInsPath : public testing::Test
{
protected:
    static std::string AskFrom(fs::path const& programFolder)
    {
        fs::create_directories(programFolder);
        fs::path const program = programFolder / "program";
        fs::copy_file(COMGUI_PLUGINS_PATH, program);
        // NOLINTNEXTLINE(cert-env33-c): the path is the test's own
        std::FILE* const pipe = popen(("LC_ALL=C '" + program.string() + "'").c_str(), "r");
        std::string answer(4096, '\0');
        answer.resize(std::fread(answer.data(), 1, answer.size(), pipe));
        EXPECT_EQ(pclose(pipe), 0);
        return answer;
    }

    static std::string InLibraryFolder() { return (fs::path(COMGUI_HOST_FOLDER) / "ComGUI.Bundle").string(); }

    TemporaryFolder const folder;
};

TEST_F(GetPlugInsPath, PlugInsBesideTheProgramWithTheBundle_IsThere)
{
    fs::path const bundle = folder.Path() / "PlugIns" / "ComGUI.Bundle";
    fs::create_directories(bundle);
    EXPECT_EQ(AskFrom(folder.Path()), bundle.string());
}

TEST_F(GetPlugInsPath, PlugInsBesideTheProgramWithoutTheBundle_IsInTheLibrarysFolder)
{
    fs::create_directories(folder.Path() / "PlugIns" / "Other.Bundle");
    EXPECT_EQ(AskFrom(folder.Path()), InLibraryFolder());
}

TEST_F(GetPlugInsPath, NoPlugInsBesideTheProgram_IsInTheLibrarysFolder)
{
    EXPECT_EQ(AskFrom(folder.Path()), InLibraryFolder());
}

TEST_F(GetPlugInsPath, ProgramFolderBeyondAscii_NeedsNoLocale)
{
    fs::path const programs = folder.Path() / "Programme f\xC3\xBCr Drucker";
    fs::path const bundle = programs / "PlugIns" / "ComGUI.Bundle";
    fs::create_directories(bundle);
    EXPECT_EQ(AskFrom(programs), bundle.string());
}
}  // namespace
