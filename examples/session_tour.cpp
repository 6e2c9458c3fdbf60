// A whole session with a server, step by step, told on the screen: finding the plug-in, testing the server,
// logging in, reading the system ticket, writing a job ticket that a second session reads, hearing of
// changes, creating and listing tickets, working on a ticket file, logging out. The exit status is 0 only if
// every step gave what it should.
#include "Shown.h"

#include <comgui/comgui.h>

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <future>
#include <iostream>
#include <mutex>
#include <sstream>
#include <string>
#include <unistd.h>
#include <vector>
#include <wx/init.h>

namespace
{
constexpr char Host[] = "localhost";
constexpr int Port = 50000;
constexpr int JobType = 3;
constexpr int JobId = 1;
constexpr int Stamp = 20260101;  // a host's own mark; the plug-in only carries it

std::string Text(wxString const& text) { return text.utf8_string(); }

char const* YesOrNo(bool value) { return value ? "yes" : "no"; }

template <typename Array, typename Convert>
std::string Joined(Array const& array, Convert convert)
{
    std::ostringstream text;
    for (auto const& element : array)
        text << (text.tellp() > 0 ? ", " : "") << convert(element);
    return text.str();
}

std::string Joined(wxArrayString const& array) { return Joined(array, Text); }

std::string Joined(wxArrayInt const& array)
{
    return Joined(array, [](int value) { return value; });
}

// Tells each step on the screen and keeps count of those that went wrong.
class Tour
{
public:
    void Chapter(char const* title) { std::cout << '\n' << title << '\n'; }

    // A step whose outcome is known beforehand.
    template <typename Value>
    void Expect(std::string const& step, Value const& got, Value const& expected)
    {
        Show(got == expected, step, got);
        if (got != expected)
            std::cout << "          expected: " << expected << '\n';
    }

    // A step that must be good, with what came back.
    template <typename Value>
    void Show(bool good, std::string const& step, Value const& got)
    {
        ++m_steps;
        m_failures += good ? 0 : 1;
        std::cout << (good ? "  ok      " : "  FAILED  ") << step << ": " << Harmless(got) << std::endl;
    }

    void ShowText(std::string const& step, std::string const& got) { Show(!got.empty(), step, got); }

    int ExitStatus() const { return m_failures == 0 ? 0 : 1; }

    void Farewell() const
    {
        if (m_failures == 0)
            std::cout << "\nAll " << m_steps << " steps gave what they should.\n";
        else
            std::cout << '\n' << m_failures << " of " << m_steps << " steps FAILED.\n";
    }

private:
    template <typename Value>
    static Value const& Harmless(Value const& value)
    {
        return value;
    }
    static std::string Harmless(std::string const& text) { return Shown(text); }

    int m_steps = 0;
    int m_failures = 0;
};

// The record of a session that the host keeps for itself.
TLogin Record(char const* user, char const* password, int port)
{
    TLogin login = {};
    login.nSize = sizeof login;
    stracpy(login.szUser, user, sizeof login.szUser);
    stracpy(login.szPassword, password, sizeof login.szPassword);
    stracpy(login.szServerHost, Host, sizeof login.szServerHost);
    login.iServerPort = port;
    return login;
}

// Null if there is none; then the way out is told.
ComGUIManager* FindPlugIn()
{
    ComGUIManager* const manager = ComGUIManager::GetInstance();
    if (hSTicketInstance)
        return manager;
    wxString path;
    UtilityObjects::GetPlugInsPath(path, L"" COMGUI_BUNDLE_NAME);
    std::cerr << "session_tour: cannot open the communication plug-in " << Text(path)
              << ": build or install " COMGUI_BUNDLE_NAME " there\n";
    return nullptr;
}

void TestServer(Tour& tour, ComGUIManager& manager)
{
    tour.Chapter("Is there a server?");
    TLogin here = Record("", "", Port);
    TLogin elsewhere = Record("", "", Port + 1);
    tour.Expect("IsAlive at localhost:50000", manager.IsAlive(&here), 0);
    tour.Expect("  our address, as the server sees it", std::string(here.szLocalAddress),
                std::string("127.0.0.1"));
    tour.ShowText("  GetUserLockInfo", Text(manager.GetUserLockInfo(&here)));
    tour.Expect("IsAlive at localhost:50001, where none listens", manager.IsAlive(&elsewhere), -2005);
    tour.Show(manager.IsServerLocal(&here), "IsServerLocal", YesOrNo(manager.IsServerLocal(&here)));
}

bool LogIn(Tour& tour, ComGUIManager& manager)
{
    tour.Chapter("Logging in");
    int const initialized = manager.Initialize("admin", "wrong", Host, Port);
    tour.Expect("Initialize takes a local port and prepares the session", initialized, 0);
    int const wrong = manager.Login("admin", "wrong", Host, Port);
    tour.Show(wrong != 0, "Login with a wrong password is refused, with the plug-in's code", wrong);
    int const unknown = manager.Login("nobody", "", Host, Port);
    tour.Show(unknown != 0, "Login of an unknown user is refused", unknown);
    int const result = manager.Login("admin", "admin", Host, Port);
    tour.Expect("Login as admin", result, 0);
    if (result != 0)
        return false;
    tour.Expect("  the user", Text(manager.GetCurrentlyLoggedUser()), std::string("admin"));
    tour.Show(manager.IsCurrentUserAdmin(), "  is an administrator", YesOrNo(manager.IsCurrentUserAdmin()));
    tour.ShowText("  our end point", Text(manager.GetLocalEndPoint()));
    return true;
}

void ReadSystemTicket(Tour& tour, ComGUIManager& manager)
{
    tour.Chapter("Reading the system ticket (type 0, id 0)");
    char const* name = nullptr;
    manager.GetSystemTicketParamForKey("System/Name", PARAM_STRING, &name, -1);
    tour.ShowText("System/Name is a text", name ? name : "");
    int port = 0;
    manager.GetSystemTicketParamForKey("System/MasterSOAPPort", PARAM_INT, &port, -1);
    tour.Expect("System/MasterSOAPPort is an int", port, Port);

    char languages[] = "System/Languages";
    wxArrayString const texts = manager.GetStringArray(0, 0, languages);
    tour.ShowText("System/Languages is a list of texts", Joined(texts));
    tour.Expect("  with so many values", manager.GetValueCount(manager.GetClientContainer(), 0, 0, languages),
                static_cast<int>(texts.size()));
    char resolutions[] = "System/Resolutions";
    tour.ShowText("System/Resolutions is a list of ints", Joined(manager.GetIntArray(0, 0, resolutions)));
    int missing = 7;
    tour.Expect("A missing key gives",
                manager.GetParameter(0, 0, "System/NoSuchKey", PARAM_INT, &missing, -1), 0);
    tour.Expect("  and leaves our variable", missing, 7);
}

// What the second session sees of the job ticket.
class SecondSession
{
public:
    SecondSession(ComGUIManager& manager) : m_manager(manager), m_login(Record("operator", "operator", Port))
    {
    }

    bool LogIn()
    {
        return m_manager.InitializeBackward(&m_login, Stamp) == 0 && m_manager.LoginBackward(&m_login) == 0 &&
               (m_container = m_manager.GetBackwardContainer()) != nullptr;
    }

    int LogOut() { return m_manager.LogoutBackward(&m_login); }

    int Uninitialize() { return m_manager.UninitializeAsync(&m_login); }

    // To be told of every change of a job ticket.
    int Subscribe()
    {
        char const* const everyKey[] = {nullptr};
        int const result = m_manager.SetCallback(&m_login, nullptr);
        return result != 0 ? result : m_manager.EnableNotifications(&m_login, JobType, everyKey);
    }

    void Unsubscribe() { m_manager.DisableNotifications(&m_login, JobType); }

    int Read(char const* key, PARAM_TYPE type, void* value) const
    {
        return m_manager.GetParameter(m_container, JobType, JobId, key, type, value, -1);
    }

    wxArrayInt Ints(char const* key) const
    {
        return m_manager.GetIntArray(m_container, JobType, JobId, wxString::FromUTF8(key));
    }

private:
    ComGUIManager& m_manager;
    TLogin m_login;
    MTICKET_ACCESS const* m_container = nullptr;
};

void ShareJobTicket(Tour& tour, ComGUIManager& manager, SecondSession& second)
{
    tour.Chapter("Writing the ticket of job 1, and reading it through a second session");
    bool const loggedIn = second.LogIn();
    tour.Show(loggedIn, "A second, independent session logs in as operator", YesOrNo(loggedIn));
    if (!loggedIn)
        return;

    int const copies = 250;
    double const coverage = 61.5;
    tour.Expect("First session writes an int",
                manager.SetParameter(JobType, JobId, "Tour/Copies", PARAM_INT, &copies, -1), 1);
    tour.Expect("  a double",
                manager.SetParameter(JobType, JobId, "Tour/Coverage", PARAM_DOUBLE, &coverage, -1), 1);
    tour.Expect("  a text",
                manager.SetParameter(JobType, JobId, "Tour/Paper", PARAM_STRING, "matt, 135 g/m\xC2\xB2", -1),
                1);
    for (int pos = 0; pos < 3; ++pos)
    {
        int const page = 10 * (pos + 1);
        tour.Expect("  value " + std::to_string(pos) + " of a list",
                    manager.SetParameter(JobType, JobId, "Tour/Pages", PARAM_INT, &page, pos == 0 ? -1 : pos),
                    1);
    }

    int seenCopies = 0;
    double seenCoverage = 0;
    char const* seenPaper = "";
    second.Read("Tour/Copies", PARAM_INT, &seenCopies);
    second.Read("Tour/Coverage", PARAM_DOUBLE, &seenCoverage);
    second.Read("Tour/Paper", PARAM_STRING, &seenPaper);
    tour.Expect("Second session reads the int", seenCopies, copies);
    tour.Expect("  the double", seenCoverage, coverage);
    tour.Expect("  the text", std::string(seenPaper), std::string("matt, 135 g/m\xC2\xB2"));
    tour.Expect("  the list", Joined(second.Ints("Tour/Pages")), std::string("10, 20, 30"));

    for (char const* key : {"Tour/Copies", "Tour/Coverage", "Tour/Paper", "Tour/Pages"})
        tour.Expect(std::string("First session deletes ") + key,
                    manager.SetParameter(JobType, JobId, key, PARAM_NONE, nullptr, -1), 1);
    tour.Expect("Second session's read of the int gives", second.Read("Tour/Copies", PARAM_INT, &seenCopies),
                0);
    tour.Expect("  and its list holds so many values", second.Ints("Tour/Pages").size(), std::size_t{0});
}

// The library's receiver deletes itself at its end; this one tells when its thread is over, which is later:
// wxWidgets must not go before that.
class Receiver : public ReceiverThread
{
public:
    explicit Receiver(std::promise<void>& ended) : m_ended(ended) {}

    void* Entry() override
    {
        thread_local LastAct last;  // dies with the thread
        last.ended = &m_ended;
        return ReceiverThread::Entry();
    }

private:
    struct LastAct
    {
        ~LastAct() { ended->set_value(); }
        std::promise<void>* ended = nullptr;
    };

    std::promise<void>& m_ended;
};

// Events as they come, to be waited for.
class EventLog
{
public:
    EventLog()
        : m_subscription(CEventManager::GetInstance()->Subscribe(
              [this](wxEvent& event)
              {
                  std::lock_guard const guard(m_lock);
                  m_ids.push_back(event.GetId());
                  m_changed.notify_all();
              }))
    {
    }
    EventLog(EventLog const&) = delete;
    EventLog& operator=(EventLog const&) = delete;
    ~EventLog() { CEventManager::GetInstance()->Unsubscribe(m_subscription); }

    bool WaitFor(int id)
    {
        std::unique_lock guard(m_lock);
        return m_changed.wait_for(guard, std::chrono::seconds(10),
                                  [&] { return std::find(m_ids.begin(), m_ids.end(), id) != m_ids.end(); });
    }

private:
    std::mutex m_lock;
    std::condition_variable m_changed;
    std::vector<int> m_ids;
    unsigned long long m_subscription;
};

// What the first session does to job tickets, and the second one hears of.
void ChangeJobs(Tour& tour, ComGUIManager& manager, EventLog& log)
{
    MTICKET_ACCESS const* const container = manager.GetClientContainer();
    MTICKET_READ const& read = *MTICKET_READ::Of(container);
    MTICKET_ADMIN const& admin = *MTICKET_ADMIN::Of(container);

    int const job = admin.CreateNextTicket(JobType);
    tour.Show(job > 0, "First session creates a job ticket; its id", job);
    tour.Show(log.WaitFor(1000002), "  second session hears of it as event", 1000002);

    STICKET_ACCESS const* const ticket = read.OpenTicket(JobType, job);
    tour.Show(ticket != nullptr, "First session opens it", YesOrNo(ticket != nullptr));
    if (!ticket)
        return;
    tour.Expect("  writes a text into it",
                STICKET_MODIFY::Of(ticket)->SetParameter("Job/Identification/Name", "Tour", -1), 1);
    tour.Show(log.WaitFor(1000004), "  second session hears of it as event", 1000004);
    tour.Expect("  reads it back",
                Text(STICKET_READ::Of(ticket)->GetWxStringParameter(-1, "Job/Identification/Name", "")),
                std::string("Tour"));
    tour.Expect("  and closes it", admin.CloseTicket(JobType, job, false), 1);

    std::vector<int> ids;
    read.GetTickets(JobType, ids);
    tour.ShowText("The job tickets there are", Joined(ids, [](int id) { return id; }));
    tour.Expect("First session deletes its own", manager.DeleteTicketOfType(JobType, job), 1);
    tour.Show(log.WaitFor(1000003), "  second session hears of it as event", 1000003);
}

void HearOfChanges(Tour& tour, ComGUIManager& manager, SecondSession& second)
{
    tour.Chapter("Being told of changes");
    EventLog log;
    std::promise<void> ended;
    auto* const receiver = new Receiver(ended);
    receiver->Run();
    tour.Expect("Second session subscribes to job tickets", second.Subscribe(), 0);
    ChangeJobs(tour, manager, log);
    receiver->ShutDown();
    ended.get_future().wait();
    second.Unsubscribe();
}

void WorkOnATicketFile(Tour& tour, ComGUIManager& manager)
{
    tour.Chapter("Working on a ticket file, without a server");
    std::filesystem::path const file =
        std::filesystem::temp_directory_path() / ("session_tour-" + std::to_string(getpid()) + ".xml");
    std::ofstream(file) << "<ticket version=\"1\"/>\n";
    wxString const path = wxString::FromUTF8(file.c_str());

    tour.Expect("SetParameterToLocal writes an int", manager.SetParameterToLocal(path, "Copies", 25), 1);
    tour.Expect("  which the file holds from then on",
                manager.GetIntParameterFromLocal(path, "Copies", 0, -1), 25);
    tour.Expect("AddStringToStringListLocal adds a text",
                manager.AddStringToStringListLocal(path, "Papers", "matt"), 1);
    tour.Expect("  another one", manager.AddStringToStringListLocal(path, "Papers", "glossy"), 1);
    tour.Expect("  but none that is there", manager.AddStringToStringListLocal(path, "Papers", "matt"), 0);
    tour.Expect("  so the list is", Joined(manager.GetStringArrayParameterFromLocal(path, "Papers")),
                std::string("matt, glossy"));
    std::filesystem::remove(file);
    tour.Expect("A file that is not there gives -1, whatever the default",
                manager.GetIntParameterFromLocal(path, "Copies", 7, -1), -1);
}

void LogOut(Tour& tour, ComGUIManager& manager, SecondSession& second)
{
    tour.Chapter("Logging out");
    tour.Expect("Second session logs out", second.LogOut(), 0);
    tour.Expect("First session logs out", manager.Logout(), 0);
    int value = 7;
    tour.Expect("A guarded read is answered by the library itself",
                manager.GetParameter(0, 0, "System/MasterSOAPPort", PARAM_INT, &value, -1), -1);
    tour.Expect("  and leaves our variable", value, 7);
    std::cout << "          (giving a session back takes 4 seconds, always)" << std::endl;
    tour.Expect("Uninitialize of the first", manager.Uninitialize(), 0);
    tour.Expect("UninitializeAsync of the second", second.Uninitialize(), 0);
}
}  // namespace

int main(int argc, char** argv)
{
    if (argc > 1)
    {
        bool const isHelp = std::string(argv[1]) == "--help";
        char const* const help = "Runs a whole session and tells each step. It takes no arguments.\n"
                                 "Exit status: 0 every step gave what it should; 1 one did not; 2 a wrong "
                                 "command line.\n";
        char const* const refusal =
            "session_tour: takes no arguments; session_tour --help tells what it does\n";
        (isHelp ? std::cout << help : std::cerr << refusal).flush();
        return isHelp ? 0 : 2;
    }
    wxInitializer const wx;  // the receiver is a thread of wxWidgets
    Tour tour;
    tour.Chapter("Opening the communication plug-in");
    ComGUIManager* const manager = FindPlugIn();
    if (!manager)
        return 1;
    wxString path;
    UtilityObjects::GetPlugInsPath(path, L"" COMGUI_BUNDLE_NAME);
    tour.ShowText("Opened", Text(path));

    TestServer(tour, *manager);
    if (LogIn(tour, *manager))
    {
        ReadSystemTicket(tour, *manager);
        SecondSession second(*manager);
        ShareJobTicket(tour, *manager, second);
        HearOfChanges(tour, *manager, second);
        WorkOnATicketFile(tour, *manager);
        LogOut(tour, *manager, second);
    }
    tour.Farewell();
    return tour.ExitStatus();
}
