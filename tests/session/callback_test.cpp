// How the plug-in is told where notifications go, and which of them are wanted.
#include "comgui/session/ComGUIManager.h"

#include "comgui/access/STICKET_MODIFY.h"
#include "comgui/access/STICKET_READ.h"
#include "tests/session/FakeModule.h"
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using comgui::test::CALL;
using comgui::test::SLOT;
using comgui::test::TicketFake;

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
char const* const keys[] = {"Job/*", nullptr};

class Callback : public WithManager
{
protected:
    Callback()
    {
        module.ticket = &ticket;
        module.container = fake.Access();
        module.calls.clear();
        module.onCommand = [this](char const* command, int size, void* data)
        {
            commands.emplace_back(command);
            EXPECT_EQ(size, 0);
            STICKET_READ const& request = *STICKET_READ::Of(static_cast<STICKET_ACCESS*>(data));
            callback = request.GetVoidParameter(-1, "pGUI2Notification", nullptr);
            user = request.GetVoidParameter(-1, "pUser", nullptr);
            if (answersId)
                STICKET_MODIFY::Of(static_cast<STICKET_ACCESS*>(data))
                    ->SetParameter("iGUINotificationID", 815, -1);
            return commandResult;
        };
    }

    CALL Switch(int type, int id, int notification, bool enable) const
    {
        CALL call{SLOT::SWITCH, type, id};
        call.notification = notification;
        call.enable = enable;
        if (enable)
            call.keys = {"Job/*"};
        return call;
    }

    TicketFake ticket;
    TLogin login = {};
    bool answersId = true;
    int commandResult = 0;
    std::vector<std::string> commands;
    void* callback = nullptr;
    void* user = nullptr;
};

using CallbackDeathTest = Callback;
}  // namespace

TEST_F(Callback, OfTheImplicitSession_IsRegisteredWithATransientTicket)
{
    EXPECT_EQ(manager.SetCallback(this), 0);
    EXPECT_THAT(commands, ElementsAre("local.set.callback"));
    EXPECT_EQ(callback, reinterpret_cast<void*>(&ComGUIManager::fGUI2NOTIFICATION));
    EXPECT_EQ(user, this);
    EXPECT_THAT(module.paths, ElementsAre("(null)"));
    EXPECT_EQ(module.destroyed, 1);
    EXPECT_THAT(module.calls, ElementsAre("SendCommandEntry"));
}

TEST_F(Callback, OfTheImplicitSession_LeavesTheIdOfItsRecordAt0_ByDesign)
{
    manager.SetCallback(this);
    EXPECT_EQ(manager.EnableNotifications(nullptr, 3, keys), 0);
    EXPECT_THAT(fake.calls, ElementsAre(Switch(3, -3, 0, true)));
}

TEST_F(Callback, OfARecord_KeepsTheIdThere)
{
    login.hSession = &login;
    login.iGUINotificationID = -1;
    EXPECT_EQ(manager.SetCallback(&login, this), 0);
    EXPECT_EQ(login.iGUINotificationID, 815);
    EXPECT_EQ(module.session, &login);
    EXPECT_EQ(user, this);
    EXPECT_EQ(module.destroyed, 1);
}

TEST_F(Callback, OfARecordWithAnId_SwitchesOffWhatThatHeardFirst)
{
    login.iGUINotificationID = 5;
    manager.SetCallback(&login, this);
    EXPECT_THAT(fake.calls, ElementsAre(Switch(-3, -3, 5, false)));
    EXPECT_THAT(module.calls, ElementsAre("GetClientContainerEntry", "SendCommandEntry"));
}

TEST_F(Callback, OfARecordWithoutAnId_SkipsThatAndRegisters)
{
    login.iGUINotificationID = -1;
    EXPECT_EQ(manager.SetCallback(&login, this), 0);
    EXPECT_THAT(fake.calls, IsEmpty());
    EXPECT_THAT(commands, ElementsAre("local.set.callback"));
}

TEST_F(Callback, OfARecord_WithoutATicket_GivesMinus1)
{
    module.ticket = nullptr;
    login.iGUINotificationID = 5;
    EXPECT_EQ(manager.SetCallback(&login, this), -1);
    EXPECT_THAT(commands, IsEmpty());
    EXPECT_THAT(fake.calls, ElementsAre(Switch(-3, -3, 5, false)));  // before the ticket is asked for
}

TEST_F(CallbackDeathTest, OfTheImplicitSession_WithoutATicket_GoesThroughNull_ByDesign)
{
    module.ticket = nullptr;
    EXPECT_DEATH(manager.SetCallback(this), "");
}

TEST_F(Callback, Refused_GivesThePlugInsCodeAndKeepsTheId)
{
    commandResult = 44;
    login.iGUINotificationID = 5;
    EXPECT_EQ(manager.SetCallback(&login, this), 44);
    EXPECT_EQ(login.iGUINotificationID, 5);
    EXPECT_EQ(module.destroyed, 1);
    EXPECT_EQ(manager.SetCallback(this), 44);
}

TEST_F(Callback, AnsweredWithoutAnId_SetsMinus1)
{
    answersId = false;
    login.iGUINotificationID = 5;
    EXPECT_EQ(manager.SetCallback(&login, this), 0);
    EXPECT_EQ(login.iGUINotificationID, -1);
}

TEST_F(Callback, EnableNotifications_OfATypeOrATicket_SwitchesThemOn)
{
    login.iGUINotificationID = 5;
    login.hSession = &login;
    fake.success = 0;  // a failure of the slot does not show
    EXPECT_EQ(manager.EnableNotifications(&login, 3, keys), 0);
    EXPECT_EQ(manager.EnableNotifications(&login, 3, 7, keys), 0);
    EXPECT_EQ(manager.DisableNotifications(&login, 3), 0);
    EXPECT_THAT(fake.calls,
                ElementsAre(Switch(3, -3, 5, true), Switch(3, 7, 5, true), Switch(3, -3, 5, false)));
    EXPECT_EQ(module.session, &login);
}

TEST_F(Callback, EnableNotifications_WithoutARecord_TakesTheImplicitOne)
{
    module.onLogin = [this](TLogin& record)
    {
        record.hSession = this;
        record.iGUINotificationID = 9;
    };
    LogIn();
    fake.calls.clear();
    manager.EnableNotifications(nullptr, 3, 7, keys);
    manager.DisableNotifications(nullptr, 3);
    EXPECT_EQ(module.session, this);
    EXPECT_THAT(fake.calls, ElementsAre(Switch(3, 7, 9, true), Switch(3, -3, 9, false)));
}

TEST_F(Callback, EnableNotifications_WithAnIdOfMinus1_DoesNothingAndGives0)
{
    login.iGUINotificationID = -1;
    EXPECT_EQ(manager.EnableNotifications(&login, 3, keys), 0);
    EXPECT_EQ(manager.EnableNotifications(&login, 3, 7, keys), 0);
    EXPECT_EQ(manager.DisableNotifications(&login, 3), 0);
    EXPECT_THAT(fake.calls, IsEmpty());
}

TEST_F(Callback, EnableNotifications_WithoutAContainer_DoesNothingAndGives0)
{
    module.container = nullptr;
    login.iGUINotificationID = 5;
    EXPECT_EQ(manager.EnableNotifications(&login, 3, keys), 0);
    EXPECT_EQ(manager.DisableNotifications(&login, 3), 0);
    EXPECT_THAT(fake.calls, IsEmpty());
}
