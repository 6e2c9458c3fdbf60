#include "comgui/session/ComGUIGlobals.h"

#include <gtest/gtest.h>
#include <string>

TEST(Globals, WithoutAManager_AreNullButTheName)
{
    EXPECT_EQ(hSTicketInstance, nullptr);
    EXPECT_EQ(hMTicketInstance, nullptr);
    EXPECT_EQ(tLogin, nullptr);
    EXPECT_EQ(pTicketContainer, nullptr);
    EXPECT_EQ(std::wstring(pszFuncName), L"ComGetInterface");
}
