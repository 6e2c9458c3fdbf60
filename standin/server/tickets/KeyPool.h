// Every parameter key of a server once, so that a key is compared by its address and all values of one key
// share one text. Keys stay for the life of the pool. Its owner locks it.
#pragma once

#include "standin/server/tickets/KeyHash.h"
#include <memory>
#include <unordered_map>

namespace standin
{
// A key's text lies right behind its size, ended by a zero byte: a look-up that has found the key has its
// text in the same line of the cache.
class PooledKey
{
public:
    std::size_t Hash() const { return m_hash; }
    std::string_view Text() const { return {CStr(), m_size}; }
    char const* CStr() const { return reinterpret_cast<char const*>(this + 1); }

private:
    friend class KeyPool;
    PooledKey(std::size_t hash, std::size_t size) : m_hash(hash), m_size(size) {}

    std::size_t m_hash;
    std::size_t m_size;
};
using Key = PooledKey const*;

class KeyPool
{
public:
    Key Intern(std::string_view text)
    {
        auto const known = m_keys.find(text);
        if (known != m_keys.end())
            return known->second.get();
        auto const size = sizeof(PooledKey) + text.size() + 1;
        Room room(static_cast<PooledKey*>(::operator new(size)));
        auto* const key = new (room.get()) PooledKey(HashOf(text), text.size());
        auto* const bytes = reinterpret_cast<char*>(key + 1);
        bytes[text.copy(bytes, text.size())] = '\0';
        m_keys.emplace(key->Text(), std::move(room));
        return key;
    }

private:
    struct Free
    {
        void operator()(PooledKey* key) const { ::operator delete(key); }
    };
    using Room = std::unique_ptr<PooledKey, Free>;
    struct Hash
    {
        std::size_t operator()(std::string_view text) const { return HashOf(text); }
    };
    std::unordered_map<std::string_view, Room, Hash> m_keys;
};
}  // namespace standin
