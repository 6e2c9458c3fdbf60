#include "comgui/client/TransferPool.h"

#include "comgui/access/MTICKET_ADMIN.h"
#include "comgui/access/MTICKET_READ.h"
#include "comgui/session/TCommandRecord.h"
#include "comgui/session/TJobIdentification.h"
#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstdlib>
#include <sys/stat.h>
#include <system_error>

namespace comgui::detail
{
namespace
{
constexpr int Lanes = 4;
constexpr std::chrono::milliseconds ProgressInterval(100);
constexpr std::chrono::seconds RateSpan(3);

int NextNumber()
{
    static std::atomic<int> newest{0};
    return ++newest;
}

std::optional<long long> SizeOf(std::string const& path)
{
    struct stat found
    {
    };
    if (stat(path.c_str(), &found) != 0 || !S_ISREG(found.st_mode))
        return std::nullopt;
    return found.st_size;
}
}  // namespace

TransferTask::TransferTask(TransferPool& carrier, KIND itsKind, std::string from, std::string to,
                           JobOptions itsOptions)
    : pool(carrier.shared_from_this()), number(NextNumber()), kind(itsKind), source(std::move(from)),
      target(std::move(to)), options(std::move(itsOptions))
{
    if (kind != Get)
        progress.total = SizeOf(source);
}

// A worker's manager and session. For its thread.
class TransferPool::Lane
{
public:
    ~Lane() { Leave(); }

    // Logs in as the record says, unless a session is there. The record's local port makes it the same end
    // point.
    Outcome Enter(TLogin const& like)
    {
        if (!m_manager)
        {
            auto opened = OpenManager();
            if (!opened)
                return opened.GetError();
            m_manager = *std::move(opened);
            m_record = static_cast<TLogin*>(std::calloc(1, sizeof(TLogin)));
            if (!m_record)
                return Error{OutOfMemory, {}, {}};
        }
        if (m_isIn)
            return {};
        *m_record = like;
        m_record->hSession = nullptr;
        m_record->iGUINotificationID = -1;
        int const code = m_manager->Login(m_record);
        ForgetPassword(*m_record);  // it has served: each login gets a new record
        m_isIn = code == 0;
        return m_isIn ? Outcome() : FailureOf(*m_manager, code, m_record->szUser);
    }

    void Leave()
    {
        if (m_isIn)
            m_manager->Logout(m_record);
        m_isIn = false;
    }

    // Another has ended the session: its handle is worth nothing now, or stands for another session.
    void Lose() { m_isIn = false; }

    bool IsIn() const { return m_isIn; }
    TLogin const& Record() const { return *m_record; }

    // Error: the plug-in's.
    Result<int> Announce(TransferTask const& task)
    {
        if (Outcome const checked = Check(task.options); !checked)
            return checked.GetError();
        char command[] = "remote.job.prepare";
        TCommandRecord record{};
        record.nMagic = static_cast<unsigned int>(m_manager->GetEndian());
        record.nSize = sizeof record;
        record.iArgA = task.options.queue.value_or(-1);
        record.iArgC = task.options.copies.value_or(0);
        std::string const path = "$(JOB)/" + task.target;
        std::copy_n(path.data(), std::min(path.size(), sizeof record.szText2), record.szText2);
        if (int const code = m_manager->SendCommand(m_record, command, sizeof record, &record); code != 0)
            return FailureOf(*m_manager, code, task.source);
        if (record.iResult < 0)
            return FailureOf(*m_manager, CreateRefused, task.source);
        return record.iResult;
    }

    Outcome Carry(TransferTask const& task)
    {
        std::string source = task.source;
        std::string target = task.target;
        int code = 0;
        if (task.kind == TransferTask::Put)
            code = m_manager->PutFileSync(source.data(), target.data());
        else if (task.kind == TransferTask::Get)
            code = m_manager->GetFileSync(source.data(), target.data());
        else
        {
            char folder[] = "$(UPLOADJOB)";
            TJobIdentification job{};
            job.nSize = sizeof job;
            job.pszUploadFolder = folder;
            code = m_manager->SendJob(m_record, &job, source.data(), target.data());
        }
        return code == 0 ? Outcome() : FailureOf(*m_manager, code, task.source);
    }

private:
    // The plug-in drops a queue that is not there, and then the job is good.
    Outcome Check(JobOptions const& options) const
    {
        if (options.copies.value_or(1) < 1)
            return Error{OutOfRange, std::to_string(*options.copies), {}};
        if (!options.queue)
            return {};
        MTICKET_ACCESS const* const container = m_manager->GetClientContainer();
        if (!container)
            return Error{NoContainer, m_record->szUser, {}};
        if (!MTICKET_READ::Of(container)->OpenTicket(QueueTickets, *options.queue))
            return Error{
                NoSuchTicket, std::to_string(QueueTickets) + "/" + std::to_string(*options.queue), {}};
        MTICKET_ADMIN::Of(container)->CloseTicket(QueueTickets, *options.queue, false);
        return {};
    }

    std::unique_ptr<ComGUIManager> m_manager;
    TLogin* m_record = nullptr;  // the manager's since the first login
    bool m_isIn = false;
};

TransferPool::TransferPool(std::function<bool()> isLoggedIn, std::function<std::optional<TLogin>()> getRecord,
                           std::function<void(Event const&)> publish)
    : m_isLoggedIn(std::move(isLoggedIn)), m_getRecord(std::move(getRecord)), m_publish(std::move(publish))
{
}

TransferPool::~TransferPool() = default;

std::shared_ptr<TransferTask> TransferPool::Begin(TransferTask::KIND kind, std::string source,
                                                  std::string target, JobOptions options)
{
    auto task =
        std::make_shared<TransferTask>(*this, kind, std::move(source), std::move(target), std::move(options));
    bool const isLoggedIn = m_isLoggedIn();
    Lock lock(m_lock);
    if (m_isStopped || !isLoggedIn)
    {
        Finish(task, Error{NotLoggedIn, task->source, {}}, lock);
        return task;
    }
    if (!StartThreads(m_running.size() + m_waiting.size() + 1))
    {
        Finish(task, Error{OutOfMemory, task->source, {}}, lock);
        return task;
    }
    m_waiting.push_back(task);
    m_work.notify_one();
    return task;
}

// As many as so many tasks need, at most. Whether there is one that works: then all of them get their turn.
bool TransferPool::StartThreads(std::size_t tasks)
{
    constexpr std::size_t Others = 2;
    try
    {
        if (m_threads.empty())
            m_threads.emplace_back([this] { CutCancelled(); });
        if (m_threads.size() < Others)
            m_threads.emplace_back([this] { AskForAll(); });
        while (m_threads.size() < Others + std::min<std::size_t>(Lanes, tasks))
            m_threads.emplace_back([this] { Work(); });
    }
    catch (std::system_error const&)
    {
    }
    return m_threads.size() > Others;
}

void TransferPool::Work()
{
    Lane lane;
    Lock lock(m_lock);
    while (true)
    {
        if (m_waiting.empty() && lane.IsIn())
        {
            lock.unlock();
            lane.Leave();
            lock.lock();
            --m_busy;
            m_over.notify_all();
            continue;
        }
        m_work.wait(lock, [this] { return m_isStopped || !m_waiting.empty(); });
        if (m_waiting.empty())
            return;
        Task const task = m_waiting.front();
        m_waiting.pop_front();
        m_running.push_back(task);
        bool const wasIn = lane.IsIn();
        lock.unlock();
        Outcome outcome = Carry(lane, task);
        if (TakeSessionBack(*task))
            lane.Lose();
        else if (!outcome)
            lane.Leave();  // a prepared job that failed goes with its session
        auto const fetched = task->kind == TransferTask::Get && outcome ? SizeOf(task->target) : std::nullopt;
        lock.lock();
        if (fetched)
            task->progress.total = fetched;
        m_busy += (lane.IsIn() ? 1 : 0) - (wasIn ? 1 : 0);
        if (!outcome && task->isCancelled)
            outcome = Error{Cancelled, task->source, {}};
        Finish(task, std::move(outcome), lock);
    }
}

Outcome TransferPool::Carry(Lane& lane, Task const& task)
{
    auto record = m_getRecord();
    if (!record)
        return Error{Cancelled, task->source, {}};  // by the logout that has come in between
    Outcome entered = lane.Enter(*record);
    ForgetPassword(*record);
    if (!entered)
        return entered;
    {
        std::lock_guard const lock(m_lock);
        if (task->isCancelled)
            return Error{Cancelled, task->source, {}};
        task->session = lane.Record();
        m_ask.notify_all();
    }
    if (task->kind == TransferTask::Job)
    {
        Result<int> const job = lane.Announce(*task);
        if (!job)
            return job.GetError();
        std::lock_guard const lock(m_lock);
        task->job = *job;
    }
    return lane.Carry(*task);
}

// From now on the task's session is not cut any more. Waits for a cut that has begun, and says whether there
// was one: then nothing else may use the session, even if the transfer was faster.
bool TransferPool::TakeSessionBack(TransferTask& task)
{
    Lock lock(m_lock);
    m_over.wait(lock, [&task] { return !task.isBeingCut; });
    task.session.reset();
    return task.isCut;
}

// With the end of a transfer goes all that waits for it.
void TransferPool::Finish(Task const& task, Outcome outcome, Lock& lock)
{
    m_running.erase(std::remove(m_running.begin(), m_running.end(), task), m_running.end());
    m_waiting.erase(std::remove(m_waiting.begin(), m_waiting.end(), task), m_waiting.end());
    task->progress.rest.reset();
    if (outcome)
    {
        long long const size = task->progress.total.value_or(task->progress.done);
        task->progress.done = size;
        task->progress.total = size;
    }
    else
        task->job.reset();
    task->outcome = outcome;
    m_over.notify_all();
    m_cut.notify_all();
    TransferEnded const event{task->number, std::move(outcome), task->job};
    lock.unlock();
    m_publish(event);
    lock.lock();
}

void TransferPool::Cancel(TransferTask& task)
{
    Lock lock(m_lock);
    if (task.outcome || task.isCancelled)
        return;
    task.isCancelled = true;
    auto const waiting = std::find_if(m_waiting.begin(), m_waiting.end(),
                                      [&task](Task const& each) { return each.get() == &task; });
    if (waiting != m_waiting.end())
        Finish(Task(*waiting), Error{Cancelled, task.source, {}}, lock);
    m_cut.notify_all();
}

void TransferPool::CancelAll()
{
    for (Task const& task : Running())
        Cancel(*task);
}

void TransferPool::WaitForAll()
{
    Lock lock(m_lock);
    m_over.wait(lock, [this] { return m_running.empty() && m_waiting.empty() && m_busy == 0; });
}

void TransferPool::Stop()
{
    {
        std::lock_guard const lock(m_lock);
        m_isStopped = true;
    }
    CancelAll();
    m_work.notify_all();
    m_ask.notify_all();
    m_cut.notify_all();
    for (std::thread& thread : m_threads)
        thread.join();
    m_threads.clear();
}

std::vector<std::shared_ptr<TransferTask>> TransferPool::Running() const
{
    std::lock_guard const lock(m_lock);
    std::vector<Task> all = m_running;
    all.insert(all.end(), m_waiting.begin(), m_waiting.end());
    std::sort(all.begin(), all.end(),
              [](Task const& left, Task const& right) { return left->number < right->number; });
    return all;
}

std::optional<Outcome> TransferPool::WaitFor(TransferTask const& task,
                                             std::optional<std::chrono::milliseconds> time)
{
    Lock lock(m_lock);
    auto const isOver = [&task] { return task.outcome.has_value(); };
    if (time)
        m_over.wait_for(lock, *time, isOver);
    else
        m_over.wait(lock, isOver);
    return task.outcome;
}

// On a thread and with a manager of their own, so that they wait for no answer: the ends of those that are
// cancelled.
void TransferPool::CutCancelled()
{
    auto const isDue = [](Task const& task) { return task->isCancelled && task->session; };
    Lock lock(m_lock);
    while (true)
    {
        auto const due = std::find_if(m_running.begin(), m_running.end(), isDue);
        if (due != m_running.end())
            Cut(*Task(*due), lock);
        else if (m_isStopped && m_running.empty())
            return;
        else
            m_cut.wait(lock);
    }
}

void TransferPool::Cut(TransferTask& task, Lock& lock)
{
    TLogin const session = *task.session;
    task.session.reset();  // once is enough
    task.isBeingCut = true;
    lock.unlock();
    bool const isCut = CutShort(session);
    lock.lock();
    task.isBeingCut = false;
    task.isCut = isCut;
    m_over.notify_all();
}

// Another thread asks how far the others are.
void TransferPool::AskForAll()
{
    Lock lock(m_lock);
    while (true)
    {
        m_ask.wait(lock, [this] { return m_isStopped || !m_running.empty(); });
        for (Task const& task : std::vector<Task>(m_running))
        {
            if (!task->session || task->isCancelled)
                continue;
            TLogin const session = *task->session;
            lock.unlock();
            AskForProgress(task, session);
            lock.lock();
        }
        if (m_ask.wait_for(lock, ProgressInterval, [this] { return m_isStopped; }))
            return;
    }
}

bool TransferPool::CutShort(TLogin session)
{
    auto const code = m_cutter.With([&session](ComGUIManager& manager) { return manager.Logout(&session); });
    return code.operator bool();
}

// A plug-in that does not know the question leaves the progress as it is.
void TransferPool::AskForProgress(Task const& task, TLogin session)
{
    char command[] = "local.get.progress";
    long long done = 0;
    long long total = 0;
    auto const isKnown = m_asker.With(
        [&](ComGUIManager& manager)
        {
            ScratchTicket const answer;
            return answer && manager.SendCommand(&session, command, 0, answer.Address()) == 0 &&
                   answer.Get("Transfer/Done", done) && answer.Get("Transfer/Size", total);
        });
    if (!isKnown || !*isKnown)
        return;
    std::lock_guard const lock(m_lock);
    if (task->outcome || (done == task->progress.done && total == task->progress.total))
        return;
    NoteProgress(*task, done, total);
    m_publish(TransferProgressed{task->number, task->progress});  // under the lock: before the end
}

void TransferPool::NoteProgress(TransferTask& task, long long done, long long total)
{
    auto const now = Clock::now();
    task.samples.emplace_back(now, done);
    while (task.samples.size() > 2 && now - task.samples.front().first > RateSpan)
        task.samples.pop_front();
    TransferProgress& progress = task.progress;
    progress.done = done;
    progress.total = total;
    std::chrono::duration<double> const time = now - task.samples.front().first;
    if (time.count() > 0)
        progress.rate = static_cast<double>(done - task.samples.front().second) / time.count();
    progress.rest.reset();
    if (progress.rate > 0)
        progress.rest =
            std::chrono::seconds(std::llround(std::ceil(static_cast<double>(total - done) / progress.rate)));
}
}  // namespace comgui::detail
