// Carries a connection's transfers, each in a session of its own: the library's calls block, and only the end
// of a session cuts one short. For any thread.
#pragma once

#include "comgui/client/Event.h"
#include "comgui/client/SharedManager.h"
#include "comgui/client/Transfers.h"
#include "comgui/session/TLogin.h"
#include <condition_variable>
#include <deque>
#include <functional>
#include <mutex>
#include <thread>

namespace comgui::detail
{
class TransferPool;

// One transfer. What has no comment never changes.
class TransferTask
{
public:
    enum KIND
    {
        Job,
        Put,
        Get,
    };

    TransferTask(TransferPool& pool, KIND kind, std::string source, std::string target, JobOptions options);

    std::shared_ptr<TransferPool> const pool;
    int const number;
    KIND const kind;
    std::string const source;
    std::string const target;  // of a job its name
    JobOptions const options;

    // Guarded by the pool's lock.
    std::optional<TLogin> session{};  // while the plug-in may be at work for it
    bool isCancelled = false;
    bool isBeingCut = false;           // its session is being ended
    bool isCut = false;                // its session has been ended
    std::optional<Outcome> outcome{};  // at the end
    std::optional<int> job{};
    TransferProgress progress{};
    std::deque<std::pair<std::chrono::steady_clock::time_point, long long>> samples{};  // for the rate
};

class TransferPool : public std::enable_shared_from_this<TransferPool>
{
public:
    // isLoggedIn: does not wait. getRecord: what to log in with; nothing while logged out. publish: to the
    // subscribers. All for any thread.
    TransferPool(std::function<bool()> isLoggedIn, std::function<std::optional<TLogin>()> getRecord,
                 std::function<void(Event const&)> publish);
    ~TransferPool();  // after Stop
    TransferPool(TransferPool const&) = delete;
    TransferPool& operator=(TransferPool const&) = delete;

    std::shared_ptr<TransferTask> Begin(TransferTask::KIND kind, std::string source, std::string target,
                                        JobOptions options);
    void Cancel(TransferTask& task);
    std::optional<Outcome> WaitFor(TransferTask const& task, std::optional<std::chrono::milliseconds> time);
    std::vector<std::shared_ptr<TransferTask>> Running() const;

    // Reads a member of the task.
    template <typename Member>
    Member Look(TransferTask const& task, Member TransferTask::*member) const
    {
        std::lock_guard const lock(m_lock);
        return task.*member;
    }

    void CancelAll();
    void WaitForAll();  // and for the ends of their sessions
    void Stop();        // cancels all, and ends the threads; what begins afterwards is cancelled

private:
    using Clock = std::chrono::steady_clock;
    using Lock = std::unique_lock<std::mutex>;
    using Task = std::shared_ptr<TransferTask>;
    class Lane;

    bool StartThreads(std::size_t tasks);
    void Work();
    Outcome Carry(Lane& lane, Task const& task);
    bool TakeSessionBack(TransferTask& task);
    void Finish(Task const& task, Outcome outcome, Lock& lock);
    void CutCancelled();
    void Cut(TransferTask& task, Lock& lock);
    void AskForAll();
    bool CutShort(TLogin session);
    void AskForProgress(Task const& task, TLogin session);
    void NoteProgress(TransferTask& task, long long done, long long total);

    std::function<bool()> const m_isLoggedIn;
    std::function<std::optional<TLogin>()> const m_getRecord;
    std::function<void(Event const&)> const m_publish;
    SharedManager m_cutter;  // ends sessions
    SharedManager m_asker;   // for questions about transfers

    mutable std::mutex m_lock;  // the members below
    std::deque<Task> m_waiting;
    std::vector<Task> m_running;
    std::condition_variable m_work, m_cut, m_ask, m_over;
    int m_busy = 0;  // workers that hold a session
    bool m_isStopped = false;
    std::vector<std::thread> m_threads;
};
}  // namespace comgui::detail
