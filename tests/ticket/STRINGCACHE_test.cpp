#include "comgui/ticket/STRINGCACHE.h"

#include <gtest/gtest.h>

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
