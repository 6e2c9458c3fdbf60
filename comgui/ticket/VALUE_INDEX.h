// Keeps each distinct value once, at an address that stays until Clear(): what the caches of a
// SETMULTIPAR_LIST are made of. Nobody sees the order of the values, so they are found by their hash. One
// thread at a time.
//
// KIND says what the values are:
//   VALUE    what is looked for, cheap to copy          STORED   what an address is given out of
//   Hash(value, seed)      Same(stored, value)          Store(pool, value) -> STORED const*
#pragma once

#include "comgui/ticket/POOL.h"
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

namespace comgui::detail
{
using HASH = std::uint64_t;

// Both halves of the product, so that every bit of either factor counts.
inline HASH Mix(HASH left, HASH right)
{
    __extension__ using WIDE = unsigned __int128;
    WIDE const product = static_cast<WIDE>(left) * right;
    return static_cast<HASH>(product) ^ static_cast<HASH>(product >> 64);
}

inline HASH HashOfNumber(HASH bits, HASH seed) { return Mix(bits ^ seed, 0x9E3779B97F4A7C15); }

template <typename WORD>
HASH LoadWord(char const* from)
{
    WORD word;
    std::memcpy(&word, from, sizeof word);
    return word;
}

// Sixteen bytes a step; the last step looks at the last bytes, which may overlap those before.
inline HASH HashOfBytes(char const* bytes, std::size_t size, HASH seed)
{
    HASH hash = seed ^ size;
    HASH head = 0;
    HASH tail = 0;
    if (size >= 8)
    {
        char const* const last = bytes + size - 8;
        for (; size > 16; size -= 16, bytes += 16)
            hash = Mix(LoadWord<std::uint64_t>(bytes) ^ seed, LoadWord<std::uint64_t>(bytes + 8) ^ hash);
        head = LoadWord<std::uint64_t>(size >= 8 ? bytes : last);
        tail = LoadWord<std::uint64_t>(last);
    }
    else if (size >= 4)
    {
        head = LoadWord<std::uint32_t>(bytes);
        tail = LoadWord<std::uint32_t>(bytes + size - 4);
    }
    else if (size > 0)
    {
        head = LoadWord<unsigned char>(bytes);
        tail = LoadWord<unsigned char>(bytes + size / 2) << 8 | LoadWord<unsigned char>(bytes + size - 1);
    }
    return Mix(Mix(head ^ seed, tail ^ hash), 0x9E3779B97F4A7C15);
}

template <typename KIND>
class VALUE_INDEX
{
public:
    using VALUE = typename KIND::VALUE;
    using STORED = typename KIND::STORED;

    VALUE_INDEX() = default;
    VALUE_INDEX(VALUE_INDEX const&) = delete;
    VALUE_INDEX& operator=(VALUE_INDEX const&) = delete;

    // The stored value that equals this one, which is stored first if there is none. Throws std::bad_alloc.
    STORED const* Keep(VALUE value)
    {
        // Values come in runs: a vector of like values asks for the same one again and again.
        if (m_last && KIND::Same(*m_last, value))
            return m_last;
        HASH const hash = KIND::Hash(value, Seed());
        if (m_count >= m_slots.size() / 2)
            Grow();
        SLOT& slot = Find(hash, value);
        if (!slot.value)
        {
            slot = {hash, KIND::Store(m_pool, value)};
            ++m_count;
        }
        return m_last = slot.value;
    }

    // Drops all values; every address given out dies.
    void Clear()
    {
        m_last = nullptr;
        m_count = 0;
        m_slots = std::vector<SLOT>();
        m_pool.Clear();
    }

private:
    struct SLOT
    {
        HASH hash;
        STORED const* value;  // null: free
    };

    // Differs from run to run, so that no stream can be made in which all values fall together.
    HASH Seed() const { return Mix(reinterpret_cast<std::uintptr_t>(this), 0xD6E8FEB86659FD93); }

    // The slot of that value, or the free one where it belongs.
    SLOT& Find(HASH hash, VALUE value)
    {
        std::size_t const mask = m_slots.size() - 1;
        std::size_t at = hash & mask;
        while (m_slots[at].value && (m_slots[at].hash != hash || !KIND::Same(*m_slots[at].value, value)))
            at = (at + 1) & mask;
        return m_slots[at];
    }

    void Grow()
    {
        std::vector<SLOT> old(m_slots.empty() ? FirstSlots : m_slots.size() * 2, SLOT{});
        old.swap(m_slots);
        std::size_t const mask = m_slots.size() - 1;
        for (SLOT const& slot : old)
            if (slot.value)
            {
                std::size_t at = slot.hash & mask;
                while (m_slots[at].value)
                    at = (at + 1) & mask;
                m_slots[at] = slot;
            }
    }

    static constexpr std::size_t FirstSlots = 16;  // a power of two, as is every later size

    POOL m_pool;
    std::vector<SLOT> m_slots;  // at most half full
    std::size_t m_count = 0;
    STORED const* m_last = nullptr;
};
}  // namespace comgui::detail
