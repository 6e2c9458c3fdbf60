// Watches a server: logs in, asks to be told of all changes, prints each event as it comes, and leaves in
// good order on Ctrl-C. With --busy a second session changes tickets meanwhile, so that there is something
// to see.
#include "ServerSession.h"
#include "Shown.h"

#include <chrono>
#include <climits>
#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <thread>
#include <wx/cmdline.h>
#include <wx/datetime.h>

char const ProgramName[] = "watch_tickets";

namespace
{
constexpr int JobType = 3;
constexpr int WatchedTypes[] = {0, 2, 3, 7, 12, 17};
constexpr char const* EveryKey[] = {nullptr};

struct OPTIONS
{
    LOGIN login;
    int events = 0;  // leave after so many; 0: on Ctrl-C only
    bool busy = false;
};

// Nothing, or the status with which to end at once: after --help, or after a message on a wrong command line.
std::optional<int> Parse(int argc, char** argv, OPTIONS& options)
{
    wxCmdLineParser parser;
    parser.SetLogo("Prints what changes in the tickets of a server, until Ctrl-C.\n"
                   "Exit status: 0 all is well; 2 a wrong command line, no server, no login, or the output "
                   "cannot be written.");
    parser.AddSwitch("h", "help", "show this text", wxCMD_LINE_OPTION_HELP);
    parser.AddSwitch("b", "busy", "change tickets meanwhile, in a second session (as operator)");
    LOGIN::AddOptions(parser);
    parser.AddOption("n", "events", "leave after so many events (0: no limit)");
    if (auto const status = ParseCommandLine(parser, argc, argv))
        return status;
    if (!options.login.TakeOptions(parser) || !TakeNumber(parser, "events", options.events, 0, INT_MAX))
        return Trouble;
    options.busy = parser.Found("busy");
    return std::nullopt;
}

std::string ValueOf(NotifData const& data)
{
    switch (data.NotifValueType)
    {
    case PARAM_NONE:
        return data.NotifKind == 1 ? "(deleted)" : "";
    case PARAM_INT:
        return wxString::Format("%.0f", data.NotifNumber).utf8_string();
    case PARAM_DOUBLE:
        return wxString::Format("%g", data.NotifNumber).utf8_string();
    case PARAM_STRING:
        return "\"" + Shown(data.NotifText.utf8_string()) + "\"";
    case PARAM_COUNT:
        return "(several values)";
    default:
        return "(a value)";
    }
}

// Prints events on the receiver's thread, quickly, since the plug-in waits meanwhile.
class Printer
{
public:
    explicit Printer(int limit) : m_limit(limit) {}

    void Print(ServerNotificationEvent const& event)
    {
        if (m_isOver)
            return;  // what still comes while the program is leaving
        NotifData const& data = event.GetNotifData();
        std::printf("%s  event %d  ticket %d/%d  %s %s\n",
                    wxDateTime::UNow().Format("%H:%M:%S.%l").utf8_string().c_str(), event.GetId(),
                    data.NotifCode, data.NotifArgA, Shown(data.NotifKey.utf8_string()).c_str(),
                    ValueOf(data).c_str());
        bool const isWritten = FlushOutput();
        m_isOver = ++m_printed == m_limit || !isWritten;
        if (m_isOver)
            EndSignals::Raise();
    }

private:
    int const m_limit;
    int m_printed = 0;
    bool m_isOver = false;
};

// A second session of this program, which works on tickets. It uses the slots of its container alone, since
// the manager itself is for one thread.
class BusySession
{
public:
    BusySession(ComGUIManager& manager, comgui::Server const& server)
        : m_manager(manager), m_login(NewRecord(server, {"operator", "operator"}))
    {
    }
    BusySession(BusySession const&) = delete;
    BusySession& operator=(BusySession const&) = delete;
    ~BusySession() { std::free(m_login); }

    bool Start()
    {
        int result = m_manager.InitializeBackward(m_login, Stamp);
        if (result == 0)
            result = m_manager.LoginBackward(m_login);
        if (result != 0)
            return Fail("the second session cannot log in as operator", result);
        m_container = m_manager.GetBackwardContainer();
        m_thread = std::thread([this] { Work(); });
        return true;
    }

    void Stop()
    {
        if (!m_thread.joinable())
            return;
        {
            std::lock_guard const guard(m_lock);
            m_stop = true;
        }
        m_stopped.notify_all();
        m_thread.join();
        m_manager.LogoutBackward(m_login);
    }

private:
    void Work()
    {
        MTICKET_MODIFY const& modify = *MTICKET_MODIFY::Of(m_container);
        MTICKET_ADMIN const& admin = *MTICKET_ADMIN::Of(m_container);
        MTICKET_READ const& read = *MTICKET_READ::Of(m_container);
        for (int round = 1; Pause(); ++round)
        {
            int const job = admin.CreateNextTicket(JobType);
            if (job < 0)
                continue;
            modify.SetParameter(JobType, job, "Job/Identification/Name",
                                wxString::Format("Brochure %d", round), -1);
            modify.SetParameter(JobType, job, "Job/Progress", 12.5, -1);
            if (STICKET_ACCESS const* const ticket = read.OpenTicket(JobType, job))
            {
                STICKET_MODIFY::Of(ticket)->SetParameter("Job/Copies", 100 * round, -1);
                admin.CloseTicket(JobType, job, false);
            }
            modify.DelParameter(JobType, job, "Job/Progress", -1);
            m_container->MOPERATION(m_container->Instance, JobType, job, MTICKET_OP_DELETE, nullptr);
        }
    }

    // False when it is time to stop.
    bool Pause()
    {
        std::unique_lock guard(m_lock);
        return !m_stopped.wait_for(guard, std::chrono::milliseconds(500), [this] { return m_stop; });
    }

    ComGUIManager& m_manager;
    TLogin* m_login;
    MTICKET_ACCESS const* m_container = nullptr;
    std::thread m_thread;
    std::mutex m_lock;
    std::condition_variable m_stopped;
    bool m_stop = false;
};

bool Subscribe(ComGUIManager& manager, TLogin* login)
{
    if (int const result = manager.SetCallback(login, nullptr); result != 0)
        return Fail("the plug-in takes no callback", result);
    for (int const type : WatchedTypes)
        manager.EnableNotifications(login, type, EveryKey);
    return true;
}

int Watch(ComGUIManager& manager, TLogin* login, OPTIONS const& options, EndSignals const& end)
{
    if (!Subscribe(manager, login))
        return Trouble;
    Printer printer(options.events);
    auto receiver =
        std::make_unique<EventReceiver>([&](ServerNotificationEvent const& event) { printer.Print(event); });

    BusySession busy(manager, options.login.server);
    bool const started = !options.busy || busy.Start();
    if (started)
    {
        std::printf("Watching %s as %s; Ctrl-C ends it.\n", Shown(options.login.server.host).c_str(),
                    Shown(manager.GetCurrentlyLoggedUser().utf8_string()).c_str());
        if (FlushOutput())
            end.Wait();
    }
    std::puts("\nLeaving.");
    busy.Stop();

    // The order in which a host leaves: receiver, notifications, session.
    receiver.reset();
    for (int const type : WatchedTypes)
        manager.DisableNotifications(login, type);
    return started && FlushOutput() ? Good : Trouble;
}
}  // namespace

int main(int argc, char** argv)
{
    std::signal(SIGPIPE, SIG_IGN);
    EndSignals const end;
    OPTIONS options;
    if (auto const status = Parse(argc, argv, options))
        return *status;

    ComGUIManager* const manager = ComGUIManager::GetInstance();
    if (!IsPlugInThere())
        return Trouble;
    TLogin* const login = NewRecord(options.login.server, options.login.account);
    if (!LogIn(*manager, login))
        return Trouble;
    int const status = Watch(*manager, login, options, end);
    manager->Logout();  // and no Uninitialize, which waits: the process ends here anyway
    return status;
}
