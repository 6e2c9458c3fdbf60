// A ticket in memory: values by key. Its parameters come from the storage when first asked for. The server
// locks it.
#pragma once

#include "standin/server/tickets/KeyPool.h"
#include "standin/server/tickets/KeyValues.h"
#include <unordered_map>

namespace standin
{
struct Ticket
{
    using Keys = std::unordered_map<Key, KeyValues>;

    bool loaded = false;
    Keys keys;  // none of them without a value

    KeyValues const* Find(Key key) const  // null for a null key, too
    {
        auto const found = keys.find(key);
        return found == keys.end() ? nullptr : &found->second;
    }

    // The keys that begin with the prefix, bytewise in order.
    std::vector<Key> SortedKeys(std::string_view prefix = {}) const;
};

// Answers a read of a key's values as the slots promise; *out is untouched when it gives false. False for a
// null out, too.
bool ReadValue(KeyValues const& values, PARAM_TYPE type, void* out, int pos);
}  // namespace standin
