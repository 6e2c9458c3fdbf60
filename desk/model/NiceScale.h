// Where the ticks of an axis stand, and how its numbers are written. Plain values; words are the view's.
#pragma once

#include <vector>

namespace desk
{
enum class Quantity
{
    Number,
    DecimalBytes,  // kB, MB ... by 1000
    BinaryBytes,   // KiB, MiB ... by 1024
};

// A number in a unit: 1.5 of power 2 of DecimalBytes are 1.5 MB.
struct ScaledNumber
{
    double number;
    int digits;  // behind the point
    int power;   // 0 to 6; always 0 for Quantity::Number
};

// With about three digits that matter. What is no finite number is 0.
ScaledNumber Scaled(double value, Quantity quantity);

// Ticks at 1, 2 or 5 times a power of ten of one unit, chosen by the greatest value that is shown.
class NiceScale
{
public:
    // low, high: what must be visible, in either order; what is no finite number counts as 0. pixels: the
    // length of the axis. room: pixels that a label needs; there are at least two ticks whatever it is.
    NiceScale(double low, double high, int pixels, int room, Quantity quantity = Quantity::Number);

    // Where the axis begins and ends: ticks, the first and the last.
    double Low() const { return m_ticks.front(); }
    double High() const { return m_ticks.back(); }
    std::vector<double> const& Ticks() const { return m_ticks; }  // ascending

    // How a tick is written: all in one unit, with as many digits as tell them apart.
    ScaledNumber Label(double tick) const;

    // 0 at Low, 1 at High.
    double Share(double value) const { return (value - Low()) / (High() - Low()); }

private:
    std::vector<double> m_ticks;
    double m_unit = 1;
    int m_power = 0;
    int m_digits = 0;
};
}  // namespace desk
