// Paths of the server on this machine.
#include "comgui/session/ComGUIManager.h"

#include "tests/folders/FolderServer.h"
#include "tests/session/Tickets.h"
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <memory>

using testing::IsEmpty;

namespace
{
// A manager that is kept, since it does not free its translator.
class DecodedPaths : public Tickets
{
protected:
    DecodedPaths() : kept(*NewManager())
    {
        first.SetFolder("System/Folders/Temp", "/first");
        second.SetFolder("System/Folders/Temp", "/second");
    }

    void LogInAt(FolderServer& server)
    {
        module.container = server.container.Access();
        kept.Login("u", "p", "h", 1);
    }

    ComGUIManager& kept;
    FolderServer first;
    FolderServer second;

private:
    static ComGUIManager* NewManager()
    {
        static std::vector<std::unique_ptr<ComGUIManager>>& managers =
            *new std::vector<std::unique_ptr<ComGUIManager>>;
        return managers.emplace_back(std::make_unique<ComGUIManager>()).get();
    }
};
}  // namespace

TEST_F(DecodedPaths, LoggedOut_AreEmptyAndNothingIsAsked)
{
    EXPECT_EQ(kept.GetDecodedPath("/a"), "");
    EXPECT_THAT(first.container.calls, IsEmpty());
}

TEST_F(DecodedPaths, AreResolvedWithTheFoldersOfTheServer)
{
    LogInAt(first);
    EXPECT_EQ(kept.GetDecodedPath("$(TEMP)/x/y"), "/first/x/y");
    EXPECT_EQ(kept.GetDecodedPath("$(UNKNOWN)/x"), "$(UNKNOWN)/x");
    EXPECT_EQ(kept.GetDecodedPath("/a/b"), "/a/b");
}

TEST_F(DecodedPaths, Folders_AreAskedForAtTheFirstCallAlone)
{
    LogInAt(first);
    EXPECT_THAT(first.container.calls, IsEmpty());
    kept.GetDecodedPath("$(TEMP)/x");
    EXPECT_FALSE(first.container.calls.empty());
    first.container.calls.clear();
    first.SetFolder("System/Folders/Temp", "/changed");
    EXPECT_EQ(kept.GetDecodedPath("$(TEMP)/x"), "/first/x");
    EXPECT_THAT(first.container.calls, IsEmpty());
}

TEST_F(DecodedPaths, AfterALogoutAndAnotherLogin_AreThoseOfTheFirstSession_ByDesign)
{
    LogInAt(first);
    EXPECT_EQ(kept.GetDecodedPath("$(TEMP)/x"), "/first/x");
    kept.Logout();
    EXPECT_EQ(kept.GetDecodedPath("$(TEMP)/x"), "");
    LogInAt(second);
    EXPECT_EQ(kept.GetDecodedPath("$(TEMP)/x"), "/first/x");
    EXPECT_THAT(second.container.calls, IsEmpty());
}

TEST_F(DecodedPaths, LoggedInWithoutAContainer_StayAsTheyAre)
{
    module.container = nullptr;
    kept.Login("u", "p", "h", 1);
    EXPECT_EQ(kept.GetDecodedPath("$(TEMP)/x"), "$(TEMP)/x");
}
