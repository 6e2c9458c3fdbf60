#include "desk/model/TimeSeries.h"

#include <algorithm>
#include <cmath>

namespace desk
{
namespace
{
// Takes the later point into the earlier one.
void Merge(TimePoint& point, TimePoint const& later)
{
    point = {later.time, later.value, std::min(point.low, later.low), std::max(point.high, later.high)};
}
}  // namespace

TimeSeries::TimeSeries(std::size_t capacity, double resolution)
    : m_capacity(std::max<std::size_t>(capacity, 2)), m_width(resolution)
{
}

double TimeSeries::SlotOf(double time) const { return std::floor((time - m_start) / m_width); }

void TimeSeries::Add(double time, double value)
{
    if (!std::isfinite(time) || !std::isfinite(value))
        return;
    if (IsEmpty())
    {
        m_start = time;
        m_lowest = m_highest = value;
    }
    else
        time = std::max(time, m_points.back().time);
    m_lowest = std::min(m_lowest, value);
    m_highest = std::max(m_highest, value);

    TimePoint const point{time, value, value, value};
    if (!IsEmpty() && SlotOf(time) == SlotOf(m_points.back().time))
        return Merge(m_points.back(), point);
    m_points.push_back(point);
    while (m_points.size() > m_capacity)
        Thin();
}

void TimeSeries::Thin()
{
    m_width *= 2;
    std::size_t last = 0;
    for (std::size_t i = 1; i < m_points.size(); ++i)
        if (SlotOf(m_points[i].time) == SlotOf(m_points[last].time))
            Merge(m_points[last], m_points[i]);
        else
            m_points[++last] = m_points[i];
    m_points.resize(last + 1);
}

TimePoint const* TimeSeries::Nearest(double time) const
{
    if (IsEmpty())
        return nullptr;
    auto const after =
        std::lower_bound(m_points.begin(), m_points.end(), time,
                         [](TimePoint const& point, double when) { return point.time < when; });
    if (after == m_points.begin())
        return &*after;
    auto const before = after - 1;
    return after == m_points.end() || time - before->time <= after->time - time ? &*before : &*after;
}
}  // namespace desk
