#include "comgui/ticket/POOL.h"

#include <algorithm>
#include <new>
#include <utility>

namespace comgui::detail
{
struct alignas(std::max_align_t) POOL::BLOCK
{
    BLOCK* next;

    char* Bytes() { return reinterpret_cast<char*>(this + 1); }
};

POOL::BLOCK* POOL::NewBlock(std::size_t size)
{
    if (size > PTRDIFF_MAX - sizeof(BLOCK))
        throw std::bad_alloc();
    return m_blocks = new (operator new(sizeof(BLOCK) + size)) BLOCK{m_blocks};
}

void* POOL::TakeFromANewBlock(std::size_t size)
{
    // A large piece gets a block of its own, so that what is left of the current one is not lost.
    if (size > m_nextSize / 4)
        return NewBlock(size)->Bytes();
    char* const bytes = NewBlock(m_nextSize)->Bytes();
    m_free = bytes + size;
    m_left = m_nextSize - size;
    // The newest block is then two thirds of all of them. An allocator that gives memory back to the system
    // once more than twice its largest block is free keeps all of it for the next pool; with blocks that
    // double, a list of 10,000 records that is made again and again took five times as long.
    m_nextSize = std::min(m_nextSize * 3, LargestSize);
    return bytes;
}

void POOL::Clear()
{
    while (m_blocks)
        operator delete(std::exchange(m_blocks, m_blocks->next));
    m_free = nullptr;
    m_left = 0;
    m_nextSize = FirstSize;
}
}  // namespace comgui::detail
