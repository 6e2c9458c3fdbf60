#include "tools/comgui_trace/Summary.h"

#include "tools/comgui_trace/CallText.h"
#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstdio>

namespace tracing
{
namespace
{
// The smallest duration that so much of the sorted ones does not exceed.
std::uint64_t Percentile(std::vector<std::uint64_t> const& sorted, double part)
{
    auto const place = static_cast<std::size_t>(std::ceil(part * static_cast<double>(sorted.size())));
    return sorted[std::clamp<std::size_t>(place, 1, sorted.size()) - 1];
}

// A bar for each range from one power of two to the next: how many calls took that long.
std::string Histogram(std::vector<std::uint64_t> const& sorted)
{
    static constexpr std::array Bars = {" ", "▁", "▂", "▃", "▄", "▅", "▆", "▇", "█"};
    auto const first = std::bit_width(sorted.front());
    std::vector<std::size_t> counts(static_cast<std::size_t>(std::bit_width(sorted.back()) - first) + 1);
    for (std::uint64_t const duration : sorted)
        ++counts[static_cast<std::size_t>(std::bit_width(duration) - first)];
    std::size_t const most = *std::max_element(counts.begin(), counts.end());
    std::string text;
    for (std::size_t const count : counts)
        text += Bars[count ? 1 + (Bars.size() - 2) * count / most : 0];
    return text;
}

std::vector<std::uint64_t> Sorted(std::vector<std::uint64_t> durations)
{
    std::sort(durations.begin(), durations.end());
    return durations;
}
}  // namespace

void Summary::Add(TracedCall const& call)
{
    Figures& figures = m_calls[static_cast<std::size_t>(call.began.head.call)];
    if (call.hasEnded)
        figures.durations.push_back(call.duration);
    else
        ++figures.open;
    if (!call.isGood)
        ++figures.failed;
}

std::string Summary::Text(unsigned long long dropped) const
{
    std::array<char, 256> line;
    std::snprintf(line.data(), line.size(), "%-24s %9s %8s %9s %9s %9s %9s  %s\n", "call", "calls", "failed",
                  "half", "90 %", "99 %", "longest", "each bar twice the time of the one before");
    std::string text = line.data();
    for (std::size_t i = 0; i < m_calls.size(); ++i)
    {
        Figures const& figures = m_calls[i];
        if (figures.durations.empty())
            continue;
        auto const sorted = Sorted(figures.durations);
        std::snprintf(
            line.data(), line.size(), "%-24s %9zu %8llu %9s %9s %9s %9s  %s\n", trace::CallTexts[i].name,
            sorted.size(), figures.failed, DurationText(Percentile(sorted, 0.5)).c_str(),
            DurationText(Percentile(sorted, 0.9)).c_str(), DurationText(Percentile(sorted, 0.99)).c_str(),
            DurationText(sorted.back()).c_str(), Histogram(sorted).c_str());
        text += line.data();
    }
    for (std::size_t i = 0; i < m_calls.size(); ++i)
        if (m_calls[i].open)
            text += std::string(trace::CallTexts[i].name) + ": " + std::to_string(m_calls[i].open) +
                    " never ended\n";
    if (dropped)
        text +=
            std::to_string(dropped) + " records were dropped: they came faster than they could be written\n";
    return text;
}

nlohmann::ordered_json Summary::Json(unsigned long long dropped) const
{
    nlohmann::ordered_json json;
    json["calls"] = nlohmann::ordered_json::array();
    for (std::size_t i = 0; i < m_calls.size(); ++i)
    {
        Figures const& figures = m_calls[i];
        if (figures.durations.empty() && !figures.open)
            continue;
        nlohmann::ordered_json call{{"call", trace::CallTexts[i].name},
                                    {"calls", figures.durations.size()},
                                    {"failed", figures.failed},
                                    {"open", figures.open}};
        if (!figures.durations.empty())
        {
            auto const sorted = Sorted(figures.durations);
            call["nanoseconds"] = {{"half", Percentile(sorted, 0.5)},
                                   {"90", Percentile(sorted, 0.9)},
                                   {"99", Percentile(sorted, 0.99)},
                                   {"longest", sorted.back()}};
        }
        json["calls"].push_back(std::move(call));
    }
    json["dropped"] = dropped;
    return json;
}
}  // namespace tracing
