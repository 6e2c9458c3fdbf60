// Numbers that walks have handed out: each once, and where it is for as long as its owner lives, since a
// client may gather a ticket by the addresses of its values. For any thread.
#pragma once

#include "standin/server/tickets/TicketSnapshot.h"
#include <mutex>
#include <unordered_set>

namespace standin
{
class WalkedNumbers
{
public:
    // An address for the value word of a number.
    void const* AddressOf(unsigned long long word)
    {
        std::lock_guard const lock(m_lock);
        return &*m_numbers.insert(word).first;  // a short number's bytes come first
    }

private:
    std::mutex m_lock;
    std::unordered_set<unsigned long long> m_numbers;
};
}  // namespace standin
