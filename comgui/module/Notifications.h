// Tells clients of changes: knows which session wants to hear of which tickets, and calls the clients on a
// thread of its own, one call at a time, in the order in which the changes were posted. No lock is held
// during a call, which may use the plug-in as it likes.
//
// For any thread. What waits to be told is bounded by memory alone.
#pragma once

#include "comgui/module/Callback.h"
#include "comgui/module/KeySelection.h"
#include <chrono>
#include <condition_variable>
#include <deque>
#include <map>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

namespace comgui::plugin
{
class Session;

class Notifications
{
public:
    Notifications() = default;
    ~Notifications();  // not from a call of a client
    Notifications(Notifications const&) = delete;
    Notifications& operator=(Notifications const&) = delete;

    // For the author: to be called when a change is visible to those who read.
    void Changed(Address ticket, std::vector<Parameter> const& parameters);
    void Created(Address ticket);
    void Deleted(Address ticket);

    // One session, whatever it has switched on; nothing if it has not registered.
    void Tell(Session const& session, int kind, int argA, int code, std::vector<Parameter> const& parameters);

    // For the kit. An id that no registration has had.
    int NewId();

    // From now on the session is told under that id, and under no earlier one. False after Stop. Throws
    // std::system_error if there can be no thread.
    bool Register(Session const& session, int id, Callback callback);

    // One ticket, or with TICKET_ID_ALL every ticket of the type. Enabling again replaces the keys. False for
    // an id that is not the session's, and for no such address.
    bool Enable(Session const& session, int id, Address tickets, KeySelection keys);

    // The same the other way round; a whole type takes its single tickets along, and type -3 everything. When
    // it returns no call about them runs or will come, unless it is called from a call of a client itself.
    bool Disable(Session const& session, int id, Address tickets);

    // No call for the session runs or will come when it returns, with the same exception.
    void Remove(Session const& session);

    // Begins no further call, for good, and waits for a running one, but no longer than told.
    void Stop(std::chrono::milliseconds patience);

private:
    struct Listener
    {
        Session const* session;
        int id;
        Callback callback;
        std::map<Address, KeySelection> wanted{};

        KeySelection const* Wants(Address ticket) const;
    };
    struct Message
    {
        std::shared_ptr<Listener> listener;
        int kind;
        int argA;
        int code;
        std::vector<Parameter> parameters;
        std::optional<Address> ticket{};  // nothing for what was told to the session itself
    };
    using Lock = std::unique_lock<std::mutex>;

    bool IsStopped();
    std::shared_ptr<Listener> Find(Session const& session, int id) const;
    void Post(int kind, Address ticket, std::vector<Parameter> const& parameters);
    void Queue(Message message);
    void Withdraw(Listener const& listener, bool all);
    void WaitFor(Listener const& listener, Lock& lock);
    void Run();

    std::mutex m_lock;  // of all members below
    std::vector<std::shared_ptr<Listener>> m_listeners;
    std::deque<Message> m_waiting;
    std::condition_variable m_work;
    std::condition_variable m_done;
    Listener const* m_running = nullptr;  // whose call runs
    unsigned long long m_calls = 0;       // a wait for one must not become one for the next
    int m_newestId = 0;
    bool m_isStopped = false;
    bool m_isOver = false;  // the thread's work
    std::thread m_thread;   // begun at the first registration
};
}  // namespace comgui::plugin
