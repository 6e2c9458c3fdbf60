#include "desk/model/NiceScale.h"

#include <algorithm>
#include <cmath>

namespace desk
{
namespace
{
constexpr int GreatestPower = 6;      // exa
constexpr double Greatest = 1e300;    // so that differences stay finite
constexpr double Least = 1e-290;      // so that a step is no denormal number
constexpr double Finest = 1e-9;       // of the values: below, doubles no longer tell ticks apart
constexpr double GreatestExact = 15;  // digits that a double has

double Tamed(double value)
{
    return std::isfinite(value) && std::abs(value) >= Least ? std::clamp(value, -Greatest, Greatest) : 0;
}

double BaseOf(Quantity quantity) { return quantity == Quantity::BinaryBytes ? 1024 : 1000; }

int PowerOf(double value, Quantity quantity)
{
    int power = 0;
    if (quantity != Quantity::Number)
        for (double rest = std::abs(value); rest >= BaseOf(quantity) && power < GreatestPower; ++power)
            rest /= BaseOf(quantity);
    return power;
}

// The least of 1, 2, 5 times a power of ten that is not below.
double NiceStep(double least)
{
    double const ten = std::pow(10, std::floor(std::log10(least)));
    for (double const factor : {1.0, 2.0, 5.0})
        if (factor * ten >= least * (1 - Finest))
            return factor * ten;
    return 10 * ten;
}

int DigitsOf(double step)
{
    double const digits = std::ceil(-std::log10(step) - Finest);
    return static_cast<int>(std::clamp(digits, 0.0, GreatestExact));
}
}  // namespace

ScaledNumber Scaled(double value, Quantity quantity)
{
    value = Tamed(value);
    int power = PowerOf(value, quantity);
    double number = value / std::pow(BaseOf(quantity), power);
    // 999.7 kB would be written as 1000 kB.
    if (quantity != Quantity::Number && std::abs(number) >= BaseOf(quantity) - 0.5 && power < GreatestPower)
    {
        number /= BaseOf(quantity);
        ++power;
    }
    bool const isWhole = quantity != Quantity::Number && power == 0;
    double const size = std::abs(number);
    int const digits = isWhole || size >= 99.95 ? 0 : size >= 9.995 ? 1 : 2;
    return {number, digits, power};
}

NiceScale::NiceScale(double low, double high, int pixels, int room, Quantity quantity)
{
    low = Tamed(low);
    high = Tamed(high);
    if (low > high)
        std::swap(low, high);
    double const size = std::max(std::abs(low), std::abs(high));
    if (high - low <= size * Finest)
        high = size == 0 ? 1 : high + size * 0.1;
    m_power = PowerOf(std::max(std::abs(low), std::abs(high)), quantity);
    m_unit = std::pow(BaseOf(quantity), m_power);

    double const intervals = std::clamp(pixels / std::max(room, 1), 1, 20);
    double step = NiceStep((high - low) / m_unit / intervals);
    if (quantity != Quantity::Number && m_power == 0)
        step = std::max(step, 1.0);  // there is no half byte
    m_digits = DigitsOf(step);
    double const first = std::floor(low / m_unit / step + Finest);
    double const last = std::max(std::ceil(high / m_unit / step - Finest), first + 1);
    for (int i = 0; i <= static_cast<int>(last - first); ++i)
        m_ticks.push_back((first + i) * step * m_unit);
}

ScaledNumber NiceScale::Label(double tick) const
{
    double const number = tick / m_unit;
    return {number == 0 ? 0 : number, m_digits, m_power};  // no "-0"
}
}  // namespace desk
