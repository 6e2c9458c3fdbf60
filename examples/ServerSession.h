// How an example without the client kit logs in, and hears of changes.
#pragma once

#include "CommandLine.h"
#include "EndSignals.h"
#include "Output.h"
#include <comgui/comgui.h>
#include <functional>
#include <future>

// With the plug-in's code; always false.
bool Fail(std::string const& what, int code);

// Whether the library found its plug-in; says so if not.
bool IsPlugInThere();

// A record of the host's own for one session. From calloc, since one that is logged in becomes the manager's.
TLogin* NewRecord(comgui::Server const& server, comgui::Account const& account);

// Looks for the server, prepares a session and logs in; says why if it cannot. Takes the record over: it is
// the manager's once it comes to the login, and is freed if it does not.
bool LogIn(ComGUIManager& manager, TLogin* login);

// A host's own mark of its sessions; the plug-in only carries it.
constexpr int Stamp = 20260101;

// Hears events as long as it lives. The handler runs on the receiver's thread, and should be quick, since the
// plug-in waits meanwhile.
class EventReceiver
{
public:
    explicit EventReceiver(std::function<void(ServerNotificationEvent const&)> handler);
    ~EventReceiver();
    EventReceiver(EventReceiver const&) = delete;
    EventReceiver& operator=(EventReceiver const&) = delete;

private:
    unsigned long long m_subscription;
    std::promise<void> m_ended;
    ReceiverThread* m_thread;
};
