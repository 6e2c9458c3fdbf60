#include "ServerSession.h"

#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <memory>
#include <pthread.h>
#include <unistd.h>
#include <utility>

namespace
{
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

constexpr int WrongUserOrPassword = 107;  // a code of ComGUI.Bundle, the plug-in of this package
}  // namespace

bool Fail(std::string const& what, int code)
{
    return Fail(what + " (the plug-in's code: " + std::to_string(code) + ")");
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

TLogin* NewRecord(comgui::Server const& server, comgui::Account const& account)
{
    auto* const login = static_cast<TLogin*>(std::calloc(1, sizeof(TLogin)));
    if (!login)
        std::abort();
    login->nSize = sizeof(TLogin);
    login->iGUINotificationID = -1;
    stracpy(login->szUser, account.user.c_str(), sizeof login->szUser);
    stracpy(login->szPassword, account.password.c_str(), sizeof login->szPassword);
    stracpy(login->szServerHost, server.host.c_str(), sizeof login->szServerHost);
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
