// The tickets of a site in a folder of one machine, in one SQLite database that any number of programs have
// open at the same time:
//
//     site.db    tickets, users, journal, programs; with site.db-wal and site.db-shm while it is open
//     site.lock  who is there, whose turn it is to write, the bell; see LockFile and SharedPage
//
// What was committed outlives the end of the process at any instant. A power cut may take back the newest
// changes, each as a whole, unless Durability::Full is asked for or Sync has returned.
//
// In a child process that was made by fork every operation throws StoreError.
#pragma once

#include "standin/server/files/DatabaseFiles.h"
#include "standin/server/store/SiteStore.h"
#include "standin/server/store/StoreContent.h"
#include "standin/server/store/StoreLimits.h"
#include "standin/server/store/sqlite/Database.h"
#include "standin/server/store/sqlite/Flusher.h"
#include "standin/server/store/sqlite/GroupCommit.h"
#include "standin/server/store/sqlite/LockFile.h"
#include "standin/server/store/sqlite/SharedPage.h"
#include <filesystem>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace standin
{
enum class Durability
{
    Process,  // a commit does not wait for the disk
    Full,     // it does, in one transaction and with one flush for those of all threads that wait
};

struct SqliteOptions
{
    Durability durability = Durability::Process;

    // Keeps others who open the site waiting until EndOpening, so that what belongs to the site and not to
    // the store can be put in order meanwhile.
    bool keepOpening = false;

    // Called for a damaged database, alone with the site, to set the files away that begin with site.db. The
    // site then begins anew. Without it the damage is thrown.
    std::function<void(DamagedStore const&)> setAside{};

    std::chrono::milliseconds turnLimit{2000};       // for a writer who does not answer
    std::chrono::milliseconds openingLimit{30'000};  // for others who open the site
    StoreLimits limits{};
};

class SqliteStore final : public SiteStore
{
public:
    // Opens the site in that folder, which has to be there. first is asked for the content of a new one,
    // alone with the site; what it throws passes through, and the site stays new.
    //
    // Takes the same time at any size if the site was left in order and the file is the one that was left.
    // Otherwise who opens it alone has every page checked, and a file that is no database, is cut,
    // overwritten or somebody else's throws DamagedStore. A file of an older schema is upgraded then; one of
    // a newer schema is refused by StoreError and left as it is.
    SqliteStore(std::filesystem::path const& folder, std::function<StoreContent()> const& first,
                SqliteOptions options = {});
    ~SqliteStore() override;
    SqliteStore(SqliteStore const&) = delete;
    SqliteStore& operator=(SqliteStore const&) = delete;

    // Whether nobody else had the site open when this did.
    bool WasFirst() const { return m_wasFirst; }

    // Whether the last that had it open before has left in order. Of use to the first only.
    bool EndedInOrder() const { return m_endedInOrder; }

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
    std::string Name() const override { return m_folder.string(); }
    bool IsTidy() const noexcept override { return m_page->IsTidy(); }
    void NoteTidy() noexcept override { m_page->NoteTidy(); }
    void EndOpening() override;
    bool KeepsOpening() override;
    std::unique_ptr<UsersTurn> TakeUsersTurn(std::chrono::milliseconds limit) override;

    // Looks at every page, too. Takes about two seconds for 300 MB.
    std::vector<std::string> Check(Progress const& progress) override;
    void ReadContent(std::function<void(TicketChange&&)> const& takeTicket,
                     std::function<void(User&&)> const& takeUser, Progress const& progress) override;
    Sizes Measure() override;

    // Copies the database, as of one moment, into a new file that is a whole site.db. Throws StoreError, and
    // leaves no file, if there is one of that name already or it cannot be written.
    void BackupTo(std::filesystem::path const& file, Progress const& progress);

private:
    struct Writer;  // the connection for changes, with its statements
    struct Reader;  // the connection for everything else
    class Writing;  // a transaction of the writer, in its turn
    class Reading;  // a transaction of the reader

    void Enter();
    void OpenDatabase(std::function<StoreContent()> const& first);
    void OpenAlone(std::function<StoreContent()> const& first);
    void OpenBesideOthers();
    void Fill(StoreContent const& content);
    void Register();
    bool MayHaveNote(SharedPage::ClosingNote& note) const;

    void CheckUsable() const;
    void CheckInPlace();
    std::unique_lock<std::mutex> Lock(std::mutex& mutex) const;
    void CommitTogether(GroupCommit::Group group);
    void RecordOf(TicketChange const& change);
    CommitOutcome Make(TicketChange const& change, Sequence next);
    void PutParameters(TicketAddress address, TicketChange const& change);
    int NextId(TicketChange const& change);
    Sequence LastSequence(Database& database, Database::Statement const& statement) const;
    void Flush(Sequence sequence);
    Sequence PrunableUpTo(Sequence& pruned);
    bool IsAlive(ProgramId program) const;
    bool TakeEstate(Estate& estate);
    void Forget(ProgramId program);
    bool BuryOne(ProgramId program, std::function<void(Estate const&)> const& clear);
    long long Change(char const* sql, long long parameter);
    void Put(User const& user);
    static std::vector<User> UsersIn(Database& database);

    std::filesystem::path const m_folder;
    std::filesystem::path const m_file;
    SqliteOptions const m_options;
    bool m_wasFirst = false;
    bool m_endedInOrder = false;
    ProgramId m_self = 0;

    DatabaseFiles const m_files;  // outlives the connections
    std::unique_ptr<LockFile> m_lock;
    std::unique_ptr<SharedPage> m_page;
    std::int64_t m_inode = 0;  // of the database
    std::atomic<bool> m_isReplaced{false};
    std::atomic<bool> m_hasLeft{false};
    std::atomic<bool> m_isInterrupted{false};

    // Never two of these mutexes at a time, but for Leave, which takes them in this order.
    std::mutex m_writing;
    std::unique_ptr<Writer> m_writer;
    std::mutex m_reading;
    std::unique_ptr<Reader> m_reader;
    std::unique_ptr<Flusher> m_flusher;
    std::unique_ptr<GroupCommit> m_group;

    std::mutex m_opening;
    bool m_isOpening = false;

    std::mutex m_burials;
    std::set<ProgramId> m_burying;  // by threads of this handle, which the locks do not keep apart

    std::mutex m_maintenance;
    Sequence m_heard = 0;  // as the database has it
};
}  // namespace standin
