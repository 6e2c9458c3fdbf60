// A site in memory, for tests: several handles, each of which counts as a program, share one MemorySite. It
// keeps the whole contract of Store, and can be told to fail in the ways in which engines fail.
#pragma once

#include "standin/server/store/Store.h"
#include "standin/server/store/StoreLimits.h"
#include <atomic>
#include <condition_variable>
#include <deque>
#include <map>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <utility>

namespace standin
{
class MemorySite
{
public:
    explicit MemorySite(StoreLimits const& limits = {});

    // What a test begins with: committed by no program, and of use before and while programs have the site
    // open. A ticket that is not there is made; a value that is there is replaced.
    void AddTicket(TicketAddress address);
    void Put(TicketAddress address, std::string_view key, int pos, StoredValue const& value);
    void PutUser(User const& user);

    // Faults. All of them hold for every handle.
    void FailAll(bool fail);                      // every operation throws StoreError
    void FailOperation(int which);                // that operation from now on throws, 1 for the next; once
    void Fail(char const* operation, bool fail);  // that one throws StoreError, named as in Store
    void BeUnreachable(bool is) { m_isUnreachable = is; }  // as far as IsReachable says
    void BreakJournal();                                   // its newest record cannot be read any more
    void AnswerUnknownOnce(bool andCommit);                // the next Commit, which happens or does not
    bool HasFailed() const;                                // the fault that was ordered last has shown
    void Interject(std::function<void()> action);  // runs once, when the next Commit begins; may use handles
    void InterjectBehind(std::function<void()> action);  // the same when one was made and is not answered yet

    int Loads() const;    // calls of Load that were answered
    int Looks() const;    // calls of ChangesSince
    int Commits() const;  // changes that were committed by programs

private:
    friend class MemoryStore;

    struct Stored
    {
        StoredValue value;
        std::string bytes;
    };
    using Values = std::map<std::pair<std::string, int>, Stored, std::less<>>;
    struct Ticket
    {
        TicketState state;
        ProgramId owner = 0;
        Values values;
    };
    struct Record
    {
        ProgramId program;
        std::uint64_t number;
        int kind;
        TicketAddress address;
        std::string bytes;
    };
    struct Program
    {
        ProgramInfo info;
        ProgramId buriedBy = 0;
    };

    // All of them are for a caller that holds m_mutex.
    CommitOutcome Make(TicketChange const& change, ProgramId program, std::uint64_t number);
    int FreeId(TicketChange const& change) const;
    Sequence Append(Record record);
    void MayFail(char const* operation);
    bool IsBeingBuried(Program const& program) const;

    StoreLimits const m_limits;
    mutable std::mutex m_mutex;
    std::condition_variable m_bell;
    std::atomic<Sequence> m_committed{0};
    Sequence m_pruned = 0;  // the journal begins behind that one
    std::deque<Record> m_journal;
    std::map<TicketAddress, Ticket> m_tickets;
    std::map<std::string, User, std::less<>> m_users;
    std::map<ProgramId, Program> m_programs;
    std::map<long long, SessionInfo> m_sessions;
    std::map<std::string, ProgramId, std::less<>> m_partFiles;
    ProgramId m_lastProgram = 0;
    long long m_lastSession = 0;

    std::atomic<bool> m_isUnreachable = false;
    bool m_failAll = false;
    int m_failIn = 0;  // 0: no failure is due
    enum class Unknown
    {
        No,
        AndNotCommitted,
        AndCommitted,
    } m_unknown = Unknown::No;
    bool m_hasFailed = false;
    std::set<std::string, std::less<>> m_failing;
    std::atomic<int> m_looks = 0;
    std::function<void()> m_interjection;
    std::function<void()> m_interjectionBehind;
    int m_loads = 0;
    int m_commits = 0;
};

// The handle of one program. Its end without Leave is the program's death.
class MemoryStore final : public Store
{
public:
    explicit MemoryStore(std::shared_ptr<MemorySite> site, std::string const& name = "test");
    ~MemoryStore() override;
    MemoryStore(MemoryStore const&) = delete;
    MemoryStore& operator=(MemoryStore const&) = delete;

    // As if the process were killed: what it has stays, every further operation throws StoreError.
    void Die();

    CommitOutcome Commit(TicketChange const& change, std::uint64_t number) override;
    std::optional<CommitOutcome> FindCommit(std::uint64_t number) override;
    void Sync() override;
    bool IsReachable() const noexcept override { return !m_site->m_isUnreachable; }
    std::atomic<Sequence> const& Committed() const noexcept override;
    Sequence Tickets(std::function<void(TicketAddress, TicketState const&)> const& take) override;
    std::optional<Loaded>
    Load(TicketAddress address,
         std::function<void(std::string_view key, int pos, StoredValue const& value)> const& take) override;
    bool ChangesSince(Sequence after, std::function<void(CommittedChange&&)> const& take) override;
    void WaitForChanges(Sequence heard, std::chrono::milliseconds time) override;
    void Interrupt() noexcept override;
    void Maintain(Sequence heard) override;
    ProgramId Self() const noexcept override;
    std::vector<ProgramInfo> Programs() override;
    int Bury(std::function<void(Estate const&)> const& clear) override;
    void Leave() override;
    long long OpenSession(std::string_view user) override;
    void CloseSession(long long session) override;
    std::vector<SessionInfo> Sessions() override;
    bool AddPartFile(std::string_view path) override;
    void RemovePartFile(std::string_view path) override;
    std::optional<User> FindUser(std::string_view name) override;
    std::vector<User> Users() override;
    void PutUser(User const& user) override;
    bool RemoveUser(std::string_view name) override;

private:
    std::unique_lock<std::mutex> Begin(char const* operation);
    ProgramId NextToBury(ProgramId after, Estate& estate);
    void Forget(ProgramId program);

    std::shared_ptr<MemorySite> const m_site;
    ProgramId m_self = 0;
    bool m_isInterrupted = false;
    bool m_hasLeft = false;
};
}  // namespace standin
