// Every parameter key of a server once, so that a key is compared and hashed by its address and all records
// of one key share one text. Keys stay for the life of the pool. Its owner locks it.
#pragma once

#include <functional>
#include <string>
#include <string_view>
#include <unordered_set>

namespace standin
{
using Key = std::string const*;

class KeyPool
{
public:
    // Null for a key that no ticket ever held. Allocates nothing.
    Key Find(std::string_view text) const
    {
        auto const found = m_keys.find(text);
        return found == m_keys.end() ? nullptr : &*found;
    }

    Key Intern(std::string_view text)
    {
        Key const known = Find(text);
        return known ? known : &*m_keys.emplace(text).first;
    }

private:
    struct Hash
    {
        using is_transparent = void;
        std::size_t operator()(std::string_view text) const { return std::hash<std::string_view>()(text); }
    };
    std::unordered_set<std::string, Hash, std::equal_to<>> m_keys;
};
}  // namespace standin
