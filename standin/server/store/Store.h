// Where the tickets of a site last, and the journal by which all programs of the site hear of every change.
// Several programs have a store open at the same time, each through a handle of its own; there is one
// implementation for each kind of engine, and all of them pass the same contract suite.
//
// For any thread. A handle synchronises itself, so callers must hold no lock of theirs across a call: every
// call but Committed() may wait for the disk, for another program, or for a network.
//
// Every operation throws StoreError when the store fails (disk full, damaged, connection lost ...). Nothing
// of the failed operation has taken effect then, but for what Sync says; only Commit has an answer of its own
// for "nobody knows".
#pragma once

#include "standin/server/store/TicketChange.h"
#include <atomic>
#include <chrono>
#include <functional>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace standin
{
// what() is one line that names the store, the reason and the remedy.
class StoreError : public std::runtime_error
{
public:
    using std::runtime_error::runtime_error;
};

// The store cannot be reached, and may be a moment later.
class LostStore : public StoreError
{
public:
    using StoreError::StoreError;
};

// A record of the journal cannot be read. The tickets may be sound all the same.
class BrokenJournal : public StoreError
{
public:
    using StoreError::StoreError;
};

// This handle is of no more use, now and for ever.
class UnusableStore : public StoreError
{
public:
    using StoreError::StoreError;
};

// Whether the operation has taken effect is not known, and nobody asks after it any more.
class UnknownOutcome : public StoreError
{
public:
    using StoreError::StoreError;
};

struct User
{
    std::string name;
    std::string passwordHash;  // as crypt(3) writes it
    int role = 0;              // 16: administrator
    int ticketId = 0;          // of the user's own ticket, type 17
};

struct CommitOutcome
{
    enum Kind
    {
        Committed,  // sequence is the change's number, address the ticket's (with the id that a creation got)
        Conflict,   // the ticket is not as the change expects: plan again on what holds at sequence
        NoFreeId,   // every id of the type is in use
        Unknown,    // the connection broke: FindCommit answers later
    };
    Kind kind = Unknown;
    Sequence sequence = 0;
    TicketAddress address{};
};

// A ticket at the moment of a load or a listing.
struct TicketState
{
    Incarnation incarnation = 0;
    Sequence revision = 0;  // the number of the last change that it had
};

struct ProgramInfo
{
    ProgramId id = 0;
    long process = 0;  // the operating system's number, on its machine
    std::string machine;
    std::string name;     // of the executable
    long long since = 0;  // when it opened the site, in seconds since 1970
    Sequence heard = 0;   // up to which change it is known to have heard, see Maintain
    bool isAlive = false;
};

struct SessionInfo
{
    long long id = 0;
    ProgramId program = 0;
    std::string user;
    long long since = 0;  // in seconds since 1970
};

// What a program that died has left.
struct Estate
{
    struct Ticket
    {
        TicketAddress address;
        Incarnation incarnation;
        Sequence revision;  // with which the program owned it: with another one it may be somebody's again
    };
    ProgramId program = 0;
    std::vector<Ticket> tickets;         // that it owned
    std::vector<std::string> partFiles;  // absolute paths, on its machine
};

class Store
{
public:
    virtual ~Store() = default;

    // --- changes

    // Makes the change in one transaction with its journal record, if the ticket still is as it expects: of a
    // write the incarnation and the revision, of a deletion the incarnation, and the revision unless it is
    // AnyRevision; of a creation, that there is no ticket. Once it answers Committed the change survives the
    // end of the process at any instant, and every Committed() of the site on this machine is at least its
    // sequence; of an engine whose programs share no memory only this handle's is, and the others follow when
    // its bell rings. number: the caller's own, from 1 up, none twice by this handle.
    // PARAM_POINTER values are of use to this process alone: what they replace goes from the store, and in
    // the journal they are deletions. A change that expects nothing untrue but has no parameters is
    // committed like others.
    virtual CommitOutcome Commit(TicketChange const& change, std::uint64_t number) = 0;

    // Whether the change of this handle with that number was committed, and as what; nothing if it was not,
    // and then it never will be. After Unknown only; who goes on asking after a failure pauses no longer than
    // some seconds, lest the journal forget it.
    virtual std::optional<CommitOutcome> FindCommit(std::uint64_t number) = 0;

    // What was committed through this handle is on the disk when this returns, so that a power cut cannot
    // take it back. Callers that wait at the same time share one flush. If it throws, what was committed
    // holds, but a power cut may take it back; so it is with a change of the users that throws for this
    // reason.
    virtual void Sync() = 0;

    // --- what holds

    // Whether the store answers, as far as that is known without asking it now; one on this machine always
    // does. Never waits.
    virtual bool IsReachable() const noexcept { return true; }

    // The newest change that this handle knows of; never falls. On one machine that is the newest at all
    // that was acknowledged to anybody, but for what the bell takes in an engine whose programs share no
    // memory. One load, for any thread, at any time.
    virtual std::atomic<Sequence> const& Committed() const noexcept = 0;

    // Every ticket, in ascending order of addresses; take must not use the store. Returns the number of the
    // last change that the listing has seen.
    virtual Sequence Tickets(std::function<void(TicketAddress, TicketState const&)> const& take) = 0;

    struct Loaded
    {
        TicketState state;
        Sequence sequence = 0;  // the last change of the site that the load has seen
    };

    // Hands out every value of a ticket as of one moment, ordered by key (bytewise) and position; bytes live
    // until take returns, and take must not use the store. Nothing, and take is not called, if there is no
    // such ticket.
    virtual std::optional<Loaded>
    Load(TicketAddress address,
         std::function<void(std::string_view key, int pos, StoredValue const& value)> const& take) = 0;

    // --- the feed

    // Hands out the changes behind that one, in order and without gaps, as many as are there but not more
    // than a few thousand, or some megabytes. take may use the store. False, with nothing handed out, if the
    // journal begins later than that. Throws BrokenJournal for a record that nobody can read.
    virtual bool ChangesSince(Sequence after, std::function<void(CommittedChange&&)> const& take) = 0;

    // Returns when another handle has committed a change above that number, when the time is over, after
    // Interrupt, or for no reason at all; for a change of this handle's own it need not. It looks into the
    // store itself before it returns at the end of the time, in case a program died between its commit and
    // its ring.
    virtual void WaitForChanges(Sequence heard, std::chrono::milliseconds time) = 0;

    // Lets a call of WaitForChanges that runs, or else the next one, return at once.
    virtual void Interrupt() noexcept = 0;

    // To be called about once a second: notes that this program has heard up to that change, and prunes the
    // journal of what every living program has heard. Some thousand records are always kept; a program that
    // falls behind by more than a million is left behind.
    virtual void Maintain(Sequence heard) = 0;

    // --- programs, sessions, and what dies with them

    virtual ProgramId Self() const noexcept = 0;
    virtual std::vector<ProgramInfo> Programs() = 0;

    // Calls clear for every program that has died without Leave and that nobody else is burying, and forgets
    // the program with its sessions and part files when clear has returned. clear may use the store. If it
    // throws, or this process dies, somebody buries that program anew; the others are buried all the same,
    // and what was thrown first passes through at the end. Returns how many were buried.
    virtual int Bury(std::function<void(Estate const&)> const& clear) = 0;

    // An orderly end: this program's sessions are forgotten, and so is the program unless it still has part
    // files or owns tickets, which are then for others to bury. The handle is of no more use. The last to
    // leave brings everything into one file where the engine has files.
    virtual void Leave() = 0;

    virtual long long OpenSession(std::string_view user) = 0;
    virtual void CloseSession(long long session) = 0;
    virtual std::vector<SessionInfo> Sessions() = 0;

    // A file on this machine that has not got its name yet: noted before it is made, forgotten once it has
    // its name or is gone. path is absolute. Each program has notes of its own: a path that another one has
    // noted is refused, by false, and a note of another one's stays.
    virtual bool AddPartFile(std::string_view path) = 0;
    virtual void RemovePartFile(std::string_view path) = 0;

    // --- users

    virtual std::optional<User> FindUser(std::string_view name) = 0;
    virtual std::vector<User> Users() = 0;               // by name
    virtual void PutUser(User const& user) = 0;          // makes or replaces
    virtual bool RemoveUser(std::string_view name) = 0;  // false if there is no such user
};
}  // namespace standin
