#include "examples/ServerSession.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <iterator>
#include <unistd.h>
#include <utility>

namespace
{
constexpr int Ends[] = {SIGINT, SIGTERM, SIGHUP};

// The library's receiver deletes itself at its end; this one tells when.
class Receiver : public ReceiverThread
{
public:
    explicit Receiver(std::promise<void>& ended) : m_ended(ended) {}
    ~Receiver() override { m_ended.set_value(); }

private:
    std::promise<void>& m_ended;
};
}  // namespace

void SERVER::AddOptions(wxCmdLineParser& parser)
{
    parser.AddOption("u", "user", "log in as this user (admin)");
    parser.AddOption("p", "password", "with this password (admin)");
    parser.AddOption("s", "server", "at this host (localhost)");
    parser.AddOption("o", "port", "and port (50000)", wxCMD_LINE_VAL_NUMBER);
}

void SERVER::TakeOptions(wxCmdLineParser const& parser)
{
    parser.Found("user", &user);
    parser.Found("password", &password);
    parser.Found("server", &host);
    parser.Found("port", &port);
}

bool Fail(char const* what, int code)
{
    std::fprintf(stderr, "%s: %s (the plug-in's code: %d)\n", ProgramName, what, code);
    return false;
}

bool IsPlugInThere()
{
    if (hSTicketInstance)
        return true;
    wxString path;
    UtilityObjects::GetPlugInsPath(path, L"" COMGUI_BUNDLE_NAME);
    std::fprintf(stderr, "%s: cannot open the communication plug-in %s: build or install it there\n",
                 ProgramName, path.utf8_string().c_str());
    return false;
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
    login->iServerPort = static_cast<int>(server.port);
    return login;
}

bool LogIn(ComGUIManager& manager, TLogin* login)
{
    if (!manager.IsServerOnline(login))
        return Fail("no server answers there", -2005);
    if (int const result = manager.Initialize(login, Stamp); result != 0)
        return Fail("cannot prepare a session", result);
    if (int const result = manager.Login(login); result != 0)
        return Fail("the server refuses the login", result);
    return manager.GetClientContainer() || Fail("the session has no tickets", 0);
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
    m_thread->Run();
}

EventReceiver::~EventReceiver()
{
    m_thread->ShutDown();  // and no use of it from here on: it deletes itself
    m_ended.get_future().wait();
    CEventManager::GetInstance()->Unsubscribe(m_subscription);
}
