#include "desk/model/Contrast.h"

#include <gtest/gtest.h>

using namespace desk;

namespace
{
constexpr Rgb Black{0, 0, 0};
constexpr Rgb White{255, 255, 255};
}  // namespace

TEST(Contrast, OfBlackAndWhiteIs21)
{
    EXPECT_NEAR(ContrastOf(Black, White), 21, 1e-9);
    EXPECT_NEAR(ContrastOf(White, Black), 21, 1e-9);
    EXPECT_EQ(ContrastOf(White, White), 1);
}

TEST(Contrast, GreenIsBrighterThanBlue) { EXPECT_GT(Luminance({0, 255, 0}), Luminance({0, 0, 255})); }

TEST(Contrast, MixedLiesBetween)
{
    EXPECT_EQ(Mixed(Black, White, 0), Black);
    EXPECT_EQ(Mixed(Black, White, 1), White);
    EXPECT_EQ(Mixed({0, 100, 200}, {100, 0, 200}, 0.5), (Rgb{50, 50, 200}));
    EXPECT_EQ(Mixed(Black, White, 7), White);
}

TEST(Contrast, AReadableColourStays) { EXPECT_EQ(Readable({0, 0, 200}, White, 4.5), (Rgb{0, 0, 200})); }

TEST(Contrast, EveryColourBecomesReadableOnEveryGrey)
{
    for (int grey = 0; grey < 256; grey += 15)
        for (Rgb const colour : {Rgb{255, 228, 0}, Rgb{26, 26, 26}, Rgb{250, 250, 250}, Rgb{100, 58, 150}})
        {
            auto const shade = static_cast<unsigned char>(grey);
            Rgb const back{shade, shade, shade};
            EXPECT_GE(ContrastOf(Readable(colour, back, 4.5), back), 4.5) << grey;
        }
}
