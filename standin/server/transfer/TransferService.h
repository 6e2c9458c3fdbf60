// Brings files to the server and fetches them. Each call works on the thread of its caller; those that are
// left for later come one after another on one thread of the service's own. For any thread; no lock is held
// while a file is copied. A failure is one line on stderr.
//
// A path of the client's side is UTF-8; backslashes in it are separators, as in the paths of ticket files.
#pragma once

#include "standin/server/sessions/NotificationService.h"
#include "standin/server/sessions/TicketService.h"
#include "standin/server/transfer/PartFile.h"
#include "standin/server/transfer/ServerPath.h"
#include "standin/server/transfer/TransferError.h"
#include "standin/server/trouble/Troubles.h"
#include <chrono>
#include <condition_variable>
#include <deque>
#include <list>
#include <optional>
#include <thread>

namespace standin
{
inline constexpr char TransferSizeKey[] = "Transfer/Size";  // an int64, in bytes

// A transfer on its way, which may be cut from outside.
class RunningTransfer
{
public:
    explicit RunningTransfer(unsigned long long session) : m_session(session) {}

    unsigned long long Session() const { return m_session; }
    void Cut() { m_cut.store(true, std::memory_order_relaxed); }
    void Check() const;  // throws TransferError once it has been cut

    // How far it is, in bytes; any thread may look. turn: in the order in which copying begins, 1 and up.
    void Begin(unsigned long long turn, off_t size);
    void Advance(off_t done) { m_done.store(done, std::memory_order_relaxed); }
    unsigned long long Turn() const { return m_turn; }  // 0 before it copies
    off_t Done() const { return m_done.load(std::memory_order_relaxed); }
    off_t Size() const { return m_size; }

private:
    unsigned long long const m_session;
    std::atomic<bool> m_cut{false};
    std::atomic<off_t> m_done{0};
    unsigned long long m_turn = 0;  // these two are under the lock of the service
    off_t m_size = 0;
};

class TransferService
{
public:
    static constexpr std::size_t MostWaiting = 1000;  // of one session, with those whose ends wait to be told

    // site: its folder, where nothing is put nor fetched, whatever the system ticket has for $(INSTALL).
    TransferService(Store& store, TicketService& tickets, NotificationService& notifications,
                    std::filesystem::path const& site, Troubles& troubles = Troubles::None())
        : m_store(store), m_tickets(tickets), m_notifications(notifications), m_troubles(troubles),
          m_site(site)
    {
    }
    ~TransferService();  // cuts what runs
    TransferService(TransferService const&) = delete;
    TransferService& operator=(TransferService const&) = delete;

    struct Request
    {
        enum Direction
        {
            ToServer,
            ToClient,
        };
        Direction direction;
        std::string source;
        std::string target;
    };

    // A target that ends in a separator, or is a variable alone, is a folder, and the source gives the name.
    TransferResult Carry(Session const& session, Request const& request);

    // The same later, and told to the session as TransferEnded with the strings "Transfer/Source" and
    // "Transfer/Target" as they came, the int "Transfer/Code" and the int64 "Transfer/Size" in bytes. What is
    // wrong with the paths themselves, and an ended session, is told at once; so are too many.
    TransferResult CarryLater(Session const& session, Request request);

    // Of the transfer that copies for the session now; of several, the one that began first. Nothing if none
    // does: what waits, or is only looked at yet, does not count. Waits for no transfer.
    struct Progress
    {
        off_t done;  // at most size, and never less than before
        off_t size;
    };
    std::optional<Progress> ProgressOf(Session const& session);

    // Runs a transfer of any kind in such a way that it can be cut, and answers how it ended.
    TransferResult Run(Session const& session, std::function<void(RunningTransfer& running)> const& work);

    // For an ended session: takes back what waits, cuts what runs and waits for its end.
    void End(Session const& session);

    // The same for all sessions, and for good, but waits no longer than told.
    void Stop(std::chrono::milliseconds patience);

    // How much is copied at a time, and what is called after each piece: tests hold transfers up there. Not
    // while one runs.
    struct Pace
    {
        std::size_t piece = std::size_t{1024} * 1024;
        std::function<void()> after{};
    };
    void Set(Pace pace) { m_pace = std::move(pace); }

    // What carried files outlast; the end of the process unless told otherwise. Not while one runs.
    void Set(PartFile::Survives what) { m_survives = what; }

    // Before something is written to the server's disk. Throws TransferError where that is said to be full.
    void CheckRoom() const;

    // What the transfer calls after a piece: checks for a cut, then told.
    void Copy(PartFile& target, SourceFile const& source, RunningTransfer& running,
              std::function<void(off_t done)> const& told = {});

    static std::filesystem::path ClientPath(std::string text);  // absolute. Throws TransferError

private:
    struct Waiting
    {
        unsigned long long session;
        Request asked;
        Request request;  // with the client's path as it was meant when it was asked for
    };
    using Lock = std::unique_lock<std::mutex>;
    using Place = std::list<RunningTransfer>::iterator;

    std::size_t PieceUpTo(Troubles::Standstill const& still, off_t size) const;
    void CheckServer(RunningTransfer const& running) const;
    off_t CarryNow(Request const& request, RunningTransfer& running);
    TransferResult Finish(Place running, std::function<void(RunningTransfer& running)> const& work);
    bool Runs(unsigned long long session) const;
    void Work();
    void Tell(Waiting const& done, TransferResult result, off_t size);

    FolderTable Folders() { return FolderTable(m_tickets.Folders().values); }

    Store& m_store;
    TicketService& m_tickets;
    NotificationService& m_notifications;
    Troubles& m_troubles;
    std::string const m_site;
    Pace m_pace;
    PartFile::Survives m_survives = PartFile::Survives::EndOfProcess;

    std::mutex m_lock;  // the members below
    std::list<RunningTransfer> m_running;
    unsigned long long m_lastTurn = 0;
    std::deque<Waiting> m_waiting;
    std::condition_variable m_work;
    std::condition_variable m_done;
    bool m_stopped = false;
    std::thread m_thread;  // begun when something first waits
};
}  // namespace standin
