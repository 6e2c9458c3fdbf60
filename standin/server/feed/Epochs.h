// Tells when memory that was taken out of a shared structure can be freed: when every thread that may have
// found it there has left its reading section. Readers take no lock and write to no line that another thread
// reads often: each has a word of its own in which it notes the epoch that it entered in. Whoever frees asks
// the system for a memory barrier in all threads (membarrier), so that readers need none of their own.
//
// A library for this (liburcu) exists; the thread sanitizer cannot see what it does, and reports races.
//
// One for the process, for any thread. Reading sections may be nested; inside one nothing may block.
#pragma once

#include "standin/server/tickets/TicketSnapshot.h"
#include <atomic>
#include <cstdint>
#include <list>
#include <mutex>

namespace standin
{
// Decides how long texts live that are gone from their tickets and whose addresses somebody outside has.
class TextKeeper
{
public:
    virtual ~TextKeeper() = default;
    virtual void Keep(TicketTexts texts) noexcept = 0;  // called on any thread that changes tickets
};

class Epochs
{
    struct alignas(64) Reader
    {
        std::atomic<std::uint64_t> epoch{0};  // 0: not reading
        unsigned depth = 0;                   // its thread's own
        std::atomic<bool> isTaken{true};
        Reader* next = nullptr;
    };

public:
    static Epochs& Get();  // never destroyed

    // A reading section.
    class Guard
    {
    public:
        Guard() : m_reader(Mine())
        {
            if (m_reader.depth++ != 0)
                return;
            // Who finds this epoch finds all that was published before it began.
            std::uint64_t const now = s_now.load(std::memory_order_acquire);
            if (s_systemBarrier.load(std::memory_order_relaxed)) [[likely]]
            {
                m_reader.epoch.store(now, std::memory_order_release);
                std::atomic_signal_fence(std::memory_order_seq_cst);  // what is read is read after this
            }
            else
                m_reader.epoch.exchange(now, std::memory_order_seq_cst);
        }
        ~Guard()
        {
            if (--m_reader.depth == 0)
                m_reader.epoch.store(0, std::memory_order_release);
        }
        Guard(Guard const&) = delete;
        Guard& operator=(Guard const&) = delete;

    private:
        Reader& m_reader;
    };

    // Takes over what no new reader can find any more. Not inside a section.
    void Retire(Garbage&& garbage, TextKeeper& texts) noexcept;

    // Frees what can be freed. Drain waits until all is that was retired before: not inside a section.
    void Collect();
    void Drain();

private:
    struct Retired
    {
        std::uint64_t epoch;
        Garbage garbage;
        TextKeeper* texts;
    };
    struct EndOfThread;

    Epochs();
    static Reader& Mine()
    {
        Reader* const mine = s_mine;
        return mine ? *mine : Register();
    }
    static Reader& Register();
    std::list<Retired> Collectable();
    static std::uint64_t OldestReader();
    static void Dispose(Garbage&& garbage, TextKeeper& texts);

    static std::atomic<std::uint64_t> s_now;
    static std::atomic<bool> s_systemBarrier;
    static std::atomic<Reader*> s_readers;
#ifdef __GLIBC__
    // Without this a plug-in's thread_local costs a call.
    [[gnu::tls_model("initial-exec")]]
#endif
    static thread_local constinit Reader* s_mine;

    std::mutex m_lock;
    std::list<Retired> m_retired;  // in the order of their epochs; to take some out needs no memory
    int m_collecting = 0;          // threads that free what they have taken out
};
}  // namespace standin
