// Every parameter key of a server once, so that a key is compared by its address and all values of one key
// share one text. Its owner locks it.
//
// A key stays in the pool as long as a ticket has it. The others are taken out now and then, since a site
// that lives for years may see keys without end; who needs one for longer than he sees its ticket holds it.
#pragma once

#include "standin/server/tickets/KeyHash.h"
#include <algorithm>
#include <atomic>
#include <new>
#include <unordered_map>
#include <utility>
#include <vector>

namespace standin
{
// A key's text lies right behind this, ended by a zero byte: a look-up that has found the key has its text in
// the same line of the cache.
class PooledKey
{
public:
    std::size_t Hash() const { return m_hash; }
    std::string_view Text() const { return {CStr(), m_size}; }
    char const* CStr() const { return reinterpret_cast<char const*>(this + 1); }

    // A ticket has it from now on, or no longer. For the owner of the pool.
    void Gain() const { ++m_tickets; }
    void Lose() const { --m_tickets; }

private:
    friend class KeyPool;
    friend class HeldKey;
    explicit PooledKey(std::string_view text) : m_hash(HashOf(text)), m_size(text.size())
    {
        auto* const bytes = reinterpret_cast<char*>(this + 1);
        bytes[text.copy(bytes, text.size())] = '\0';
    }

    std::size_t m_hash;
    std::size_t m_size;
    mutable std::size_t m_tickets = 0;
    mutable std::atomic<std::size_t> m_holders{0};
};
using Key = PooledKey const*;

// A key that stays, whatever becomes of its tickets and its pool. For any thread.
class HeldKey
{
public:
    HeldKey() = default;
    HeldKey(Key key) : m_key(key)  // of a pool, or seen in a ticket
    {
        if (m_key)
            m_key->m_holders.fetch_add(1, std::memory_order_relaxed);
    }
    HeldKey(HeldKey const& other) : HeldKey(other.m_key) {}
    HeldKey(HeldKey&& other) noexcept : m_key(std::exchange(other.m_key, nullptr)) {}
    HeldKey& operator=(HeldKey other) noexcept
    {
        std::swap(m_key, other.m_key);
        return *this;
    }
    ~HeldKey()
    {
        if (m_key && m_key->m_holders.fetch_sub(1, std::memory_order_acq_rel) == 1)
            ::operator delete(const_cast<PooledKey*>(m_key));
    }

    Key Get() const { return m_key; }
    Key operator->() const { return m_key; }

private:
    Key m_key = nullptr;
};

class KeyPool
{
public:
    // Stays until a call of TakeUnused finds no ticket that has it.
    Key Intern(std::string_view text)
    {
        auto const known = m_keys.find(text);
        if (known != m_keys.end())
            return known->second.Get();
        HeldKey key(new (::operator new(sizeof(PooledKey) + text.size() + 1)) PooledKey(text));
        std::string_view const name = key->Text();
        return m_keys.emplace(name, std::move(key)).first->second.Get();
    }

    std::size_t Size() const { return m_keys.size(); }

    // Is it time to take some out? At first when there are a thousand, then when there are twice as many as
    // were left.
    bool IsFull() const { return m_keys.size() >= m_full; }

    // The keys that no ticket has, for readers may still see them. Throws bad_alloc, with nothing changed.
    std::vector<HeldKey> TakeUnused()
    {
        auto const isUnused = [](auto const& each) { return each.second->m_tickets == 0; };
        std::vector<HeldKey> unused;
        unused.reserve(static_cast<std::size_t>(std::count_if(m_keys.begin(), m_keys.end(), isUnused)));
        for (auto const& each : m_keys)
            if (isUnused(each))
                unused.push_back(each.second);
        std::erase_if(m_keys, isUnused);
        m_full = std::max(SmallestFull, 2 * m_keys.size());
        return unused;
    }

private:
    static constexpr std::size_t SmallestFull = 1000;

    struct Hash
    {
        std::size_t operator()(std::string_view text) const { return HashOf(text); }
    };
    std::unordered_map<std::string_view, HeldKey, Hash> m_keys;
    std::size_t m_full = SmallestFull;
};
}  // namespace standin
