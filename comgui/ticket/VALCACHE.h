// Keeps each distinct number once and gives out its address. 0.0 and -0.0 are one number, the first of them
// that came. NaN equals nothing, so keep it out. Otherwise as STRINGCACHE.
#pragma once

#include "comgui/ticket/VALUE_INDEX.h"
#include <new>
#include <type_traits>

namespace comgui::detail
{
template <typename T>
struct NUMBER
{
    using VALUE = T;
    using ENTRY = T;

    static HASH Hash(T number, HASH seed)
    {
        if constexpr (std::is_floating_point_v<T>)
            number += T(0);  // turns -0.0 into 0.0
        HASH bits = 0;
        std::memcpy(&bits, &number, sizeof number);
        return HashOfNumber(bits, seed);
    }
    static HASH HashOf(T number, HASH seed) { return Hash(number, seed); }
    static bool Same(T entry, T number) { return entry == number; }
    static T* Make(void* place, T number, HASH, POOL&) { return new (place) T(number); }
};
}  // namespace comgui::detail

// T: int, unsigned int, long long, unsigned long long or double.
template <typename T>
class VALCACHE
{
public:
    VALCACHE() : m_numbers(m_ownPool) {}

    // Takes all memory from that pool, where it stays when the cache is cleared.
    explicit VALCACHE(comgui::detail::POOL& pool) : m_numbers(pool) {}

    // Replaces number by the address of the cached copy, and returns that address. Null stays null.
    T const* operator()(T const*& number) { return number ? number = Keep(*number) : nullptr; }

    // The address of the cached copy.
    T const* Keep(T number) { return &m_numbers.Keep(number); }

    // Keep is about to be called for that number and for others: their searches then wait for the memory
    // together.
    void Expect(T number) const { m_numbers.Expect(number); }

    // Drops all numbers; every address given out dies.
    void clear()
    {
        m_numbers.Clear();
        m_ownPool.Clear();
    }

private:
    comgui::detail::POOL m_ownPool;
    comgui::detail::VALUE_INDEX<comgui::detail::NUMBER<T>> m_numbers;
};
