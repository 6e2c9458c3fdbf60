#include "tools/comgui_site/users.h"

#include "comgui/testing/TemporaryFolder.h"
#include "standin/server/store/sqlite/SqliteStore.h"
#include "tests/tools/SiteTest.h"

using comgui::test::TemporaryFolder;

using namespace comgui_site;
using namespace standin;
using testing::HasSubstr;

namespace
{
class SiteUsers : public SiteTest
{
protected:
    std::string Users()
    {
        std::string text;
        for (User const& user : store.Users())
            text += user.name + ":" + std::to_string(user.role) + ":" + std::to_string(user.ticketId) + " ";
        return text;
    }
    std::string Refusal(NewUser const& user)
    {
        return TroubleOf([&] { comgui_site::AddUser(store, user, "$y$new"); });
    }
};

std::string const Before = "admin:16:1 operator:1:2 ";
}  // namespace

TEST_F(SiteUsers, AddUser_WithoutATicket_MakesTheNext)
{
    User const made = comgui_site::AddUser(store, {"anna", 16}, "$y$new");
    EXPECT_EQ(made.ticketId, 3);
    EXPECT_EQ(Users(), "admin:16:1 anna:16:3 operator:1:2 ");
    EXPECT_EQ(store.FindUser("anna")->passwordHash, "$y$new");
    EXPECT_EQ(Ticket({17, 3}), "User/Name[0]=\"anna\" User/Role[0]=16");
}

TEST_F(SiteUsers, AddUser_WithATicketThatIsThere_LeavesItAsItIs)
{
    Put({17, 9}, "User/Language", Bytes(PARAM_STRING, "fr"));
    comgui_site::AddUser(store, {"anna", 1, 9}, "$y$new");
    EXPECT_EQ(Ticket({17, 9}), "User/Language[0]=\"fr\"");
}

TEST_F(SiteUsers, AddUser_WithATicketThatIsMissing_MakesIt)
{
    comgui_site::AddUser(store, {"anna", 1, 40}, "$y$new");
    EXPECT_EQ(store.FindUser("anna")->ticketId, 40);
    EXPECT_THAT(Ticket({17, 40}), HasSubstr("anna"));
}

TEST_F(SiteUsers, AddUser_OfANameThatIsTaken_IsRefused)
{
    EXPECT_THAT(Refusal({"admin"}), HasSubstr("there is a user \"admin\" already"));
    EXPECT_EQ(store.FindUser("admin")->passwordHash, "$y$hash");
}

TEST_F(SiteUsers, AddUser_WithTheTicketOfAnother_IsRefused)
{
    EXPECT_THAT(Refusal({"anna", 1, 2}), HasSubstr("17/2 is \"operator\"'s own"));
    EXPECT_EQ(Users(), Before);
}

TEST_F(SiteUsers, AddUser_OfNamesThatAreNone_IsRefused)
{
    EXPECT_THAT(Refusal({""}), HasSubstr("is empty"));
    EXPECT_THAT(Refusal({"a\x1Bz"}), HasSubstr("control characters or is not UTF-8: \"a\\x1bz\""));
    EXPECT_THAT(Refusal({"a\xFF"}), HasSubstr("not UTF-8"));
    EXPECT_THAT(Refusal({" a"}), HasSubstr("a space"));
    EXPECT_THAT(Refusal({"a "}), HasSubstr("a space"));
    EXPECT_THAT(Refusal({std::string(128, 'x')}), HasSubstr("more than 127 bytes"));
    EXPECT_EQ(Users(), Before);
    EXPECT_EQ(Refusal({std::string(127, 'x')}), "");
}

TEST_F(SiteUsers, AddUser_WhenTheUserCannotBeWritten_LeavesNoTicket)
{
    int operation = 1;
    for (;; ++operation)
    {
        site->FailOperation(operation);
        bool const isDone = Refusal({"anna"}).empty();
        if (isDone)
            break;
        EXPECT_TRUE(site->HasFailed());
        EXPECT_EQ(Users(), Before) << operation;
        EXPECT_EQ(Ticket({17, 3}), "none") << operation;
        ASSERT_LT(operation, 20);
    }
    EXPECT_GT(operation, 2);
}

TEST_F(SiteUsers, RemoveUser_TakesTheTicketAlong)
{
    EXPECT_TRUE(RemoveUser(store, "operator", false));
    EXPECT_EQ(Users(), "admin:16:1 ");
    EXPECT_EQ(Ticket({17, 2}), "none");
}

TEST_F(SiteUsers, RemoveUser_ThatKeepsTheTicket)
{
    EXPECT_FALSE(RemoveUser(store, "operator", true));
    EXPECT_EQ(Ticket({17, 2}), "");
}

TEST_F(SiteUsers, RemoveUser_WithTheTicketOfAnother_LeavesIt)
{
    HaveUser("twin", 1, 2);
    EXPECT_FALSE(RemoveUser(store, "twin", false));
    EXPECT_EQ(Ticket({17, 2}), "");
}

TEST_F(SiteUsers, RemoveUser_ThatIsNone_IsRefused)
{
    EXPECT_THAT(TroubleOf([&] { RemoveUser(store, "no\x1B", false); }),
                HasSubstr("no user has the name \"no\\x1b\""));
}

TEST_F(SiteUsers, LastAdministrator_IsNeitherRemovedNorDemoted)
{
    EXPECT_THAT(TroubleOf([&] { RemoveUser(store, "admin", false); }), HasSubstr("the last administrator"));
    EXPECT_THAT(TroubleOf([&] { SetRole(store, "admin", 1); }), HasSubstr("the last administrator"));
    EXPECT_EQ(Users(), Before);
    EXPECT_EQ(TroubleOf([&] { SetRole(store, "admin", 16); }), "");
}

TEST_F(SiteUsers, LastButOneAdministrator_MayGo)
{
    SetRole(store, "operator", 16);
    SetRole(store, "admin", 1);
    EXPECT_EQ(Users(), "admin:1:1 operator:16:2 ");
    EXPECT_TRUE(RemoveUser(store, "admin", false));
}

TEST_F(SiteUsers, SetRole_ChangesTheTicketThatHasTheRole)
{
    Put({17, 2}, "User/Role", Integer(PARAM_INT, 1));
    Put({17, 2}, "User/Language", Bytes(PARAM_STRING, "fr"));
    SetRole(store, "operator", 16);
    EXPECT_EQ(Ticket({17, 2}), "User/Language[0]=\"fr\" User/Role[0]=16");
    SetRole(store, "admin", 16);
    EXPECT_EQ(Ticket({17, 1}), "");
}

TEST_F(SiteUsers, SetPasswordHash_LeavesTheRest)
{
    SetPasswordHash(store, "admin", "$y$other");
    EXPECT_EQ(store.FindUser("admin")->passwordHash, "$y$other");
    EXPECT_EQ(store.FindUser("operator")->passwordHash, "$y$hash");
    EXPECT_EQ(Users(), Before);
}

TEST(SiteUsersTurn, IsForOneAtATime)
{
    TemporaryFolder const folder;
    standin::SqliteStore store(folder.Path(), [] { return standin::StoreContent(); });
    auto first = std::make_unique<UsersTurn>(store);
    EXPECT_EQ(store.TakeUsersTurn(std::chrono::milliseconds(20)), nullptr);
    first.reset();
    EXPECT_NE(store.TakeUsersTurn(std::chrono::milliseconds(20)), nullptr);
}
