// The host's event bus. GetInstance and PublishEvent are what the library calls; declared here, supplied by
// the host's event library, or by libcomgui_host, which adds Subscribe and Unsubscribe.
//
// For any thread. Handlers run on the thread that publishes, in the order of their subscription. A handler
// may subscribe, unsubscribe and publish: a handler added meanwhile hears the next event, one removed
// meanwhile hears nothing more. An exception of a handler goes to whoever published, and the handlers behind
// it do not hear that event.
#pragma once

#include "comgui/foundation/export.h"
#include <functional>
#include <memory>
#include <wx/event.h>

class CEventManager;
using CEventManagerPtr = std::shared_ptr<CEventManager>;

class COMGUI_EXPORT CEventManager
{
public:
    static CEventManagerPtr GetInstance();

    CEventManager();
    ~CEventManager();
    CEventManager(CEventManager const&) = delete;
    CEventManager& operator=(CEventManager const&) = delete;

    // Delivers the event to every handler; when it returns, all have been called. What the event refers to
    // is not used afterwards.
    void PublishEvent(wxEvent& event);

    // Only in libcomgui_host. The token names the subscription; it is never 0 and never given out twice.
    using Handler = std::function<void(wxEvent&)>;
    unsigned long long Subscribe(Handler handler);

    // Only in libcomgui_host. Ends a subscription; false if there is no such one. When it returns the handler
    // runs no more, on no thread; only a call from inside a handler does not wait for other threads.
    bool Unsubscribe(unsigned long long token);

private:
    struct STATE;
    std::unique_ptr<STATE> m_state;
};
