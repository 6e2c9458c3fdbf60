#include "comgui/foundation/number_bits.h"

#include "comgui/foundation/MathLib.h"
#include "tests/foundation/NumberSamples.h"

#include <gtest/gtest.h>

namespace detail = comgui::detail;

TEST(NumberBits, ManyDoubles_AgreesWithWhatHostsGet)
{
    ForManyDoubles(
        [](double v)
        {
            ASSERT_EQ(detail::IsNotANumber(v), MathLib::IsNotANumber(v)) << BitsOf(v);
            ASSERT_EQ(BitsOf(detail::CastToNotANumber(v)), BitsOf(MathLib::CastToNotANumber(v))) << BitsOf(v);
        });
}

TEST(NumberBits, ManyIntegers_AgreesWithWhatHostsGet)
{
    ForManyIntegers(
        [](unsigned long long v)
        {
            auto const number = static_cast<long long>(v);
            float const single = FromBits(static_cast<unsigned int>(v));
            ASSERT_EQ(detail::IsNotANumber(single), MathLib::IsNotANumber(single)) << HexOf(v);
            ASSERT_EQ(BitsOf(detail::U64ToDouble(v)), BitsOf(MathLib::U64ToDouble(v))) << HexOf(v);
            ASSERT_EQ(detail::FitsIntoDouble(v), MathLib::FitsIntoDouble(v)) << HexOf(v);
            ASSERT_EQ(detail::FitsIntoDouble(number), MathLib::FitsIntoDouble(number)) << HexOf(v);
            ASSERT_EQ(detail::FitsIntoLongLong(v), MathLib::FitsIntoLongLong(v)) << HexOf(v);
        });
}

TEST(NumberBits, AreUsableInConstants)
{
    static_assert(detail::U64ToDouble(0xFFFFFFFFFFFFFFFF) == 18446744073709549568.0);
    static_assert(detail::FitsIntoDouble(-0x20000000000000LL) &&
                  !detail::FitsIntoDouble(-0x20000000000001LL));
    EXPECT_EQ(BitsOf(detail::NotADoubleNumber), BitsOf(MathLib::NOT_A_DOUBLE_NUMBER));
    EXPECT_EQ(std::bit_cast<unsigned int>(detail::NotAFloatNumber), 0x7FC00000U);
}
