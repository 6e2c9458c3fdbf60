// What a ticket holds, and which of its keys flash.
#include "desk/model/TicketContent.h"

#include <gtest/gtest.h>

using namespace desk;
using namespace std::chrono_literals;
using comgui::Snapshot;
using comgui::Value;

namespace
{
constexpr TicketContent::Time Begin{};

class Content : public testing::Test
{
protected:
    Content() { content.Show(Snapshot({{"a", 1}, {"b", "x"}, {"c", 0.5}}), Begin); }

    auto Write(std::string const& key, Value value, std::chrono::milliseconds at)
    {
        return content.Apply({key, std::move(value)}, Begin + at);
    }
    auto Flashing(std::chrono::milliseconds at) { return content.Fading(Begin + at).flashing; }

    TicketContent content;
};

using Keys = std::vector<std::string>;

Snapshot ManyKeys(int value)
{
    std::vector<comgui::SnapshotEntry> entries;
    for (int i = 0; i < 100'000; ++i)
        entries.push_back({"Key" + std::to_string(100'000 + i), value});
    return Snapshot(std::move(entries));
}
}  // namespace

TEST_F(Content, FirstOneIsAllNewAndDoesNotFlash)
{
    TicketContent fresh;
    auto const differences = fresh.Show(Snapshot({{"a", 1}}), Begin);
    ASSERT_EQ(differences.size(), 1U);
    EXPECT_EQ(differences[0].before, std::nullopt);
    EXPECT_EQ(differences[0].after, Value(1));
    EXPECT_FALSE(fresh.IsAnyFlashing());
    EXPECT_EQ(fresh.Changed("a"), std::nullopt);
}

TEST_F(Content, KeysAreSortedAndFound)
{
    EXPECT_EQ(content.Keys(), (std::vector<std::string_view>{"a", "b", "c"}));
    ASSERT_TRUE(content.Find("b"));
    EXPECT_EQ(*content.Find("b"), Value("x"));
    EXPECT_EQ(content.Find("d"), nullptr);
}

TEST_F(Content, LaterShowGivesWhatDiffers)
{
    auto const differences = content.Show(Snapshot({{"", 7}, {"a", 2}, {"c", 0.5}, {"d", 4}}), Begin);
    Keys told;
    for (auto const& difference : differences)
        told.push_back(difference.key + ": " + (difference.before ? ToText(*difference.before) : "-") +
                       " > " + (difference.after ? ToText(*difference.after) : "-"));
    EXPECT_EQ(told, (Keys{": - > 7", "a: 1 > 2", "b: x > -", "d: - > 4"}));
    EXPECT_EQ(content.Keys(), (std::vector<std::string_view>{"", "a", "c", "d"}));
    EXPECT_EQ(Flashing(1ms), (Keys{"", "a", "d"}));
}

TEST_F(Content, TheSameAgainIsNoDifference)
{
    EXPECT_TRUE(content.Show(Snapshot({{"a", 1}, {"b", "x"}, {"c", 0.5}}), Begin + 1s).empty());
    EXPECT_FALSE(content.IsAnyFlashing());
}

TEST_F(Content, ChangeReplacesAValue)
{
    auto const difference = Write("a", 2, 10ms);
    ASSERT_TRUE(difference);
    EXPECT_EQ(difference->before, Value(1));
    EXPECT_EQ(difference->after, Value(2));
    EXPECT_EQ(*content.Find("a"), Value(2));
    EXPECT_EQ(content.Changed("a"), Begin + 10ms);
}

TEST_F(Content, ChangeMayChangeTheType)
{
    EXPECT_TRUE(Write("a", 1U, 0ms));
    EXPECT_EQ(*content.Find("a"), Value(1U));
}

TEST_F(Content, EqualValueIsNoChange)
{
    EXPECT_FALSE(Write("a", 1, 10ms));
    EXPECT_EQ(content.Changed("a"), std::nullopt);
}

TEST_F(Content, ChangeWithoutAValueIsLeftToARead)
{
    EXPECT_FALSE(content.Apply({"a", std::nullopt}, Begin));
    EXPECT_EQ(*content.Find("a"), Value(1));
}

TEST_F(Content, NewKeyFlashes)
{
    auto const difference = Write("bb", 5, 0ms);
    ASSERT_TRUE(difference);
    EXPECT_EQ(difference->before, std::nullopt);
    EXPECT_EQ(Flashing(0ms), Keys{"bb"});
    EXPECT_EQ(content.Size(), 4U);
}

TEST_F(Content, DeletedKeyIsGone)
{
    auto const difference = Write("a", {}, 0ms);
    ASSERT_TRUE(difference);
    EXPECT_EQ(difference->after, std::nullopt);
    EXPECT_EQ(content.Find("a"), nullptr);
    EXPECT_FALSE(Write("a", {}, 0ms));
}

TEST_F(Content, DeletedKeyFlashesNoMore)
{
    Write("a", 2, 0ms);
    Write("a", {}, 1ms);
    EXPECT_FALSE(content.IsAnyFlashing());
    auto const flashes = content.Fading(Begin + 2s);
    EXPECT_TRUE(flashes.flashing.empty() && flashes.ended.empty());
}

TEST_F(Content, FlashLastsASecond)
{
    Write("a", 2, 0ms);
    EXPECT_EQ(Flashing(999ms), Keys{"a"});
    auto const flashes = content.Fading(Begin + 1000ms);
    EXPECT_TRUE(flashes.flashing.empty());
    EXPECT_EQ(flashes.ended, Keys{"a"});
    EXPECT_TRUE(content.Fading(Begin + 1001ms).ended.empty());
    EXPECT_EQ(content.Changed("a"), Begin);
}

TEST_F(Content, AnotherChangeFlashesAnew)
{
    Write("a", 2, 0ms);
    Write("b", "y", 100ms);
    Write("a", 3, 500ms);
    EXPECT_EQ(Flashing(600ms), (Keys{"b", "a"}));
    EXPECT_EQ(Flashing(1200ms), Keys{"a"});
}

TEST_F(Content, GlowFallsFromOneToZero)
{
    Write("a", 2, 0ms);
    EXPECT_EQ(content.Glow("a", Begin), 1.0);
    EXPECT_EQ(content.Glow("a", Begin + 250ms), 0.75);
    EXPECT_EQ(content.Glow("a", Begin + 1000ms), 0.0);
    EXPECT_EQ(content.Glow("a", Begin + 1h), 0.0);
    EXPECT_EQ(content.Glow("a", Begin - 1h), 1.0);
    EXPECT_EQ(content.Glow("b", Begin), 0.0);
    EXPECT_EQ(content.Glow("nowhere", Begin), 0.0);
}

TEST_F(Content, ClearedOneIsAsNew)
{
    Write("a", 2, 0ms);
    content.Clear();
    EXPECT_EQ(content.Size(), 0U);
    EXPECT_FALSE(content.IsAnyFlashing());
    EXPECT_EQ(content.Show(Snapshot({{"z", 1}}), Begin).size(), 1U);
    EXPECT_FALSE(content.IsAnyFlashing());
}

TEST_F(Content, LargeValueAndOddKeyAreKept)
{
    std::string const key(2000, '/');
    std::string const text(1'000'000, '\n');
    EXPECT_TRUE(Write(key, text, 0ms));
    EXPECT_EQ(*content.Find(key), Value(text));
}

TEST(ManyKeysOfContent, AreShownAndChangedAtOnce)
{
    TicketContent content;
    Snapshot const before = ManyKeys(1);
    Snapshot const after = ManyKeys(2);
    EXPECT_EQ(content.Show(before, Begin).size(), 100'000U);
    EXPECT_EQ(content.Show(after, Begin).size(), 100'000U);
    for (int i = 0; i < 10'000; ++i)
        ASSERT_TRUE(content.Apply({"Key" + std::to_string(i), i}, Begin));
    EXPECT_EQ(content.Fading(Begin).flashing.size(), 110'000U);
}

TEST(ManyKeysOfContent, AreNotToldUnlessTheyFlash)
{
    TicketContent content;
    content.Show(ManyKeys(1), Begin);
    content.Apply({"Key150000", 2}, Begin);
    EXPECT_EQ(content.Fading(Begin).flashing.size(), 1U);
}
