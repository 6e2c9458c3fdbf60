#include "standin/server/store/memory/MemoryStore.h"

#include "standin/server/store/ChangeRecord.h"
#include <algorithm>
#include <ctime>
#include <stdexcept>
#include <unistd.h>

namespace standin
{
namespace
{
// The site whose values this thread is being handed out, if any.
thread_local MemorySite const* handingOut = nullptr;

class HandingOut
{
public:
    explicit HandingOut(MemorySite const* site) { handingOut = site; }
    ~HandingOut() { handingOut = nullptr; }
    HandingOut(HandingOut const&) = delete;
    HandingOut& operator=(HandingOut const&) = delete;
};

StoredValue WithBytes(StoredValue value, std::string const& bytes)
{
    value.bytes = bytes;
    return value;
}
}  // namespace

MemorySite::MemorySite(StoreLimits const& limits) : m_limits(limits) {}

void MemorySite::AddTicket(TicketAddress address)
{
    TicketChange change;
    change.kind = TicketChange::Create;
    change.address = address;
    std::lock_guard const lock(m_mutex);
    Make(change, 0, 0);
}

void MemorySite::Put(TicketAddress address, std::string_view key, int pos, StoredValue const& value)
{
    AddTicket(address);
    TicketChange change;
    change.address = address;
    change.parameters.push_back({std::string(key), pos, TicketValue::FromStored(value)});
    std::lock_guard const lock(m_mutex);
    change.incarnation = m_tickets.at(address).state.incarnation;
    change.revision = m_tickets.at(address).state.revision;
    Make(change, 0, 0);
}

void MemorySite::PutUser(User const& user)
{
    std::lock_guard const lock(m_mutex);
    m_users[user.name] = user;
}

void MemorySite::FailAll(bool fail)
{
    std::lock_guard const lock(m_mutex);
    m_failAll = fail;
    m_hasFailed = false;
}

void MemorySite::FailOperation(int which)
{
    std::lock_guard const lock(m_mutex);
    m_failIn = which;
    m_hasFailed = false;
}

void MemorySite::Fail(char const* operation, bool fail)
{
    std::lock_guard const lock(m_mutex);
    if (fail)
        m_failing.insert(operation);
    else
        m_failing.erase(operation);
}

void MemorySite::BreakJournal()
{
    std::lock_guard const lock(m_mutex);
    m_journal.back().bytes = "no record";
}

void MemorySite::AnswerUnknownOnce(bool andCommit)
{
    std::lock_guard const lock(m_mutex);
    m_unknown = andCommit ? Unknown::AndCommitted : Unknown::AndNotCommitted;
    m_hasFailed = false;
}

bool MemorySite::HasFailed() const
{
    std::lock_guard const lock(m_mutex);
    return m_hasFailed;
}

void MemorySite::Interject(std::function<void()> action)
{
    std::lock_guard const lock(m_mutex);
    m_interjection = std::move(action);
}

void MemorySite::InterjectBehind(std::function<void()> action)
{
    std::lock_guard const lock(m_mutex);
    m_interjectionBehind = std::move(action);
}

int MemorySite::Looks() const
{
    std::lock_guard const lock(m_mutex);
    return m_looks;
}

int MemorySite::Loads() const
{
    std::lock_guard const lock(m_mutex);
    return m_loads;
}

int MemorySite::Commits() const
{
    std::lock_guard const lock(m_mutex);
    return m_commits;
}

void MemorySite::MayFail(char const* operation)
{
    bool const isDue = m_failIn > 0 && --m_failIn == 0;
    if (!m_failAll && !isDue && !m_failing.contains(operation))
        return;
    m_hasFailed = true;
    throw StoreError(std::string("the site in memory: ") + operation + " was told to fail; tell it not to");
}

// LargestId is the last resort: with it in use there is nothing above, and the smallest free id is due. -1:
// there is none.
int MemorySite::FreeId(TicketChange const& change) const
{
    int const type = change.address.type;
    auto const behind = m_tickets.lower_bound({type + 1, 0});
    bool const isFirst = behind == m_tickets.begin() || std::prev(behind)->first.type != type;
    int const largest = std::max(isFirst ? 0 : std::prev(behind)->first.id, change.aboveId);
    if (largest < m_limits.largestId)
        return largest + 1;
    int free = 0;
    for (auto ticket = m_tickets.lower_bound({type, 0}); ticket != behind && ticket->first.id == free;
         ++ticket)
        ++free;
    return free <= m_limits.largestId ? free : -1;
}

Sequence MemorySite::Append(Record record)
{
    m_journal.push_back(std::move(record));
    Sequence const sequence = m_committed.load() + 1;
    m_committed.store(sequence);
    m_bell.notify_all();
    return sequence;
}

CommitOutcome MemorySite::Make(TicketChange const& change, ProgramId program, std::uint64_t number)
{
    Sequence const next = m_committed.load() + 1;
    TicketAddress address = change.address;
    for (TicketChange::Basis const& other : change.others)
    {
        auto const found = m_tickets.find(other.address);
        if (found == m_tickets.end() || found->second.state.incarnation != other.incarnation ||
            found->second.state.revision != other.revision)
            return {CommitOutcome::Conflict, next - 1, address};
    }
    Record record{program, number, change.kind, address, {}};
    AppendChangeRecord(record.bytes, change);

    Ticket ticket;
    if (change.kind == TicketChange::Create)
    {
        if (address.id == TicketChange::NextId)
            address.id = FreeId(change);
        if (change.address.id == TicketChange::NextId && address.id < 0)
            return {CommitOutcome::NoFreeId, next - 1, change.address};
        if (!IsValid(address))
            throw StoreError("the site in memory: no ticket can have the address " +
                             std::to_string(address.type) + "/" + std::to_string(address.id) +
                             "; choose another");
        if (m_tickets.contains(address))
            return {CommitOutcome::Conflict, next - 1, address};
        ticket.state.incarnation = next;
    }
    else
    {
        auto const found = m_tickets.find(address);
        bool const anyRevision =
            change.kind == TicketChange::Delete && change.revision == TicketChange::AnyRevision;
        if (found == m_tickets.end() || found->second.state.incarnation != change.incarnation ||
            (!anyRevision && found->second.state.revision != change.revision))
            return {CommitOutcome::Conflict, next - 1, address};
        ticket = found->second;  // changed as a copy: nothing of a failed operation takes effect
    }

    for (ParameterChange const& parameter : change.parameters)
    {
        bool const isDeletion = parameter.value.type == PARAM_NONE || parameter.value.type == PARAM_POINTER;
        if (parameter.pos == -1 && (isDeletion || parameter.hadOthers))
            std::erase_if(ticket.values,
                          [&parameter](auto const& entry) { return entry.first.first == parameter.key; });
        std::pair const place(parameter.key, std::max(parameter.pos, 0));
        ticket.values.erase(place);
        if (isDeletion)
            continue;
        StoredValue const value = parameter.value.ToStored();
        ticket.values[place] = {WithBytes(value, {}), std::string(value.bytes)};
    }
    ticket.state.revision = next;
    if (change.owner != TicketChange::Owner::Unchanged)
        ticket.owner = change.owner == TicketChange::Owner::ThisProgram ? program : 0;

    record.address = address;
    if (change.kind == TicketChange::Delete)
        m_tickets.erase(address);
    else
        m_tickets[address] = std::move(ticket);
    return {CommitOutcome::Committed, Append(std::move(record)), address};
}

bool MemorySite::IsBeingBuried(Program const& program) const
{
    auto const digger = m_programs.find(program.buriedBy);
    return digger != m_programs.end() && digger->second.info.isAlive;
}

MemoryStore::MemoryStore(std::shared_ptr<MemorySite> site, std::string const& name) : m_site(std::move(site))
{
    std::lock_guard const lock(m_site->m_mutex);
    m_site->MayFail("opening");
    m_self = ++m_site->m_lastProgram;
    ProgramInfo info;
    info.id = m_self;
    info.process = getpid();
    info.machine = "memory";
    info.name = name;
    info.since = std::time(nullptr);
    info.heard = m_site->m_committed;
    info.isAlive = true;
    m_site->m_programs[m_self] = {info};
}

MemoryStore::~MemoryStore() { Die(); }

void MemoryStore::Die()
{
    std::lock_guard const lock(m_site->m_mutex);
    auto const self = m_site->m_programs.find(m_self);
    if (self != m_site->m_programs.end())
        self->second.info.isAlive = false;
    m_hasLeft = true;
}

std::unique_lock<std::mutex> MemoryStore::Begin(char const* operation)
{
    if (handingOut == m_site.get())
        throw std::logic_error("a function that takes values uses the store that hands them out");
    std::unique_lock lock(m_site->m_mutex);
    if (m_hasLeft)
        throw UnusableStore("the site in memory: this program has ended; open it anew");
    m_site->MayFail(operation);
    return lock;
}

CommitOutcome MemoryStore::Commit(TicketChange const& change, std::uint64_t number)
{
    auto lock = Begin("Commit");
    if (auto const interjection = std::exchange(m_site->m_interjection, nullptr))
    {
        lock.unlock();
        interjection();
        lock.lock();
    }
    auto const unknown = std::exchange(m_site->m_unknown, MemorySite::Unknown::No);
    m_site->m_hasFailed = m_site->m_hasFailed || unknown != MemorySite::Unknown::No;
    if (unknown == MemorySite::Unknown::AndNotCommitted)
        return {};
    CommitOutcome const outcome = m_site->Make(change, m_self, number);
    m_site->m_commits += outcome.kind == CommitOutcome::Committed ? 1 : 0;
    if (auto const interjection = std::exchange(m_site->m_interjectionBehind, nullptr))
    {
        lock.unlock();
        interjection();
    }
    return unknown == MemorySite::Unknown::No ? outcome : CommitOutcome();
}

std::optional<CommitOutcome> MemoryStore::FindCommit(std::uint64_t number)
{
    auto const lock = Begin("FindCommit");
    auto const& journal = m_site->m_journal;
    auto const found = std::find_if(journal.rbegin(), journal.rend(),
                                    [&](MemorySite::Record const& record)
                                    { return record.program == m_self && record.number == number; });
    if (found == journal.rend())
        return std::nullopt;
    auto const place = static_cast<Sequence>(journal.rend() - found);
    return CommitOutcome{CommitOutcome::Committed, m_site->m_pruned + place, found->address};
}

void MemoryStore::Sync() { Begin("Sync"); }

std::atomic<Sequence> const& MemoryStore::Committed() const noexcept { return m_site->m_committed; }

Sequence MemoryStore::Tickets(std::function<void(TicketAddress, TicketState const&)> const& take)
{
    std::vector<std::pair<TicketAddress, TicketState>> tickets;
    auto lock = Begin("Tickets");
    tickets.reserve(m_site->m_tickets.size());
    for (auto const& [address, ticket] : m_site->m_tickets)
        tickets.emplace_back(address, ticket.state);
    Sequence const sequence = m_site->m_committed;
    lock.unlock();
    HandingOut const handing(m_site.get());
    for (auto const& [address, state] : tickets)
        take(address, state);
    return sequence;
}

std::optional<Store::Loaded>
MemoryStore::Load(TicketAddress address,
                  std::function<void(std::string_view key, int pos, StoredValue const& value)> const& take)
{
    auto lock = Begin("Load");
    ++m_site->m_loads;
    auto const found = m_site->m_tickets.find(address);
    if (found == m_site->m_tickets.end())
        return std::nullopt;
    Loaded const loaded{found->second.state, m_site->m_committed};
    MemorySite::Values const values = found->second.values;
    lock.unlock();
    HandingOut const handing(m_site.get());
    for (auto const& [place, stored] : values)
        take(place.first, place.second, WithBytes(stored.value, stored.bytes));
    return loaded;
}

bool MemoryStore::ChangesSince(Sequence after, std::function<void(CommittedChange&&)> const& take)
{
    std::vector<CommittedChange> changes;
    ++m_site->m_looks;
    auto lock = Begin("ChangesSince");
    if (after < m_site->m_pruned)
        return false;
    Sequence const end = std::min(m_site->m_committed.load(), after + m_site->m_limits.feedLargest);
    for (Sequence sequence = after + 1; sequence <= end; ++sequence)
    {
        MemorySite::Record const& record =
            m_site->m_journal[static_cast<std::size_t>(sequence - m_site->m_pruned - 1)];
        CommittedChange change{sequence, record.program, record.number, {}};
        try
        {
            change.change = ReadChangeRecord(record.kind, record.address, record.bytes);
        }
        catch (StoreError const& error)
        {
            throw BrokenJournal(std::string("the site in memory: ") + error.what());
        }
        if (record.kind == TicketChange::Create)
            change.change.incarnation = change.change.revision = sequence;
        changes.push_back(std::move(change));
    }
    lock.unlock();
    for (CommittedChange& change : changes)
        take(std::move(change));
    return true;
}

void MemoryStore::WaitForChanges(Sequence heard, std::chrono::milliseconds time)
{
    auto lock = Begin("WaitForChanges");
    m_site->m_bell.wait_for(lock, time, [&] { return m_isInterrupted || m_site->m_committed > heard; });
    m_isInterrupted = false;
}

void MemoryStore::Interrupt() noexcept
{
    std::lock_guard const lock(m_site->m_mutex);
    m_isInterrupted = true;
    m_site->m_bell.notify_all();
}

void MemoryStore::Maintain(Sequence heard)
{
    auto const lock = Begin("Maintain");
    m_site->m_programs.at(m_self).info.heard = heard;
    Sequence upTo = heard;
    for (auto const& [id, program] : m_site->m_programs)
        if (program.info.isAlive)
            upTo = std::min(upTo, program.info.heard);
    Sequence const last = m_site->m_committed;
    StoreLimits const& limits = m_site->m_limits;
    upTo = std::min(upTo, last - std::min(last, limits.journalKept));
    upTo = std::max(upTo, last - std::min(last, limits.journalLargest));
    for (; m_site->m_pruned < upTo; ++m_site->m_pruned)
        m_site->m_journal.pop_front();
}

ProgramId MemoryStore::Self() const noexcept { return m_self; }

std::vector<ProgramInfo> MemoryStore::Programs()
{
    auto const lock = Begin("Programs");
    std::vector<ProgramInfo> programs;
    for (auto const& [id, program] : m_site->m_programs)
        programs.push_back(program.info);
    return programs;
}

int MemoryStore::Bury(std::function<void(Estate const&)> const& clear)
{
    int buried = 0;
    std::exception_ptr failure;
    Estate estate;
    for (ProgramId program = 0; (program = NextToBury(program, estate)) != 0;)
    {
        try
        {
            clear(estate);
            Forget(program);
            ++buried;
        }
        catch (...)
        {
            failure = failure ? failure : std::current_exception();
            std::lock_guard const lock(m_site->m_mutex);
            auto const left = m_site->m_programs.find(program);
            if (left != m_site->m_programs.end())
                left->second.buriedBy = 0;
        }
    }
    if (failure)
        std::rethrow_exception(failure);
    return buried;
}

// The next dead program that nobody is burying, now marked as being buried; 0 if there is none.
ProgramId MemoryStore::NextToBury(ProgramId after, Estate& estate)
{
    auto const lock = Begin("Bury");
    auto const end = m_site->m_programs.end();
    auto const found =
        std::find_if(m_site->m_programs.upper_bound(after), end,
                     [this](auto const& entry)
                     { return !entry.second.info.isAlive && !m_site->IsBeingBuried(entry.second); });
    if (found == end)
        return 0;
    found->second.buriedBy = m_self;
    estate = {};
    estate.program = found->first;
    for (auto const& [address, ticket] : m_site->m_tickets)
        if (ticket.owner == estate.program)
            estate.tickets.push_back({address, ticket.state.incarnation, ticket.state.revision});
    for (auto const& [path, program] : m_site->m_partFiles)
        if (program == estate.program)
            estate.partFiles.push_back(path);
    return estate.program;
}

void MemoryStore::Forget(ProgramId program)
{
    auto const lock = Begin("Bury");
    for (auto& [address, ticket] : m_site->m_tickets)
        if (ticket.owner == program)
            ticket.owner = 0;
    std::erase_if(m_site->m_sessions, [=](auto const& entry) { return entry.second.program == program; });
    std::erase_if(m_site->m_partFiles, [=](auto const& entry) { return entry.second == program; });
    m_site->m_programs.erase(program);
}

void MemoryStore::Leave()
{
    auto const lock = Begin("Leave");
    std::erase_if(m_site->m_sessions, [this](auto const& entry) { return entry.second.program == m_self; });
    bool const hasPartFiles = std::any_of(m_site->m_partFiles.begin(), m_site->m_partFiles.end(),
                                          [this](auto const& entry) { return entry.second == m_self; });
    bool const ownsTickets = std::any_of(m_site->m_tickets.begin(), m_site->m_tickets.end(),
                                         [this](auto const& entry) { return entry.second.owner == m_self; });
    if (ownsTickets || hasPartFiles)
        m_site->m_programs.at(m_self).info.isAlive = false;
    else
        m_site->m_programs.erase(m_self);
    m_hasLeft = true;
}

long long MemoryStore::OpenSession(std::string_view user)
{
    auto const lock = Begin("OpenSession");
    long long const id = ++m_site->m_lastSession;
    m_site->m_sessions[id] = {id, m_self, std::string(user), std::time(nullptr)};
    return id;
}

void MemoryStore::CloseSession(long long session)
{
    auto const lock = Begin("CloseSession");
    m_site->m_sessions.erase(session);
}

std::vector<SessionInfo> MemoryStore::Sessions()
{
    auto const lock = Begin("Sessions");
    std::vector<SessionInfo> sessions;
    for (auto const& [id, session] : m_site->m_sessions)
        sessions.push_back(session);
    return sessions;
}

bool MemoryStore::AddPartFile(std::string_view path)
{
    auto const lock = Begin("AddPartFile");
    return m_site->m_partFiles.try_emplace(std::string(path), m_self).first->second == m_self;
}

void MemoryStore::RemovePartFile(std::string_view path)
{
    auto const lock = Begin("RemovePartFile");
    auto const found = m_site->m_partFiles.find(path);
    if (found != m_site->m_partFiles.end() && found->second == m_self)
        m_site->m_partFiles.erase(found);
}

std::optional<User> MemoryStore::FindUser(std::string_view name)
{
    auto const lock = Begin("FindUser");
    auto const found = m_site->m_users.find(name);
    return found == m_site->m_users.end() ? std::nullopt : std::optional(found->second);
}

std::vector<User> MemoryStore::Users()
{
    auto const lock = Begin("Users");
    std::vector<User> users;
    for (auto const& [name, user] : m_site->m_users)
        users.push_back(user);
    return users;
}

void MemoryStore::PutUser(User const& user)
{
    auto const lock = Begin("PutUser");
    m_site->m_users[user.name] = user;
}

bool MemoryStore::RemoveUser(std::string_view name)
{
    auto const lock = Begin("RemoveUser");
    auto const found = m_site->m_users.find(name);
    if (found == m_site->m_users.end())
        return false;
    m_site->m_users.erase(found);
    return true;
}
}  // namespace standin
