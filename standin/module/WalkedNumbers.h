// Numbers that walks have handed out, and where they are, since a client may gather a ticket by the addresses
// of its values. An address is good for ten minutes, and until 10,000 other numbers have been handed out; so
// walking over a counter for months takes no memory without end. For any thread.
#pragma once

#include <chrono>
#include <functional>
#include <mutex>
#include <unordered_set>
#include <utility>

namespace standin
{
class WalkedNumbers
{
public:
    using Time = std::chrono::steady_clock::time_point;
    using Clock = std::function<Time()>;

    static constexpr std::chrono::minutes KeptFor{10};
    static constexpr std::size_t KeptNumbers = 10'000;

    explicit WalkedNumbers(Clock clock = std::chrono::steady_clock::now) : m_clock(std::move(clock)) {}

    // An address for the value word of a number; a short number's bytes come first.
    void const* AddressOf(unsigned long long word)
    {
        std::lock_guard const lock(m_lock);
        if (m_numbers.size() >= KeptNumbers)
            GrowOld();
        return &*m_numbers.insert(word).first;
    }

    std::size_t Count() const
    {
        std::lock_guard const lock(m_lock);
        return m_numbers.size() + m_old.size();
    }

private:
    // The old ones have had their time once as many others have come behind them, and taken as long.
    void GrowOld()
    {
        Time const now = m_clock();
        if (now - m_since < KeptFor)
            return;
        m_old = std::exchange(m_numbers, {});
        m_since = now;
    }

    Clock const m_clock;
    mutable std::mutex m_lock;
    std::unordered_set<unsigned long long> m_numbers;  // handed out since
    std::unordered_set<unsigned long long> m_old;      // and those before
    Time m_since = m_clock();
};
}  // namespace standin
