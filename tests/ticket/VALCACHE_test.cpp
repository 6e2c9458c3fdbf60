#include "comgui/ticket/VALCACHE.h"

#include <cmath>
#include <gtest/gtest.h>
#include <limits>
#include <map>
#include <random>

namespace
{
template <typename T>
class VALCACHE_OF : public testing::Test
{
protected:
    VALCACHE<T> cache;
};
using NUMBERS = testing::Types<int, unsigned int, long long, unsigned long long, double>;

template <typename T>
T Random(std::mt19937_64& random)
{
    if constexpr (std::is_floating_point_v<T>)
        return std::ldexp(static_cast<T>(static_cast<int>(random() % 2000) - 1000),
                          static_cast<int>(random() % 40));
    else
        return static_cast<T>(random() >> random() % 64);
}
}  // namespace

TYPED_TEST_SUITE(VALCACHE_OF, NUMBERS, );

TYPED_TEST(VALCACHE_OF, Call_ReplacesTheArgumentByItsCachedCopy)
{
    TypeParam const source = 7;
    TypeParam const* number = &source;
    EXPECT_EQ(this->cache(number), number);
    EXPECT_NE(number, &source);
    EXPECT_EQ(*number, source);
}

TYPED_TEST(VALCACHE_OF, Null_StaysNull)
{
    TypeParam const* number = nullptr;
    EXPECT_EQ(this->cache(number), nullptr);
    EXPECT_EQ(number, nullptr);
}

TYPED_TEST(VALCACHE_OF, EqualNumbers_ShareOneAddress)
{
    TypeParam const* const seven = this->cache.Keep(7);
    TypeParam const* const eight = this->cache.Keep(8);
    EXPECT_NE(seven, eight);
    EXPECT_EQ(this->cache.Keep(7), seven);
    EXPECT_EQ(this->cache.Keep(8), eight);
}

TYPED_TEST(VALCACHE_OF, Limits_AreKept)
{
    for (TypeParam const limit :
         {std::numeric_limits<TypeParam>::lowest(), std::numeric_limits<TypeParam>::max(), TypeParam{0},
          std::numeric_limits<TypeParam>::min()})
        EXPECT_EQ(*this->cache.Keep(limit), limit);
}

TYPED_TEST(VALCACHE_OF, ManyNumbers_AreOneForOneAsInAMap)
{
    std::mt19937_64 random(1);
    std::map<TypeParam, TypeParam const*> known;
    for (int i = 0; i < 20000; ++i)
    {
        TypeParam const number = Random<TypeParam>(random);
        TypeParam const* const kept = this->cache.Keep(number);
        ASSERT_EQ(*kept, number);
        ASSERT_EQ(known.emplace(number, kept).first->second, kept) << number;
    }
    for (auto const& [number, kept] : known)
        ASSERT_EQ(*kept, number);
}

TYPED_TEST(VALCACHE_OF, Clear_LeavesACacheThatWorks)
{
    this->cache.Keep(7);
    this->cache.clear();
    EXPECT_EQ(*this->cache.Keep(8), TypeParam{8});
    EXPECT_EQ(*this->cache.Keep(7), TypeParam{7});
}

TEST(VALCACHE, ZeroOfEitherSign_IsTheFirstThatCame)
{
    VALCACHE<double> plusFirst;
    double const* const plus = plusFirst.Keep(0.0);
    EXPECT_EQ(plusFirst.Keep(1.0), plusFirst.Keep(1.0));
    EXPECT_EQ(plusFirst.Keep(-0.0), plus);
    EXPECT_FALSE(std::signbit(*plus));

    VALCACHE<double> minusFirst;
    double const* const minus = minusFirst.Keep(-0.0);
    minusFirst.Keep(1.0);
    EXPECT_EQ(minusFirst.Keep(0.0), minus);
    EXPECT_TRUE(std::signbit(*minus));
}
