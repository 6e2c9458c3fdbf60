// Values whose addresses were handed out to a host, and which nobody gives back. An address is good for a
// while, and until so many others have been handed out behind it; so a host that reads for months takes no
// memory without end. Equal values share one address. For any thread.
#pragma once

#include <chrono>
#include <cstddef>
#include <functional>
#include <mutex>
#include <string>
#include <unordered_set>
#include <utility>

namespace comgui::plugin
{
template <typename T>
class Kept
{
public:
    using Time = std::chrono::steady_clock::time_point;
    using Clock = std::function<Time()>;

    static constexpr std::size_t KeptWeight = 10'000;  // a value weighs 1, and a text 1 more for each KiB

    explicit Kept(std::chrono::seconds keptFor, Clock clock = std::chrono::steady_clock::now)
        : m_keptFor(keptFor), m_clock(std::move(clock))
    {
    }

    T const& Keep(T value)
    {
        std::lock_guard<std::mutex> const lock(m_lock);
        if (m_weight >= KeptWeight)
            GrowOld();
        if (auto node = m_old.extract(value))  // its time begins again, at the same address
            return *m_values.insert(std::move(node)).position;
        auto const [position, isNew] = m_values.insert(std::move(value));
        if (isNew)
            m_weight += WeightOf(*position);
        return *position;
    }

    std::size_t Count() const
    {
        std::lock_guard<std::mutex> const lock(m_lock);
        return m_values.size() + m_old.size();
    }

private:
    // The old ones have had their time once as many others have come behind them, and taken as long.
    void GrowOld()
    {
        Time const now = m_clock();
        if (now - m_since < m_keptFor)
            return;
        m_old = std::exchange(m_values, {});
        m_weight = 0;
        m_since = now;
    }

    static std::size_t WeightOf(std::string const& text) { return 1 + text.size() / 1024; }
    template <typename Number>
    static std::size_t WeightOf(Number)
    {
        return 1;
    }

    std::chrono::seconds const m_keptFor;
    Clock const m_clock;
    mutable std::mutex m_lock;
    std::unordered_set<T> m_values;  // handed out since
    std::unordered_set<T> m_old;     // and those before
    std::size_t m_weight = 0;        // of the first
    Time m_since = m_clock();
};

// What the typed tickets of a session have handed out.
struct KeptValues
{
    static constexpr std::chrono::seconds KeptFor{60};

    Kept<std::string> texts{KeptFor};           // bytes too
    Kept<unsigned long long> numbers{KeptFor};  // of walks; a short number's bytes come first
};
}  // namespace comgui::plugin
