// The one road of every change of a site: from the store's journal, in the order of the commits, into this
// program's cache and to its listener, whoever made the change. A change of this program's own comes from the
// hand of its writer instead of the journal, but in its turn.
//
// For any thread. A thread of the feed's own waits for what other programs change. Its lock is held for work
// in memory only, never across a call of the store; the failures of the store that no caller hears of are
// reported on stderr once, until it works again.
#pragma once

#include "standin/server/feed/ChangeListener.h"
#include "standin/server/feed/TicketCache.h"
#include <condition_variable>
#include <map>
#include <optional>
#include <set>
#include <thread>

namespace standin
{
class Feed
{
public:
    // Reads which tickets there are. Store, listener and keeper outlive the feed. Throws StoreError.
    Feed(Store& store, ChangeListener& listener, TextKeeper& texts);
    ~Feed();
    Feed(Feed const&) = delete;
    Feed& operator=(Feed const&) = delete;

    // Ends the thread; changes still come when somebody reads.
    void Stop();

    // The cache, with everything in it that was acknowledged to anybody on this machine when this was
    // called. If the store fails, with what is known.
    TicketCache const& Fresh()
    {
        if (m_heard.load(std::memory_order_acquire) < m_committed.load(std::memory_order_acquire))
            [[unlikely]]
            CatchUp();
        return m_cache;
    }

    TextKeeper& Texts() { return m_cache.Texts(); }

    // Brings the parameters of a ticket into the cache. False if there is no such ticket, or if it cannot be
    // read. Not inside an Epochs::Guard.
    bool Load(TicketAddress address);

    // For a ticket whose cache contradicts the store although everything was heard: somebody has edited the
    // store by hand, past the journal. Takes over what is there, without the ticket's pointers; nobody is
    // notified. Throws StoreError.
    void Reload(TicketAddress address);

    // Everything up to that change is in the cache when this returns true. False if the store fails.
    bool CatchUp(Sequence sequence) noexcept;

    Sequence Heard() const { return m_heard.load(std::memory_order_acquire); }

    // Up to which change nothing of the journal will be needed again here: neither for the cache, nor for a
    // listener that has no room yet, nor for a change of this program whose outcome is being asked for.
    Sequence Settled();

    // A change that this program commits. Made before the commit; if it is not delivered by its end it comes
    // from the journal, if it was committed at all.
    class OwnChange
    {
    public:
        OwnChange(Feed& feed, TicketChange change);
        ~OwnChange();
        OwnChange(OwnChange const&) = delete;
        OwnChange& operator=(OwnChange const&) = delete;

        TicketChange const& Get() const { return m_change; }
        std::uint64_t Number() const { return m_number; }

        // Once it is committed: it is in the cache when this returns.
        void Deliver(CommitOutcome const& outcome) noexcept;

    private:
        Feed& m_feed;
        TicketChange m_change;
        std::uint64_t const m_number;
        bool const m_isOnlyHere;  // it has pointers, which no journal keeps
        std::multiset<Sequence>::iterator m_begun;
    };

private:
    using Lock = std::unique_lock<std::mutex>;

    bool CatchUp() noexcept;
    bool LoadOrReport(TicketAddress address);
    void Fetch(Lock& lock);
    bool ReadJournal(Sequence after, std::vector<CommittedChange>& fetched);
    void TakeFromJournal(std::vector<CommittedChange>& fetched);
    void MakeReady();
    void Make(CommittedChange& committed);
    using Values = std::vector<TicketCache::LoadedValue>;
    std::optional<Store::Loaded> Read(TicketAddress address, Values& values);
    ChangedParameters NewsOf(TicketChange const& change);
    void Tell(TicketChange::Kind kind, TicketAddress ticket, ChangedParameters&& news);
    bool TellMore();
    void TellFromJournal(CommittedChange const& committed);
    void GiveUpTelling() noexcept;
    void Listen();
    void LoadWanted();
    void Report(std::string const& line) noexcept;

    // When the journal begins behind what was heard.
    struct Listing;
    void Rebuild(Lock& lock);
    Listing List();
    void TakeOver(Listing& listing);
    ChangedParameters Difference(TicketSnapshot const* before, Values const& after);

    Store& m_store;
    ChangeListener& m_listener;
    std::atomic<Sequence> const& m_committed;  // the store's
    std::atomic<Sequence> m_heard{0};          // everything up to it is in the cache
    std::atomic<std::uint64_t> m_newestNumber{0};
    std::atomic<bool> m_hasReported{false};

    std::mutex m_lock;  // the members below
    TicketCache m_cache;
    std::map<Sequence, CommittedChange> m_ready;  // behind what was heard, perhaps with gaps
    std::set<std::uint64_t> m_onlyHere;           // numbers of own changes that only their writers can bring
    Sequence m_awaited = 0;                       // of such a one, which is next; 0: none
    std::multiset<Sequence> m_begunAt;            // what was heard when own changes on their way began
    std::optional<Sequence> m_told;  // the listener has no room: up to where it was told; the rest waits
    std::map<Sequence, ChangedParameters> m_pointersToTell;  // which no journal keeps
    std::map<TicketAddress, Sequence> m_toldAhead;  // by the last rebuilding: up to where it told of a ticket
    std::set<TicketAddress> m_wanted;               // have changed, and the listener was told; not loaded yet
    bool m_isFetching = false;
    std::condition_variable m_progress;
    bool m_isStopped = false;
    std::thread m_thread;
};
}  // namespace standin
