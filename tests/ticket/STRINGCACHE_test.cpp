#include "comgui/ticket/STRINGCACHE.h"

#include <gtest/gtest.h>
#include <map>
#include <random>
#include <string>

TEST(STRINGCACHE, Call_ReplacesTheArgumentByItsCachedCopy)
{
    STRINGCACHE cache;
    std::string const source = "text";
    char const* text = source.c_str();
    EXPECT_EQ(cache(text), text);
    EXPECT_NE(text, source.c_str());
    EXPECT_STREQ(text, "text");
}

TEST(STRINGCACHE, Index_LeavesTheArgumentAlone)
{
    STRINGCACHE cache;
    std::string const source = "text";
    char const* const text = source.c_str();
    EXPECT_STREQ(cache[text], "text");
    EXPECT_NE(cache[text], source.c_str());
}

TEST(STRINGCACHE, Null_StaysNull)
{
    STRINGCACHE cache;
    char const* text = nullptr;
    EXPECT_EQ(cache(text), nullptr);
    EXPECT_EQ(text, nullptr);
    EXPECT_EQ(cache[nullptr], nullptr);
}

TEST(STRINGCACHE, EqualTexts_ShareOneAddress)
{
    STRINGCACHE cache;
    EXPECT_EQ(cache[std::string("same").c_str()], cache[std::string("same").c_str()]);
    EXPECT_NE(cache["same"], cache["other"]);
}

TEST(STRINGCACHE, Addresses_SurviveManyFurtherTexts)
{
    STRINGCACHE cache;
    char const* const first = cache["first"];
    for (int i = 0; i < 1000; ++i)
        cache[std::to_string(i).c_str()];
    EXPECT_STREQ(first, "first");
    EXPECT_EQ(cache["first"], first);
}

TEST(STRINGCACHE, Clear_LeavesACacheThatWorks)
{
    STRINGCACHE cache;
    cache["text"];
    cache.clear();
    EXPECT_STREQ(cache["text"], "text");
}

TEST(STRINGCACHE, EmptyText_IsATextLikeOthers)
{
    STRINGCACHE cache;
    char const* const empty = cache[""];
    ASSERT_NE(empty, nullptr);
    EXPECT_STREQ(empty, "");
    cache["text"];
    EXPECT_EQ(cache[""], empty);
}

TEST(STRINGCACHE, BeginningOfAnother_IsATextOfItsOwn)
{
    STRINGCACHE cache;
    char const* const whole = cache["whole"];
    char const* const beginning = cache["who"];
    EXPECT_NE(whole, beginning);
    EXPECT_STREQ(whole, "whole");
    EXPECT_STREQ(beginning, "who");
    EXPECT_EQ(cache["whole"], whole);
}

TEST(STRINGCACHE, Keep_TakesBytesThatNoZeroByteFollows)
{
    STRINGCACHE cache;
    EXPECT_STREQ(cache.Keep(std::string_view("text and more", 4)), "text");
    EXPECT_EQ(cache.Keep("text"), cache["text"]);
}

TEST(STRINGCACHE, Text_IsCopiedAndNotKeptInPlace)
{
    STRINGCACHE cache;
    std::string source = "text";
    char const* const kept = cache[source.c_str()];
    source = "____";
    EXPECT_STREQ(kept, "text");
}

TEST(STRINGCACHE, ManyTexts_AreOneForOneAsInAMap)
{
    STRINGCACHE cache;
    std::mt19937 random(1);
    std::map<std::string, char const*> known;
    for (int i = 0; i < 20000; ++i)
    {
        std::string text(random() % 40, 'a');
        for (char& byte : text)
            byte = static_cast<char>('a' + random() % 2);
        char const* const kept = cache[text.c_str()];
        ASSERT_EQ(kept, text);
        ASSERT_EQ(known.emplace(text, kept).first->second, kept);
    }
    for (auto const& [text, kept] : known)
        ASSERT_EQ(kept, text);
}
