// The snippets of docs/writing-a-module.md. What is between two marks is what the document shows.
#include "comgui/module.h"
#include <chrono>
#include <future>
#include <gtest/gtest.h>

namespace
{
using namespace comgui::plugin;
using namespace std::chrono_literals;

// The server of the snippets.
class Printer
{
public:
    explicit Printer(Notifications& notifications) : m_notifications(notifications) {}

    bool Answers() const { return true; }
    bool Knows(std::string_view user, std::string_view password) const
    {
        return user == "ada" && password == "right";
    }
    int Copies() const { return m_copies; }
    // [changes]
    void SetCopies(int copies)
    {
        m_copies = copies;
        m_notifications.Changed(SystemTicket, {{"Printer/Copies", copies, -1}});
    }
    // [/changes]
    bool IsLocked() const { return m_copies > 99; }
    void Print(std::string_view file) { m_printed = file; }
    std::string const& Printed() const { return m_printed; }

private:
    Notifications& m_notifications;
    int m_copies = 1;
    std::string m_printed;
};

// [container]
class PrinterTickets : public Container
{
public:
    PrinterTickets(Session& session, Printer& printer) : Container(session), m_printer(printer) {}

    bool Exists(Address ticket) override { return ticket == SystemTicket; }

    Value Read(Address, std::string_view key, int pos) override
    {
        if (key == "Printer/Copies" && pos == 0)
            return m_printer.Copies();
        return {};  // no value
    }

    bool Write(Address, std::string_view key, Value const& value, int pos) override
    {
        int const* const copies = std::get_if<int>(&value);
        if (key != "Printer/Copies" || !copies || pos > 0)
            return false;
        m_printer.SetCopies(*copies);
        return true;
    }

    std::vector<Parameter> All(Address, std::string_view prefix) override
    {
        std::vector<Parameter> all;
        if (std::string_view("Printer/Copies").substr(0, prefix.size()) == prefix)
            all.push_back({"Printer/Copies", m_printer.Copies()});
        return all;
    }

private:
    Printer& m_printer;
};
// [/container]

// [session]
class PrinterSession : public Session
{
public:
    explicit PrinterSession(Printer& printer) : m_printer(printer), m_tickets(*this, printer) {}

    ContainerSlots* GetContainer() override { return &m_tickets; }

    int SendJob(TJobIdentification const&, std::string_view path, std::string_view) override
    {
        if (m_printer.IsLocked())
            throw Refused(7);  // the client gets this code
        m_printer.Print(path);
        return Done;
    }

private:
    Printer& m_printer;
    PrinterTickets m_tickets;
};
// [/session]

// [module]
class PrinterModule : public Module
{
public:
    int IsAlive(std::string_view, int) override { return m_printer.Answers() ? 0 : 1; }

    LoggedIn LogIn(Credentials const& credentials) override
    {
        if (!m_printer.Knows(credentials.user, credentials.password))
            return {};  // refused
        return {std::make_unique<PrinterSession>(m_printer)};
    }

private:
    Printer m_printer{GetNotifications()};  // where it tells of changes
};
// [/module]

class SnippetsOfThePlugInKit : public testing::Test
{
protected:
    SnippetsOfThePlugInKit()
    {
        EXPECT_EQ(table.Open(&hInstance), 0);
        login.nSize = sizeof login;
        std::string("ada").copy(login.szUser, 3);
        std::string("right").copy(login.szPassword, 5);
        EXPECT_EQ(table.LoginEntry(hInstance, &login), 0);
        container = table.GetClientContainerEntry(hInstance, login.hSession);
    }
    ~SnippetsOfThePlugInKit() override { EXPECT_EQ(table.LogoutEntry(hInstance, login.hSession), 0); }

    int Copies() const
    {
        int copies = 0;
        EXPECT_EQ(
            container->MGETPARAMETER(container->Instance, 0, 0, "Printer/Copies", PARAM_INT, &copies, -1), 1);
        return copies;
    }
    int SetCopies(int copies) const
    {
        return container->MSETPARAMETER(container->Instance, 0, 0, "Printer/Copies", PARAM_INT, &copies, -1);
    }
    int SendJob() const
    {
        TJobIdentification job{};
        job.nSize = sizeof job;
        char folder[] = "$(JOB)";
        job.pszUploadFolder = folder;
        char path[] = "/tmp/page.pdf";
        char name[] = "page";
        return table.SendJobEntry(hInstance, login.hSession, &job, path, name);
    }

    ComGUIModuleInterface& table = PlugIn<PrinterModule>::Table();
    void* hInstance = nullptr;
    TLogin login{};
    MTICKET_ACCESS const* container = nullptr;
};
}  // namespace

TEST_F(SnippetsOfThePlugInKit, Values_AreThoseOfTheServer)
{
    EXPECT_EQ(SetCopies(25), 1);
    EXPECT_EQ(Copies(), 25);
    int number = 0;
    EXPECT_EQ(
        container->MGETPARAMETER(container->Instance, 0, 0, "Printer/Copies", PARAM_DOUBLE, &number, -1), 0);
    EXPECT_EQ(container->MGETPARAMETER(container->Instance, 0, 1, "Printer/Copies", PARAM_INT, &number, -1),
              0);
}

TEST_F(SnippetsOfThePlugInKit, Jobs_ArePrintedOrRefusedWithTheAuthorsCode)
{
    EXPECT_EQ(SetCopies(1), 1);
    EXPECT_EQ(SendJob(), 0);
    EXPECT_EQ(SetCopies(100), 1);
    EXPECT_EQ(SendJob(), 7);
}

TEST_F(SnippetsOfThePlugInKit, WrongPassword_IsRefused)
{
    TLogin other{};
    other.nSize = sizeof other;
    EXPECT_EQ(table.LoginEntry(hInstance, &other), LoginRefused);
}

TEST_F(SnippetsOfThePlugInKit, Changes_AreTold)
{
    static std::promise<std::string> heard;
    auto const hear = [](void*, int, int, int, int, void* data)
    { heard.set_value(static_cast<SETMULTIPAR const*>(data)->key); };
    Notifications& service = PlugIn<PrinterModule>::GetModule().GetNotifications();
    static Session const listener;
    int const id = service.NewId();
    ASSERT_TRUE(service.Register(listener, id, Callback(hear, nullptr)));
    ASSERT_TRUE(service.Enable(listener, id, SystemTicket, {}));
    EXPECT_EQ(SetCopies(3), 1);
    auto key = heard.get_future();
    EXPECT_EQ(key.wait_for(20s), std::future_status::ready);
    service.Remove(listener);
    EXPECT_EQ(key.get(), "Printer/Copies");
}

TEST(SnippetOfThePlugInKit, Parameters_KeepTheRulesOfPositions)
{
    // [parameters]
    Parameters job;
    job.Write("Job/Inks", std::string("Cyan"), -1);    // the key as a whole
    job.Write("Job/Inks", std::string("Gold"), -2);    // behind the last
    job.Write("Job/Inks", std::string("Magenta"), 0);  // in place of the first
    job.Write("Job/Inks", {}, 1);                      // deletes the second
    // [/parameters]
    EXPECT_EQ(job.Count("Job/Inks"), 1);
    EXPECT_EQ(job.Read("Job/Inks", 0), Value(std::string("Magenta")));
}
