// What becomes of a site when processes are killed, meet, or find it unusable.
#include "tests/integration/Host.h"
#include "tests/support/ChildProcess.h"
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

TEST_F(SiteOfAHost, WriteThatWasAcknowledged_SurvivesKill9)
{
    std::int64_t acknowledged = 0;
    {
        ChildProcess child(
            [](auto const& tell)
            {
                if (LogIn() == 0)
                    for (int i = 1; WriteInt("Test/Counter", i) == 1; ++i)
                        tell(i);
            });
        while (acknowledged < 200)
        {
            std::optional<std::int64_t> const number = child.Next();
            ASSERT_TRUE(number);
            acknowledged = *number;
        }
        child.Kill();
        acknowledged = child.Last(acknowledged);
    }
    ASSERT_EQ(LogIn(), 0);
    EXPECT_GE(ReadInt("Test/Counter"), acknowledged);
    EXPECT_LE(ReadInt("Test/Counter"), acknowledged + 1);  // one more may have been on its way
}

TEST_F(SiteOfAHost, TableWriteThatWasKilled_IsThereWholeOrNotAtAll)
{
    constexpr int Size = 500;
    ChildProcess child(
        [](auto const& tell)
        {
            if (LogIn() != 0)
                return;
            MTICKET_ACCESS const* const container = Manager().GetClientContainer();
            std::vector<std::string> keys;
            for (int i = 0; i < Size; ++i)
                keys.push_back("Test/Table/" + std::to_string(i));
            std::vector<SETMULTIPAR> table(Size + 1);
            for (int round = 1;; ++round)
            {
                for (std::size_t i = 0; i < Size; ++i)
                    table[i] = {keys[i].c_str(), PARAM_INT, 0, &round, -1, false, {}};
                if (container->MSETMULTIPAR(container->Instance, 3, 1, table.data()) == 0)
                    return;
                tell(round);
            }
        });
    for (int i = 0; i < 5; ++i)
        ASSERT_TRUE(child.Next());
    child.Kill();

    ASSERT_EQ(LogIn(), 0);
    int const round = ReadInt("Test/Table/0");
    EXPECT_GE(round, 5);
    for (int i = 1; i < Size; ++i)
        ASSERT_EQ(ReadInt(("Test/Table/" + std::to_string(i)).c_str()), round);
}

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
