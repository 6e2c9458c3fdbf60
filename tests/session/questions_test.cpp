// Questions answered from local state.
#include "comgui/session/ComGUIManager.h"

#include "comgui/foundation/stracpy.h"
#include "tests/session/FakeModule.h"
#include <clocale>
#include <filesystem>
#include <fstream>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <wx/utils.h>

namespace
{
class Questions : public WithManager
{
protected:
    ~Questions() override { EXPECT_THAT(module.calls, testing::IsEmpty()); }  // none asks the plug-in

    static void Put(char (&field)[128], std::string const& text)
    {
        stracpy(field, text.c_str(), sizeof field);
    }

    TLogin record = {};
};

struct ROLE_FACT
{
    int role;
    bool admin;
};

class Role : public Questions, public testing::WithParamInterface<ROLE_FACT>
{
};

struct HOST_FACT
{
    char const* name;
    std::string host;
    char const* address;
    bool local;          // asked of the manager's record
    bool localByRecord;  // asked of a given one
};

class ServerHost : public Questions, public testing::WithParamInterface<HOST_FACT>
{
protected:
    ServerHost() { EXPECT_TRUE(std::setlocale(LC_CTYPE, "C.UTF-8")); }  // for the letter case of umlauts
    ~ServerHost() override { std::setlocale(LC_CTYPE, "C"); }

    static void Fill(TLogin& login)
    {
        Put(login.szServerHost, GetParam().host);
        Put(login.szLocalAddress, GetParam().address);
    }

    static void FillForTheOpposite(TLogin& login, bool local)
    {
        Put(login.szServerHost, local ? "elsewhere.invalid" : "localhost");
        Put(login.szLocalAddress, "10.0.0.1");
    }
};

std::string HostName() { return wxGetHostName().utf8_string(); }
}  // namespace

TEST_F(Questions, GetServerName_IsEmpty) { EXPECT_EQ(manager.GetServerName(), ""); }

TEST_F(Questions, GetServerNameOfARecord_IsMinus9999ForAnyArgument_ByDesign)
{
    EXPECT_EQ(manager.GetServerName(&record), -9999);
    EXPECT_EQ(manager.GetServerName(nullptr), -9999);
}

TEST_F(Questions, GetEndian_IsAlwaysIIII) { EXPECT_EQ(manager.GetEndian(), 0x49494949); }

TEST_F(Questions, GetLocalEndPoint_IsReadAsUtf8)
{
    Put(own->szLocalEndPoint, "B\xC3\xBCro:50006");
    EXPECT_EQ(manager.GetLocalEndPoint(), wxString::FromUTF8("B\xC3\xBCro:50006"));
}

TEST_F(Questions, GetCurrentlyLoggedUser_IsReadAsUtf8FromEitherRecord)
{
    Put(own->szUser, "J\xC3\xB6rg");
    Put(record.szUser, "Zo\xC3\xAB");
    EXPECT_EQ(manager.GetCurrentlyLoggedUser(), wxString::FromUTF8("J\xC3\xB6rg"));
    EXPECT_EQ(manager.GetCurrentlyLoggedUser(&record), wxString::FromUTF8("Zo\xC3\xAB"));
}

TEST_F(Questions, GetCurrentlyLoggedUserTicketID_IsTheClientStamp)
{
    own->iClientStamp = 815;
    EXPECT_EQ(manager.GetCurrentlyLoggedUserTicketID(), 815);
}

TEST_F(Questions, GetUserLockInfo_JoinsAddressAndPortOfEitherRecord)
{
    Put(own->szLocalAddress, "10.0.0.1");
    own->iLocalPort = 50006;
    Put(record.szLocalAddress, "10.0.0.2");
    record.iLocalPort = 4294967295u;
    EXPECT_EQ(manager.GetUserLockInfo(), "http://10.0.0.1:50006");
    EXPECT_EQ(manager.GetUserLockInfo(&record), "http://10.0.0.2:4294967295");
}

TEST_F(Questions, IsTernServerLocal_LooksForTheServersFileInTheCurrentFolder)
{
    std::filesystem::path const before = std::filesystem::current_path();
    std::filesystem::current_path(folder.Path());
    EXPECT_FALSE(manager.IsTernServerLocal());
    std::filesystem::create_directory("ComGUISrv.Dll");
    EXPECT_FALSE(manager.IsTernServerLocal());
    std::filesystem::remove("ComGUISrv.Dll");
    std::ofstream("ComGUISrv.Dll").put('x');
    EXPECT_TRUE(manager.IsTernServerLocal());
    std::filesystem::current_path(before);
}

// Each form has the other record say the opposite.
TEST_P(Role, IsAdministrator)
{
    int const opposite = GetParam().admin ? 0 : 16;
    own->iUserRole = GetParam().role;
    record.iUserRole = opposite;
    EXPECT_EQ(manager.IsCurrentUserAdmin(), GetParam().admin);
    own->iUserRole = opposite;
    record.iUserRole = GetParam().role;
    EXPECT_EQ(manager.IsCurrentUserAdmin(&record), GetParam().admin);
}

INSTANTIATE_TEST_SUITE_P(OnlyForExactly16_ByDesign, Role,
                         testing::Values(ROLE_FACT{16, true}, ROLE_FACT{0, false}, ROLE_FACT{17, false},
                                         ROLE_FACT{48, false}, ROLE_FACT{-16, false}),
                         [](auto const& fact) { return "Case" + std::to_string(fact.index); });

TEST_P(ServerHost, IsLocal)
{
    Fill(*own);
    FillForTheOpposite(record, GetParam().local);
    EXPECT_EQ(manager.IsServerLocal(), GetParam().local);
    Fill(record);
    FillForTheOpposite(*own, GetParam().localByRecord);
    EXPECT_EQ(manager.IsServerLocal(&record), GetParam().localByRecord);
}

INSTANTIATE_TEST_SUITE_P(
    Facts, ServerHost,
    testing::Values(HOST_FACT{"LocalAddress", "10.0.0.1", "10.0.0.1", true, true},
                    HOST_FACT{"AnotherAddress", "10.0.0.2", "10.0.0.1", false, false},
                    HOST_FACT{"LocalAddressInOtherLetterCase_ByDesign", "FE80::A", "fe80::a", false, true},
                    HOST_FACT{"UmlautInOtherLetterCase_ByDesign", "B\xC3\x9CRO", "b\xC3\xBCro", false, true},
                    HOST_FACT{"BothEmpty", "", "", true, true},
                    HOST_FACT{"NoHost", "", "10.0.0.1", false, false},
                    HOST_FACT{"HostName", HostName(), "10.0.0.1", true, true},
                    HOST_FACT{"HostNameInCapitals", wxGetHostName().Upper().utf8_string(), "10.0.0.1", true,
                              true},
                    HOST_FACT{"HostNameAndMore", HostName() + "x", "10.0.0.1", false, false},
                    HOST_FACT{"Localhost", "localhost", "10.0.0.1", true, true},
                    HOST_FACT{"LocalhostInCapitals", "LOCALHOST", "10.0.0.1", true, true},
                    HOST_FACT{"Loopback", "127.0.0.1", "10.0.0.1", true, true},
                    HOST_FACT{"OtherLoopback_ByDesign", "127.0.0.2", "10.0.0.1", false, false},
                    HOST_FACT{"LoopbackWithAZero_ByDesign", "127.0.0.01", "10.0.0.1", false, false},
                    HOST_FACT{"IPv6Loopback_ByDesign", "::1", "10.0.0.1", false, false}),
    [](auto const& fact) { return std::string(fact.param.name); });

using QuestionsBeforeLogin = WithManager;

TEST_F(QuestionsBeforeLogin, GetCurrentlyLoggedUserTicketID_IsTheStampOfInitialize)
{
    manager.Initialize("u", "p", "h", 1);
    EXPECT_EQ(manager.GetCurrentlyLoggedUserTicketID(), 30312656);
}
