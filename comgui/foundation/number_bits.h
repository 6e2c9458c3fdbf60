// The tests and conversions of numbers that a stream makes for every value it carries, by bits and inline;
// MathLib gives the same ones out to hosts.
#pragma once

#include <bit>

namespace comgui::detail
{
inline constexpr unsigned long long DoubleExponent = 0x7FF0000000000000;
inline constexpr unsigned int FloatExponent = 0x7F800000;
inline constexpr unsigned long long TopBit = 0x8000000000000000;

inline constexpr double NotADoubleNumber = std::bit_cast<double>(0x7FF8000000000000);
inline constexpr float NotAFloatNumber = std::bit_cast<float>(0x7FC00000);

// By bits, since no compiler option for faster arithmetic may take the test away. A set of all exponent bits
// takes in the infinities.
constexpr bool IsNotANumber(double v)
{
    return (std::bit_cast<unsigned long long>(v) & DoubleExponent) == DoubleExponent;
}

constexpr bool IsNotANumber(float v)
{
    return (std::bit_cast<unsigned int>(v) & FloatExponent) == FloatExponent;
}

constexpr double CastToNotANumber(double v) { return IsNotANumber(v) ? NotADoubleNumber : v; }

// From -2^53 to 2^53: one unsigned comparison for both ends.
constexpr bool FitsIntoDouble(long long v)
{
    return static_cast<unsigned long long>(v) + 0x20000000000000 < 0x40000000000001;
}

constexpr bool FitsIntoDouble(unsigned long long v) { return v <= 0x20000000000000; }

constexpr bool FitsIntoLongLong(unsigned long long v) { return (v & TopBit) == 0; }

constexpr double U64ToDouble(unsigned long long v)
{
    if (FitsIntoLongLong(v))
        return static_cast<double>(static_cast<long long>(v));
    constexpr unsigned long long half = 0x400;  // of the 11 bits that a double has no room for
    constexpr unsigned long long limit = ~TopBit - half;
    unsigned long long mantissa = v & ~TopBit;
    if (mantissa > limit)
        mantissa = limit;  // or the sum would spill into the exponent
    return std::bit_cast<double>(0x43E0000000000000 | ((mantissa + half) >> 11));
}
}  // namespace comgui::detail
