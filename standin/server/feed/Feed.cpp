#include "standin/server/feed/Feed.h"

#include "standin/server/files/Report.h"
#include <algorithm>
#include <cassert>

namespace standin
{
namespace
{
// A program that dies between its commit and its ring is noticed after that time at the latest.
constexpr std::chrono::milliseconds SlowPoll(500);

using Values = std::vector<TicketCache::LoadedValue>;

std::optional<Store::Loaded> LoadFrom(Store& store, TicketAddress address, Values& values)
{
    return store.Load(address,
                      [&](std::string_view key, int pos, StoredValue const& value) {
                          values.push_back({std::string(key), pos, TicketValue::FromStored(value)});
                      });
}

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
}

void Feed::CatchUp() noexcept { CatchUp(m_committed.load(std::memory_order_acquire)); }

bool Feed::CatchUp(Sequence sequence) noexcept
{
    try
    {
        Lock lock(m_lock);
        while (m_heard.load(std::memory_order_relaxed) < sequence)
        {
            Sequence const before = m_heard.load(std::memory_order_relaxed);
            bool const isComing = m_isFetching || m_awaited == before + 1;
            if (isComing)
                m_progress.wait(lock);
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
    bool const isThere =
        m_store.ChangesSince(after, [&](CommittedChange&& change) { fetched.push_back(std::move(change)); });
    if (!isThere)
        return Rebuild(lock);
    lock.lock();
    for (CommittedChange& change : fetched)
    {
        if (change.program == m_store.Self() && m_onlyHere.contains(change.number))
            m_awaited = m_awaited ? std::min(m_awaited, change.sequence) : change.sequence;
        else
            m_ready.try_emplace(change.sequence, std::move(change));
    }
    MakeReady();
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
    ChangedParameters news = isWanted ? NewsOf(change) : ChangedParameters();
    bool const isLoaded = change.kind != TicketChange::Write || m_cache.Find(ticket);
    if (isWanted && !isLoaded)
        m_wanted.insert(ticket);
    m_cache.Make(change, committed.sequence);
    if (!isWanted)
        return;
    if (change.kind == TicketChange::Create)
        m_listener.Created(ticket);
    if (change.kind == TicketChange::Delete)
        m_listener.Deleted(ticket);
    else if (!news.empty())
        m_listener.Written(ticket, std::move(news));
}

ChangedParameters Feed::NewsOf(TicketChange const& change)
{
    ChangedParameters news;
    news.reserve(change.parameters.size());
    for (ParameterChange const& each : change.parameters)
        news.push_back({m_cache.Intern(each.key), each.pos, each.value.Copy()});
    return news;
}

bool Feed::Load(TicketAddress address)
{
    try
    {
        for (;;)
        {
            Values values;
            auto const loaded = LoadFrom(m_store, address, values);
            // What is published is never ahead of what was heard.
            if (!loaded || !CatchUp(loaded->sequence))
                return false;
            std::lock_guard const lock(m_lock);
            if (m_cache.Publish(address, loaded->state, values))
                return true;
        }
    }
    catch (StoreError const& error)
    {
        Report(error.what());
        return false;
    }
}

void Feed::Reload(TicketAddress address)
{
    Values values;
    auto const loaded = LoadFrom(m_store, address, values);
    if (loaded)
        CatchUp(loaded->sequence);
    std::lock_guard const lock(m_lock);
    bool const isOvertaken = loaded && m_cache.RevisionOf(address) > loaded->state.revision;
    if (isOvertaken)
        return;
    m_cache.Forget(address);
    if (!loaded)
        return;
    m_cache.Note(address, loaded->state);
    m_cache.Publish(address, loaded->state, values);
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
    for (Lock lock(m_lock); !m_isStopped;)
    {
        lock.unlock();
        bool works = true;
        try
        {
            m_store.WaitForChanges(Heard(), SlowPoll);
            CatchUp();
            LoadWanted();
            Epochs::Get().Collect();
        }
        catch (std::exception const& error)
        {
            works = false;
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
    if (!m_isOnlyHere)
        return;
    std::lock_guard const lock(m_feed.m_lock);
    m_feed.m_onlyHere.insert(m_number);
}

Feed::OwnChange::~OwnChange()
{
    if (!m_isOnlyHere)
        return;
    std::lock_guard const lock(m_feed.m_lock);
    if (m_feed.m_onlyHere.erase(m_number))
        m_feed.m_awaited = 0;  // then it comes from the journal
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
        if (outcome.sequence > m_feed.m_heard.load(std::memory_order_relaxed))
            m_feed.m_ready.insert_or_assign(
                outcome.sequence,
                CommittedChange{outcome.sequence, m_feed.m_store.Self(), m_number, std::move(m_change)});
        m_feed.m_onlyHere.erase(m_number);
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
