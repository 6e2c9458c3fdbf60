// Keeps each distinct value once, at an address that stays until Clear(): what the caches of a
// SETMULTIPAR_LIST are made of. Nobody sees the order of the values, so they are found by their hash. All
// memory is the pool's, which several may share. One thread at a time.
//
// KIND says what the values are:
//   VALUE                           what is looked for, cheap to copy
//   ENTRY                           what is kept, and stays where it is; its destructor is not run
//   Hash(value, seed)               the same for equal values
//   HashOf(entry, seed)             the same again
//   Same(entry, value)
//   Make(place, value, hash, pool)  the new entry, at that place
#pragma once

#include "comgui/foundation/hash.h"
#include "comgui/ticket/POOL.h"
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <new>

namespace comgui::detail
{
template <typename KIND>
class VALUE_INDEX
{
public:
    using VALUE = typename KIND::VALUE;
    using ENTRY = typename KIND::ENTRY;

    // The pool must outlive the index.
    explicit VALUE_INDEX(POOL& pool)
        : m_pool(pool), m_seed(Mix(reinterpret_cast<std::uintptr_t>(this), 0xD6E8FEB86659FD93))
    {
    }
    VALUE_INDEX(VALUE_INDEX const&) = delete;
    VALUE_INDEX& operator=(VALUE_INDEX const&) = delete;

    // The entry of that value, which is made first if there is none. Throws std::bad_alloc.
    ENTRY const& Keep(VALUE value)
    {
        // Values come in runs: a vector of like values asks for the same one again and again.
        if (m_last && KIND::Same(*m_last, value))
            return *m_last;
        HASH const hash = KIND::Hash(value, m_seed);
        if (m_count == m_limit)
            Grow();
        NUMBER const mask = SlotCount() - 1;
        NUMBER const mark = MarkOf(hash);
        std::size_t at = hash & mask;
        for (; m_slots[at] != FreeSlot; at = (at + 1) & mask)
        {
            // An entry is far away; the mark in its slot says of most others that they are not meant.
            NUMBER const number = m_slots[at] ^ mark;
            if (number > mask)
                continue;
            ENTRY const& entry = *EntryAt(number);
            if (KIND::Same(entry, value))
                return *(m_last = &entry);
        }
        m_last = AddEntry(value, hash);
        m_slots[at] = mark | m_count;
        return *m_last;
    }

    // Asks for the memory that a search for the value begins in: it comes while others are asked for.
    void Expect(VALUE value) const
    {
        if (m_slots)
            __builtin_prefetch(&m_slots[KIND::Hash(value, m_seed) & (SlotCount() - 1)], 1);
    }

    // Forgets all values; every address given out dies. Their memory is the pool's to free.
    void Clear()
    {
        m_last = nullptr;
        m_next = m_blockEnd = nullptr;
        m_count = 0;
        m_limit = 0;
        m_slots = nullptr;
        m_slotBits = 0;
    }

private:
    using NUMBER = std::uint32_t;  // entries count from 1
    static constexpr NUMBER FreeSlot = 0;
    static constexpr unsigned int FirstBlockBits = 4;
    static constexpr unsigned int FirstSlotBits = 5;
    static constexpr unsigned int ManySlotBits = 16;
    static constexpr NUMBER Ahead = 16;  // of a loop's step, for the memory to come in time

    // Entries stand in blocks of doubling size, so that none ever moves: the highest bit tells the block.
    static unsigned int BlockOf(NUMBER place)
    {
        return 31u - static_cast<unsigned int>(__builtin_clz(place));
    }

    NUMBER SlotCount() const { return NUMBER(1) << m_slotBits; }

    // What a slot holds above the bits of an entry's number: a part of its hash.
    NUMBER MarkOf(HASH hash) const { return static_cast<NUMBER>(hash >> 32) << m_slotBits; }

    ENTRY* EntryAt(NUMBER number) const
    {
        NUMBER const place = number - 1 + (NUMBER(1) << FirstBlockBits);
        unsigned int const block = BlockOf(place);
        return m_blocks[block - FirstBlockBits] + (place - (NUMBER(1) << block));
    }

    ENTRY* AddEntry(VALUE value, HASH hash)
    {
        if (m_next == m_blockEnd)
            AddBlock();
        ENTRY* const entry = KIND::Make(m_next, value, hash, m_pool);
        ++m_next;
        ++m_count;
        return entry;
    }

    void AddBlock()
    {
        NUMBER const size = m_count + (NUMBER(1) << FirstBlockBits);
        m_next = static_cast<ENTRY*>(m_pool.Take(size * sizeof(ENTRY), alignof(ENTRY)));
        m_blockEnd = m_next + size;
        m_blocks[BlockOf(size) - FirstBlockBits] = m_next;
    }

    // Sparse slots are found sooner, as long as they all stay in the processor's cache.
    void Grow()
    {
        unsigned int const bits = !m_slots ? FirstSlotBits : m_slotBits + (m_slotBits < ManySlotBits ? 3 : 2);
        if (bits > 31)
            throw std::bad_alloc();
        std::size_t const size = (std::size_t(1) << bits) * sizeof(NUMBER);
        m_slots = static_cast<NUMBER*>(std::memset(m_pool.Take(size, alignof(NUMBER)), FreeSlot, size));
        m_slotBits = bits;
        m_limit = SlotCount() / (bits > ManySlotBits ? 2 : 3);
        std::size_t const mask = SlotCount() - 1;
        auto const hashOf = [&](NUMBER number) { return KIND::HashOf(*EntryAt(number), m_seed); };
        for (NUMBER number = 1; number <= m_count; ++number)
        {
            if (number + Ahead <= m_count)
                __builtin_prefetch(&m_slots[hashOf(number + Ahead) & mask], 1);
            HASH const hash = hashOf(number);
            std::size_t at = hash & mask;
            while (m_slots[at] != FreeSlot)
                at = (at + 1) & mask;
            m_slots[at] = MarkOf(hash) | number;
        }
    }

    POOL& m_pool;
    HASH const m_seed;  // differs from run to run, so that no stream makes all values fall together
    // The number of the entry whose hash says this place or, if that is taken, one before; and its mark.
    NUMBER* m_slots = nullptr;
    unsigned int m_slotBits = 0;  // slots are a power of two, at least twice the entries
    ENTRY* m_blocks[32 - FirstBlockBits] = {};
    ENTRY* m_next = nullptr;  // where the next entry goes, unless the newest block is full
    ENTRY* m_blockEnd = nullptr;
    NUMBER m_count = 0;
    NUMBER m_limit = 0;  // how many entries there may be before the slots have to grow
    ENTRY const* m_last = nullptr;
};
}  // namespace comgui::detail
