// Has the plug-in report what subscribers want. Too much does no harm: the hub looks anew. For any thread.
#pragma once

#include "comgui/client/EventHub.h"
#include "comgui/client/Worker.h"
#include "comgui/ticket/MTICKET_ACCESS.h"
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <set>
#include <string>

namespace comgui::detail
{
class NotificationSwitch
{
public:
    explicit NotificationSwitch(EventHub& hub) : m_hub(hub) {}
    NotificationSwitch(NotificationSwitch const&) = delete;
    NotificationSwitch& operator=(NotificationSwitch const&) = delete;

    // notification: the session's number, worth something to its container alone. Nothing is on at first.
    // Like EndSession, waits for one call of the plug-in at most, in the session before.
    void BeginSession(MTICKET_ACCESS const* container, int notification);

    // The plug-in drops by itself what was on.
    void EndSession();

    // Makes those two wait no longer than that, if it is called before.
    void Interrupt() { m_isLeaving = true; }

    // Begins its thread, which calls the plug-in, since that may take long. Throws std::system_error if there
    // is none to be had. Before the first subscription; until then there is nothing to switch.
    void Start();

    // Has the thread bring what the plug-in reports in line with what subscribers want. Gives a number to
    // wait with, but no longer than patience: if that is not enough, subscribers are told later that what
    // came to be reported may have changed meanwhile.
    std::uint64_t Ask();
    void Await(std::uint64_t turn, std::chrono::milliseconds patience);

    // Whether the plug-in has refused something that is wanted: Ask asks it again, and subscribers are told
    // of what it takes then, like those who lost their patience.
    bool IsRefused() const { return m_isRefused; }

    // For good: ends its thread. What waits there is dropped, and nobody waits any more.
    void Stop();

private:
    using Keys = std::set<std::string>;            // none stands for all keys
    using Wanted = std::map<TicketAddress, Keys>;  // a type by TICKET_ID_ALL

    void Switch();
    static Wanted Union(std::vector<Interest> const& interests);
    std::set<TicketAddress> SwitchOff(Wanted const& wanted);
    std::set<TicketAddress> SwitchOn(Wanted const& wanted);
    void Serve(std::uint64_t turn);

    EventHub& m_hub;
    std::atomic<bool> m_isLeaving{false};
    std::atomic<bool> m_isRefused{false};

    std::mutex m_switching;  // held while the plug-in is called; the members below
    MTICKET_ACCESS const* m_container = nullptr;
    int m_notification = -1;
    Wanted m_enabled;
    std::set<TicketAddress> m_refused;  // by the plug-in, the last time
    std::set<TicketAddress> m_news;     // switched on for a turn that is not done yet, maybe

    std::mutex m_waiting;  // taken after the one above; the members below
    std::condition_variable m_served;
    std::uint64_t m_asked = 0;  // the last turn that was asked for
    std::uint64_t m_done = 0;   // the last turn of which all is switched
    std::uint64_t m_late = 0;   // the last turn whose asker has lost his patience
    std::unique_ptr<Worker> m_worker;
    bool m_isStopped = false;
};
}  // namespace comgui::detail
