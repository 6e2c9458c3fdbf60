#include "comgui/foundation/MathLib.h"

#include "tests/foundation/NumberSamples.h"

#include <algorithm>
#include <cfloat>
#include <climits>
#include <cmath>
#include <dlfcn.h>
#include <gtest/gtest.h>
#include <limits>

using namespace MathLib;

namespace
{
double const infinity = std::numeric_limits<double>::infinity();
double const noNumber = std::numeric_limits<double>::quiet_NaN();
double const just = 0.49999999999999994;  // the last double below one half

// What is left of a finite number behind its cut fraction, in the range of T.
template <typename T>
T Cut(double v)
{
    long double const cut = std::trunc(static_cast<long double>(v));
    return static_cast<T>(std::clamp(cut, static_cast<long double>(std::numeric_limits<T>::min()),
                                     static_cast<long double>(std::numeric_limits<T>::max())));
}

__extension__ typedef unsigned __int128 WIDE;
}  // namespace

TEST(NOT_A_DOUBLE_NUMBER, IsTheQuietNaNWithoutPayload)
{
    EXPECT_EQ(BitsOf(NOT_A_DOUBLE_NUMBER), "7FF8000000000000");
}

TEST(NOT_A_FLOAT_NUMBER, IsTheQuietNaNWithoutPayload)
{
    EXPECT_EQ(std::bit_cast<unsigned int>(NOT_A_FLOAT_NUMBER), 0x7FC00000U);
}

TEST(NOT_A_DOUBLE_NUMBER, HasOneAddressForTheLibraryAndItsHost)
{
    EXPECT_EQ(dlsym(RTLD_DEFAULT, "_ZN7MathLib19NOT_A_DOUBLE_NUMBERE"), &NOT_A_DOUBLE_NUMBER);
}

TEST(NotANumber, OfDouble_HasTheBitsOfTheConstant)
{
    EXPECT_EQ(BitsOf(NotANumber<double>()), BitsOf(NOT_A_DOUBLE_NUMBER));
}

TEST(NotANumber, OfFloat_HasTheBitsOfTheConstant)
{
    EXPECT_EQ(std::bit_cast<unsigned int>(NotANumber<float>()), 0x7FC00000U);
}

TEST(IsNotANumber, Infinity_CountsAsMissing_ByDesign)
{
    EXPECT_TRUE(IsNotANumber(infinity));
    EXPECT_TRUE(IsNotANumber(-infinity));
    EXPECT_TRUE(IsNotANumber(std::numeric_limits<float>::infinity()));
    EXPECT_TRUE(IsNotANumber(-std::numeric_limits<float>::infinity()));
}

TEST(IsNotANumber, NaNOfAnyPayloadAndSign_IsTrue)
{
    for (unsigned long long const bits :
         {0x7FF0000000000001ULL, 0x7FF8000000000000ULL, 0x7FFFFFFFFFFFFFFFULL, 0xFFF0000000000001ULL,
          0xFFF8000000000000ULL, 0xFFFFFFFFFFFFFFFFULL})
        EXPECT_TRUE(IsNotANumber(FromBits(bits))) << HexOf(bits);
    for (unsigned int const bits :
         {0x7F800001U, 0x7FC00000U, 0x7FFFFFFFU, 0xFF800001U, 0xFFC00000U, 0xFFFFFFFFU})
        EXPECT_TRUE(IsNotANumber(FromBits(bits))) << HexOf(bits);
}

TEST(IsNotANumber, FiniteNumber_IsFalse)
{
    for (double const v : {0.0, -0.0, 1.5, -1.5, DBL_MAX, -DBL_MAX, DBL_MIN, FromBits(1ULL)})
        EXPECT_FALSE(IsNotANumber(v)) << BitsOf(v);
    for (float const v : {0.0F, -0.0F, 1.5F, -1.5F, FLT_MAX, -FLT_MAX, FLT_MIN, FromBits(1U)})
        EXPECT_FALSE(IsNotANumber(v)) << v;
}

TEST(IsNotANumber, ManyDoubles_AgreesWithTheStandardLibrary)
{
    ForManyDoubles([](double v) { ASSERT_EQ(IsNotANumber(v), !std::isfinite(v)) << BitsOf(v); });
}

TEST(IsNotANumber, ManyFloats_AgreesWithTheStandardLibrary)
{
    ForManyIntegers(
        [](unsigned long long bits)
        {
            float const v = FromBits(static_cast<unsigned int>(bits));
            ASSERT_EQ(IsNotANumber(v), !std::isfinite(v)) << HexOf(bits);
        });
}

TEST(CastToNotANumber, WhateverIsMissing_ComesOutAsTheOnePattern)
{
    for (unsigned long long const bits :
         {0x7FF0000000000000ULL, 0xFFF0000000000000ULL, 0x7FF0000000000001ULL, 0xFFF8000000000000ULL,
          0x7FFFFFFFFFFFFFFFULL, 0xFFFFFFFFFFFFFFFFULL})
        EXPECT_EQ(BitsOf(CastToNotANumber(FromBits(bits))), "7FF8000000000000") << HexOf(bits);
}

TEST(CastToNotANumber, FiniteNumber_StaysAsItIs)
{
    for (double const v : {1.5, -0.0, 0.0, -DBL_MAX, FromBits(1ULL)})
        EXPECT_EQ(BitsOf(CastToNotANumber(v)), BitsOf(v));
}

TEST(cast_value, InsideTheRange_IsCutTowardZero)
{
    EXPECT_EQ(cast_value<int>(2.9), 2);
    EXPECT_EQ(cast_value<int>(-2.9), -2);
    EXPECT_EQ(cast_value<unsigned int>(2.9), 2U);
    EXPECT_EQ(cast_value<unsigned int>(3000000000.9), 3000000000U);
    EXPECT_EQ(cast_value<long long>(-3000000000.9), -3000000000LL);
}

TEST(cast_value, Int_StopsAtItsLimits)
{
    EXPECT_EQ(cast_value<int>(2147483646.5), 2147483646);
    EXPECT_EQ(cast_value<int>(2147483647.0), INT_MAX);
    EXPECT_EQ(cast_value<int>(2147483647.5), INT_MAX);
    EXPECT_EQ(cast_value<int>(2147483648.0), INT_MAX);
    EXPECT_EQ(cast_value<int>(infinity), INT_MAX);
    EXPECT_EQ(cast_value<int>(-2147483647.5), -2147483647);
    EXPECT_EQ(cast_value<int>(-2147483648.0), INT_MIN);
    EXPECT_EQ(cast_value<int>(-2147483648.5), INT_MIN);
    EXPECT_EQ(cast_value<int>(-2147483649.0), INT_MIN);
    EXPECT_EQ(cast_value<int>(-infinity), INT_MIN);
}

TEST(cast_value, UnsignedInt_StopsAtItsLimits)
{
    EXPECT_EQ(cast_value<unsigned int>(4294967294.5), 4294967294U);
    EXPECT_EQ(cast_value<unsigned int>(4294967295.0), UINT_MAX);
    EXPECT_EQ(cast_value<unsigned int>(4294967295.5), UINT_MAX);
    EXPECT_EQ(cast_value<unsigned int>(4294967296.0), UINT_MAX);
    EXPECT_EQ(cast_value<unsigned int>(infinity), UINT_MAX);
    EXPECT_EQ(cast_value<unsigned int>(-0.0), 0U);
    EXPECT_EQ(cast_value<unsigned int>(-FromBits(1ULL)), 0U);
    EXPECT_EQ(cast_value<unsigned int>(-1.0), 0U);
    EXPECT_EQ(cast_value<unsigned int>(-infinity), 0U);
}

TEST(cast_value, LongLong_StopsAtItsLimits)
{
    EXPECT_EQ(cast_value<long long>(9223372036854774784.0), 0x7FFFFFFFFFFFFC00LL);
    EXPECT_EQ(cast_value<long long>(9223372036854777856.0), LLONG_MAX);
    EXPECT_EQ(cast_value<long long>(infinity), LLONG_MAX);
    EXPECT_EQ(cast_value<long long>(-9223372036854774784.0), -0x7FFFFFFFFFFFFC00LL);
    EXPECT_EQ(cast_value<long long>(-9223372036854775808.0), LLONG_MIN);
    EXPECT_EQ(cast_value<long long>(-9223372036854777856.0), LLONG_MIN);
    EXPECT_EQ(cast_value<long long>(-infinity), LLONG_MIN);
}

#if defined(__x86_64__) || defined(__aarch64__)
TEST(cast_value, WhatCppLeavesOpen_IsTheProcessorsOwnConversion_ByDesign)
{
#    if defined(__x86_64__)
    EXPECT_EQ(cast_value<int>(noNumber), INT_MIN);
    EXPECT_EQ(cast_value<unsigned int>(noNumber), 0U);
    EXPECT_EQ(cast_value<long long>(noNumber), LLONG_MIN);
    EXPECT_EQ(cast_value<long long>(9223372036854775808.0), LLONG_MIN);
#    else
    EXPECT_EQ(cast_value<int>(noNumber), 0);
    EXPECT_EQ(cast_value<unsigned int>(noNumber), 0U);
    EXPECT_EQ(cast_value<long long>(noNumber), 0);
    EXPECT_EQ(cast_value<long long>(9223372036854775808.0), LLONG_MAX);
#    endif
}
#endif

TEST(cast_value, ManyDoubles_AgreesWithTheCutAndClampedNumber)
{
    ForManyDoubles(
        [](double v)
        {
            if (!std::isfinite(v))
                return;
            ASSERT_EQ(cast_value<int>(v), Cut<int>(v)) << BitsOf(v);
            ASSERT_EQ(cast_value<unsigned int>(v), Cut<unsigned int>(v)) << BitsOf(v);
            if (v == 0x1p63)
                return;
            ASSERT_EQ(cast_value<long long>(v), Cut<long long>(v)) << BitsOf(v);
        });
}

TEST(Round, Half_GoesAwayFromZero)
{
    EXPECT_EQ(Round(0.5), 1.0);
    EXPECT_EQ(Round(-0.5), -1.0);
    EXPECT_EQ(Round(1.5), 2.0);
    EXPECT_EQ(Round(2.5), 3.0);
    EXPECT_EQ(Round(-2.5), -3.0);
}

TEST(Round, OtherFraction_GoesToTheNearestInteger)
{
    EXPECT_EQ(Round(2.4), 2.0);
    EXPECT_EQ(Round(2.6), 3.0);
    EXPECT_EQ(Round(-2.4), -2.0);
    EXPECT_EQ(Round(-2.6), -3.0);
}

TEST(Round, MinusZero_BecomesZero) { EXPECT_EQ(BitsOf(Round(-0.0)), "0000000000000000"); }

TEST(Round, SmallNegative_BecomesMinusZero_ByDesign) { EXPECT_EQ(BitsOf(Round(-0.3)), "8000000000000000"); }

TEST(Round, LastNumberBelowOneHalf_BecomesOne_ByDesign)
{
    EXPECT_EQ(Round(just), 1.0);
    EXPECT_EQ(Round(-just), -1.0);
}

TEST(Round, LastNumberBelowAnotherHalf_GoesDown)
{
    EXPECT_EQ(Round(1.4999999999999998), 1.0);
    EXPECT_EQ(Round(-1.4999999999999998), -1.0);
}

TEST(Round, NumberWithoutFraction_StaysAsItIs)
{
    for (double const v : {1.0, -1.0, 4503599627370494.0, 4503599627370495.0, -4503599627370495.0,
                           4503599627370496.0, -4503599627370496.0, 1e300, infinity, -infinity})
        EXPECT_EQ(Round(v), v);
}

TEST(Round, LastHalfThatADoubleHolds_StaysUnrounded_ByDesign)
{
    EXPECT_EQ(Round(4503599627370494.5), 4503599627370495.0);
    EXPECT_EQ(Round(-4503599627370494.5), -4503599627370495.0);
    EXPECT_EQ(Round(4503599627370495.5), 4503599627370495.5);
    EXPECT_EQ(Round(-4503599627370495.5), -4503599627370495.5);
}

TEST(Round, NaN_StaysNaN) { EXPECT_TRUE(std::isnan(Round(noNumber))); }

TEST(Round, ManyDoubles_AgreesWithTheStandardLibrary)
{
    ForManyDoubles(
        [](double v)
        {
            if (v == 0 || std::isnan(v) || std::fabs(v) == just || std::fabs(v) == 4503599627370495.5)
                return;  // told above
            ASSERT_EQ(BitsOf(Round(v)), BitsOf(std::round(v))) << BitsOf(v);
        });
}

TEST(RoundToInt, RoundsAndStopsAtTheLimits)
{
    EXPECT_EQ(RoundToInt(2.5), 3);
    EXPECT_EQ(RoundToInt(-2.5), -3);
    EXPECT_EQ(RoundToInt(2147483646.5), INT_MAX);
    EXPECT_EQ(RoundToInt(3000000000.0), INT_MAX);
    EXPECT_EQ(RoundToInt(-3000000000.0), INT_MIN);
}

TEST(RoundToUnsigned, RoundsAndStopsAtTheLimits)
{
    EXPECT_EQ(RoundToUnsigned(2.5), 3U);
    EXPECT_EQ(RoundToUnsigned(2999999999.5), 3000000000U);
    EXPECT_EQ(RoundToUnsigned(-0.4), 0U);
    EXPECT_EQ(RoundToUnsigned(-0.6), 0U);
    EXPECT_EQ(RoundToUnsigned(4294967296.0), UINT_MAX);
}

TEST(RoundToI64, RoundsAndStopsAtTheLimits)
{
    EXPECT_EQ(RoundToI64(3000000000.5), 3000000001LL);
    EXPECT_EQ(RoundToI64(-3000000000.5), -3000000001LL);
    EXPECT_EQ(RoundToI64(1e19), LLONG_MAX);
    EXPECT_EQ(RoundToI64(-1e19), LLONG_MIN);
}

TEST(RoundToU64, RoundsAndStopsAtTheLimits)
{
    EXPECT_EQ(RoundToU64(2.5), 3ULL);
    EXPECT_EQ(RoundToU64(-0.6), 0ULL);
    EXPECT_EQ(RoundToU64(-0.4), 0ULL);
    EXPECT_EQ(RoundToU64(0x1p63), 0x8000000000000000ULL);
    EXPECT_EQ(RoundToU64(1e20), ULLONG_MAX);
    EXPECT_EQ(RoundToU64(noNumber), ULLONG_MAX);
}

TEST(RoundToBigGranularity, GivesAMultiple)
{
    EXPECT_EQ(RoundToBigGranularity(1234.0, 100), 1200.0);
    EXPECT_EQ(RoundToBigGranularity(1250.0, 100), 1300.0);
    EXPECT_EQ(RoundToBigGranularity(-1250.0, 100), -1300.0);
    EXPECT_EQ(RoundToBigGranularity(2.5, 1), 3.0);
}

TEST(RoundToBigGranularity, GranularityBelowOne_LeavesTheNumber)
{
    EXPECT_EQ(RoundToBigGranularity(1234.5, 0), 1234.5);
    EXPECT_EQ(RoundToBigGranularity(1234.5, -5), 1234.5);
}

TEST(RoundToSmallGranularity, GivesAFraction)
{
    EXPECT_EQ(RoundToSmallGranularity(1.26, 10), 1.3);
    EXPECT_EQ(RoundToSmallGranularity(1.125, 4), 1.25);
    EXPECT_EQ(RoundToSmallGranularity(-1.125, 4), -1.25);
    EXPECT_EQ(RoundToSmallGranularity(2.5, 1), 3.0);
}

TEST(RoundToSmallGranularity, GranularityBelowOne_LeavesTheNumber)
{
    EXPECT_EQ(RoundToSmallGranularity(1.26, 0), 1.26);
    EXPECT_EQ(RoundToSmallGranularity(1.26, -5), 1.26);
}

TEST(EpsilonFloor, JustBelowAnInteger_IsThatInteger)
{
    EXPECT_EQ(EpsilonFloor(2.9999999, 0.0001), 3.0);
    EXPECT_EQ(EpsilonFloor(-3.0000001, 0.0001), -3.0);
}

TEST(EpsilonFloor, FurtherAway_IsTheFloor)
{
    EXPECT_EQ(EpsilonFloor(2.9, 0.0001), 2.0);
    EXPECT_EQ(EpsilonFloor(-3.1, 0.0001), -4.0);
    EXPECT_EQ(EpsilonFloor(2.9999999, 0.0), 2.0);
}

TEST(EpsilonFloor, NegativeEpsilon_CountsByItsSize) { EXPECT_EQ(EpsilonFloor(2.9999999, -0.0001), 3.0); }

TEST(EpsilonCeil, JustAboveAnInteger_IsThatInteger)
{
    EXPECT_EQ(EpsilonCeil(3.0000001, 0.0001), 3.0);
    EXPECT_EQ(EpsilonCeil(-2.9999999, 0.0001), -3.0);
}

TEST(EpsilonCeil, FurtherAway_IsTheCeiling)
{
    EXPECT_EQ(EpsilonCeil(3.1, 0.0001), 4.0);
    EXPECT_EQ(EpsilonCeil(-2.9, 0.0001), -2.0);
    EXPECT_EQ(EpsilonCeil(3.0000001, 0.0), 4.0);
}

TEST(EpsilonCeil, Zero_IsZeroWithAnyEpsilon)
{
    for (double const epsilon : {0.0, 0.1, 1000.0})
        EXPECT_EQ(EpsilonCeil(0.0, epsilon), 0.0);
}

TEST(EpsilonToInteger, UsesTheToleranceAndStopsAtTheLimits)
{
    EXPECT_EQ(EpsilonFloorToInt(2.9999999, 0.0001), 3);
    EXPECT_EQ(EpsilonFloorToInt(-2.5, 0.0), -3);
    EXPECT_EQ(EpsilonFloorToInt(1e10, 0.0), INT_MAX);
    EXPECT_EQ(EpsilonCeilToInt(3.0000001, 0.0001), 3);
    EXPECT_EQ(EpsilonCeilToInt(-2.5, 0.0), -2);
    EXPECT_EQ(EpsilonCeilToInt(-1e10, 0.0), INT_MIN);
    EXPECT_EQ(EpsilonFloorToUnsigned(2.9999999, 0.0001), 3U);
    EXPECT_EQ(EpsilonFloorToUnsigned(3000000000.5, 0.0), 3000000000U);
    EXPECT_EQ(EpsilonFloorToUnsigned(-0.5, 0.0), 0U);
    EXPECT_EQ(EpsilonCeilToUnsigned(3.0000001, 0.0001), 3U);
    EXPECT_EQ(EpsilonCeilToUnsigned(2.5, 0.0), 3U);
    EXPECT_EQ(EpsilonCeilToUnsigned(1e10, 0.0), UINT_MAX);
}

TEST(EpsilonEqual, ToleranceComesFromTheSecondNumberAlone_ByDesign)
{
    EXPECT_FALSE(EpsilonEqual(1.0, 0.0, 10.0));
    EXPECT_TRUE(EpsilonEqual(0.0, 1.0, 1.0));
    EXPECT_TRUE(EpsilonEqual(0.0, 0.0, 0.0));
}

TEST(EpsilonEqual, DistanceEqualToTheTolerance_IsEqual)
{
    EXPECT_TRUE(EpsilonEqual(3.0, 4.0, 0.25));
    EXPECT_TRUE(EpsilonEqual(5.0, 4.0, 0.25));
    EXPECT_TRUE(EpsilonEqual(-5.0, -4.0, 0.25));
    EXPECT_FALSE(EpsilonEqual(5.000001, 4.0, 0.25));
    EXPECT_FALSE(EpsilonEqual(2.999999, 4.0, 0.25));
}

TEST(ExplicitEpsilonEqual, DistanceUpToEpsilon_IsEqual)
{
    EXPECT_TRUE(ExplicitEpsilonEqual(100.0, 100.25, 0.25));
    EXPECT_TRUE(ExplicitEpsilonEqual(100.25, 100.0, 0.25));
    EXPECT_FALSE(ExplicitEpsilonEqual(100.0, 100.26, 0.25));
    EXPECT_TRUE(ExplicitEpsilonEqual(0.25, 0.0, 0.25));
}

TEST(Comparisons, WithANaN_AreFalse)
{
    EXPECT_FALSE(EpsilonEqual(noNumber, 1.0, 1.0));
    EXPECT_FALSE(EpsilonEqual(1.0, noNumber, 1.0));
    EXPECT_FALSE(EpsilonEqual(1.0, 1.0, noNumber));
    EXPECT_FALSE(ExplicitEpsilonEqual(noNumber, 1.0, 1.0));
    EXPECT_FALSE(ExplicitEpsilonEqual(1.0, noNumber, 1.0));
    EXPECT_FALSE(ExplicitEpsilonEqual(1.0, 1.0, noNumber));
}

TEST(Comparisons, OfEqualInfinities_AreFalse_ByDesign)
{
    EXPECT_FALSE(EpsilonEqual(infinity, infinity, 1.0));
    EXPECT_FALSE(ExplicitEpsilonEqual(infinity, infinity, 1.0));
}

TEST(MagneticInt, CloseToAnInteger_IsThatInteger)
{
    EXPECT_EQ(MagneticInt(2.0000001, 0.001), 2.0);
    EXPECT_EQ(MagneticInt(1.9999999, 0.001), 2.0);
    EXPECT_EQ(MagneticInt(-2.0000001, 0.001), -2.0);
}

TEST(MagneticInt, ToleranceGrowsWithTheInteger)
{
    EXPECT_EQ(MagneticInt(1000.4, 0.001), 1000.0);
    EXPECT_EQ(MagneticInt(10.4, 0.001), 10.4);
}

TEST(MagneticInt, CloseToZero_UsesTheToleranceAsItIs)
{
    EXPECT_EQ(MagneticInt(0.0005, 0.001), 0.0);
    EXPECT_EQ(MagneticInt(-0.0005, 0.001), 0.0);
    EXPECT_EQ(MagneticInt(0.25, 0.25), 0.0);
    EXPECT_EQ(MagneticInt(0.002, 0.001), 0.002);
}

TEST(MagneticInt, FurtherAway_StaysAsItIs)
{
    EXPECT_EQ(MagneticInt(2.4, 0.001), 2.4);
    EXPECT_EQ(MagneticInt(0.5, 0.001), 0.5);
    EXPECT_TRUE(std::isnan(MagneticInt(noNumber, 0.001)));
}

TEST(DoubleToU64, WhateverIsMissing_GivesAllOnes_ByDesign)
{
    EXPECT_EQ(DoubleToU64(noNumber), ULLONG_MAX);
    EXPECT_EQ(DoubleToU64(infinity), ULLONG_MAX);
    EXPECT_EQ(DoubleToU64(-infinity), ULLONG_MAX);
}

TEST(DoubleToU64, Negative_GivesZero)
{
    EXPECT_EQ(DoubleToU64(-1.0), 0ULL);
    EXPECT_EQ(DoubleToU64(-DBL_MAX), 0ULL);
    EXPECT_EQ(DoubleToU64(-0.0), 0ULL);
}

TEST(DoubleToU64, InTheRange_IsCutTowardZero)
{
    EXPECT_EQ(DoubleToU64(0.9), 0ULL);
    EXPECT_EQ(DoubleToU64(2.9), 2ULL);
    EXPECT_EQ(DoubleToU64(9223372036854774784.0), 0x7FFFFFFFFFFFFC00ULL);
    EXPECT_EQ(DoubleToU64(9223372036854775808.0), 0x8000000000000000ULL);
    EXPECT_EQ(DoubleToU64(9223372036854777856.0), 0x8000000000000800ULL);
    EXPECT_EQ(DoubleToU64(18446744073709549568.0), 0xFFFFFFFFFFFFF800ULL);
}

TEST(DoubleToU64, From2To64_GivesAllOnes)
{
    EXPECT_EQ(DoubleToU64(18446744073709551616.0), ULLONG_MAX);
    EXPECT_EQ(DoubleToU64(DBL_MAX), ULLONG_MAX);
}

TEST(DoubleToU64, ManyDoubles_AgreesWithTheLanguagesConversion)
{
    ForManyDoubles(
        [](double v)
        {
            unsigned long long const beyond = v < 0 && std::isfinite(v) ? 0 : ULLONG_MAX;
            ASSERT_EQ(DoubleToU64(v), v > -1.0 && v < 0x1p64 ? static_cast<unsigned long long>(v) : beyond)
                << BitsOf(v);
        });
}

TEST(U64ToDouble, Below2To53_IsExact)
{
    EXPECT_EQ(U64ToDouble(0), 0.0);
    EXPECT_EQ(U64ToDouble(1), 1.0);
    EXPECT_EQ(U64ToDouble(9007199254740991), 9007199254740991.0);
}

TEST(U64ToDouble, From2To63_GoesToTheNearest)
{
    EXPECT_EQ(U64ToDouble(0x8000000000000000), 9223372036854775808.0);
    EXPECT_EQ(U64ToDouble(0x80000000000003FF), 9223372036854775808.0);
    EXPECT_EQ(U64ToDouble(0x8000000000000401), 9223372036854777856.0);
}

TEST(U64ToDouble, HalfWayFrom2To63_GoesUp_ByDesign)
{
    EXPECT_EQ(U64ToDouble(0x8000000000000400), 9223372036854777856.0);
    EXPECT_EQ(U64ToDouble(0x8000000000000C00), 9223372036854779904.0);
}

TEST(U64ToDouble, LastNumbers_NeverReach2To64_ByDesign)
{
    EXPECT_EQ(U64ToDouble(0xFFFFFFFFFFFFFBFF), 18446744073709549568.0);
    EXPECT_EQ(U64ToDouble(0xFFFFFFFFFFFFFC00), 18446744073709549568.0);
    EXPECT_EQ(U64ToDouble(0xFFFFFFFFFFFFFFFF), 18446744073709549568.0);
}

TEST(U64ToDouble, ManyIntegers_AgreesWithWideArithmetic)
{
    ForManyIntegers(
        [](unsigned long long v)
        {
            if (v < 1ULL << 63)
            {
                ASSERT_EQ(U64ToDouble(v), static_cast<double>(v)) << HexOf(v);
                return;
            }
            WIDE const nearest = (static_cast<WIDE>(v) + 1024) / 2048 * 2048;
            WIDE const last = (static_cast<WIDE>(1) << 64) - 2048;
            ASSERT_TRUE(static_cast<WIDE>(U64ToDouble(v)) == std::min(nearest, last)) << HexOf(v);
        });
}

TEST(FitsIntoDouble, Signed_UpTo2To53OfEitherSign)
{
    EXPECT_TRUE(FitsIntoDouble(0LL));
    EXPECT_TRUE(FitsIntoDouble(-1LL));
    EXPECT_TRUE(FitsIntoDouble(0x20000000000000LL));
    EXPECT_FALSE(FitsIntoDouble(0x20000000000001LL));
    EXPECT_TRUE(FitsIntoDouble(-0x20000000000000LL));
    EXPECT_FALSE(FitsIntoDouble(-0x20000000000001LL));
    EXPECT_FALSE(FitsIntoDouble(LLONG_MAX));
    EXPECT_FALSE(FitsIntoDouble(LLONG_MIN));
}

TEST(FitsIntoDouble, Unsigned_UpTo2To53)
{
    EXPECT_TRUE(FitsIntoDouble(0ULL));
    EXPECT_TRUE(FitsIntoDouble(0x20000000000000ULL));
    EXPECT_FALSE(FitsIntoDouble(0x20000000000001ULL));
    EXPECT_FALSE(FitsIntoDouble(ULLONG_MAX));
}

TEST(FitsIntoDouble, EvenNumberBehind2To53_DoesNotFit_ByDesign)
{
    EXPECT_FALSE(FitsIntoDouble(0x20000000000002LL));
    EXPECT_FALSE(FitsIntoDouble(0x40000000000000ULL));
}

TEST(FitsIntoDouble, ManyIntegers_AgreesWithTheirWidth)
{
    ForManyIntegers(
        [](unsigned long long v)
        {
            auto const fits = [](unsigned long long size)
            { return std::bit_width(size - (size != 0)) <= 53; };
            auto const number = static_cast<long long>(v);
            ASSERT_EQ(FitsIntoDouble(v), fits(v)) << HexOf(v);
            ASSERT_EQ(FitsIntoDouble(number), fits(number < 0 ? 0 - v : v)) << HexOf(v);
        });
}

TEST(FitsIntoLongLong, TopBit_Decides)
{
    EXPECT_TRUE(FitsIntoLongLong(0));
    EXPECT_TRUE(FitsIntoLongLong(0x7FFFFFFFFFFFFFFF));
    EXPECT_FALSE(FitsIntoLongLong(0x8000000000000000));
    EXPECT_FALSE(FitsIntoLongLong(0xFFFFFFFFFFFFFFFF));
}

TEST(ResolutionToEncoderGranularity, DividesTheBaseIntoWholeSteps)
{
    EXPECT_EQ(ResolutionToEncoderGranularity(300.0, 1000.0), 1000.0 / 3);
    EXPECT_EQ(ResolutionToEncoderGranularity(400.0, 1000.0), 1000.0 / 3);  // 2.5 steps count as 3
    EXPECT_EQ(ResolutionToEncoderGranularity(600.0, 1000.0), 500.0);
    EXPECT_EQ(ResolutionToEncoderGranularity(700.0, 1000.0), 1000.0);
    EXPECT_EQ(ResolutionToEncoderGranularity(1000.0, 1000.0), 1000.0);
}

TEST(ResolutionToEncoderGranularity, MoreStepsThanAnIntHolds_StopsThere)
{
    EXPECT_EQ(ResolutionToEncoderGranularity(1e-300, 1000.0), 1000.0 / 2147483647.0);
}

TEST(ResolutionToEncoderGranularity, ImpossibleArguments_GiveNoNumber)
{
    struct
    {
        double resolution, base;
    } const impossible[] = {{1000.1, 1000.0}, {0.0, 1000.0}, {-1.0, 1000.0}, {-2.0, -1.0}, {0.0, 0.0}};
    for (auto const& arguments : impossible)
        EXPECT_EQ(BitsOf(ResolutionToEncoderGranularity(arguments.resolution, arguments.base)),
                  "7FF8000000000000")
            << arguments.resolution << " of " << arguments.base;
}
