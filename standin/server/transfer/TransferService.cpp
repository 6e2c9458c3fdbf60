#include "standin/server/transfer/TransferService.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/Report.h"
#include <algorithm>
#include <cerrno>
#include <fcntl.h>
#include <utility>

namespace standin
{
namespace
{
// A link stays a link, and what it points at is replaced.
std::filesystem::path Followed(std::filesystem::path const& file)
{
    std::error_code noLink;
    auto const target = std::filesystem::canonical(file, noLink);
    return noLink ? file : target;
}

Descriptor OpenClientFolder(std::filesystem::path const& folder)
{
    Descriptor opened(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (opened.Number() < 0)
        throw TransferError(TargetUnwritable, FileFault(folder, "cannot be opened", errno));
    return opened;
}

bool IsAt(double percent, off_t done, off_t size)
{
    return static_cast<double>(done) >= static_cast<double>(size) * percent / 100;
}

// It can be cut meanwhile.
void StandStill(std::chrono::milliseconds time, RunningTransfer const& running)
{
    constexpr std::chrono::milliseconds Pause(5);
    auto const end = std::chrono::steady_clock::now() + time;
    for (; std::chrono::steady_clock::now() < end; std::this_thread::sleep_for(Pause))
        running.Check();
}

std::string LeafOf(std::string const& path) { return path.substr(path.find_last_of("/\\") + 1); }
}  // namespace

void RunningTransfer::Check() const
{
    if (m_cut.load(std::memory_order_relaxed))
        throw TransferError(TransferCut, "");
}

void RunningTransfer::Begin(unsigned long long turn, off_t size)
{
    m_turn = turn;
    m_size = size;
}

TransferService::~TransferService()
{
    Stop(std::chrono::hours(1));
    if (m_thread.joinable())
        m_thread.join();
}

std::filesystem::path TransferService::ClientPath(std::string text)
{
    if (text.empty())
        throw TransferError(PathRefused, "the path of the local file is empty");
    std::replace(text.begin(), text.end(), '\\', '/');
    return std::filesystem::absolute(text);
}

// Of what is copied at a time an end lies where the transfer is to stand still.
std::size_t TransferService::PieceUpTo(Troubles::Standstill const& still, off_t size) const
{
    if (still.by.count() == 0)
        return m_pace.piece;
    auto const place = static_cast<std::size_t>(static_cast<double>(size) * still.at / 100);
    return std::clamp(place, std::size_t{1}, m_pace.piece);
}

// A server that is away takes nothing, and what it has lost it does not finish.
void TransferService::CheckServer(RunningTransfer const& running) const
{
    if (m_troubles.Any() && (m_troubles.IsAway() || m_troubles.HasLost(running.Session())))
        throw TransferError(TransferCut, "");
}

void TransferService::CheckRoom() const
{
    if (m_troubles.IsDiskFull())
        throw TransferError(TargetUnwritable,
                            "the server's disk is full: " + std::string(TroubleKey) + " says so");
}

void TransferService::Copy(PartFile& target, SourceFile const& source, RunningTransfer& running,
                           std::function<void(off_t done)> const& told)
{
    {
        std::lock_guard const lock(m_lock);
        running.Begin(++m_lastTurn, source.Size());
    }
    Troubles::Standstill still = m_troubles.OnTransfer();
    target.CopyFrom(source, PieceUpTo(still, source.Size()),
                    [&](off_t done)
                    {
                        running.Advance(done);
                        CheckServer(running);
                        if (still.by.count() > 0 && IsAt(still.at, done, source.Size()))
                            StandStill(std::exchange(still, {}).by, running);
                        if (m_pace.after)
                            m_pace.after();
                        running.Check();
                        if (told)
                            told(done);
                    });
}

// Gives the size of what it has carried.
off_t TransferService::CarryNow(Request const& request, RunningTransfer& running)
{
    running.Check();
    CheckServer(running);
    if (request.direction == Request::ToServer)
    {
        ServerPath const to = ServerPath::Parse(request.target, LeafOf(request.source));
        SourceFile const source(ClientPath(request.source));
        Descriptor const folder = OpenFolderOf(to, Folders(), Purpose::Write, m_site);
        CheckRoom();
        PartFile target(m_store, folder.Number(), to.name);
        Copy(target, source, running);
        target.Finish(m_survives);
        return source.Size();
    }
    ServerPath const from = ServerPath::Parse(request.source, "");
    Descriptor const folder = OpenFolderOf(from, Folders(), Purpose::Read, m_site);
    SourceFile const source(folder.Number(), from.name);
    std::filesystem::path file = ClientPath(request.target);
    file = Followed(file.has_filename() ? file : file / from.name);
    Descriptor const clientFolder = OpenClientFolder(file.parent_path());
    PartFile target(m_store, clientFolder.Number(), file.filename().string());
    Copy(target, source, running);
    target.Finish(m_survives);
    return source.Size();
}

TransferResult TransferService::Carry(Session const& session, Request const& request)
{
    return Run(session, [&](RunningTransfer& running) { CarryNow(request, running); });
}

std::optional<TransferService::Progress> TransferService::ProgressOf(Session const& session)
{
    std::lock_guard const lock(m_lock);
    RunningTransfer const* first = nullptr;
    for (RunningTransfer const& running : m_running)
    {
        bool const copies = running.Session() == session.Number() && running.Turn() != 0;
        if (copies && (!first || running.Turn() < first->Turn()))
            first = &running;
    }
    return first ? std::optional(Progress{first->Done(), first->Size()}) : std::nullopt;
}

TransferResult TransferService::Run(Session const& session,
                                    std::function<void(RunningTransfer& running)> const& work)
{
    Place place;
    {
        std::lock_guard const lock(m_lock);
        // Whoever ends a session does so before ending its transfers, so none can slip in behind.
        if (session.Ended() || m_stopped)
            return TransferCut;
        place = m_running.emplace(m_running.end(), session.Number());
    }
    return Finish(place, work);
}

TransferResult TransferService::Finish(Place running,
                                       std::function<void(RunningTransfer& running)> const& work)
{
    TransferResult result = Transferred;
    try
    {
        work(*running);
    }
    catch (TransferError const& error)
    {
        result = error.Result();
        if (*error.what())
            Report(error.what());
    }
    catch (std::exception const& error)
    {
        result = TransferFailed;
        Report(std::string("a transfer failed: ") + error.what());
    }
    std::lock_guard const lock(m_lock);
    m_running.erase(running);
    m_done.notify_all();
    return result;
}

TransferResult TransferService::CarryLater(Session const& session, Request request)
{
    Request const asked = request;
    bool const toServer = request.direction == Request::ToServer;
    TransferResult const result =
        Run(session,
            [&](RunningTransfer const&)
            {
                // The current folder may be another by then.
                std::string& local = toServer ? request.source : request.target;
                local = ClientPath(local).string();
                ServerPath const path = ServerPath::Parse(toServer ? request.target : request.source,
                                                          toServer ? LeafOf(request.source) : "");
                OpenFolderOf(path, Folders(), toServer ? Purpose::Write : Purpose::Read, m_site);
            });
    if (result != Transferred)
        return result;
    std::lock_guard const lock(m_lock);
    if (session.Ended() || m_stopped)
        return TransferCut;
    auto const isOurs = [&](Waiting const& each) { return each.session == session.Number(); };
    auto const waiting = static_cast<std::size_t>(std::count_if(m_waiting.begin(), m_waiting.end(), isOurs));
    if (waiting + m_notifications.UntoldEnds(session) >= MostWaiting)
        return TooManyTransfers;
    if (!m_thread.joinable())
        m_thread = std::thread([this] { Work(); });
    m_waiting.push_back({session.Number(), asked, std::move(request)});
    m_work.notify_one();
    return Transferred;
}

void TransferService::Work()
{
    Lock lock(m_lock);
    for (;;)
    {
        m_work.wait(lock, [this] { return m_stopped || !m_waiting.empty(); });
        if (m_stopped)
            return;
        Waiting const waiting = std::move(m_waiting.front());
        m_waiting.pop_front();
        Place const place = m_running.emplace(m_running.end(), waiting.session);
        lock.unlock();
        off_t size = 0;
        TransferResult const result =
            Finish(place, [&](RunningTransfer& running) { size = CarryNow(waiting.request, running); });
        if (result != TransferCut)  // then nobody is there to be told
            Tell(waiting, result, size);
        lock.lock();
    }
}

void TransferService::Tell(Waiting const& done, TransferResult result, off_t size)
{
    static KeyPool& keys = *new KeyPool;
    static Key const source = keys.Intern("Transfer/Source");
    static Key const target = keys.Intern("Transfer/Target");
    static Key const code = keys.Intern("Transfer/Code");
    static Key const bytes = keys.Intern(TransferSizeKey);
    try
    {
        ChangedParameters records;
        records.push_back({source, -1, TicketValue::String(done.asked.source)});
        records.push_back({target, -1, TicketValue::String(done.asked.target)});
        records.push_back({code, -1, TicketValue::Int(result)});
        records.push_back({bytes, -1, TicketValue::Int64(size)});
        m_notifications.TransferHasEnded(done.session, result, std::move(records));
    }
    catch (std::exception const& error)
    {
        Report(std::string("word of a transfer is lost: ") + error.what());
    }
}

bool TransferService::Runs(unsigned long long session) const
{
    return std::any_of(m_running.begin(), m_running.end(),
                       [session](RunningTransfer const& running) { return running.Session() == session; });
}

void TransferService::End(Session const& session)
{
    Lock lock(m_lock);
    std::erase_if(m_waiting, [&](Waiting const& waiting) { return waiting.session == session.Number(); });
    for (RunningTransfer& running : m_running)
        if (running.Session() == session.Number())
            running.Cut();
    m_done.wait(lock, [&] { return !Runs(session.Number()); });
}

void TransferService::Stop(std::chrono::milliseconds patience)
{
    Lock lock(m_lock);
    m_stopped = true;
    m_waiting.clear();
    m_work.notify_all();
    for (RunningTransfer& running : m_running)
        running.Cut();
    if (!m_done.wait_for(lock, patience, [this] { return m_running.empty(); }))
        return;
    std::thread ending = std::exchange(m_thread, {});
    lock.unlock();
    if (ending.joinable())
        ending.join();
}
}  // namespace standin
