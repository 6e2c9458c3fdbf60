#include "standin/server/feed/Epochs.h"

#include <algorithm>
#include <thread>
#ifdef __linux__
#    include <linux/membarrier.h>
#    include <sys/syscall.h>
#    include <unistd.h>
#endif

namespace standin
{
namespace
{
// So many snapshots wait before their memory is looked for: a system call is saved for the rest.
constexpr std::size_t Patience = 64;

bool PrepareSystemBarrier()
{
#ifdef __linux__
    return syscall(SYS_membarrier, MEMBARRIER_CMD_REGISTER_PRIVATE_EXPEDITED, 0, 0) == 0;
#else
    return false;
#endif
}

void SystemBarrier()
{
#ifdef __linux__
    syscall(SYS_membarrier, MEMBARRIER_CMD_PRIVATE_EXPEDITED, 0, 0);
#endif
}
}  // namespace

constinit std::atomic<std::uint64_t> Epochs::s_now{1};
constinit std::atomic<bool> Epochs::s_systemBarrier{false};  // a reader that has its own barrier is safe, too
constinit std::atomic<Epochs::Reader*> Epochs::s_readers{nullptr};
thread_local constinit Epochs::Reader* Epochs::s_mine = nullptr;

Epochs& Epochs::Get()
{
    static auto& epochs = *new Epochs;
    return epochs;
}

Epochs::Epochs() { s_systemBarrier.store(PrepareSystemBarrier(), std::memory_order_relaxed); }

// Gives a thread's reader to the next thread that needs one.
struct Epochs::EndOfThread
{
    Reader* reader = nullptr;

    ~EndOfThread()
    {
        s_mine = nullptr;
        if (reader)
            reader->isTaken.store(false, std::memory_order_release);
    }
};

Epochs::Reader& Epochs::Register()
{
    static thread_local EndOfThread endOfThread;
    Reader* reader = s_readers.load(std::memory_order_acquire);
    for (bool isFree = false; reader; reader = reader->next)
        if (isFree = false; reader->isTaken.compare_exchange_strong(isFree, true, std::memory_order_acquire))
            break;
    if (!reader)
    {
        reader = new Reader;  // stays: a thread may read to the very end of the process
        reader->next = s_readers.load(std::memory_order_relaxed);
        while (!s_readers.compare_exchange_weak(reader->next, reader, std::memory_order_acq_rel))
        {
        }
    }
    endOfThread.reader = reader;
    s_mine = reader;
    return *reader;
}

// The epoch of the reader that entered first, of those that are in a section; a huge number if none is.
std::uint64_t Epochs::OldestReader()
{
    s_now.fetch_add(1, std::memory_order_seq_cst);
    if (s_systemBarrier.load(std::memory_order_relaxed))
        SystemBarrier();
    std::uint64_t oldest = ~std::uint64_t{0};
    for (Reader const* reader = s_readers.load(std::memory_order_seq_cst); reader; reader = reader->next)
        if (std::uint64_t const epoch = reader->epoch.load(std::memory_order_seq_cst))
            oldest = std::min(oldest, epoch);
    return oldest;
}

void Epochs::Dispose(Garbage&& garbage, TextKeeper& texts)
{
    std::erase_if(garbage.texts,
                  [](auto const& text) { return !text->readers.load(std::memory_order_relaxed); });
    if (!garbage.texts.empty())
        texts.Keep(std::move(garbage.texts));
    garbage.memory.clear();
    garbage.keys.clear();
}

void Epochs::Retire(Garbage&& garbage, TextKeeper& texts) noexcept
{
    if (garbage.IsEmpty())
        return;
    std::size_t waiting = 0;
    std::uint64_t now = 0;
    try
    {
        std::lock_guard const lock(m_lock);
        // Not a plain load: what took the garbage's place must be seen by whoever enters in a later epoch.
        now = s_now.fetch_add(0, std::memory_order_acq_rel);
        m_retired.push_back({now, {}, &texts});
        m_retired.back().garbage = std::move(garbage);
        waiting = m_retired.size();
    }
    catch (std::bad_alloc const&)
    {
        while (OldestReader() <= now)  // no memory for a note that it is to be freed later
            std::this_thread::yield();
        Dispose(std::move(garbage), texts);
    }
    if (waiting >= Patience)
        Collect();
}

// What was retired in an epoch that all readers have left behind.
std::list<Epochs::Retired> Epochs::Collectable()
{
    std::list<Retired> collectable;
    std::lock_guard const lock(m_lock);
    if (m_retired.empty())
        return collectable;
    std::uint64_t const oldest = OldestReader();
    auto const end = std::find_if(m_retired.begin(), m_retired.end(),
                                  [oldest](Retired const& retired) { return retired.epoch >= oldest; });
    collectable.splice(collectable.begin(), m_retired, m_retired.begin(), end);
    return collectable;
}

void Epochs::Collect()
{
    struct Collecting
    {
        Epochs& epochs;

        explicit Collecting(Epochs& all) : epochs(all)
        {
            std::lock_guard const lock(epochs.m_lock);
            ++epochs.m_collecting;
        }
        ~Collecting()
        {
            std::lock_guard const lock(epochs.m_lock);
            --epochs.m_collecting;
        }
    };
    Collecting const collecting(*this);
    for (Retired& retired : Collectable())
        Dispose(std::move(retired.garbage), *retired.texts);
}

void Epochs::Drain()
{
    for (;;)
    {
        Collect();
        {
            std::lock_guard const lock(m_lock);
            if (m_retired.empty() && m_collecting == 0)  // another thread may still use its keeper
                return;
        }
        std::this_thread::yield();  // reading sections are short
    }
}
}  // namespace standin
