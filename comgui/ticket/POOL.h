// Memory for many small things that all die together: a list's records, the values of a cache. Taking is a
// few instructions, nothing is given back one by one, and Clear() or the pool's end frees a handful of
// blocks. It runs no destructors. One thread at a time.
#pragma once

#include <cstddef>
#include <cstdint>

namespace comgui::detail
{
class POOL
{
public:
    POOL() = default;
    POOL(POOL const&) = delete;
    POOL& operator=(POOL const&) = delete;
    ~POOL() { Clear(); }

    // size bytes that stay where they are until Clear(). alignment: a power of two, at most that of
    // std::max_align_t. Throws std::bad_alloc.
    void* Take(std::size_t size, std::size_t alignment)
    {
        std::size_t const gap = -reinterpret_cast<std::uintptr_t>(m_free) & (alignment - 1);
        if (gap > m_left || size > m_left - gap)
            return TakeFromANewBlock(size);
        char* const place = m_free + gap;
        m_free = place + size;
        m_left -= gap + size;
        return place;
    }

    // Frees all blocks; whatever was taken is gone.
    void Clear();

private:
    struct BLOCK;

    BLOCK* NewBlock(std::size_t size);
    void* TakeFromANewBlock(std::size_t size);

    BLOCK* m_blocks = nullptr;
    char* m_free = nullptr;  // the rest of the newest block that is not of a single large piece
    std::size_t m_left = 0;  // bytes of it
    std::size_t m_nextSize = FirstSize;

    static constexpr std::size_t FirstSize = 1024;
    static constexpr std::size_t LargestSize = 16ul * 1024 * 1024;
};
}  // namespace comgui::detail
