#include "comgui/module/Kept.h"

#include <gtest/gtest.h>

using namespace std::chrono_literals;

namespace
{
struct KeptTexts : testing::Test
{
    // So many others that the time alone decides.
    void KeepOthers(char const* name)
    {
        for (std::size_t i = 0; i < kept.KeptWeight; ++i)
            kept.Keep(name + std::to_string(i));
    }

    std::chrono::steady_clock::time_point now{};
    comgui::plugin::Kept<std::string> kept{60s, [this] { return now; }};
    std::string const text = "a text that lies on the heap, since it is longer than any short string";
};
}  // namespace

TEST_F(KeptTexts, EqualTexts_ShareAnAddress)
{
    EXPECT_EQ(&kept.Keep(text), &kept.Keep(std::string(text)));
    EXPECT_EQ(kept.Count(), 1u);
}

TEST_F(KeptTexts, AnAddress_StaysWhileOthersCome)
{
    std::string const& held = kept.Keep(text);
    char const* const bytes = held.c_str();
    KeepOthers("a");
    KeepOthers("b");
    EXPECT_EQ(held, text);
    EXPECT_EQ(held.c_str(), bytes);
}

TEST_F(KeptTexts, WithinTheTime_NothingGoes)
{
    kept.Keep(text);
    now += 59s;
    KeepOthers("a");
    KeepOthers("b");
    KeepOthers("c");
    EXPECT_EQ(kept.Count(), 3 * kept.KeptWeight + 1);
}

TEST_F(KeptTexts, OldOnes_GoWhenTheirTimeIsOverAndManyHaveComeBehind)
{
    kept.Keep(text);
    for (char const* const name : {"a", "b", "c", "d"})
    {
        now += 60s;
        KeepOthers(name);
    }
    EXPECT_LE(kept.Count(), 2 * kept.KeptWeight + 1);
}

TEST_F(KeptTexts, OneThatIsReadAgain_StaysAtItsAddress)
{
    std::string const* const held = &kept.Keep(text);
    for (char const* const name : {"a", "b", "c", "d", "e"})
    {
        now += 60s;
        KeepOthers(name);
        ASSERT_EQ(&kept.Keep(text), held);
    }
    EXPECT_LE(kept.Count(), 2 * kept.KeptWeight + 2);
}

TEST_F(KeptTexts, ALongText_WeighsMore)
{
    std::string const longText(1 << 20, 'x');
    for (int i = 0; i < 100; ++i)
    {
        now += 61s;
        kept.Keep(std::to_string(i) + longText);
    }
    EXPECT_LE(kept.Count(), 22u);
}
