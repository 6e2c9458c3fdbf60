// The tickets of a site in a schema of a PostgreSQL database, for any number of programs on any number of
// machines. A handle has two connections: one for its work, which its threads take in turns, and one that
// listens, see Bell.
//
// What was committed is as safe as the server's synchronous_commit makes it. Committed() follows what others
// commit as soon as the bell rings, which takes about a millisecond.
//
// A call whose connection breaks throws StoreError, or answers Unknown if it is a Commit; a change of the
// users is repeated, for a minute if need be, and throws UnknownOutcome then: at once if it was made in a
// turn of the users, which is over then. The next one connects again, and does not notice a break of some 100
// ms; as long as the server is known to be out of reach, calls fail at once, and those end that wait for it.
// No other call takes longer than the limits of connecting and of a statement together, unless bytes come and
// go all the time: a large ticket over a slow line takes its time. A thread of its own looks after the
// working connection when the bell tells it to, so that a program is soon back that calls nothing, and that
// the bell is heard meanwhile. Until it is back, others take it for dead and may bury it: it then goes on
// under its number with its sessions and the notes of its part files, but without the tickets that it owned.
//
// Who comes back to another site than before, or to a server that has not got all the changes that the
// program knows of, has done there nothing but look: from then on every operation throws UnusableStore.
//
// In a child process that was made by fork every operation throws StoreError.
#pragma once

#include "standin/server/files/ForkedChild.h"
#include "standin/server/store/SiteStore.h"
#include "standin/server/store/StoreContent.h"
#include "standin/server/store/StoreLimits.h"
#include "standin/server/store/postgres/Bell.h"
#include "standin/server/store/postgres/Connection.h"
#include "standin/server/store/postgres/Identity.h"
#include "standin/server/store/postgres/Keeper.h"
#include <condition_variable>
#include <functional>
#include <limits>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace standin
{
struct PostgresOptions
{
    std::string schema = "comgui";
    std::chrono::milliseconds connectLimit{5000};
    std::chrono::milliseconds statementLimit{10'000};
    std::chrono::milliseconds openingLimit{30'000};  // for others who open the site

    // Keeps others who open the site waiting until EndOpening.
    bool keepOpening = false;

    // A program is buried when it has been missing for so long, which is twice what it takes one to come back
    // after a break of its own connection, and two rounds of who clears up.
    std::chrono::milliseconds grace{600};

    // So long the journal is kept for who is missing, so that nobody's clients lose a change by a short
    // break. Who was not seen alive over its own connection is buried by a program only when that is older,
    // or, if it is its first, the server has been up for longer: when that breaks down all are gone, and come
    // back one by one.
    std::chrono::milliseconds settling{10'000};

    // So long after the last question for its outcome the journal is kept for a commit.
    std::chrono::milliseconds askingPause{30'000};

    // How often the working connection is looked after.
    std::chrono::milliseconds pulse{250};
    StoreLimits limits{};
};

class PostgresStore final : public SiteStore
{
public:
    // Opens the site in that database, which has to be there; uri is one of libpq's, or its keywords and
    // values. first is asked for the content of a new site while others who open it wait; what it throws
    // passes through, and the site stays new. A schema of an older version is upgraded, one of a newer
    // version or of another program is refused by StoreError and left as it is.
    PostgresStore(std::string const& uri, std::function<StoreContent()> const& first,
                  PostgresOptions options = {});
    ~PostgresStore() override;
    PostgresStore(PostgresStore const&) = delete;
    PostgresStore& operator=(PostgresStore const&) = delete;

    // By which the site is told from every other: a text of 36 characters, made with it.
    std::string const& SiteNumber() const { return m_siteNumber; }

    // Whether the folder of the site's files bears that number. Nobody has said so of a new site. For who
    // opens it, while others wait.
    bool HasFolder();
    void NoteFolder();

    CommitOutcome Commit(TicketChange const& change, std::uint64_t number) override;
    std::optional<CommitOutcome> FindCommit(std::uint64_t number) override;
    void Sync() override;
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
    std::string Name() const override { return m_name; }
    bool IsTidy() const noexcept override { return m_isTidy; }
    void NoteTidy() noexcept override { m_isTidy = true; }
    void EndOpening() override;
    bool KeepsOpening() override;

    // The server is asked in the background; its silence is noticed after some three seconds. One that lets
    // this program in no more cannot be reached either.
    bool IsReachable() const noexcept override { return m_reach.IsServing(); }

    std::unique_ptr<UsersTurn> TakeUsersTurn(std::chrono::milliseconds limit) override;
    std::vector<std::string> Check(Progress const& progress) override;
    void ReadContent(std::function<void(TicketChange&&)> const& takeTicket,
                     std::function<void(User&&)> const& takeUser, Progress const& progress) override;
    Sizes Measure() override;

private:
    // Advisory locks of the site beside those of its programs, which have numbers above 0, and of types, of
    // which an id is looked for, below 0.
    static constexpr int LockOfOpening = 0;
    static constexpr int LockOfUsers = std::numeric_limits<int>::min();

    static constexpr char const* SelectUsers =
        "SELECT name, password_hash, role, ticket_id FROM account ORDER BY name";

    class Turn;    // with the working connection
    class Burial;  // the right to bury a program

    // The right to change users after a look at them. Its lock is that connection's, and what is changed as
    // long as this handle has the turn is changed over it: so that nothing is when the lock has gone.
    struct USERS_TURN
    {
        std::mutex lock;
        std::unique_ptr<postgres::Connection> connection;
    };

    void Fill(Turn& turn, StoreContent const& content) const;
    void Register();
    bool TakeLock(postgres::Connection& connection, int lock, postgres::Clock::time_point deadline) const;
    std::unique_ptr<postgres::Connection> OwnConnection();
    bool IsForeign() const noexcept;
    void CheckUsable() const;
    void CheckReach() const;
    void CheckSite(postgres::Connection& connection, postgres::Clock::time_point deadline);
    [[noreturn]] void End(std::string const& reason);
    postgres::Connection& Working(postgres::Clock::time_point deadline);
    bool HasSoundConnection();
    std::unique_ptr<postgres::Connection> NewConnection(postgres::Clock::time_point deadline);
    bool IsAttemptDue() const;
    void ConnectAgain(postgres::Clock::time_point deadline);
    void Attempt(postgres::Clock::time_point deadline, std::chrono::milliseconds connectLimit);
    void Look() noexcept;
    void Mend() noexcept;
    void EndTurn() noexcept;
    void ComeBack(postgres::Clock::time_point deadline);
    void TakeLifeBack(postgres::Clock::time_point deadline);
    void PutBelongingsBack(postgres::Clock::time_point deadline);
    using ChangeOfUsers =
        std::function<void(postgres::Connection&, postgres::Clock::time_point deadline, bool isRepeated)>;
    void ChangeUsers(ChangeOfUsers const& change);
    void ChangeInTurn(USERS_TURN& turn, ChangeOfUsers const& change);
    void UntilKnown(ChangeOfUsers const& change);
    void TakeAway(char const* sql, postgres::Parameters const& parameters,
                  std::function<void()> const& forget);
    static void Put(postgres::Connection& connection, postgres::Clock::time_point deadline, User const& user);
    StoredValue ValueOf(postgres::Result const& rows, int row, int column, TicketAddress address) const;
    static std::vector<User> UsersOf(postgres::Result const& rows);
    postgres::Parameters RequestOf(TicketChange const& change, ProgramId program, std::uint64_t number) const;
    static CommitOutcome Send(Turn& turn, postgres::Parameters const& request, TicketAddress address);
    static void MakeLasting(postgres::Connection& connection, postgres::Clock::time_point deadline);
    void NoteQuestion(std::uint64_t number);
    void NoteAnswer(std::uint64_t number, bool isMade, Sequence forgotten);
    void Announce(Sequence committed);
    void RaiseCommitted(Sequence newest);
    Sequence Needed(Sequence heard);
    std::vector<long long> Gone();
    std::vector<ProgramId> DueForBurial();
    bool BuryOne(ProgramId program, std::function<void(Estate const&)> const& clear);
    bool TakeEstate(Estate& estate);

    ForkWatch const m_forks;
    postgres::Target const m_target;
    PostgresOptions const m_options;
    long const m_process;  // that has opened it
    ProgramId m_self = 0;
    int m_lockClass = 0;  // of the site's advisory locks
    std::string const m_machine, m_program;
    long long const m_since;
    std::string m_name;  // of the database, for messages
    std::string m_siteNumber;
    std::atomic<bool> m_isTidy{false};
    std::atomic<bool> m_hasLeft{false};
    postgres::Identity m_identity;
    postgres::Reach m_reach;
    postgres::Hurry m_hurry;

    std::mutex m_opening;
    bool m_isOpening = false;

    // The working connection belongs to the thread that has the turn.
    std::mutex m_turns;
    std::condition_variable m_turnEnded;
    bool m_isTaken = false;
    std::unique_ptr<postgres::Connection> m_working;  // null: broken
    std::uint64_t m_connected = 0;                    // how often
    postgres::Clock::time_point m_connectedSince{}, m_brokenSince{};
    postgres::GrowingPause m_pause;
    postgres::Clock::time_point m_nextAttempt{};
    std::string m_failure;                     // of the last attempt
    std::uint64_t m_returnsBeforeFailure = 0;  // of the server

    std::mutex m_usersTurns;
    std::weak_ptr<USERS_TURN> m_usersTurn;  // gone: this handle has none

    // What to put back if this program is buried by mistake. Added to by who has the turn.
    std::mutex m_belongings;
    std::atomic<bool> m_hasLeftovers{false};  // in the database, of what was taken away
    struct SESSION
    {
        std::string user;
        long long since;
    };
    std::map<long long, SESSION> m_sessions;
    std::set<std::string> m_partFiles;

    // Of who has the turn, too.
    std::map<ProgramId, postgres::Clock::time_point> m_missing;  // since when, for who prunes
    std::uint64_t m_goneOver = 0;                                // which connection that was seen over

    std::atomic<Sequence> m_settled{0};  // what Maintain was told last

    // What WaitForChanges waits for.
    std::atomic<Sequence> m_committed{0};
    std::mutex m_hearing;
    std::condition_variable m_heard;
    bool m_isInterrupted = false;

    std::mutex m_burials;
    std::set<ProgramId> m_burying;  // by threads of this handle
    struct LOOKS                    // for programs that are missing
    {
        std::uint64_t connection;  // over which
        ProgramId newest;          // at the first look
        std::set<ProgramId> known;
        std::map<ProgramId, postgres::Clock::time_point> missing;  // since when
    };
    LOOKS m_looks{std::numeric_limits<std::uint64_t>::max(), 0, {}, {}};

    std::mutex m_unknowns;
    struct UNKNOWN
    {
        Sequence known;  // when it was sent
        postgres::Clock::time_point askedAt;
        bool isKept;  // by the journal
    };
    std::map<std::uint64_t, UNKNOWN> m_unknown;  // by number

    // Last, since their threads use the other members: they have to end first, also if a constructor fails.
    std::unique_ptr<postgres::Keeper> m_keeper;
    std::unique_ptr<postgres::Bell> m_bell;  // wakes the keeper
};
}  // namespace standin
