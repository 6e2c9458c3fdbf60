// What two sessions of one process see of each other's work, through the library and the real bundle.
#include "tests/integration/Host.h"

#include <chrono>
#include <fstream>
#include <future>
#include <string>

namespace
{
class TwoSessions : public Host
{
protected:
    TwoSessions() : second(Record())
    {
        EXPECT_EQ(LogIn(), 0);
        EXPECT_EQ(Manager().InitializeBackward(&second, 1), 0);
        EXPECT_EQ(Manager().LoginBackward(&second), 0);
        container = Manager().GetBackwardContainer();
    }

    TLogin second;
    MTICKET_ACCESS const* container = nullptr;
};

class OneSession : public Host
{
};

// A record of the host's own, with which each step is called for by itself.
class ExplicitSession : public Host
{
protected:
    ExplicitSession() { Manager().Logout(); }  // whatever a test before in this process has left

    // The manager lets go of its first record unfreed.
    ~ExplicitSession() override { std::free(first); }

    // The manager's first field, which no operation shows.
    TLogin* const first = *reinterpret_cast<TLogin**>(&Manager());
};
}  // namespace

TEST_F(TwoSessions, HaveHandlesContainersAndEndPointsOfTheirOwn)
{
    ASSERT_NE(container, nullptr);
    EXPECT_NE(container, Manager().GetClientContainer());
    EXPECT_NE(wxString::FromUTF8(second.szLocalEndPoint), Manager().GetLocalEndPoint());
}

TEST_F(OneSession, ManagerOfItsOwn_SendsAJobOnAnotherThread)
{
    ASSERT_EQ(LogIn(), 0);
    static ComGUIManager& sender =
        *new ComGUIManager;  // to the end of the process: none gives its plug-in back
    sender.Initialize("operator", "operator", "localhost", 50000);
    ASSERT_EQ(sender.Login("operator", "operator", "localhost", 50000), 0);
    EXPECT_NE(sender.GetLocalEndPoint(), Manager().GetLocalEndPoint());

    auto const file = folder.Path() / "large.pdf";
    for (int i = 0; i < 20; ++i)
        std::ofstream(file, std::ios::app) << std::string(1'000'000, 'x');
    auto sending = std::async(std::launch::async,
                              [&]
                              {
                                  int const job = sender.PrepareJob(file.string(), 0, 0, -1, 0, 0);
                                  return sender.UploadJob(file.string(), 0, 0, 0, 0) != 0 ? job : -1;
                              });
    do
        EXPECT_EQ(WriteInt("Test/Number", 815), 1);
    while (sending.wait_for(std::chrono::seconds(0)) != std::future_status::ready);
    int const job = sending.get();
    int state = -1;
    EXPECT_EQ(Manager().GetParameter(3, job, "Job/State", PARAM_INT, &state, -1), 1);
    EXPECT_EQ(state, 1);
    sender.Logout();
}

TEST_F(TwoSessions, OneReadsWhatTheOtherWrote)
{
    ASSERT_EQ(WriteInt("Test/Number", 815), 1);
    int value = 0;
    EXPECT_EQ(Manager().GetParameter(container, 3, 1, "Test/Number", PARAM_INT, &value, -1), 1);
    EXPECT_EQ(value, 815);
}

TEST_F(TwoSessions, TextThatOneReadStaysWhileTheOtherReplacesIt)
{
    Manager().SetParameter(3, 1, "Test/Text", PARAM_STRING, "before", -1);
    char const* text = nullptr;
    ASSERT_EQ(Manager().GetParameter(container, 3, 1, "Test/Text", PARAM_STRING, &text, -1), 1);
    for (int i = 0; i < 100; ++i)
        Manager().SetParameter(3, 1, "Test/Text", PARAM_STRING, std::to_string(i).c_str(), -1);
    EXPECT_STREQ(text, "before");
}

TEST_F(TwoSessions, OneGoesOnAfterTheOtherLoggedOut)
{
    ASSERT_EQ(Manager().LogoutBackward(&second), 0);
    EXPECT_EQ(WriteInt("Test/Number", 1), 1);
}

TEST_F(TwoSessions, ContainerOfAnEndedSession_AnswersNothing)
{
    ASSERT_EQ(Manager().LogoutBackward(&second), 0);
    int value = 5;
    EXPECT_EQ(Manager().GetParameter(container, 0, 0, "System/MasterSOAPPort", PARAM_INT, &value, -1), 0);
    EXPECT_EQ(Manager().SetParameter(container, 3, 1, "Test/Number", PARAM_INT, &value, -1), 0);
    EXPECT_EQ(value, 5);
}

TEST_F(TwoSessions, OnlyTheAdministratorWritesToTheSystemTicket)
{
    EXPECT_EQ(Manager().SetParameter(0, 0, "System/Test", PARAM_STRING, "x", -1), 1);
    EXPECT_EQ(Manager().SetParameter(container, 0, 0, "System/Test", PARAM_STRING, "y", -1), 0);
}

TEST_F(OneSession, WrongPasswordAndUnknownUser_AreRefusedAlike)
{
    int const wrong = LogIn("admin", "wrong");
    EXPECT_NE(wrong, 0);
    EXPECT_EQ(LogIn("nobody", "admin"), wrong);
}

TEST_F(OneSession, Login_TellsRoleTicketAndEndPoint)
{
    ASSERT_EQ(LogIn("operator", "operator"), 0);
    EXPECT_FALSE(Manager().IsCurrentUserAdmin());
    EXPECT_EQ(Manager().GetCurrentlyLoggedUserTicketID(), 2);
    EXPECT_TRUE(Manager().GetLocalEndPoint().StartsWith("127.0.0.1:"));
    Manager().Logout();
    ASSERT_EQ(LogIn("admin", "admin"), 0);
    EXPECT_TRUE(Manager().IsCurrentUserAdmin());
    EXPECT_EQ(Manager().GetCurrentlyLoggedUserTicketID(), 1);
}

TEST_F(OneSession, ServerAtAnotherPortOrHost_IsNotAlive)
{
    TLogin login = Record();
    EXPECT_EQ(Manager().IsAlive(&login), 0);
    EXPECT_STREQ(login.szLocalAddress, "127.0.0.1");
    login.iServerPort = 50001;
    EXPECT_EQ(Manager().IsAlive(&login), -2005);
    login = Record();
    stracpy(login.szServerHost, "elsewhere.invalid", sizeof login.szServerHost);
    EXPECT_EQ(Manager().IsAlive(&login), -2005);
}

TEST_F(OneSession, DeletedJobTicket_IsGone)
{
    ASSERT_EQ(LogIn(), 0);
    ASSERT_EQ(Manager().DeleteTicketOfType(3, 1), 1);
    EXPECT_EQ(Manager().DeleteTicketOfType(3, 1), 0);
    EXPECT_EQ(WriteInt("Test/Number", 1), 0);
}

TEST_F(OneSession, GetTicketData_GivesTheTicketAsXml)
{
    ASSERT_EQ(LogIn(), 0);
    WriteInt("Test/Number", 815);
    int size = 0;
    Manager().GetTicketData(3, 1, 0, &size, nullptr);
    ASSERT_GT(size, 0);
    std::string xml(static_cast<std::size_t>(size), '\0');
    EXPECT_EQ(Manager().GetTicketData(3, 1, 0, &size, xml.data()), 0);
    EXPECT_NE(xml.find("Test/Number"), std::string::npos);
    EXPECT_NE(xml.find("815"), std::string::npos);
}

TEST_F(ExplicitSession, IsPreparedLoggedInAndOut)
{
    TLogin* const login = NewRecord();
    ASSERT_EQ(Manager().IsAlive(login), 0);
    ASSERT_EQ(Manager().Initialize(login, 1), 0);
    EXPECT_NE(login->iLocalPort, 0u);
    ASSERT_EQ(Manager().Login(login), 0);  // from here on the manager's
    EXPECT_NE(login->hSession, nullptr);
    EXPECT_EQ(Manager().GetCurrentlyLoggedUser(), "operator");
    EXPECT_EQ(Manager().GetCurrentlyLoggedUserTicketID(), 2);

    MTICKET_ACCESS const* const container = Manager().GetHandleToClientContainer(login);
    ASSERT_NE(container, nullptr);
    int value = 815;
    EXPECT_EQ(Manager().SetParameter(container, 3, 1, "Test/Number", PARAM_INT, &value, -1), 1);
    value = 0;
    EXPECT_EQ(Manager().GetParameter(container, 3, 1, "Test/Number", PARAM_INT, &value, -1), 1);
    EXPECT_EQ(value, 815);

    EXPECT_EQ(Manager().Logout(login), 0);
    EXPECT_EQ(Manager().GetParameter(container, 3, 1, "Test/Number", PARAM_INT, &value, -1), -1);
}

TEST_F(ExplicitSession, WithAWrongPassword_IsRefusedAndHasNoContainer)
{
    TLogin* const login = NewRecord("operator", "wrong");
    ASSERT_EQ(Manager().Initialize(login, 1), 0);
    EXPECT_NE(Manager().Login(login), 0);
    EXPECT_EQ(Manager().GetHandleToClientContainer(login), nullptr);
}
