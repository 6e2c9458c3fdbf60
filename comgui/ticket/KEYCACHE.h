// The keys of a list: each distinct one once, as in a STRINGCACHE. Keys mostly come in order, as walks and
// streams have them, and one that is above all others is new: it goes behind them without a search. Only when
// a key comes that is not, all of them are put where they are found by hash.
#pragma once

#include "comgui/foundation/short_compare.h"
#include "comgui/foundation/short_copy.h"
#include "comgui/ticket/POOL.h"
#include "comgui/ticket/VALUE_INDEX.h"
#include "comgui/ticket/value_kinds.h"
#include <algorithm>
#include <cstddef>
#include <new>
#include <string_view>

namespace comgui::detail
{
class KEYCACHE
{
public:
    // The pool must outlive the cache.
    explicit KEYCACHE(POOL& pool) : m_pool(pool), m_index(pool) {}
    KEYCACHE(KEYCACHE const&) = delete;
    KEYCACHE& operator=(KEYCACHE const&) = delete;

    // The address of the cached copy; null for null.
    char const* operator[](char const* key) { return key ? Keep(key) : nullptr; }

    // The same for a key that holds no zero byte; none need follow.
    char const* Keep(std::string_view key)
    {
        int const order = m_greatest ? Compare(key, m_greatest->Text()) : 1;
        if (order > 0)
            return Append(key);
        return order == 0 ? m_greatest->Begin() : KeepByHash(key);
    }

    // Forgets all keys; every address given out dies. Their memory is the pool's to free.
    void clear()
    {
        m_index.Clear();
        m_greatest = m_unindexed = nullptr;
    }

private:
    // With the text and its zero byte behind it.
    struct KEY
    {
        KEY* before;
        std::size_t size;

        char* Begin() { return reinterpret_cast<char*>(this + 1); }
        std::string_view Text() { return {Begin(), size}; }
    };

    static int Compare(std::string_view left, std::string_view right)
    {
        int const order = CompareBytes(left.data(), right.data(), std::min(left.size(), right.size()));
        return order != 0 ? order : (left.size() > right.size()) - (left.size() < right.size());
    }

    // A text of the index, which is to be copied for it or lies in the pool already.
    struct TEXT_OR_KEY : TEXT
    {
        struct VALUE
        {
            std::string_view text;
            bool isKept;
        };
        static HASH Hash(VALUE value, HASH seed) { return TEXT::Hash(value.text, seed); }
        static bool Same(ENTRY const& entry, VALUE value) { return TEXT::Same(entry, value.text); }
        static ENTRY* Make(void* place, VALUE value, HASH hash, POOL& pool)
        {
            return value.isKept ? new (place) ENTRY{value.text.data(), value.text.size(), hash}
                                : TEXT::Make(place, value.text, hash, pool);
        }
    };

    char const* Append(std::string_view key)
    {
        void* const place = m_pool.Take(sizeof(KEY) + key.size() + 1, alignof(KEY));
        KEY* const kept = new (place) KEY{m_unindexed, key.size()};
        Copy(kept->Begin(), key.data(), key.size());
        kept->Begin()[key.size()] = '\0';
        m_greatest = m_unindexed = kept;
        return kept->Begin();
    }

    char const* KeepByHash(std::string_view key)
    {
        for (; m_unindexed; m_unindexed = m_unindexed->before)
            m_index.Keep({m_unindexed->Text(), true});
        return m_index.Keep({key, false}).text;
    }

    POOL& m_pool;
    KEY* m_greatest = nullptr;
    KEY* m_unindexed = nullptr;  // the newest of those that are not in the index
    VALUE_INDEX<TEXT_OR_KEY> m_index;
};
}  // namespace comgui::detail
