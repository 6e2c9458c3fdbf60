// Numbers for tests that hold a function against a second, independent way to the same result, and their
// bits as text.
#pragma once

#include <array>
#include <bit>
#include <cstdio>
#include <functional>
#include <string>

inline double FromBits(unsigned long long bits) { return std::bit_cast<double>(bits); }
inline float FromBits(unsigned int bits) { return std::bit_cast<float>(bits); }

inline std::string HexOf(unsigned long long bits)
{
    std::array<char, 17> text = {};
    std::snprintf(text.data(), text.size(), "%016llX", bits);
    return text.data();
}

inline std::string BitsOf(double v) { return HexOf(std::bit_cast<unsigned long long>(v)); }

// The same sequence in every run (splitmix64).
class PATTERNS
{
public:
    unsigned long long Next()
    {
        unsigned long long bits = state += 0x9E3779B97F4A7C15;
        bits = (bits ^ (bits >> 30)) * 0xBF58476D1CE4E5B9;
        bits = (bits ^ (bits >> 27)) * 0x94D049BB133111EB;
        return bits ^ (bits >> 31);
    }

private:
    unsigned long long state = 20;
};

// Integers on both sides of every power of two, and 100,000 patterns of which each second one is cut down to
// a random width.
inline void ForManyIntegers(std::function<void(unsigned long long)> const& test)
{
    for (int bit = 0; bit < 64; ++bit)
    {
        for (unsigned long long distance = 0; distance < 3; ++distance)
        {
            test((1ULL << bit) + distance);
            test((1ULL << bit) - distance);
        }
        test((1ULL << bit) | 0x400);
        test(~(1ULL << bit));
    }
    PATTERNS patterns;
    for (int i = 0; i < 50000; ++i)
    {
        test(patterns.Next());
        test(patterns.Next() >> (patterns.Next() & 63));
    }
}

// Doubles on both sides of every power of two that a 64-bit integer can hold, and 100,000 patterns of which
// each second one lies between 2^-4 and 2^66. Both signs; NaNs and infinities are among them.
inline void ForManyDoubles(std::function<void(double)> const& test)
{
    auto const bothSigns = [&](unsigned long long bits)
    {
        test(FromBits(bits));
        test(FromBits(bits ^ 0x8000000000000000));
    };
    bothSigns(0);
    bothSigns(0x7FF0000000000000);
    for (unsigned long long exponent = 1023 - 3; exponent < 1023 + 67; ++exponent)
    {
        bothSigns((exponent << 52) - 1);
        bothSigns(exponent << 52);
        bothSigns((exponent << 52) + 1);
    }
    PATTERNS patterns;
    for (int i = 0; i < 25000; ++i)
    {
        bothSigns(patterns.Next());
        bothSigns((1019 + patterns.Next() % 71) << 52 | patterns.Next() >> 12);
    }
}
