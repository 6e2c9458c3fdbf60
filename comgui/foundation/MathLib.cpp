#include "comgui/foundation/MathLib.h"

#include "comgui/foundation/number_bits.h"
#include <bit>
#include <cmath>
#include <limits>

double const MathLib::NOT_A_DOUBLE_NUMBER = comgui::detail::NotADoubleNumber;
float const MathLib::NOT_A_FLOAT_NUMBER = comgui::detail::NotAFloatNumber;

namespace
{
// For a NaN, and for 2^63 as long long, C++ leaves the result open and the processor's own is wanted.
template <typename T>
__attribute__((no_sanitize("float-cast-overflow"))) T Truncated(double v)
{
    return static_cast<T>(v);
}

// The comparisons are strict and false for a NaN, so what C++ leaves open gets through to the conversion.
template <typename T>
T Saturated(double v, double lowest, double highest)
{
    if (v > highest)
        return std::numeric_limits<T>::max();
    if (v < lowest)
        return std::numeric_limits<T>::min();
    return Truncated<T>(v);
}
}  // namespace

bool MathLib::IsNotANumber(double v) { return comgui::detail::IsNotANumber(v); }

bool MathLib::IsNotANumber(float v) { return comgui::detail::IsNotANumber(v); }

template <>
double MathLib::NotANumber<double>()
{
    return comgui::detail::NotADoubleNumber;
}

template <>
float MathLib::NotANumber<float>()
{
    return comgui::detail::NotAFloatNumber;
}

double MathLib::CastToNotANumber(double v) { return comgui::detail::CastToNotANumber(v); }

template <>
int MathLib::cast_value<int>(double v)
{
    return Saturated<int>(v, -2147483648.0, 2147483647.0);
}

template <>
unsigned int MathLib::cast_value<unsigned int>(double v)
{
    return Saturated<unsigned int>(v, 0.0, 4294967295.0);
}

template <>
long long MathLib::cast_value<long long>(double v)
{
    return Saturated<long long>(v, -0x1p63, 0x1p63);
}

double MathLib::Round(double v)
{
    // Also for 2^52 - 0.5, the one value above this limit that has a fraction left: hosts know it unrounded.
    if (std::fabs(v) > 4503599627370495.0)
        return v;
    if (v == 0)
        return 0.0;
    if (v > 0)
        return std::floor(v + 0.5);  // the sum may round up to the next integer: that is the chosen formula
    return -std::floor(0.5 - v);
}

int MathLib::RoundToInt(double v) { return cast_value<int>(Round(v)); }

unsigned int MathLib::RoundToUnsigned(double v) { return cast_value<unsigned int>(Round(v)); }

long long MathLib::RoundToI64(double v) { return cast_value<long long>(Round(v)); }

unsigned long long MathLib::RoundToU64(double v) { return DoubleToU64(Round(v)); }

double MathLib::RoundToBigGranularity(double v, int granularity)
{
    if (granularity < 1)
        return v;
    double const g = granularity;
    return Round(v / g) * g;
}

double MathLib::RoundToSmallGranularity(double v, int granularity)
{
    if (granularity < 1)
        return v;
    double const g = granularity;
    return Round(g * v) / g;
}

double MathLib::EpsilonFloor(double v, double epsilon) { return std::floor(v + std::fabs(v * epsilon)); }

double MathLib::EpsilonCeil(double v, double epsilon) { return std::ceil(v - std::fabs(v * epsilon)); }

int MathLib::EpsilonFloorToInt(double v, double epsilon) { return cast_value<int>(EpsilonFloor(v, epsilon)); }

int MathLib::EpsilonCeilToInt(double v, double epsilon) { return cast_value<int>(EpsilonCeil(v, epsilon)); }

unsigned int MathLib::EpsilonFloorToUnsigned(double v, double epsilon)
{
    return cast_value<unsigned int>(EpsilonFloor(v, epsilon));
}

unsigned int MathLib::EpsilonCeilToUnsigned(double v, double epsilon)
{
    return cast_value<unsigned int>(EpsilonCeil(v, epsilon));
}

bool MathLib::EpsilonEqual(double a, double b, double epsilon)
{
    return std::fabs(a - b) <= std::fabs(b) * epsilon;
}

bool MathLib::ExplicitEpsilonEqual(double a, double b, double epsilon) { return std::fabs(a - b) <= epsilon; }

double MathLib::MagneticInt(double v, double epsilon)
{
    double const nearest = Round(v);
    bool const close =
        nearest != 0 ? EpsilonEqual(v, nearest, epsilon) : ExplicitEpsilonEqual(v, nearest, epsilon);
    return close ? nearest : v;
}

unsigned long long MathLib::DoubleToU64(double v)
{
    if (comgui::detail::IsNotANumber(v))
        return 0xFFFFFFFFFFFFFFFF;
    if (v < 0)
        return 0;
    if (v > 18446744073709549568.0)  // the last double below 2^64
        return 0xFFFFFFFFFFFFFFFF;
    // Past the last double below 2^63 the mantissa fills the upper half of the range: only its top bit is not
    // stored.
    if (v > 9223372036854774784.0)
        return std::bit_cast<unsigned long long>(v) << 11 | comgui::detail::TopBit;
    return static_cast<unsigned long long>(static_cast<long long>(v));
}

double MathLib::U64ToDouble(unsigned long long v) { return comgui::detail::U64ToDouble(v); }

bool MathLib::FitsIntoDouble(long long v) { return comgui::detail::FitsIntoDouble(v); }

bool MathLib::FitsIntoDouble(unsigned long long v) { return comgui::detail::FitsIntoDouble(v); }

bool MathLib::FitsIntoLongLong(unsigned long long v) { return comgui::detail::FitsIntoLongLong(v); }

double MathLib::ResolutionToEncoderGranularity(double resolution, double base)
{
    if (resolution > base || resolution <= 0 || base <= 0)
        return comgui::detail::NotADoubleNumber;
    return base / RoundToInt(base / resolution);
}
