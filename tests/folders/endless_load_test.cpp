// A folder in variable form is decoded until it is none any more, however long that takes.
#include "comgui/folders/clFOLDER_VARIABLES_IMP.h"

#include "tests/folders/FolderServer.h"
#include <csignal>
#include <gtest/gtest.h>
#include <sys/time.h>

using comgui::detail::clFOLDER_VARIABLES_IMP;

namespace
{
// Hands paths back as they are for a long time, as the real one does for ever, and then knows the folder.
class KnowsItAtLast : public clFOLDER_VARIABLES_IMP
{
public:
    using clFOLDER_VARIABLES_IMP::clFOLDER_VARIABLES_IMP;

    std::string Decode(std::string const& path, bool backslashes) const override
    {
        EXPECT_EQ(path, "$(LOG)/temp");
        EXPECT_FALSE(backslashes);
        return ++asked < Patience ? path : "/at/last";
    }

    static constexpr int Patience = 100000;
    mutable int asked = 0;
};

struct ENDLESS_FACT
{
    char const* name;
    int flags;
    char const* folder;  // of TEMP
};

class EndlessLoad : public testing::TestWithParam<ENDLESS_FACT>
{
};

// Ends this process by SIGVTALRM after that much work. Time spent waiting does not count.
void GiveMilliseconds(int milliseconds)
{
    itimerval const timer = {{0, 0}, {0, milliseconds * 1000}};
    std::signal(SIGVTALRM, SIG_DFL);
    setitimer(ITIMER_VIRTUAL, &timer, nullptr);
}
}  // namespace

TEST(Load, FolderWhoseVariableIsNotKnownYet_IsDecodedWithoutBound_ByDesign)
{
    FolderServer server;
    KnowsItAtLast folders(server.container.Access());
    server.SetFolder("System/Folders/Temp", "$(LOG)\\temp\\");
    folders.Load();
    EXPECT_EQ(folders.asked, KnowsItAtLast::Patience);
    EXPECT_EQ(folders.Encode("/at/last/x"), "$(TEMP)/x");
}

TEST_P(EndlessLoad, IsStillThereWhenItsTimeIsOver_ByDesign)
{
    testing::GTEST_FLAG(death_test_style) = "threadsafe";
    EXPECT_EXIT(
        {
            FolderServer server(GetParam().flags);
            server.SetFolder("System/InstallFolder", "/print");
            server.SetFolder("System/Folders/Temp", GetParam().folder);
            server.SetFolder("System/Folders/Log", "/log");
            GiveMilliseconds(200);
            clFOLDER_VARIABLES_IMP const folders(server.container.Access());
            std::_Exit(0);
        },
        testing::KilledBySignal(SIGVTALRM), "");
}

INSTANTIATE_TEST_SUITE_P(Facts, EndlessLoad,
                         testing::Values(ENDLESS_FACT{"FolderFurtherDown", 3, "$(LOG)/temp"},
                                         ENDLESS_FACT{"ItsOwnFolder", 3, "$(TEMP)/temp"},
                                         ENDLESS_FACT{"UnknownVariable", 3, "$(NOPE)/temp"},
                                         ENDLESS_FACT{"NoClosingParenthesis", 3, "$(INSTALL"},
                                         ENDLESS_FACT{"NoName", 1, "$()/temp"},
                                         ENDLESS_FACT{"NothingIsDecoded", 2, "$(INSTALL)/temp"}),
                         [](auto const& fact) { return std::string(fact.param.name); });

// So that the others do not pass because everything takes too long.
TEST(LoadInTime, AFolderThatIsKnown_IsLoadedInThatTime)
{
    testing::GTEST_FLAG(death_test_style) = "threadsafe";
    EXPECT_EXIT(
        {
            FolderServer server;
            server.SetFolder("System/InstallFolder", "/print");
            server.SetFolder("System/Folders/Temp", "$(INSTALL)/temp");
            GiveMilliseconds(200);
            clFOLDER_VARIABLES_IMP const folders(server.container.Access());
            std::_Exit(folders.Decode("$(TEMP)", false) == "/print/temp" ? 7 : 8);
        },
        testing::ExitedWithCode(7), "");
}
