// What a host gets through the trace, beside what the plug-in itself gives.
#include "comgui/testing/TemporaryFolder.h"
#include "comgui/ticket/TICKET_OP.h"
#include "standin/trace/RealModule.h"
#include "standin/trace/TracedEntries.h"
#include "standin/trace/TracedTables.h"
#include <cstdlib>
#include <gtest/gtest.h>

using comgui::test::TemporaryFolder;

namespace
{
class ThroughTheTrace : public testing::Test
{
protected:
    ThroughTheTrace()
    {
        setenv("COMGUI_TRACE_BUNDLE", COMGUI_BUNDLE, 1);
        setenv("COMGUI_TRACE_FILE", (Folder().Path() / "x.trace").c_str(), 1);
        setenv("COMGUI_SITE", (Folder().Path() / "site").c_str(), 1);
        table = trace::RealModule::Get()->Table();
        trace::TraceEntries(table);
        EXPECT_EQ(table.Open(&hInstance), 0);
    }
    ~ThroughTheTrace() override
    {
        if (login.hSession)
            table.LogoutEntry(hInstance, login.hSession);
    }

    static TemporaryFolder const& Folder()  // to the end of the process, as the site is
    {
        static TemporaryFolder const folder;
        return folder;
    }

    MTICKET_ACCESS const* LogIn()
    {
        login.nSize = sizeof login;
        for (char* const field : {login.szUser, login.szPassword})
            std::string("admin").copy(field, 5);
        std::string("localhost").copy(login.szServerHost, 9);
        login.iServerPort = 50000;
        EXPECT_EQ(table.InitializeEntry(hInstance, &login, 0), 0);
        EXPECT_EQ(table.LoginEntry(hInstance, &login), 0);
        return table.GetClientContainerEntry(hInstance, login.hSession);
    }

    static void* PointerIn(STICKET_ACCESS const* ticket, char const* key)
    {
        void* pointer = nullptr;
        EXPECT_EQ(ticket->SGETPARAMETER(ticket->Instance, key, PARAM_POINTER, &pointer, -1), 1);
        return pointer;
    }

    ComGUIModuleInterface table{};
    void* hInstance = nullptr;
    TLogin login{};
};

void Hear(void*, int, int, int, int, void*) {}
}  // namespace

TEST_F(ThroughTheTrace, AnOpenedTicket_IsTracedItself)
{
    MTICKET_ACCESS const* const container = LogIn();
    STICKET_ACCESS const* opened = nullptr;
    ASSERT_EQ(container->MOPERATION(container->Instance, 0, 0, MTICKET_OP_OPEN, &opened), 1);
    EXPECT_NE(trace::RealOf(opened), opened);
    STICKET_ACCESS const* again = nullptr;
    ASSERT_EQ(container->MOPERATION(container->Instance, 0, 0, MTICKET_OP_OPEN, &again), 1);
    EXPECT_EQ(again, opened);
}

TEST_F(ThroughTheTrace, TheContainer_IsTheSameEachTime)
{
    MTICKET_ACCESS const* const container = LogIn();
    EXPECT_EQ(table.GetClientContainerEntry(hInstance, login.hSession), container);
    EXPECT_EQ(table.GetClientContainerEntry(hInstance, nullptr), nullptr);
}

TEST_F(ThroughTheTrace, ATicketInMemory_IsDestroyedAndThePointerCleared)
{
    STICKET_ACCESS const* ticket = table.STicketFactory->CreateTicket(nullptr);
    ASSERT_TRUE(ticket);
    EXPECT_NE(trace::RealOf(ticket), ticket);
    table.STicketFactory->DestroyTicket(&ticket);
    EXPECT_EQ(ticket, nullptr);
    table.STicketFactory->DestroyTicket(&ticket);
    table.STicketFactory->DestroyTicket(nullptr);
}

TEST_F(ThroughTheTrace, ARegistration_LeavesTheCommandsTicketAsTheHostFilledIt)
{
    LogIn();
    STICKET_ACCESS const* ticket = table.STicketFactory->CreateTicket(nullptr);
    auto* const function = reinterpret_cast<void*>(Hear);
    EXPECT_EQ(ticket->SSETPARAMETER(ticket->Instance, "pGUI2Notification", PARAM_POINTER, function, -1), 1);
    EXPECT_EQ(ticket->SSETPARAMETER(ticket->Instance, "pUser", PARAM_POINTER, this, -1), 1);
    EXPECT_EQ(table.SendCommandEntry(hInstance, login.hSession, "local.set.callback", 0,
                                     const_cast<STICKET_ACCESS*>(ticket)),
              0);
    EXPECT_EQ(PointerIn(ticket, "pGUI2Notification"), function);
    EXPECT_EQ(PointerIn(ticket, "pUser"), this);
    int id = -1;
    EXPECT_EQ(ticket->SGETPARAMETER(ticket->Instance, "iGUINotificationID", PARAM_INT, &id, -1), 1);
    EXPECT_GE(id, 0);
    table.STicketFactory->DestroyTicket(&ticket);
}

TEST_F(ThroughTheTrace, ATableThatIsNotItsOwn_IsLeftAsItIs)
{
    STICKET_ACCESS const foreign{};
    EXPECT_EQ(trace::RealOf(&foreign), &foreign);
    EXPECT_EQ(trace::RealOf(nullptr), nullptr);
}
