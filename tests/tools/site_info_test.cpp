#include "tools/comgui_site/info.h"

#include "comgui/testing/TemporaryFolder.h"
#include "tests/tools/SiteTest.h"

using comgui::test::TemporaryFolder;

using namespace comgui_site;
using namespace standin;
using testing::HasSubstr;
using testing::Not;

namespace
{
class SiteInfoTest : public SiteTest
{
protected:
    TemporaryFolder const folder;
};
}  // namespace

TEST_F(SiteInfoTest, InfoOf_CountsTicketsByType)
{
    site->AddTicket({3, 1});
    site->AddTicket({3, 8});
    SiteInfo const info = InfoOf(store, folder.Path());
    EXPECT_EQ(info.tickets, (std::map<int, std::size_t>{{0, 1}, {3, 2}, {17, 2}}));
    EXPECT_THAT(TextOf(info), HasSubstr("tickets   5\n  type 0 (system): 1\n  type 3 (jobs): 2\n"));
}

TEST_F(SiteInfoTest, InfoOf_MeasuresDatabaseAndFilesApart)
{
    folder.Write("site.db", std::string(100, 'x'));
    folder.Write("site.db-wal", std::string(20, 'x'));
    folder.Write("site.db-shm", std::string(3000, 'x'));
    folder.Write("site.lock", std::string(4000, 'x'));
    folder.Write("seed.xml", "x");
    folder.Write("job/1/site.db", std::string(9, 'x'));
    SiteInfo const info = InfoOf(store, folder.Path());
    EXPECT_EQ(info.databaseSize, 120u);
    EXPECT_EQ(info.filesSize, 10u);
}

TEST_F(SiteInfoTest, InfoOf_ListsOtherProgramsAlone)
{
    MemoryStore other(site, "desk\x1B");
    other.OpenSession("admin");
    other.OpenSession("operator");
    SiteInfo const info = InfoOf(store, folder.Path());
    ASSERT_EQ(info.programs.size(), 1u);
    EXPECT_THAT(TextOf(info), HasSubstr("programs  1\n  desk\\x1b  process "));
    EXPECT_THAT(TextOf(info), HasSubstr("2 sessions  alive\n"));
    Json const json = JsonOf(info);
    EXPECT_EQ(json["programs"][0]["sessions"], 2);
    EXPECT_EQ(json["programs"][0]["alive"], true);
}

TEST_F(SiteInfoTest, InfoOf_ADeadProgram_SaysSo)
{
    MemoryStore other(site, "desk");
    other.Die();
    EXPECT_THAT(TextOf(InfoOf(store, folder.Path())), HasSubstr("0 sessions  dead"));
}

TEST_F(SiteInfoTest, BeginningOfJournal_IsTheFirstThatIsThere)
{
    StoreLimits limits;
    limits.journalKept = 3;
    auto const small = std::make_shared<MemorySite>(limits);
    MemoryStore owner(small);
    TicketCommits commits(owner);
    EXPECT_EQ(BeginningOfJournal(owner), 1u);
    for (int i = 0; i < 10; ++i)
        commits.CreateNext(3, {});
    EXPECT_EQ(BeginningOfJournal(owner), 1u);
    owner.Maintain(10);
    EXPECT_EQ(BeginningOfJournal(owner), 8u);
    SiteInfo const info = InfoOf(owner, folder.Path());
    EXPECT_EQ(info.oldest, 8u);
    EXPECT_THAT(TextOf(info), HasSubstr("journal   from 8 to 10\n"));
}

TEST_F(SiteInfoTest, Journal_ThatIsEmpty_SaysSo)
{
    auto const fresh = std::make_shared<MemorySite>();
    MemoryStore owner(fresh);
    SiteInfo const info = InfoOf(owner, folder.Path());
    EXPECT_THAT(TextOf(info), HasSubstr("journal   empty; the next change is 1\n"));
    EXPECT_TRUE(JsonOf(info)["oldestChangeInJournal"].is_null());
}

TEST_F(SiteInfoTest, Passwords_AreNotShown)
{
    SiteInfo const info = InfoOf(store, folder.Path());
    EXPECT_THAT(TextOf(info), HasSubstr("admin  role 16  ticket 17/1"));
    EXPECT_THAT(TextOf(info), Not(HasSubstr("$y$")));
    EXPECT_THAT(LinesOf(JsonOf(info)), Not(HasSubstr("$y$")));
}
