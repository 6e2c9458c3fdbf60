// Numbers as the whole system understands them: which ones are missing, how a double becomes an integer and
// where that stops, how it is rounded and how near counts as equal, and which 64-bit integers a double can
// hold. Pure functions, safe from any thread; no tolerance is built in. Every comparison with a NaN is false.
#pragma once

#include "comgui/foundation/export.h"

namespace MathLib
{
// The one pattern of a missing number. NOT_A_DOUBLE_NUMBER has one address in the whole process, so a
// parameter record may point at it.
COMGUI_EXPORT extern double const NOT_A_DOUBLE_NUMBER;  // 0x7FF8000000000000
COMGUI_EXPORT extern float const NOT_A_FLOAT_NUMBER;    // 0x7FC00000

// Whether v counts as missing: any NaN, and both infinities.
COMGUI_EXPORT bool IsNotANumber(double v);
COMGUI_EXPORT bool IsNotANumber(float v);

// The constant of that type. Exists for double and float; any other T does not link.
template <typename T>
T NotANumber();

template <>
COMGUI_EXPORT double NotANumber<double>();
template <>
COMGUI_EXPORT float NotANumber<float>();

// v, or NOT_A_DOUBLE_NUMBER if v counts as missing.
COMGUI_EXPORT double CastToNotANumber(double v);

// v cut toward zero; beyond the range of T its nearest end, which for unsigned int and anything negative is
// 0. What a NaN gives is up to the processor, and so is 2^63 as long long. Exists for int, unsigned int and
// long long; any other T does not link.
template <typename T>
T cast_value(double v);

template <>
COMGUI_EXPORT int cast_value<int>(double v);
template <>
COMGUI_EXPORT unsigned int cast_value<unsigned int>(double v);
template <>
COMGUI_EXPORT long long cast_value<long long>(double v);

// The nearest integer, halves away from zero; a NaN stays one.
COMGUI_EXPORT double Round(double v);

// Round(v) in the range of the result, its nearest end beyond; for a NaN as cast_value and DoubleToU64.
COMGUI_EXPORT int RoundToInt(double v);
COMGUI_EXPORT unsigned int RoundToUnsigned(double v);
COMGUI_EXPORT long long RoundToI64(double v);
COMGUI_EXPORT unsigned long long RoundToU64(double v);

// v rounded to a multiple of granularity (100: to hundreds), or to a granularity-th part (10: to tenths).
// v itself if granularity is below 1.
COMGUI_EXPORT double RoundToBigGranularity(double v, int granularity);
COMGUI_EXPORT double RoundToSmallGranularity(double v, int granularity);

// floor and ceil that take v for an integer if it misses that by no more than |v| * epsilon. The forms with
// an integer result go through cast_value.
COMGUI_EXPORT double EpsilonFloor(double v, double epsilon);
COMGUI_EXPORT double EpsilonCeil(double v, double epsilon);
COMGUI_EXPORT int EpsilonFloorToInt(double v, double epsilon);
COMGUI_EXPORT int EpsilonCeilToInt(double v, double epsilon);
COMGUI_EXPORT unsigned int EpsilonFloorToUnsigned(double v, double epsilon);
COMGUI_EXPORT unsigned int EpsilonCeilToUnsigned(double v, double epsilon);

// Whether a lies within |b| * epsilon of b. Not symmetric: the tolerance comes from b alone, and around a b
// of 0 there is none.
COMGUI_EXPORT bool EpsilonEqual(double a, double b, double epsilon);

// Whether a lies within epsilon of b.
COMGUI_EXPORT bool ExplicitEpsilonEqual(double a, double b, double epsilon);

// The nearest integer if v is close enough to it, otherwise v. Close is a matter of EpsilonEqual, and next to
// 0, where that leaves no room, of ExplicitEpsilonEqual.
COMGUI_EXPORT double MagneticInt(double v, double epsilon);

// v cut toward zero, 0 for anything negative; all ones from 2^64 up and for whatever counts as missing, minus
// infinity included.
COMGUI_EXPORT unsigned long long DoubleToU64(double v);

// The nearest double; from 2^63 up halves go up, and what would be 2^64 becomes the last double below it.
COMGUI_EXPORT double U64ToDouble(unsigned long long v);

// Whether v lies in the range in which a double holds every integer: up to 2^53, either sign.
COMGUI_EXPORT bool FitsIntoDouble(long long v);
COMGUI_EXPORT bool FitsIntoDouble(unsigned long long v);

// Whether v is below 2^63.
COMGUI_EXPORT bool FitsIntoLongLong(unsigned long long v);

// What an encoder of that base can do that comes nearest to resolution: base over a whole number of steps,
// both in the same unit. NOT_A_DOUBLE_NUMBER if resolution is above base, or either is not above 0.
COMGUI_EXPORT double ResolutionToEncoderGranularity(double resolution, double base);
}  // namespace MathLib
