// Where handlers of events run. An Executor takes a task from any thread and runs it later, on the thread of
// its choice, tasks one after another in their order; it is copied, and called by threads of the kit, so it
// must not run the task itself at once and must not throw.
#pragma once

#include "comgui/foundation/export.h"
#include <chrono>
#include <functional>
#include <memory>

class wxEvtHandler;

namespace comgui
{
using Executor = std::function<void(std::function<void()>)>;

// On the thread of wxWidgets' event loop that handles the events of that window or handler, which must live
// longer than every subscription made with it.
COMGUI_EXPORT Executor OnThreadOf(wxEvtHandler& handler);

// For programs without an event loop: keeps tasks until a thread of the program's runs them. Any thread may
// post; Run and RunFor are for one thread at a time.
class COMGUI_EXPORT TaskQueue
{
public:
    TaskQueue();
    ~TaskQueue();  // tasks that did not run never will
    TaskQueue(TaskQueue const&) = delete;
    TaskQueue& operator=(TaskQueue const&) = delete;

    Executor GetExecutor() const;  // may be used after the queue's end, too, without effect

    // Runs what waits, and what is posted meanwhile, until Stop is called, or the time is over.
    void Run();
    void RunFor(std::chrono::milliseconds time);

    void Stop();  // ends the run, or the next one; from any thread

private:
    COMGUI_LOCAL void RunUntil(std::chrono::steady_clock::time_point end);

    struct STATE;
    std::shared_ptr<STATE> m_state;
};
}  // namespace comgui
