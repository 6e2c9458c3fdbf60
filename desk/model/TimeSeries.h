// Values over time for a plot, in bounded memory however long it lasts. A plain value.
//
// Time is cut into slots of equal width, and a point stands for all values of its slot. When there are too
// many points the slots become twice as wide. A short peak stays visible, since a point keeps the extremes of
// its slot.
#pragma once

#include <cstddef>
#include <vector>

namespace desk
{
struct TimePoint
{
    double time;   // seconds; of the slot's latest value
    double value;  // the latest one
    double low;
    double high;
};

class TimeSeries
{
public:
    // resolution: the width of the first slots, in seconds.
    explicit TimeSeries(std::size_t capacity = 300, double resolution = 0.1);

    // Time does not run backwards here: one before the last counts as the last. What is no finite number is
    // left out. Constant time on the average.
    void Add(double time, double value);

    std::vector<TimePoint> const& Points() const { return m_points; }  // by time
    bool IsEmpty() const { return m_points.empty(); }

    // Of all values ever added; 0 if there are none.
    double Lowest() const { return m_lowest; }
    double Highest() const { return m_highest; }
    double Last() const { return IsEmpty() ? 0 : m_points.back().value; }

    // The point whose time is the nearest; null if there are none.
    TimePoint const* Nearest(double time) const;

private:
    double SlotOf(double time) const;
    void Thin();

    std::size_t m_capacity;
    double m_width;
    double m_start = 0;
    double m_lowest = 0;
    double m_highest = 0;
    std::vector<TimePoint> m_points;
};
}  // namespace desk
