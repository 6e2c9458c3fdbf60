// The records of a list, in order, in blocks that a pool gives and frees. One thread at a time.
#pragma once

#include "comgui/ticket/POOL.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include <algorithm>
#include <cstddef>
#include <new>

namespace comgui::detail
{
class RECORD_BLOCKS
{
public:
    // The pool must outlive the records.
    explicit RECORD_BLOCKS(POOL& pool) : m_pool(pool) {}
    RECORD_BLOCKS(RECORD_BLOCKS const&) = delete;
    RECORD_BLOCKS& operator=(RECORD_BLOCKS const&) = delete;

    unsigned long Size() const { return m_size; }

    void Append(char const* key, PARAM_TYPE type, void const* value, int pos)
    {
        if (m_next == m_end)
            AddBlock();
        new (m_next++)
            SETMULTIPAR{key, type, 0, value, pos, false, {}};  // where it stands: a copy would stall
        ++m_size;
    }

    // Where a copy of all of them ends. to: room for Size() records.
    SETMULTIPAR* CopyTo(SETMULTIPAR* to) const
    {
        ForEachBlock([&](BLOCK* block, std::size_t count) { to = std::copy_n(block->Records(), count, to); });
        return to;
    }

    // Stores as many again over them.
    void CopyFrom(SETMULTIPAR const* from)
    {
        ForEachBlock(
            [&](BLOCK* block, std::size_t count)
            {
                std::copy_n(from, count, block->Records());
                from += count;
            });
    }

    // Forgets all records. Their memory is the pool's to free.
    void Clear()
    {
        m_first = m_last = nullptr;
        m_next = m_end = nullptr;
        m_size = 0;
    }

private:
    static constexpr std::size_t SmallestBlock = 8;
    static constexpr std::size_t LargestBlock = 1024;

    // With its records behind it.
    struct BLOCK
    {
        BLOCK* next;
        std::size_t size;  // in records

        SETMULTIPAR* Records() { return reinterpret_cast<SETMULTIPAR*>(this + 1); }
    };

    void AddBlock()
    {
        std::size_t const size =
            std::clamp<std::size_t>(m_size, SmallestBlock, LargestBlock);  // doubles what there is
        void* const place = m_pool.Take(sizeof(BLOCK) + size * sizeof(SETMULTIPAR), alignof(SETMULTIPAR));
        BLOCK* const block = new (place) BLOCK{nullptr, size};
        (m_last ? m_last->next : m_first) = block;
        m_last = block;
        m_next = block->Records();
        m_end = m_next + size;
    }

    // visit: gets each block and how many records are in it.
    template <typename VISIT>
    void ForEachBlock(VISIT visit) const
    {
        for (BLOCK* block = m_first; block; block = block->next)
            visit(block, block == m_last ? static_cast<std::size_t>(m_next - block->Records()) : block->size);
    }

    POOL& m_pool;
    BLOCK* m_first = nullptr;
    BLOCK* m_last = nullptr;
    SETMULTIPAR* m_next = nullptr;  // where the next record goes, unless the last block is full
    SETMULTIPAR* m_end = nullptr;
    unsigned long m_size = 0;
};
}  // namespace comgui::detail
