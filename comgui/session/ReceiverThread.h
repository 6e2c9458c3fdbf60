// Takes notifications off ComGUIManager's queue, one in 2 milliseconds at most, and publishes each as a
// ServerNotificationEvent on the host's event bus. The host makes and runs it, after login: the first thread
// of the process to run fixes the local end point for all that follow. It is detached, so it deletes itself.
//
// Event handlers run on this thread while the queue is locked: a slow one makes the plug-in wait, and one
// that waits for the plug-in may wait for ever, be it for a further notification or in a call that lets a
// running callback end first, as switching notifications and logging out may do. An exception of a handler
// is reported on stdout, and the notification is published again.
#pragma once

#include "comgui/foundation/export.h"
#include <wx/thread.h>

class ComGUIManager;

class COMGUI_EXPORT ReceiverThread : public wxThread
{
public:
    ReceiverThread();
    ~ReceiverThread() override;

    void* Entry() override;  // always null

    // Makes the thread leave at the top of its next pass, with what is queued left where it is. From any
    // thread; does not wait. Always true.
    bool ShutDown();

    void OnExit() override;

private:
    ComGUIManager* m_pManager;
    bool m_bStop = false;  // looked at by two threads, so only by way of atomics
};
