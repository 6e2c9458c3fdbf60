// Finds texts by hash: which of few texts one is, or begins with, where many are looked for. A text is added
// with a number and stays with its owner, who keeps it where it is. Many threads may look while none adds.
#pragma once

#include "comgui/foundation/hash.h"
#include <bit>
#include <cstddef>
#include <cstdint>
#include <string_view>
#include <vector>

namespace comgui::detail
{
// Hashes the beginnings of one text, ever longer ones: what two of them have in common is read once.
class BEGINNINGS
{
public:
    BEGINNINGS(std::string_view text, HASH seed) : m_text(text), m_seed(seed), m_hash(seed) {}

    // size: up to that of the text, and never less than the time before.
    HASH HashOf(std::size_t size)
    {
        if (size < Step)
            return HashOfBytes(m_text.data(), size, m_seed);
        for (; size - m_read > Step; m_read += Step)
            m_hash = Mix(Word(m_read) ^ m_seed, Word(m_read + Step / 2) ^ m_hash);
        // The last bytes, of which some may have been read already.
        return Mix(Word(size - Step) ^ m_hash, Word(size - Step / 2) ^ (m_seed + size));
    }

private:
    static constexpr std::size_t Step = 16;

    HASH Word(std::size_t at) const { return LoadWord<std::uint64_t>(m_text.data() + at); }

    std::string_view m_text;
    HASH m_seed;
    HASH m_hash;             // of the whole steps so far
    std::size_t m_read = 0;  // bytes of them
};

class TEXT_TABLE
{
public:
    static constexpr std::size_t None = SIZE_MAX;

    // count: how many texts there will be at most. Throws std::bad_alloc.
    explicit TEXT_TABLE(std::size_t count)
        : m_slots(std::bit_ceil(SlotsEach * count)), m_mask(m_slots.size() - 1),
          m_seed(Mix(reinterpret_cast<std::uintptr_t>(m_slots.data()), 0xD6E8FEB86659FD93))
    {
    }

    // For HashOfBytes or BEGINNINGS, one of them for the whole table. It differs from run to run, so that no
    // texts can be made that all fall together.
    HASH Seed() const { return m_seed; }

    // Of equal texts the first one stays. number: not None.
    void Add(std::string_view text, HASH hash, std::size_t number)
    {
        std::size_t const place = PlaceOf(text, hash);
        if (m_slots[place].number == None)
            m_slots[place] = {hash, text, number};
    }

    // The number of the text, or None.
    std::size_t Find(std::string_view text, HASH hash) const { return m_slots[PlaceOf(text, hash)].number; }

private:
    // Most of what is looked for is not there: a free slot says so.
    static constexpr std::size_t SlotsEach = 4;

    // The slot of the text, or the free one where it belongs.
    std::size_t PlaceOf(std::string_view text, HASH hash) const
    {
        std::size_t at = hash & m_mask;
        while (m_slots[at].number != None && (m_slots[at].hash != hash || m_slots[at].text != text))
            at = (at + 1) & m_mask;
        return at;
    }

    struct SLOT
    {
        HASH hash = 0;
        std::string_view text;
        std::size_t number = None;  // the slot is free
    };

    std::vector<SLOT> m_slots;  // a power of two
    std::size_t m_mask;
    HASH m_seed;
};
}  // namespace comgui::detail
