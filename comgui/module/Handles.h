// Handles of objects that a host gets to see in place of addresses. A stale or foreign handle is known for
// what it is and never followed: it is a number, which no other object ever gets, and its kind tells handles
// of different tables apart. To find an object takes no lock and three loads.
#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <mutex>
#include <new>

namespace comgui::plugin
{
template <typename T, std::uintptr_t Kind>
class Handles
{
public:
    // For any thread. Throws std::bad_alloc.
    void* Add(T& object)
    {
        std::lock_guard const lock(m_lock);
        std::uintptr_t const index = TakeFree();
        Place& place = *PlaceOf(index);
        std::uintptr_t const handle = Kind << KindBit | place.uses << UseBit | index;
        place.object.store(&object, std::memory_order_release);
        place.handle.store(handle, std::memory_order_release);
        return reinterpret_cast<void*>(handle);
    }

    // The object that had the handle; null if it has none any more. Calls that found it before may go on.
    T* Remove(void* handle) noexcept
    {
        std::lock_guard const lock(m_lock);
        Place* const place = PlaceThatHas(handle);
        if (!place)
            return nullptr;
        place->handle.store(0, std::memory_order_release);
        if (++place->uses < MostUses)  // else nobody ever gets the place again
        {
            place->nextFree = m_firstFree;
            m_firstFree = static_cast<std::uint32_t>(reinterpret_cast<std::uintptr_t>(handle) & IndexMask);
        }
        return place->object.exchange(nullptr, std::memory_order_acq_rel);
    }

    T* Find(void const* handle) const noexcept
    {
        Place const* const place = PlaceThatHas(handle);
        if (!place)
            return nullptr;
        T* const object = place->object.load(std::memory_order_acquire);
        // The place may have got another object since, which nobody may find by this handle.
        bool const isStillThere =
            place->handle.load(std::memory_order_acquire) == reinterpret_cast<std::uintptr_t>(handle);
        return isStillThere ? object : nullptr;
    }

private:
    // Bits of a handle. No address of a process has the kind's.
    static constexpr unsigned UseBit = 32;
    static constexpr unsigned KindBit = 56;
    static constexpr std::uintptr_t IndexMask = 0xFFFF'FFFF;
    static constexpr std::uintptr_t MostUses = 1 << 24;
    static_assert(sizeof(std::uintptr_t) == 8 && Kind > 0 && Kind < 0x80);

    static constexpr std::size_t BlockSize = 1024;
    static constexpr std::size_t MostBlocks = 4096;
    static constexpr std::uint32_t NoPlace = 0xFFFF'FFFF;

    struct Place
    {
        std::atomic<std::uintptr_t> handle{0};
        std::atomic<T*> object{nullptr};
        std::uintptr_t uses = 0;  // by earlier objects
        std::uint32_t nextFree = NoPlace;
    };
    using Block = std::array<Place, BlockSize>;

    Place* PlaceOf(std::uintptr_t index) const noexcept
    {
        std::uintptr_t const number = index / BlockSize;
        Block* const block = number < MostBlocks ? m_blocks[number].load(std::memory_order_acquire) : nullptr;
        return block ? &(*block)[index % BlockSize] : nullptr;
    }

    Place* PlaceThatHas(void const* handle) const noexcept
    {
        auto const given = reinterpret_cast<std::uintptr_t>(handle);
        Place* const place = PlaceOf(given & IndexMask);
        return place && place->handle.load(std::memory_order_acquire) == given ? place : nullptr;
    }

    std::uintptr_t TakeFree()
    {
        if (m_firstFree != NoPlace)
        {
            std::uintptr_t const index = m_firstFree;
            m_firstFree = PlaceOf(index)->nextFree;
            return index;
        }
        if (m_count == BlockSize * MostBlocks)
            throw std::bad_alloc();
        if (m_count % BlockSize == 0)
            m_blocks[m_count / BlockSize].store(new Block, std::memory_order_release);
        return m_count++;
    }

    std::mutex m_lock;
    std::size_t m_count = 0;
    std::uint32_t m_firstFree = NoPlace;
    std::array<std::atomic<Block*>, MostBlocks> m_blocks{};  // never freed: handles outlive everything
};
}  // namespace comgui::plugin
