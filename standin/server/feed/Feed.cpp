#include "standin/server/feed/Feed.h"

#include "standin/server/files/NotCancelled.h"
#include "standin/server/files/RefusableCall.h"
#include "standin/server/files/Report.h"
#include <algorithm>
#include <cassert>

namespace standin
{
namespace
{
// A program that dies between its commit and its ring is noticed after that time at the latest.
constexpr std::chrono::milliseconds SlowPoll(500);

// To a listener that has no room.
constexpr std::chrono::milliseconds QuickPoll(5);

// Who waits for what another thread fetches finds out so often whether that can still come.
constexpr std::chrono::milliseconds LookForLoss(100);

bool HasPointers(TicketChange const& change)
{
    return std::any_of(change.parameters.begin(), change.parameters.end(),
                       [](ParameterChange const& each) { return each.value.type == PARAM_POINTER; });
}
}  // namespace

Feed::Feed(Store& store, ChangeListener& listener, TextKeeper& texts)
    : m_store(store), m_listener(listener), m_committed(store.Committed()), m_cache(texts)
{
    Epochs::Get();
    m_heard = store.Tickets([this](TicketAddress address, TicketState const& state)
                            { m_cache.Note(address, state); });
    m_thread = std::thread([this] { Listen(); });
}

Feed::~Feed() { Stop(); }

void Feed::Stop()
{
    {
        std::lock_guard const lock(m_lock);
        m_isStopped = true;
    }
    m_progress.notify_all();
    m_store.Interrupt();
    if (m_thread.joinable())
        m_thread.join();
}

void Feed::Report(std::string const& line) noexcept
{
    if (!m_hasReported.exchange(true))
        standin::Report(line);
    else
        RefusableCall::Note({line});
}

bool Feed::CatchUp() noexcept { return CatchUp(m_committed.load(std::memory_order_acquire)); }

bool Feed::CatchUp(Sequence sequence) noexcept
{
    NotCancelled const here;
    try
    {
        Lock lock(m_lock);
        while (m_heard.load(std::memory_order_relaxed) < sequence)
        {
            Sequence const before = m_heard.load(std::memory_order_relaxed);
            bool const isComing = m_isFetching || m_awaited == before + 1;
            if (isComing && !m_store.IsReachable())
                return false;
            if (isComing)
                m_progress.wait_for(lock, LookForLoss);
            else
                Fetch(lock);
            if (!isComing && m_awaited == 0 && m_heard.load(std::memory_order_relaxed) == before)
                return false;  // the store does not show what it has acknowledged
        }
        m_hasReported = false;
        return true;
    }
    catch (std::exception const& error)
    {
        Report(error.what());
        return false;
    }
}

// Brings more changes from the journal. One thread at a time does so, and the lock is open meanwhile.
void Feed::Fetch(Lock& lock)
{
    struct Fetching
    {
        Feed& feed;
        Lock& lock;

        ~Fetching()
        {
            if (!lock)
                lock.lock();
            feed.m_isFetching = false;
            feed.m_progress.notify_all();
        }
    };
    Sequence const after = m_heard.load(std::memory_order_relaxed);
    m_isFetching = true;
    Fetching const fetching{*this, lock};
    lock.unlock();
    std::vector<CommittedChange> fetched;
    if (!ReadJournal(after, fetched))
        return Rebuild(lock);
    lock.lock();
    TakeFromJournal(fetched);
    MakeReady();
}

// False if the journal cannot tell what is behind that change, and never will.
bool Feed::ReadJournal(Sequence after, std::vector<CommittedChange>& fetched)
{
    try
    {
        return m_store.ChangesSince(after,
                                    [&](CommittedChange&& change) { fetched.push_back(std::move(change)); });
    }
    catch (BrokenJournal const& broken)
    {
        standin::Report(broken.what());
        return false;
    }
}

void Feed::TakeFromJournal(std::vector<CommittedChange>& fetched)
{
    for (CommittedChange& change : fetched)
    {
        if (change.program == m_store.Self() && m_onlyHere.contains(change.number))
            m_awaited = m_awaited ? std::min(m_awaited, change.sequence) : change.sequence;
        else
            m_ready.try_emplace(change.sequence, std::move(change));
    }
}

// Makes what is there without a gap.
void Feed::MakeReady()
{
    while (!m_ready.empty())
    {
        auto const next = m_ready.begin();
        Sequence const heard = m_heard.load(std::memory_order_relaxed);
        if (next->first > heard + 1)
            break;
        if (next->first == heard + 1)
        {
            Make(next->second);
            m_heard.store(heard + 1, std::memory_order_release);
        }
        m_ready.erase(next);
    }
    if (m_awaited <= m_heard.load(std::memory_order_relaxed))
        m_awaited = 0;
}

void Feed::Make(CommittedChange& committed)
{
    TicketChange& change = committed.change;
    TicketAddress const ticket = change.address;
    if (committed.sequence <= m_cache.RevisionOf(ticket))
        return;  // a rebuilding has seen more of this ticket than of others, and told of it
    bool const isWanted = m_listener.Wants(ticket);
    if (isWanted && !m_told && !m_listener.HasRoom())
        m_told = committed.sequence - 1;
    bool const isNewsOnlyHere = m_told && HasPointers(change);
    bool const isNoticed = m_listener.Notices(ticket);
    bool const isNews = isNoticed || (isWanted && (!m_told || isNewsOnlyHere));
    ChangedParameters news = isNews ? NewsOf(change) : ChangedParameters();
    if (isNoticed)
        m_listener.Noticed(ticket, news);
    bool const isLoaded = change.kind != TicketChange::Write || m_cache.Find(ticket);
    if (isWanted && !isLoaded)
        m_wanted.insert(ticket);
    m_cache.Make(change, committed.sequence);
    if (isWanted && !m_told)
        Tell(change.kind, ticket, std::move(news));
    else if (isWanted && isNewsOnlyHere)
        m_pointersToTell.emplace(committed.sequence, std::move(news));
}

void Feed::Tell(TicketChange::Kind kind, TicketAddress ticket, ChangedParameters&& news)
{
    if (kind == TicketChange::Create)
        m_listener.Created(ticket);
    if (kind == TicketChange::Delete)
        m_listener.Deleted(ticket);
    else if (!news.empty())
        m_listener.Written(ticket, std::move(news));
}

// Tells a listener that had no room what has come meanwhile, as far as it has room now. True if there is
// more.
bool Feed::TellMore()
{
    for (;;)
    {
        std::optional<Sequence> told;
        {
            std::lock_guard const lock(m_lock);
            told = m_told;
        }
        if (!told || !m_listener.HasRoom())
            return told.has_value();
        std::vector<CommittedChange> fetched;
        bool const isThere = ReadJournal(*told, fetched);
        std::lock_guard const lock(m_lock);
        if (m_told != told)
            continue;  // a rebuilding has told the rest
        if (!isThere)
            GiveUpTelling();
        for (auto change = fetched.begin(); change != fetched.end() && m_listener.HasRoom(); ++change)
        {
            if (change->sequence > m_heard.load(std::memory_order_relaxed))
                break;
            TellFromJournal(*change);
            m_told = change->sequence;
        }
        if (m_told == m_heard.load(std::memory_order_relaxed))
        {
            m_told.reset();
            m_pointersToTell.clear();
        }
        if (fetched.empty())
            return m_told.has_value();
    }
}

void Feed::TellFromJournal(CommittedChange const& committed)
{
    TicketAddress const ticket = committed.change.address;
    auto const ahead = m_toldAhead.find(ticket);
    bool const isTold = ahead != m_toldAhead.end() && committed.sequence <= ahead->second;
    if (isTold || !m_listener.Wants(ticket))
        return;
    auto const pointers = m_pointersToTell.find(committed.sequence);
    Tell(committed.change.kind, ticket,
         pointers != m_pointersToTell.end() ? std::move(pointers->second) : NewsOf(committed.change));
}

void Feed::GiveUpTelling() noexcept
{
    if (m_told)
        standin::Report("clients of this program are too slow, and the journal no longer has what they were "
                        "not told yet; they should read their tickets anew");
    m_told.reset();
    m_pointersToTell.clear();
}

Sequence Feed::Settled()
{
    std::lock_guard const lock(m_lock);
    Sequence settled = m_heard.load(std::memory_order_relaxed);
    if (m_told)
        settled = std::min(settled, *m_told);
    return m_begunAt.empty() ? settled : std::min(settled, *m_begunAt.begin());
}

ChangedParameters Feed::NewsOf(TicketChange const& change)
{
    ChangedParameters news;
    news.reserve(change.parameters.size());
    for (ParameterChange const& each : change.parameters)
        news.push_back({m_cache.Intern(each.key), each.pos, each.value.Copy()});
    return news;
}

std::optional<Store::Loaded> Feed::Read(TicketAddress address, Values& values)
{
    return m_store.Load(address,
                        [&](std::string_view key, int pos, StoredValue const& value) {
                            values.push_back({std::string(key), pos, TicketValue::FromStored(value)});
                        });
}

bool Feed::Load(TicketAddress address)
{
    NotCancelled const here;
    RefusableRead read;
    if (LoadOrReport(address))
        return true;
    read.Refuse();
    return false;
}

bool Feed::LoadOrReport(TicketAddress address)
{
    try
    {
        for (;;)
        {
            Values values;
            auto const loaded = Read(address, values);
            // What is published is never ahead of what was heard.
            if (!loaded || !CatchUp(loaded->sequence))
                return false;
            {
                std::lock_guard const lock(m_lock);
                if (m_cache.Publish(address, loaded->state, values))
                    return true;
                bool const hasChanged = m_cache.RevisionOf(address) > loaded->sequence;
                if (hasChanged)
                    continue;
            }
            Reload(address);  // no change explains it, or the ticket is gone
            return m_cache.IncarnationOf(address) != 0;
        }
    }
    catch (StoreError const& error)
    {
        Report(error.what());
        return false;
    }
}

// A ticket that is there is never hidden from the readers, who take no lock.
void Feed::Reload(TicketAddress address)
{
    for (;;)
    {
        Sequence const before = m_committed.load(std::memory_order_acquire);
        Values values;
        auto const loaded = Read(address, values);
        Sequence const seen = loaded ? loaded->sequence : before;
        bool const isHeard = CatchUp(seen);
        std::lock_guard const lock(m_lock);
        bool const isOvertaken = m_heard.load(std::memory_order_relaxed) > seen;
        if (isOvertaken)
            continue;
        if (!loaded)
            return m_cache.Forget(address);
        if (!isHeard)
            return;
        m_cache.Note(address, loaded->state);
        m_cache.Publish(address, loaded->state, values);
        return;
    }
}

void Feed::LoadWanted()
{
    std::set<TicketAddress> wanted;
    {
        std::lock_guard const lock(m_lock);
        wanted.swap(m_wanted);
    }
    for (TicketAddress const address : wanted)
        Load(address);
}

void Feed::Listen()
{
    bool hasMore = false;
    for (Lock lock(m_lock); !m_isStopped;)
    {
        lock.unlock();
        bool works = false;
        try
        {
            m_store.WaitForChanges(Heard(), hasMore ? QuickPoll : SlowPoll);
            works = CatchUp();
            hasMore = TellMore();
            LoadWanted();
            Epochs::Get().Collect();
        }
        catch (std::exception const& error)
        {
            Report(error.what());
        }
        lock.lock();
        if (!works)
            m_progress.wait_for(lock, SlowPoll, [this] { return m_isStopped; });
    }
}

Feed::OwnChange::OwnChange(Feed& feed, TicketChange change)
    : m_feed(feed), m_change(std::move(change)), m_number(++feed.m_newestNumber),
      m_isOnlyHere(HasPointers(m_change))
{
    std::lock_guard const lock(m_feed.m_lock);
    if (m_isOnlyHere)
        m_feed.m_onlyHere.insert(m_number);
    m_begun = m_feed.m_begunAt.insert(m_feed.m_heard.load(std::memory_order_relaxed));
}

Feed::OwnChange::~OwnChange()
{
    std::lock_guard const lock(m_feed.m_lock);
    m_feed.m_begunAt.erase(m_begun);
    if (!m_isOnlyHere)
        return;
    m_feed.m_onlyHere.erase(m_number);
    m_feed.m_awaited = 0;  // if it was not delivered it comes from the journal
    m_feed.m_progress.notify_all();
}

void Feed::OwnChange::Deliver(CommitOutcome const& outcome) noexcept
{
    m_change.address = outcome.address;
    if (m_change.kind == TicketChange::Create)
        m_change.incarnation = outcome.sequence;
    try
    {
        std::lock_guard const lock(m_feed.m_lock);
        m_feed.m_onlyHere.erase(m_number);  // first: if there is no memory for it, it comes from the journal
        if (outcome.sequence > m_feed.m_heard.load(std::memory_order_relaxed))
            m_feed.m_ready.insert_or_assign(
                outcome.sequence,
                CommittedChange{outcome.sequence, m_feed.m_store.Self(), m_number, std::move(m_change)});
        m_feed.MakeReady();
    }
    catch (std::exception const& error)
    {
        m_feed.Report(error.what());  // the change is safe, and readers come by it later
    }
    m_feed.m_progress.notify_all();
    m_feed.CatchUp(outcome.sequence);
}
}  // namespace standin
