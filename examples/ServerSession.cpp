#include "ServerSession.h"

#include "Shown.h"
#include <algorithm>
#include <atomic>
#include <cerrno>
#include <charconv>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <iterator>
#include <memory>
#include <pthread.h>
#include <unistd.h>
#include <utility>
#include <wx/msgout.h>

namespace
{
constexpr int Ends[] = {SIGINT, SIGTERM, SIGHUP};

// The library's receiver deletes itself at its end; this one tells when its thread is over, which is later:
// wxWidgets must not go before that, nor what it keeps for the thread be left behind.
class Receiver : public ReceiverThread
{
public:
    explicit Receiver(std::promise<void>& ended) : m_ended(ended) {}

    void* Entry() override
    {
        pthread_setspecific(Key(), new LastAct{&m_ended});
        return ReceiverThread::Entry();
    }

private:
    struct LastAct
    {
        std::promise<void>* ended;
        bool isLastRound = false;
    };

    // What others have for a thread goes in the first round of such ends, so this waits for the second.
    static void End(void* data)
    {
        auto* const act = static_cast<LastAct*>(data);
        if (!std::exchange(act->isLastRound, true) && pthread_setspecific(Key(), act) == 0)
            return;
        std::promise<void>& ended = *act->ended;
        delete act;
        ended.set_value();
    }

    static pthread_key_t Key()
    {
        static pthread_key_t const key = []
        {
            pthread_key_t made{};
            pthread_key_create(&made, &End);
            return made;
        }();
        return key;
    }

    std::promise<void>& m_ended;
};

// The receiver says farewell on standard output, which is not for those who read our lines.
class QuietOutput
{
public:
    QuietOutput() : m_output(dup(STDOUT_FILENO))
    {
        std::fflush(stdout);
        int const nowhere = open("/dev/null", O_WRONLY | O_CLOEXEC);
        dup2(nowhere, STDOUT_FILENO);
        close(nowhere);
    }
    QuietOutput(QuietOutput const&) = delete;
    QuietOutput& operator=(QuietOutput const&) = delete;
    ~QuietOutput()
    {
        std::fflush(stdout);
        dup2(m_output, STDOUT_FILENO);
        close(m_output);
    }

private:
    int m_output;
};

// Where wxCmdLineParser tells what is wrong.
class Complaints : public wxMessageOutput
{
public:
    void Output(wxString const& text) override
    {
        wxString line = text.Strip(wxString::both);
        line.Replace("\n", "; ");
        Fail(line.utf8_string() + "; " + ProgramName + " --help tells how");
    }
};

constexpr int WrongUserOrPassword = 107;  // a code of ComGUI.Bundle, the plug-in of this package
}  // namespace

std::optional<int> ParseCommandLine(wxCmdLineParser& parser)
{
    Complaints complaints;
    wxMessageOutput* const before = wxMessageOutput::Set(&complaints);
    int const result = parser.Parse(false);
    wxMessageOutput::Set(before);
    if (result > 0)
        return Trouble;
    if (result == 0)
        return std::nullopt;
    std::fputs(parser.GetUsageString().utf8_str(), stdout);
    return FlushOutput() ? Good : Trouble;
}

std::optional<int> WholeNumber(std::string const& text, int least, int largest)
{
    int number = 0;
    auto const [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    if (error != std::errc() || end != text.data() + text.size() || number < least || number > largest)
        return std::nullopt;
    return number;
}

std::string NumberFrom(int least, int largest, std::string const& given)
{
    return "a whole number from " + std::to_string(least) + " to " + std::to_string(largest) + ", not \"" +
           given + "\"";
}

bool TakeNumber(wxCmdLineParser const& parser, char const* option, int& value, int least, int largest)
{
    wxString given;
    if (!parser.Found(option, &given))
        return true;
    std::string const text = given.utf8_string();
    auto const number = WholeNumber(text, least, largest);
    value = number.value_or(value);
    return number || Fail(std::string("--") + option + " takes " + NumberFrom(least, largest, text) + "; " +
                          ProgramName + " --help tells how");
}

void SERVER::AddOptions(wxCmdLineParser& parser)
{
    parser.AddOption("u", "user", "log in as this user (admin)");
    parser.AddOption("p", "password", "with this password (admin)");
    parser.AddOption("s", "server", "at this host (localhost)");
    parser.AddOption("o", "port", "and port (50000)");
}

bool SERVER::TakeOptions(wxCmdLineParser const& parser)
{
    parser.Found("user", &user);
    parser.Found("password", &password);
    parser.Found("server", &host);
    return TakeNumber(parser, "port", port, LeastPort, LargestPort);
}

bool Fail(std::string const& what)
{
    std::fprintf(stderr, "%s: %s\n", ProgramName, Shown(what).c_str());
    return false;
}

bool Fail(std::string const& what, int code)
{
    return Fail(what + " (the plug-in's code: " + std::to_string(code) + ")");
}

bool FlushOutput()
{
    static std::atomic<bool> isGood = true;
    errno = EIO;  // where it is an earlier write that failed
    if (!isGood || (std::fflush(stdout) == 0 && std::ferror(stdout) == 0))
        return isGood;
    isGood = false;
    if (errno != EPIPE)
        Fail(std::string("the output cannot be written: ") + std::strerror(errno) +
             "; make room there, or send it elsewhere");
    return false;
}

bool IsPlugInThere()
{
    if (hSTicketInstance)
        return true;
    wxString path;
    UtilityObjects::GetPlugInsPath(path, L"" COMGUI_BUNDLE_NAME);
    return Fail("cannot open the communication plug-in " + path.utf8_string() +
                ": build or install it there");
}

TLogin* NewRecord(char const* user, char const* password, SERVER const& server)
{
    auto* const login = static_cast<TLogin*>(std::calloc(1, sizeof(TLogin)));
    if (!login)
        std::abort();
    login->nSize = sizeof(TLogin);
    login->iGUINotificationID = -1;
    stracpy(login->szUser, user, sizeof login->szUser);
    stracpy(login->szPassword, password, sizeof login->szPassword);
    stracpy(login->szServerHost, server.host.utf8_str(), sizeof login->szServerHost);
    login->iServerPort = server.port;
    return login;
}

bool LogIn(ComGUIManager& manager, TLogin* login)
{
    std::unique_ptr<TLogin, decltype(&std::free)> record(login, std::free);
    if (!manager.IsServerOnline(login))
        return Fail("cannot reach a server at " + std::string(login->szServerHost) + ", port " +
                    std::to_string(login->iServerPort));
    if (int const result = manager.Initialize(login, Stamp); result != 0)
        return Fail("cannot prepare a session", result);
    if (int const result = manager.Login(record.release()); result != 0)
        return Fail(result == WrongUserOrPassword ? "the server refuses the login: wrong user or password"
                                                  : "the server refuses the login",
                    result);
    return manager.GetClientContainer() || Fail("the session has no tickets");
}

EndSignals::EndSignals()
{
    sigemptyset(&m_signals);
    for (int const signal : Ends)
        sigaddset(&m_signals, signal);
    pthread_sigmask(SIG_BLOCK, &m_signals, nullptr);
}

void EndSignals::Wait() const
{
    int signal = 0;
    sigwait(&m_signals, &signal);
    pthread_sigmask(SIG_UNBLOCK, &m_signals, nullptr);  // somebody may be in a hurry
}

bool EndSignals::ArePending()
{
    sigset_t pending;
    sigpending(&pending);
    return std::any_of(std::begin(Ends), std::end(Ends),
                       [&](int signal) { return sigismember(&pending, signal) == 1; });
}

void EndSignals::Raise() { kill(getpid(), SIGTERM); }

EventReceiver::EventReceiver(std::function<void(ServerNotificationEvent const&)> handler)
    : m_subscription(CEventManager::GetInstance()->Subscribe(
          [handler = std::move(handler)](wxEvent& event)
          {
              if (auto const* const notified = dynamic_cast<ServerNotificationEvent*>(&event))
                  handler(*notified);
          })),
      m_thread(new Receiver(m_ended))
{
    if (m_thread->Run() == wxTHREAD_NO_ERROR)
        return;
    Fail("cannot start a thread to hear events with");  // and would wait for its end for ever
    std::exit(Trouble);
}

EventReceiver::~EventReceiver()
{
    QuietOutput const quiet;
    m_thread->ShutDown();  // and no use of it from here on: it deletes itself
    m_ended.get_future().wait();
    CEventManager::GetInstance()->Unsubscribe(m_subscription);
}
