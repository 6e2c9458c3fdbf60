// The snippets of docs/client-kit.md. What is between two marks is what the document shows.
#include "tests/client/Client.h"

#include "tests/support/Files.h"
#include <algorithm>
#include <atomic>
#include <chrono>
#include <fstream>
#include <gmock/gmock.h>
#include <thread>
#include <wx/app.h>
#include <wx/event.h>
#include <wx/init.h>

using comgui::test::TemporaryFolder;

using namespace comgui;
using namespace std::chrono_literals;
using testing::Contains;
using testing::ElementsAre;
using testing::StartsWith;

namespace
{
using Clock = std::chrono::steady_clock;

std::vector<std::string> shown;

void Show(std::string const& text) { shown.push_back(text); }

class SnippetsOfTheClientKit : public Client
{
protected:
    SnippetsOfTheClientKit()
    {
        shown.clear();
        LogIn();
    }

    // A job's ticket with some keys.
    TicketAddress Job() const
    {
        TicketAddress const job = NewTicket();
        (void)tickets.WriteAll(job, {{"Job/Copies", 12},
                                     {"Job/Priority", 0.5},
                                     {"Job/Separations", MakeList<std::string>({"Cyan", "Gold, matt"})},
                                     {"Job/File", "$(JOB)/7/page.pdf"}});
        return job;
    }
};

// The user corrects the password.
bool AskAgain(std::string const& why, Account& account)
{
    Show(why);
    account.password = "admin";
    return true;
}
}  // namespace

TEST(SnippetOfTheClientKit, LogIn_ShowsWhatWentWrong)
{
    TemporaryFolder const folder;
    setenv("COMGUI_SITE", (folder / "site").c_str(), 1);
    shown.clear();
    Account account{"admin", "wrong"};
    // [log-in]
    Connection connection;
    Tickets const tickets = connection.GetTickets();  // of whatever session there is when they are used
    Server const server{"localhost", 50000};
    Result<User> user = connection.LogIn(server, account);
    while (!user && AskAgain(user.GetError().Text(), account))  // "admin: wrong user or password"
        user = connection.LogIn(server, account);
    if (user)
        Show("Welcome, " + user->name);
    // [/log-in]
    EXPECT_THAT(shown, ElementsAre("admin: wrong user or password", "Welcome, admin"));
    EXPECT_TRUE(tickets.Exists({SystemTickets, 0}));
}

TEST_F(SnippetsOfTheClientKit, ListTickets)
{
    // [list-tickets]
    for (int const type : tickets.Types().ValueOr({}))
        for (TicketAddress const ticket : tickets.List(type).ValueOr({}))
            Show(std::to_string(ticket.type) + "/" + std::to_string(ticket.id));
    // [/list-tickets]
    EXPECT_THAT(shown, Contains("0/0"));
    EXPECT_THAT(shown, Contains("17/1"));
}

TEST_F(SnippetsOfTheClientKit, ReadAValue)
{
    TicketAddress const job = Job();
    // [read]
    // With a default:
    int const copies = tickets.ReadAs<int>(job, "Job/Copies").ValueOr(1);

    // With the reason if there is none. A single value is a list of one here:
    auto const inks = tickets.ReadAs<std::vector<std::string>>(job, "Job/Separations");
    Show(inks ? std::to_string(inks->size()) + " inks" : inks.GetError().Text());

    // Whatever its type is:
    if (auto const value = tickets.Read(job, "Job/Priority"))
        Show(std::string(NameOf(value->Type())) + ": " + ToText(*value));
    // [/read]
    EXPECT_EQ(copies, 12);
    EXPECT_THAT(shown, ElementsAre("2 inks", "double: 0.5"));
}

TEST_F(SnippetsOfTheClientKit, WriteWhatAUserHasTyped)
{
    TicketAddress const job = Job();
    std::string const typed = "a dozen";
    // [write-text]
    Outcome const written = tickets.WriteText(job, "Job/Copies", typed);
    if (!written)
        Show(written.GetError().Text());  // "3/1 Job/Copies: this is not a number"
    // [/write-text]
    EXPECT_THAT(shown, ElementsAre(testing::EndsWith("Job/Copies: this is not a number")));
    EXPECT_EQ(*tickets.ReadAs<int>(job, "Job/Copies"), 12);
    EXPECT_TRUE(tickets.WriteText(job, "Job/Separations", "Cyan, \"Gold, shiny\", White"));
    EXPECT_EQ(tickets.ReadAs<std::vector<std::string>>(job, "Job/Separations")->at(1), "Gold, shiny");
}

TEST_F(SnippetsOfTheClientKit, WriteManyKeys)
{
    TicketAddress const job = Job();
    // [write-many]
    std::vector<KeyValue> const values{
        {"Job/Copies", 25},
        {"Job/Name", "Poster"},
        {"Job/Separations", MakeList<std::string>({"Cyan", "Gold, matt"})},
        {"Job/Priority", Value()},  // deletes the key
    };
    std::vector<Outcome> const outcomes = tickets.WriteAll(job, values);
    for (std::size_t i = 0; i < values.size(); ++i)
        if (!outcomes[i])
            Show(values[i].key + ": " + outcomes[i].GetError().Text());
    // [/write-many]
    EXPECT_THAT(shown, ElementsAre());
    EXPECT_EQ(*tickets.ReadAs<int>(job, "Job/Copies"), 25);
    EXPECT_EQ(CodeOf(tickets.Read(job, "Job/Priority")), NoSuchKey);
}

TEST_F(SnippetsOfTheClientKit, ShowPaths)
{
    TicketAddress const job = Job();
    // [paths]
    auto const path = tickets.ReadAs<std::string>(job, "Job/File");                // "/srv/job/7/page.pdf"
    auto const stored = tickets.Read(job, "Job/File", WholeKey, Paths::AsStored);  // "$(JOB)/7/page.pdf"
    auto const written =
        tickets.Write(job, "Job/File", path.ValueOr("") + ".old");  // "$(JOB)/7/page.pdf.old"
    // What an event brings is as stored:
    std::string const visible = tickets.Resolved("$(JOB)/7/page.pdf");
    // [/paths]
    EXPECT_EQ(*path, (site.Folder() / "job/7/page.pdf").string());
    EXPECT_EQ(ToText(*stored), "$(JOB)/7/page.pdf");
    EXPECT_EQ(ToText(*tickets.Read(job, "Job/File", WholeKey, Paths::AsStored)), "$(JOB)/7/page.pdf.old");
    EXPECT_TRUE(written);
    EXPECT_EQ(visible, *path);
}

TEST_F(SnippetsOfTheClientKit, Snapshot_AndWhatHasChanged)
{
    TicketAddress const job = Job();
    auto const somethingHappens = [this, job] { (void)tickets.Write(job, "Job/Copies", 13); };
    // [snapshot]
    Snapshot const before = tickets.ReadAll(job).ValueOr({});
    somethingHappens();
    Snapshot const after = tickets.ReadAll(job).ValueOr({});
    for (auto const& [key, was, is] : Difference(before, after))
        Show(key + ": " + (was ? ToText(*was) : "new") + " -> " + (is ? ToText(*is) : "gone"));
    // [/snapshot]
    EXPECT_THAT(shown, ElementsAre("Job/Copies: 12 -> 13"));
}

namespace
{
// [hear-in-a-window]
class JobPanel : public wxEvtHandler  // in a program: wxPanel or wxFrame
{
public:
    explicit JobPanel(Connection& connection)
        : m_changes(connection.Subscribe(Interest::InTypes({JobTickets}, {"Job/State", "Job/Copies"}),
                                         OnThreadOf(*this), [this](Event const& event) { Take(event); }))
    {
    }

private:
    void Take(Event const& event)  // on the window's thread
    {
        if (auto const* const changed = std::get_if<TicketChanged>(&event))
            for (auto const& [key, value] : changed->keys)
                Show(key + " is now " + (value ? ToText(*value) : "to be read"));
    }

    Subscription m_changes;  // the last member: no handler runs once the others are destroyed
};
// [/hear-in-a-window]

void WaitFor(std::size_t count, std::function<void()> const& run)
{
    for (auto const end = Clock::now() + 20s; shown.size() < count && Clock::now() < end;)
        run();
}
}  // namespace

TEST_F(SnippetsOfTheClientKit, HearOfChanges_InAWindow)
{
    wxInitializer const wxWidgets;
    TicketAddress const job = Job();
    JobPanel const panel(connection);
    ASSERT_TRUE(tickets.Write(job, "Job/Copies", 13));
    WaitFor(1,
            []
            {
                wxTheApp->ProcessPendingEvents();  // a handler's own is only for one that has some
                std::this_thread::sleep_for(1ms);
            });
    EXPECT_THAT(shown, ElementsAre("Job/Copies is now 13"));
}

TEST_F(SnippetsOfTheClientKit, HearOfChanges_WithoutAWindow)
{
    TicketAddress const job = Job();
    std::atomic<bool> isHeard = false;
    std::thread other(
        [&]
        {
            for (int state = 1; !isHeard; ++state)
                ASSERT_TRUE(tickets.Write(job, "Job/State", state));
        });
    // [hear-without-a-window]
    TaskQueue queue;
    auto const subscription =
        connection.Subscribe(Interest::InTickets({job}, {"Job/State"}), queue.GetExecutor(),
                             [&queue](Event const& event)  // on the thread that runs the queue
                             {
                                 auto const* const changed = std::get_if<TicketChanged>(&event);
                                 if (!changed || changed->keys.empty())
                                     return;
                                 Show("Job/State is " + ToText(changed->keys[0].value.value_or("unknown")));
                                 queue.Stop();
                             });
    queue.RunFor(20s);  // Run() would wait without an end
    // [/hear-without-a-window]
    isHeard = true;
    other.join();
    EXPECT_THAT(shown, ElementsAre(StartsWith("Job/State is ")));
}

TEST_F(SnippetsOfTheClientKit, FollowATicket)
{
    TicketAddress const job = Job();
    TaskQueue queue;
    // [follow]
    Worker const worker(queue.GetExecutor());  // in a window: OnThreadOf(*this)
    LiveTicket const live(connection, worker, job,
                          [](TicketUpdate const& update)  // on the thread that runs the queue
                          {
                              if (!update.outcome)
                                  Show(update.outcome.GetError().Text());  // "3/7: there is no such ticket"
                              for (auto const& [key, was, is] : update.differences)
                                  Show(key + ": " + (is ? ToText(*is) : "gone"));
                          });
    // [/follow]
    auto const await = [&queue](std::string const& text)
    {
        for (auto const end = Clock::now() + 20s;
             std::find(shown.begin(), shown.end(), text) == shown.end() && Clock::now() < end;)
            queue.RunFor(5ms);
        return shown.back() == text;
    };
    ASSERT_TRUE(await("Job/Separations: Cyan, \"Gold, matt\""));
    EXPECT_EQ(shown.size(), 4u);
    ASSERT_TRUE(tickets.Write(job, "Job/Copies", 13));
    EXPECT_TRUE(await("Job/Copies: 13"));
    ASSERT_TRUE(tickets.Write(job, "Job/Copies", Value()));
    EXPECT_TRUE(await("Job/Copies: gone"));
}

TEST_F(SnippetsOfTheClientKit, SendAJob)
{
    std::string const file = folder.Write("page.pdf", std::string(1 << 20, 'x')).string();
    bool const isStopWanted = false;
    // [send-a-job]
    JobOptions options;
    options.name = "poster.pdf";
    options.copies = 25;
    Transfer job = connection.GetTransfers().SendJob(file, options);
    while (!job.WaitFor(100ms))
    {
        TransferProgress const progress = job.Progress();
        Show(std::to_string(progress.done) + " of " + std::to_string(progress.total.value_or(0)) + " bytes");
        if (isStopWanted)
            job.Cancel();
    }
    Outcome const outcome = job.Wait();
    if (!outcome)
        Show(outcome.GetError().Text());
    else if (auto const id = job.Job())
        Show("It is job " + std::to_string(*id));
    // [/send-a-job]
    EXPECT_THAT(shown.back(), StartsWith("It is job "));
    EXPECT_EQ(*tickets.ReadAs<int>({JobTickets, *job.Job()}, "Job/Copies"), 25);
}
