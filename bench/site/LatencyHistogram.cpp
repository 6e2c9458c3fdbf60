#include "bench/site/LatencyHistogram.h"

#include <algorithm>
#include <bit>

namespace
{
// Each power of two is cut into so many buckets; below the first one a bucket is one nanosecond.
constexpr unsigned FineBits = 5;
constexpr std::uint64_t Fine = 1u << FineBits;

std::size_t BucketOf(std::uint64_t nanoseconds)
{
    auto const width = static_cast<unsigned>(std::bit_width(nanoseconds));
    unsigned const power = width > FineBits + 1 ? width - FineBits - 1 : 0;
    return power * Fine + (nanoseconds >> power);
}

std::uint64_t UpperBorderOf(std::size_t bucket)
{
    std::uint64_t const power = bucket < 2 * Fine ? 0 : bucket / Fine - 1;
    return ((bucket - power * Fine + 1) << power) - 1;
}
}  // namespace

LatencyHistogram::LatencyHistogram(nlohmann::json const& form) : m_max(form.at("max"))
{
    for (auto const& bucket : form.at("buckets"))
        m_count += m_buckets.at(bucket.at(0)) = bucket.at(1);
}

void LatencyHistogram::Add(std::int64_t nanoseconds)
{
    nanoseconds = std::max<std::int64_t>(nanoseconds, 0);
    ++m_buckets[BucketOf(static_cast<std::uint64_t>(nanoseconds))];
    ++m_count;
    m_max = std::max(m_max, nanoseconds);
}

void LatencyHistogram::Add(LatencyHistogram const& other)
{
    for (std::size_t i = 0; i < Buckets; ++i)
        m_buckets[i] += other.m_buckets[i];
    m_count += other.m_count;
    m_max = std::max(m_max, other.m_max);
}

std::int64_t LatencyHistogram::Percentile(double percent) const
{
    double const wanted = static_cast<double>(m_count) * percent / 100;
    std::uint64_t seen = 0;
    for (std::size_t i = 0; i < Buckets; ++i)
        if (seen += m_buckets[i]; seen > 0 && static_cast<double>(seen) >= wanted)
            return std::min(static_cast<std::int64_t>(UpperBorderOf(i)), m_max);
    return 0;
}

nlohmann::json LatencyHistogram::Form() const
{
    auto buckets = nlohmann::json::array();
    for (std::size_t i = 0; i < Buckets; ++i)
        if (m_buckets[i] > 0)
            buckets.push_back({i, m_buckets[i]});
    return {{"max", m_max}, {"buckets", buckets}};
}
