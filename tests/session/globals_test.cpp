#include "comgui/session/ComGUIGlobals.h"

#include "tests/session/FakeModule.h"
#include <gtest/gtest.h>
#include <string>

using GlobalsOfASession = WithManager;

TEST(Globals, WithoutAManager_AreNullButTheName)
{
    EXPECT_EQ(hSTicketInstance, nullptr);
    EXPECT_EQ(hMTicketInstance, nullptr);
    EXPECT_EQ(tLogin, nullptr);
    EXPECT_EQ(pTicketContainer, nullptr);
    EXPECT_EQ(std::wstring(pszFuncName), L"ComGetInterface");
}

TEST_F(GlobalsOfASession, ButTheFactory_StayAsTheyAre)
{
    manager.Initialize("u", "p", "h", 1);
    LogIn();
    EXPECT_EQ(hSTicketInstance, &module.factory);
    EXPECT_EQ(hMTicketInstance, nullptr);
    EXPECT_EQ(tLogin, nullptr);
    EXPECT_EQ(pTicketContainer, nullptr);
    EXPECT_EQ(std::wstring(pszFuncName), L"ComGetInterface");
}
