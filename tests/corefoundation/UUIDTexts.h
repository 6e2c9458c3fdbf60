// The types and factories of the tests' bundles.
#pragma once

inline constexpr char typeA[] = "0A0B0C0D-0000-4000-8000-0000000000AA";
inline constexpr char typeB[] = "0A0B0C0D-0000-4000-8000-0000000000BB";
inline constexpr char factory1[] = "F0E0D0C0-1111-4000-8000-000000000001";
inline constexpr char factory2[] = "F0E0D0C0-1111-4000-8000-000000000002";
inline constexpr char factory3[] = "F0E0D0C0-1111-4000-8000-000000000003";
