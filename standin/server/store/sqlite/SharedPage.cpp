#include "standin/server/store/sqlite/SharedPage.h"

#include "standin/server/files/FileError.h"
#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstring>
#include <ctime>
#include <fcntl.h>
#include <new>
#include <pthread.h>
#include <string>
#include <sys/mman.h>
#include <sys/stat.h>
#include <thread>
#ifdef __linux__
#    include <linux/futex.h>
#    include <sys/syscall.h>
#    include <unistd.h>
#endif

namespace standin
{
namespace
{
constexpr std::size_t PageSize = 4096;

// Begins like a line of text, since the version that knew only one owner shows it as the owner's name.
constexpr char Mark[32] = "several programs (comgui site)\n";
constexpr std::uint32_t Version = 2;

using namespace std::chrono_literals;
using std::chrono::steady_clock;

template <typename T>
void Raise(std::atomic<T>& number, T to) noexcept
{
    T now = number.load();
    while (now < to && !number.compare_exchange_weak(now, to))
    {
    }
}
}  // namespace

struct SharedPage::Page
{
    char mark[sizeof Mark];
    std::uint32_t version;
    std::uint32_t size;      // of this record
    std::uint32_t turnSize;  // of its mutex
    std::uint32_t hasNote;
    ClosingNote note;

    // What is read all the time lies apart from what every turn writes.
    alignas(64) std::atomic<Sequence> committed;
    std::atomic<Sequence> flushed;
    std::atomic<std::uint32_t> bell;
    std::atomic<std::uint32_t> waiting;  // for the bell, in all programs; of those that died some may be left
    std::atomic<std::uint32_t> hasDamage;
    std::atomic<std::uint32_t> isTidy;
    std::atomic<std::uint32_t> failedFlushes;
    std::atomic<std::uint32_t> mendedFlushes;
    alignas(64) std::atomic<std::uint32_t> turns;  // counts them
    std::atomic<std::uint32_t> isTurnOpen;         // begun and not yet ended
    pthread_mutex_t turn;
};

// What systems do differently: how processes wait for each other.
#if defined(__linux__)
namespace
{
void MakeTurn(pthread_mutex_t& turn)
{
    pthread_mutexattr_t attributes;
    pthread_mutexattr_init(&attributes);
    pthread_mutexattr_setpshared(&attributes, PTHREAD_PROCESS_SHARED);
    pthread_mutexattr_setrobust(&attributes, PTHREAD_MUTEX_ROBUST);
    pthread_mutex_init(&turn, &attributes);
    pthread_mutexattr_destroy(&attributes);
}
}  // namespace

bool SharedPage::TakeTurn(std::chrono::milliseconds limit)
{
    auto const end = steady_clock::now() + limit;
    for (;;)
    {
        timespec until{};
        clock_gettime(CLOCK_REALTIME, &until);
        auto const nanoseconds = std::chrono::nanoseconds(until.tv_nsec) + limit;
        until.tv_sec += static_cast<std::time_t>(nanoseconds / 1s);
        until.tv_nsec = static_cast<long>((nanoseconds % 1s).count());
        int const error = pthread_mutex_timedlock(&m_page->turn, &until);
        if (error == EOWNERDEAD)
            pthread_mutex_consistent(&m_page->turn);
        if (error == 0 || error == EOWNERDEAD)
            return true;
        if (steady_clock::now() >= end)  // the clock that the lock goes by may have been set
            return false;
    }
}

void SharedPage::PassTurnOn() noexcept { pthread_mutex_unlock(&m_page->turn); }

void SharedPage::Ring(For whom) noexcept
{
    static_assert(sizeof m_page->bell == sizeof(std::uint32_t));
    ++m_page->bell;
    // Who waits has counted himself before he looked at the bell, so nobody is overlooked.
    bool const isDue = [&]
    {
        std::lock_guard const lock(m_counting);
        return whom == For::All || m_page->waiting > m_waitingHere;
    }();
    if (isDue)
        syscall(SYS_futex, &m_page->bell, FUTEX_WAKE, INT_MAX, nullptr, nullptr, 0);
}

void SharedPage::Wait(std::uint32_t bell, std::chrono::nanoseconds time) noexcept
{
    timespec const limit{static_cast<std::time_t>(time / 1s), static_cast<long>((time % 1s).count())};
    {
        std::lock_guard const lock(m_counting);
        ++m_waitingHere;
        ++m_page->waiting;
    }
    syscall(SYS_futex, &m_page->bell, FUTEX_WAIT, bell, &limit, nullptr, 0);
    std::lock_guard const lock(m_counting);
    --m_waitingHere;
    --m_page->waiting;
}
#else
namespace
{
void MakeTurn(pthread_mutex_t&) {}
}  // namespace

bool SharedPage::TakeTurn(std::chrono::milliseconds limit)
{
    return m_file.LockWithin(LockFile::Turn, LockFile::Hold::Exclusive, limit);
}

void SharedPage::PassTurnOn() noexcept { m_file.Unlock(LockFile::Turn); }

void SharedPage::Ring(For) noexcept { ++m_page->bell; }

void SharedPage::Wait(std::uint32_t bell, std::chrono::nanoseconds time) noexcept
{
    for (auto const end = steady_clock::now() + time; Bell() == bell && steady_clock::now() < end;)
        std::this_thread::sleep_for(std::min<std::chrono::nanoseconds>(time, 5ms));
}
#endif

SharedPage::SharedPage(LockFile& file) : m_file(file)
{
    static_assert(sizeof(Page) <= PageSize && std::atomic<Sequence>::is_always_lock_free);
    // A descriptor of its own: the mapping keeps what it came from open, and with it the locks, also in a
    // child process.
    Descriptor const own(open(file.Path().c_str(), O_RDWR | O_CLOEXEC));
    struct stat found = {};
    if (own.Number() < 0 || fstat(own.Number(), &found) != 0)
        throw StoreError(FileFault(file.Path(), "cannot be opened", errno));
    if (static_cast<std::int64_t>(found.st_ino) != file.Inode())
        throw StoreError(file.Path().string() +
                         ": was removed while the site was opened; leave it, then try again");
    // Not ftruncate: a block that the disk has no room for would end the process when it is touched.
    int const error = posix_fallocate(own.Number(), 0, PageSize);
    if (error != 0)
        throw StoreError(FileFault(file.Path(), "cannot be extended", error));
    void* const address = mmap(nullptr, PageSize, PROT_READ | PROT_WRITE, MAP_SHARED, own.Number(), 0);
    if (address == MAP_FAILED)
        throw StoreError(FileFault(file.Path(), "cannot be mapped", errno));
    m_page = std::launder(static_cast<Page*>(address));
}

SharedPage::~SharedPage() { munmap(m_page, PageSize); }

bool SharedPage::IsOurs() const
{
    return std::memcmp(m_page->mark, Mark, sizeof Mark) == 0 && m_page->version == Version &&
           m_page->size == sizeof(Page) && m_page->turnSize == sizeof(pthread_mutex_t);
}

std::optional<SharedPage::ClosingNote> SharedPage::TakeNote()
{
    if (!IsOurs() || m_page->hasNote == 0)
        return std::nullopt;
    m_page->hasNote = 0;
    // Before the database changes: after a power cut the note must not be there beside what it is not about.
    if (msync(m_page, PageSize, MS_SYNC) != 0)
        throw StoreError(FileFault(m_file.Path(), "cannot be written", errno));
    return m_page->note;
}

void SharedPage::Reset(Sequence committed, bool isTidy)
{
    std::memset(static_cast<void*>(m_page), 0, PageSize);
    m_page = new (m_page) Page{};
    m_page->version = Version;
    m_page->size = sizeof(Page);
    m_page->turnSize = sizeof(pthread_mutex_t);
    m_page->committed = committed;
    m_page->flushed = committed;
    m_page->isTidy = isTidy ? 1 : 0;
    MakeTurn(m_page->turn);
    std::memcpy(m_page->mark, Mark, sizeof Mark);
}

void SharedPage::Check() const
{
    if (!IsOurs())
        throw StoreError(m_file.Path().string() +
                         ": of another version of this program, which has the site open; end that "
                         "first, or use the same version");
}

std::atomic<Sequence> const& SharedPage::Committed() const noexcept { return m_page->committed; }

void SharedPage::RaiseCommitted(Sequence committed) noexcept { Raise(m_page->committed, committed); }

Sequence SharedPage::Flushed() const noexcept { return m_page->flushed; }
void SharedPage::RaiseFlushed(Sequence flushed) noexcept { Raise(m_page->flushed, flushed); }

std::uint32_t SharedPage::FailedFlushes() const noexcept { return m_page->failedFlushes; }
std::uint32_t SharedPage::MendedFlushes() const noexcept { return m_page->mendedFlushes; }
void SharedPage::NoteFailedFlush() noexcept { ++m_page->failedFlushes; }
void SharedPage::NoteMendedFlushes(std::uint32_t failed) noexcept { Raise(m_page->mendedFlushes, failed); }

std::uint32_t SharedPage::Bell() const noexcept { return m_page->bell; }

// An owner who is slow but passes the turn on again and again is no reason to give up: the limit holds for
// the time in which nothing moves.
SharedPage::Turn::Turn(SharedPage& page, std::chrono::milliseconds limit) : m_page(page)
{
    constexpr int MostLimits = 15;
    for (int limits = 1;; ++limits)
    {
        std::uint32_t const turns = page.m_page->turns;
        if (page.TakeTurn(limit))
            break;
        if (turns == page.m_page->turns || limits == MostLimits)
            throw StoreError(page.m_file.Path().parent_path().string() +
                             ": another program holds the site and does not answer; end it, then try again");
    }
    ++page.m_page->turns;
    m_isAfterFailure = page.m_page->isTurnOpen.exchange(1) != 0;
}

SharedPage::Turn::~Turn()
{
    if (m_isOurs)
        m_page.PassTurnOn();
}

void SharedPage::Turn::End() noexcept
{
    m_page.m_page->isTurnOpen = 0;
    m_page.PassTurnOn();
    m_isOurs = false;
}

bool SharedPage::IsTidy() const noexcept { return m_page->isTidy != 0; }
void SharedPage::NoteTidy() noexcept { m_page->isTidy = 1; }

void SharedPage::NoteDamage() noexcept { m_page->hasDamage = 1; }

void SharedPage::LeaveNote(ClosingNote const& note) noexcept
{
    if (m_page->hasDamage != 0)
        return;
    m_page->note = note;
    m_page->hasNote = 1;
}
}  // namespace standin
