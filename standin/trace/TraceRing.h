// A bounded ring of records in a file that is mapped into memory: any thread of the traced program puts
// records in, one thread takes them out, and after the program's death another process can. To put one in
// takes no lock and never waits: if the ring is full the record is dropped and counted.
#pragma once

#include "standin/trace/TraceFormat.h"
#include <algorithm>
#include <atomic>
#include <cstddef>
#include <cstring>
#include <memory>
#include <string>

namespace trace
{
class TraceRing
{
public:
    static constexpr std::uint32_t Slots = 16'384;  // a power of two; 4 MiB

    // Null if the file cannot be made or mapped; errno tells why.
    static std::unique_ptr<TraceRing> Make(std::string const& file);

    // That of another process, or null.
    static std::unique_ptr<TraceRing> Open(std::string const& file);
    ~TraceRing();
    TraceRing(TraceRing const&) = delete;
    TraceRing& operator=(TraceRing const&) = delete;

    // Whether records are wanted, a switch that any process may turn.
    bool IsOn() const noexcept { return m_head->isOn.load(std::memory_order_relaxed) != 0; }
    std::atomic<std::uint32_t> const& TheSwitch() const noexcept { return m_head->isOn; }
    void Switch(bool on) noexcept { m_head->isOn.store(on ? 1 : 0, std::memory_order_relaxed); }

    // record: begins with a RecordHead that tells its size, which is LargestRecord at most.
    void Put(void const* record, std::size_t size) noexcept
    {
        std::uint64_t place = m_head->end.load(std::memory_order_relaxed);
        for (;;)
        {
            Slot& slot = m_slots[place % Slots];
            std::uint64_t const turn = slot.turn.load(std::memory_order_acquire);
            if (turn == place)
            {
                if (!m_head->end.compare_exchange_weak(place, place + 1, std::memory_order_relaxed))
                    continue;
                std::memcpy(slot.record, record, size);
                slot.turn.store(place + 1, std::memory_order_release);
                return;
            }
            if (turn < place)  // what is there has not been taken out yet
            {
                m_head->dropped.fetch_add(1, std::memory_order_relaxed);
                return;
            }
            place = m_head->end.load(std::memory_order_relaxed);
        }
    }

    // Calls take(record, size) for each that is complete, in their order. For one thread at a time.
    template <typename Take>
    std::size_t TakeAll(Take const& take)
    {
        std::size_t taken = 0;
        for (std::uint64_t place = m_head->begin.load(std::memory_order_relaxed);; ++place, ++taken)
        {
            Slot& slot = m_slots[place % Slots];
            if (slot.turn.load(std::memory_order_acquire) != place + 1)
                return taken;
            RecordHead head;
            std::memcpy(&head, slot.record, sizeof head);
            take(static_cast<char const*>(slot.record), head.size);
            m_head->begin.store(place + 1, std::memory_order_relaxed);
            slot.turn.store(place + Slots, std::memory_order_release);
        }
    }

    // The same without taking them out.
    template <typename Look>
    void LookAtAll(Look const& look) const
    {
        for (std::uint64_t place = m_head->begin.load(std::memory_order_relaxed);; ++place)
        {
            Slot const& slot = m_slots[place % Slots];
            if (slot.turn.load(std::memory_order_acquire) != place + 1)
                return;
            RecordHead head;
            std::memcpy(&head, slot.record, sizeof head);
            look(static_cast<char const*>(slot.record), std::min<std::size_t>(head.size, LargestRecord));
        }
    }

    // The records that were dropped, ever.
    std::uint64_t Dropped() const noexcept { return m_head->dropped.load(std::memory_order_relaxed); }

private:
    struct Head
    {
        alignas(64) std::atomic<std::uint64_t> begin;  // taken out up to here
        alignas(64) std::atomic<std::uint64_t> end;    // put in
        alignas(64) std::atomic<std::uint64_t> dropped;
        std::atomic<std::uint32_t> isOn;
        char magic[8];
    };
    struct Slot
    {
        std::atomic<std::uint64_t> turn;  // place: free for it; place + 1: holds it
        char record[LargestRecord];
    };
    static_assert(sizeof(Slot) == 256 && std::atomic<std::uint64_t>::is_always_lock_free);
    static constexpr std::size_t Size = sizeof(Head) + sizeof(Slot) * Slots;

    explicit TraceRing(void* memory)
        : m_head(static_cast<Head*>(memory)),
          m_slots(reinterpret_cast<Slot*>(static_cast<char*>(memory) + sizeof(Head)))
    {
    }
    static void* Map(int descriptor) noexcept;

    Head* const m_head;
    Slot* const m_slots;
};
}  // namespace trace
