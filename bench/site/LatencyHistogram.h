// How long something took, as counts in buckets that are about 3 % wide: small, whatever the number of
// measurements, and easily added up over several programs. Times are nanoseconds.
#pragma once

#include <cstdint>
#include <nlohmann/json.hpp>
#include <vector>

class LatencyHistogram
{
public:
    LatencyHistogram() = default;
    explicit LatencyHistogram(nlohmann::json const& form);  // as Form() gave it

    void Add(std::int64_t nanoseconds);
    void Add(LatencyHistogram const& other);

    std::uint64_t Count() const { return m_count; }
    std::int64_t Percentile(double percent) const;  // the upper border of its bucket; 0 without a measurement
    std::int64_t Max() const { return m_max; }

    nlohmann::json Form() const;

private:
    static constexpr std::size_t Buckets = 2048;

    std::vector<std::uint64_t> m_buckets = std::vector<std::uint64_t>(Buckets);
    std::uint64_t m_count = 0;
    std::int64_t m_max = 0;
};
