// Sites for tests, and the server's own side of them.
#include "comgui/client.h"
#include "comgui/comgui.h"
#include "comgui/testing.h"
#include "tests/testing/HeardKeys.h"
#include <cstdlib>
#include <gmock/gmock.h>
#include <optional>
#include <sys/wait.h>
#include <unistd.h>

using comgui::plugin::Bytes;
using comgui::test::Address;
using comgui::test::TemporarySite;
using comgui::test::Value;
using testing::ElementsAre;
using testing::HasSubstr;

namespace
{
class SiteOfATest : public testing::Test
{
protected:
    void LogIn(char const* user = "admin") { ASSERT_TRUE(connection.LogIn({}, {user, user})); }

    TemporarySite site;
    comgui::Connection connection;
    comgui::Tickets const tickets = connection.GetTickets();
};

template <typename Work>
std::string ErrorOf(Work const& work)
{
    try
    {
        work();
        return "none";
    }
    catch (std::runtime_error const& error)
    {
        return error.what();
    }
}
}  // namespace

TEST_F(SiteOfATest, HasTheUsersAndTicketsOfANewSite)
{
    LogIn("operator");
    LogIn("admin");
    EXPECT_EQ(*tickets.ReadAs<std::string>({0, 0}, "System/Name"), "Print Server");
    EXPECT_EQ(std::getenv("COMGUI_SITE"), site.Folder().string());
    EXPECT_TRUE(std::filesystem::exists(site.Folder() / "tickets/SYS_0000.xml"));
}

TEST_F(SiteOfATest, UserThatIsAdded_MayLogIn)
{
    int const own = site.AddUser("anna", "secret", 16);
    auto const user = connection.LogIn({}, {"anna", "secret"});
    ASSERT_TRUE(user);
    EXPECT_EQ(user->ticket, (comgui::TicketAddress{17, own}));
    EXPECT_TRUE(user->isAdministrator);
    EXPECT_FALSE(connection.LogIn({}, {"anna", "Secret"}));
}

TEST_F(SiteOfATest, ClientAndTest_SeeTheSameTickets)
{
    LogIn();
    Address const job = site.Create(3, {{"Job/Copies", 2}});
    comgui::TicketAddress const address{3, job.id};
    EXPECT_EQ(*tickets.ReadAs<int>(address, "Job/Copies"), 2);
    EXPECT_TRUE(tickets.Write(address, "Job/Copies", 3));
    EXPECT_EQ(site.Read(job, "Job/Copies"), Value(3));
    site.Write(job, {{"A", 1LL, -1}, {"B", 2u, -1}, {"C", 3ULL, -1}, {"D", 0.5, -1}, {"E", Bytes{"x"}, -1}});
    EXPECT_EQ(*tickets.ReadAs<long long>(address, "A"), 1);
    EXPECT_EQ(site.Read(job, "A"), Value(1LL));
    EXPECT_EQ(site.Read(job, "B"), Value(2u));
    EXPECT_EQ(site.Read(job, "C"), Value(3ULL));
    EXPECT_EQ(site.Read(job, "D"), Value(0.5));
    EXPECT_EQ(site.Read(job, "E"), Value(Bytes{"x"}));
    site.Put(job, "E", {});
    EXPECT_EQ(site.Read(job, "E"), Value());
    EXPECT_TRUE(site.Exists(job));
    site.Delete(job);
    EXPECT_FALSE(site.Exists(job));
    EXPECT_FALSE(tickets.Exists(address));
}

TEST_F(SiteOfATest, WhatCannotBeDone_Throws)
{
    EXPECT_EQ(ErrorOf([&] { site.Put({3, 99}, "A", 1); }), "3/99: A cannot be written");
    EXPECT_EQ(ErrorOf(
                  [&] {
                      site.Put({0, 0}, "A", static_cast<void*>(nullptr));
                  }),
              "a server stores no pointers");
    EXPECT_EQ(ErrorOf([&] { site.Delete({3, 99}); }), "3/99: cannot be deleted");
    EXPECT_EQ(ErrorOf([&] { site.Create(100); }), "no ticket of type 100 can be made");
}

TEST_F(SiteOfATest, WhatTheTestDoes_IsHeardOf)
{
    LogIn();
    Address const job = site.Create(3);
    auto const heard = KeysHeardOf(connection, [&] { site.Put(job, "Job/State", 1); });
    EXPECT_THAT(heard, ElementsAre("Job/State"));
}

TEST_F(SiteOfATest, Trouble_ReachesClients_AndGoes)
{
    LogIn();
    site.SetTrouble({"fail call=MGETPARAMETER user=admin"});
    EXPECT_FALSE(tickets.Read({0, 0}, "System/Name"));
    site.SetTrouble({});
    EXPECT_TRUE(tickets.Read({0, 0}, "System/Name"));
    EXPECT_THROW(site.SetTrouble({"full", "nonsense"}), std::invalid_argument);
    EXPECT_TRUE(tickets.Write({0, 0}, "K", 1)) << "a rule that is wrong takes no others along";
}

TEST_F(SiteOfATest, Trouble_DoesNotStandInTheTestsOwnWay)
{
    Address const job = site.Create(3);
    for (char const* rule : {"full", "away", "fail", "delay by=10m"})
    {
        SCOPED_TRACE(rule);
        site.SetTrouble({rule});
        site.Put(job, "A", 1);
        EXPECT_EQ(site.Read(job, "A"), Value(1));
        site.Delete(site.Create(3, {{"B", 2}}));
    }
}

// The check for leaks takes a lock that another thread of the parent may have held: a child has no such
// thread.
static bool isChild = false;
extern "C" __attribute__((visibility("default"))) int __lsan_is_turned_off();
int __lsan_is_turned_off() { return isChild ? 1 : 0; }

TEST_F(SiteOfATest, StaysThere_WhenAForkedChildEnds)
{
    comgui::test::ModuleFake const module;
    pid_t const child = fork();
    if (child == 0)
    {
        isChild = true;
        std::exit(0);
    }
    int status = 0;
    waitpid(child, &status, 0);
    EXPECT_TRUE(std::filesystem::exists(site.Folder() / "site.db"));
    EXPECT_TRUE(std::filesystem::exists(module.PlugIns() / "ComGUI.Bundle"));
}

TEST(TemporarySites, OneAfterTheOther_AreSitesOfTheirOwn)
{
    std::filesystem::path first;
    {
        TemporarySite const site;
        first = site.Folder();
    }
    TemporarySite const second;
    EXPECT_NE(second.Folder(), first);
    EXPECT_EQ(std::getenv("COMGUI_SITE"), second.Folder().string());
}
