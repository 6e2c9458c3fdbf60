#include "comgui/ticket/BIN_STRING_CACHE.h"

#include <gtest/gtest.h>
#include <map>
#include <random>

namespace
{
std::string BytesOf(BIN_STRING const* value) { return {value->begin(), value->end()}; }
}  // namespace

TEST(BIN_STRING_CACHE, Call_ReplacesTheArgumentByItsCachedCopy)
{
    BIN_STRING_CACHE cache;
    std::string bytes("a\0b", 3);
    BIN_STRING const source(bytes);
    BIN_STRING const* value = &source;
    EXPECT_EQ(cache(value), value);
    EXPECT_NE(value, &source);
    bytes = "___";
    EXPECT_EQ(BytesOf(value), std::string("a\0b", 3));
}

TEST(BIN_STRING_CACHE, Null_StaysNull)
{
    BIN_STRING_CACHE cache;
    BIN_STRING const* value = nullptr;
    EXPECT_EQ(cache(value), nullptr);
    EXPECT_EQ(value, nullptr);
}

TEST(BIN_STRING_CACHE, InvalidValues_AreOneWithANullView)
{
    BIN_STRING_CACHE cache;
    BIN_STRING const source("abc", 0);
    BIN_STRING const* value = &source;
    cache(value);
    ASSERT_NE(value, nullptr);
    EXPECT_EQ(value->data, nullptr);
    EXPECT_EQ(value->size, 0u);
    cache.Keep(BIN_STRING("x", 1));
    EXPECT_EQ(cache.Keep(BIN_STRING()), value);
    EXPECT_EQ(cache.Keep(BIN_STRING(nullptr, 3)), value);
}

TEST(BIN_STRING_CACHE, ZeroBytes_Count)
{
    BIN_STRING_CACHE cache;
    BIN_STRING const* const zero = cache.Keep(BIN_STRING("\0", 1));
    BIN_STRING const* const zeros = cache.Keep(BIN_STRING("\0\0", 2));
    EXPECT_NE(zero, zeros);
    EXPECT_NE(cache.Keep(BIN_STRING()), zero);
    EXPECT_EQ(BytesOf(zeros), std::string(2, '\0'));
}

TEST(BIN_STRING_CACHE, ManyValues_AreOneForOneAsInAMap)
{
    BIN_STRING_CACHE cache;
    std::mt19937 random(1);
    std::map<std::string, BIN_STRING const*> known;
    for (int i = 0; i < 20000; ++i)
    {
        std::string bytes(random() % 40, '\0');
        for (char& byte : bytes)
            byte = static_cast<char>(random() % 2);
        BIN_STRING const* const kept = cache.Keep(BIN_STRING(bytes));
        ASSERT_EQ(BytesOf(kept), bytes);
        ASSERT_EQ(known.emplace(bytes, kept).first->second, kept);
    }
    for (auto const& [bytes, kept] : known)
        ASSERT_EQ(BytesOf(kept), bytes);
}

TEST(BIN_STRING_CACHE, Clear_LeavesACacheThatWorks)
{
    BIN_STRING_CACHE cache;
    cache.Keep(BIN_STRING("abc", 3));
    cache.clear();
    EXPECT_EQ(BytesOf(cache.Keep(BIN_STRING("abc", 3))), "abc");
}
