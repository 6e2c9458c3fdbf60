// A receiver thread under a test's control, and what it publishes.
#pragma once

#include "comgui/session/ReceiverThread.h"
#include "tests/session/NotificationQueue.h"
#include <condition_variable>
#include <functional>
#include <mutex>
#include <string>

class wxEvent;

class Receiver : public NotificationQueue
{
protected:
    Receiver();
    ~Receiver() override;

    // The end point of the process: every test starts its threads with this one, since the first counts.
    static constexpr char EndPoint[] = "Host.Local:50006";
    void SetEndPoint(char const* text);

    static void Queue(int kind, int code, char const* key = "", char const* text = "");
    static void Queue(NotifData* notification);

    // Starts a thread. Its end, by ShutDown or by wxThread::Delete, is waited for.
    void Run();
    void ShutDown();
    void Delete();

    // Returns when everything that is queued now has been handled.
    void WaitUntilHandled();

    struct EVENT
    {
        int id;
        int kind;
        std::string key;
    };
    std::vector<EVENT> Events();  // published so far, in order
    std::vector<int> EventIds();

    std::function<void(NotifData const&)> onEvent;  // runs in the handler; to be set before Run

private:
    class THREAD;
    void Handle(wxEvent& event);
    void WaitForTheEnd();

    std::mutex m_lock;
    std::condition_variable m_changed;
    std::vector<EVENT> m_events;
    int m_markersSeen = 0;
    int m_markersSent = 0;
    bool m_ended = true;
    int m_threadId = 0;
    THREAD* m_thread = nullptr;
    unsigned long long m_subscription = 0;
};
