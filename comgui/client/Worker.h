// A thread for calls that may take long, such as those to a slow server. What they find is handed back to the
// thread of an executor, so that a window needs no lock:
//
//     comgui::Worker worker(comgui::OnThreadOf(*this));
//     worker.Do([tickets, ticket] { return tickets.ReadAll(ticket); },
//               [this](comgui::Result<comgui::Snapshot> const& snapshot) { Show(snapshot); });
#pragma once

#include "comgui/client/Executor.h"
#include <functional>
#include <memory>
#include <thread>
#include <type_traits>
#include <utility>

namespace comgui
{
class COMGUI_EXPORT Worker
{
public:
    // results: where what was found is taken. Throws std::system_error if there is no thread to be had.
    explicit Worker(Executor results);

    // Waits for the work that runs; the work that waits is dropped, and no result is taken any more. To be
    // destroyed on the results' thread, but not by work.
    ~Worker();
    Worker(Worker const&) = delete;
    Worker& operator=(Worker const&) = delete;

    // work() is called by the worker's thread, one after another in their order; then(result), or then() if
    // work gives nothing, by the results' executor. Both are copied; work must not throw. From any thread.
    template <typename Work, typename Then>
    void Do(Work work, Then then) const
    {
        m_work([results = m_results, work = std::move(work), then = std::move(then)]() mutable
               { Answer(results, std::move(work), std::move(then)); });
    }

    // That of the results; whatever it is given, it drops once the worker is gone.
    Executor const& Results() const { return m_results; }

private:
    template <typename Work, typename Then>
    static void Answer(Executor const& results, Work work, Then then)
    {
        if constexpr (std::is_void_v<std::invoke_result_t<Work&>>)
        {
            work();
            results(std::move(then));
        }
        else
            results([then = std::move(then), result = work()]() mutable { then(std::move(result)); });
    }

    struct STATE;
    std::shared_ptr<STATE> m_state;
    Executor m_results;
    Executor m_work;
    std::thread m_thread;
};
}  // namespace comgui
