// What the programs of a site have in common in memory, as one page of the file site.lock that each of them
// maps: the number of the newest change, the bell that rings after each, and the turn of the one who writes.
// The page is worth nothing once nobody has the site open, but for the note of an orderly end: whoever opens
// the site alone makes it anew.
#pragma once

#include "standin/server/store/Store.h"
#include "standin/server/store/sqlite/LockFile.h"
#include <atomic>
#include <chrono>
#include <cstdint>
#include <mutex>
#include <optional>

namespace standin
{
class SharedPage
{
public:
    // How the database looked when the last program left in order.
    struct ClosingNote
    {
        std::int64_t size = 0;
        std::int64_t changed = 0;  // in nanoseconds since 1970
        std::int64_t inode = 0;

        friend bool operator==(ClosingNote const&, ClosingNote const&) = default;
    };

    // Maps the page. The file has to outlive it.
    explicit SharedPage(LockFile& file);
    ~SharedPage();
    SharedPage(SharedPage const&) = delete;
    SharedPage& operator=(SharedPage const&) = delete;

    // --- for who opens the site alone

    // The note, which is gone from the disk when this returns: from now on the database may change.
    std::optional<ClosingNote> TakeNote();
    void Reset(Sequence committed, bool isTidy);

    // --- for who opens it beside others

    // Throws StoreError if the page is none of ours.
    void Check() const;

    // --- for all

    std::atomic<Sequence> const& Committed() const noexcept;
    void RaiseCommitted(Sequence committed) noexcept;

    // Up to which change all is known to be on the disk.
    Sequence Flushed() const noexcept;
    void RaiseFlushed(Sequence flushed) noexcept;

    // How many flushes have failed, in all programs, and how many of them no longer matter.
    std::uint32_t FailedFlushes() const noexcept;
    std::uint32_t MendedFlushes() const noexcept;
    void NoteFailedFlush() noexcept;
    void NoteMendedFlushes(std::uint32_t failed) noexcept;

    // The bell: a number that each ring changes. Wait returns when it is no longer that one, when the time is
    // over, or for no reason. A ring for others may leave those asleep who wait here, in this mapping of the
    // page: they are told what its owner changes in another way, and waking them costs more than the rest.
    enum class For
    {
        Others,
        All,
    };
    std::uint32_t Bell() const noexcept;
    void Ring(For whom) noexcept;
    void Wait(std::uint32_t bell, std::chrono::nanoseconds time) noexcept;

    // The turn of the one who writes. It passes on when its owner dies.
    class Turn
    {
    public:
        // Throws StoreError when the owner has not answered for that long.
        Turn(SharedPage& page, std::chrono::milliseconds limit);
        ~Turn();
        Turn(Turn const&) = delete;
        Turn& operator=(Turn const&) = delete;

        // Whether an owner before this one has died or failed in the middle, so that Committed may be behind
        // the database.
        bool IsAfterFailure() const { return m_isAfterFailure; }

        // All is as it should be: Committed is what the database has.
        void End() noexcept;

    private:
        SharedPage& m_page;
        bool m_isAfterFailure = false;
        bool m_isOurs = true;
    };

    // Whether a program has cleared up since one ended in another way than in order. Lasts as the note does.
    bool IsTidy() const noexcept;
    void NoteTidy() noexcept;

    // Somebody has found the database damaged: its next opening has to look closely.
    void NoteDamage() noexcept;

    // For the last to leave. Nothing is noted after damage.
    void LeaveNote(ClosingNote const& note) noexcept;

private:
    struct Page;

    bool IsOurs() const;
    bool TakeTurn(std::chrono::milliseconds limit);
    void PassTurnOn() noexcept;

    LockFile& m_file;
    Page* m_page;
    std::mutex m_counting;            // keeps the number of those who wait here and the page's in step
    std::uint32_t m_waitingHere = 0;  // of those on the page
};
}  // namespace standin
