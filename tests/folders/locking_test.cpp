// Which operations hold the lock, and for how long.
#include "comgui/folders/clFOLDER_VARIABLES_IMP.h"

#include "comgui/folders/clSETMULTIPAR_FOLDER_VARIABLES.h"
#include "tests/folders/FolderServer.h"
#include "tests/foundation/WatchedLock.h"
#include <gtest/gtest.h>

using comgui::detail::clFOLDER_VARIABLES_IMP;

namespace
{
using STEPS = std::vector<std::string>;
STEPS const Once = {"2", "3", "4"};  // wanted, held, released

class Locking : public testing::Test
{
protected:
    Locking() { watchedLock = &watched; }
    ~Locking() override { watchedLock = nullptr; }
    Locking(Locking const&) = delete;
    Locking& operator=(Locking const&) = delete;

    // What the operation does to the lock. atStep, if it is set, looks on.
    template <typename OPERATION>
    STEPS Of(OPERATION operation)
    {
        watched.steps.clear();
        operation();
        watched.atStep = nullptr;
        return watched.steps;
    }

    WATCHED_LOCK watched;
    FolderServer server;
};
}  // namespace

TEST_F(Locking, EveryOperation_TakesTheLockOnce)
{
    for (int flags = 0; flags < 4; ++flags)
    {
        server.SetFlags(flags);
        clFOLDER_VARIABLES_IMP folders(server.container.Access());
        EXPECT_EQ(Of([&] { folders.IsEnabled(); }), Once);
        EXPECT_EQ(Of([&] { folders.Load(); }), Once);
        EXPECT_EQ(Of([&] { folders.Encode("/a"); }), Once);
        EXPECT_EQ(Of([&] { folders.Encode("K", "a"); }), Once);
        EXPECT_EQ(Of([&] { folders.Encode(nullptr, "a"); }), Once);
        EXPECT_EQ(Of([&] { folders.EncodeV("V", "a"); }), Once);
        EXPECT_EQ(Of([&] { folders.EncodeV(nullptr, "a"); }), Once);
        EXPECT_EQ(Of([&] { folders.Decode("$(V)", false); }), Once);
        EXPECT_EQ(Of([&] { folders.SetFolderVariable("V", "/v"); }), Once);
        EXPECT_EQ(Of([&] { folders.SetFolderVariable("V", nullptr); }), Once);
    }
}

TEST_F(Locking, EveryOperation_LetsTheTextOfALockThatFailsPass)
{
    clFOLDER_VARIABLES_IMP folders(server.container.Access());
    watched.atStep = [](SysLib::MUTEX_INSTANCE const&, std::string const&) { throw "no lock"; };
    EXPECT_THROW(folders.IsEnabled(), char const*);
    EXPECT_THROW(folders.Load(), char const*);
    EXPECT_THROW(folders.Encode("/a"), char const*);
    EXPECT_THROW(folders.Encode("K", "a"), char const*);
    EXPECT_THROW(folders.EncodeV("V", "a"), char const*);
    EXPECT_THROW(folders.Decode("$(V)", false), char const*);
    EXPECT_THROW(folders.SetFolderVariable("V", "/v"), char const*);
    watched.atStep = nullptr;
}

TEST_F(Locking, SetFolderVariable_OfNull_DoesNotTakeIt)
{
    clFOLDER_VARIABLES_IMP folders(nullptr);
    EXPECT_EQ(Of([&] { folders.SetFolderVariable(nullptr, "/v"); }), STEPS());
}

TEST_F(Locking, TableTranslator_TakesItForEachTextAlone)
{
    clFOLDER_VARIABLES_IMP folders(nullptr);
    SETMULTIPAR table[] = {{"K", PARAM_STRING, 0, "/a", -1, false, {}},
                           {"L", PARAM_STRING, 0, "", -1, false, {}},
                           {"M", PARAM_STRING, 0, "/b", -1, false, {}},
                           {}};
    EXPECT_EQ(Of([&] { delete folders.New_clSETMULTIPAR_FOLDER_VARIABLES(&folders, table, true); }),
              (STEPS{"2", "3", "4", "2", "3", "4"}));
}

TEST_F(Locking, WithoutContainer_OnlyALaterLoadTakesIt)
{
    std::unique_ptr<clFOLDER_VARIABLES_IMP> folders;
    EXPECT_EQ(Of([&] { folders = std::make_unique<clFOLDER_VARIABLES_IMP>(nullptr); }),
              (STEPS{"InitID", "0"}));
    EXPECT_EQ(Of([&] { folders->Load(); }), Once);
}

TEST_F(Locking, Construction_Loads)
{
    EXPECT_EQ(Of([&] { clFOLDER_VARIABLES_IMP const folders(server.container.Access()); }),
              (STEPS{"InitID", "0", "2", "3", "4", "1"}));
}

TEST_F(Locking, Load_DecodesWhileItHoldsTheLock)
{
    server.SetFolder("System/InstallFolder", "/print");
    server.SetFolder("System/Folders/Temp", "$(INSTALL)/temp");
    clFOLDER_VARIABLES_IMP folders(server.container.Access());
    std::vector<int> held;
    watched.atStep = [&](SysLib::MUTEX_INSTANCE const& instance, std::string const& step)
    {
        if (step == "3")
            held.push_back(instance.lockCount);
    };
    EXPECT_EQ(Of([&] { folders.Load(); }), (STEPS{"2", "3", "2", "3", "4", "4"}));
    EXPECT_EQ(held, (std::vector<int>{1, 2}));
}

TEST_F(Locking, Load_HoldsTheLockDuringEveryCallOfTheServer)
{
    clFOLDER_VARIABLES_IMP folders(server.container.Access());
    std::size_t const opened = server.container.calls.size();
    std::size_t const read = server.systemTicket.container.calls.size();
    watched.atStep = [&](SysLib::MUTEX_INSTANCE const&, std::string const& step)
    {
        bool const isBefore = step == "2" || step == "3";
        EXPECT_EQ(server.container.calls.size() == opened, isBefore) << step;
        EXPECT_EQ(server.systemTicket.container.calls.size(), isBefore ? read : 2 * read) << step;
    };
    EXPECT_EQ(Of([&] { folders.Load(); }), Once);
}
