// What becomes of a site that cannot be used as it is, and what lies beside its database.
#include "tests/integration/Host.h"
#include "tests/support/Files.h"
#include <gmock/gmock.h>

using testing::HasSubstr;

namespace
{
class SiteOfAHost : public Host
{
protected:
    // What the test of the server writes to stderr, which must be one line.
    static std::string LineOfFailedIsAlive()
    {
        TLogin login = Record();
        testing::internal::CaptureStderr();
        EXPECT_EQ(Manager().IsAlive(&login), -2005);
        std::string const line = testing::internal::GetCapturedStderr();
        EXPECT_EQ(std::count(line.begin(), line.end(), '\n'), 1) << line;
        return line;
    }
};
}  // namespace

TEST_F(SiteOfAHost, FolderThatCannotBeMade_IsNamed)
{
    std::filesystem::path const site = folder.Write("file", "no folder") / "site";
    UseSite(site);
    EXPECT_THAT(LineOfFailedIsAlive(), HasSubstr(site.string()));
}

TEST_F(SiteOfAHost, SystemTicket_IsKeptAsXmlToo)
{
    ASSERT_EQ(LogIn(), 0);
    Manager().SetParameter(0, 0, "System/Test", PARAM_STRING, "mirrored", -1);
    EXPECT_THAT(ContentOf(folder.Path() / "site" / "tickets" / "SYS_0000.xml"),
                testing::AllOf(HasSubstr("System/Test"), HasSubstr("mirrored")));
}

TEST_F(SiteOfAHost, DamagedDatabase_IsSetAsideAndMadeAnew)
{
    std::filesystem::create_directories(folder.Path() / "site");
    folder.Write("site/site.db", "this is no database, and it is long enough to be looked at as one");
    testing::internal::CaptureStderr();
    EXPECT_EQ(LogIn(), 0);
    EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr("site.db"));
    int kept = 0;
    for (auto const& entry : std::filesystem::directory_iterator(folder.Path() / "site"))
        kept += entry.path().filename().string().starts_with("site.db.damaged-") ? 1 : 0;
    EXPECT_EQ(kept, 1);
}
