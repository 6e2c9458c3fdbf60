#include "comgui/ticket/KEYCACHE.h"

#include <algorithm>
#include <gtest/gtest.h>
#include <map>
#include <random>
#include <string>
#include <vector>

using comgui::detail::KEYCACHE;
using comgui::detail::POOL;

namespace
{
class KeyCache : public testing::Test
{
protected:
    POOL pool;
    KEYCACHE cache{pool};
};
}  // namespace

TEST_F(KeyCache, Null_StaysNull) { EXPECT_EQ(cache[nullptr], nullptr); }

TEST_F(KeyCache, Key_IsCopiedWithItsZeroByte)
{
    std::string const key = "Job/Copies and more";
    char const* const kept = cache.Keep(std::string_view(key).substr(0, 10));
    EXPECT_NE(kept, key.data());
    EXPECT_STREQ(kept, "Job/Copies");
}

TEST_F(KeyCache, EmptyKey_IsOneToo)
{
    char const* const empty = cache[""];
    EXPECT_STREQ(empty, "");
    EXPECT_NE(cache["a"], empty);
    EXPECT_EQ(cache[""], empty);
}

TEST_F(KeyCache, KeysInOrder_AreEachGivenAgain)
{
    char const* const a = cache["a"];
    EXPECT_EQ(cache["a"], a);
    char const* const ab = cache["ab"];
    char const* const high = cache["\xC3\xA4"];  // above all ASCII
    EXPECT_NE(ab, a);
    EXPECT_EQ(cache["\xC3\xA4"], high);
    EXPECT_EQ(cache["ab"], ab);
    EXPECT_EQ(cache["a"], a);
}

TEST_F(KeyCache, KeysInAnyOrder_HaveOneAddressEach)
{
    std::mt19937 random(5);
    for (int round = 0; round < 200; ++round)
    {
        std::map<std::string, char const*> kept;
        auto const keep = [&](std::string const& key)
        {
            char const* const address = cache[key.c_str()];
            ASSERT_STREQ(address, key.c_str());
            ASSERT_EQ(kept.emplace(key, address).first->second, address) << key;
        };
        std::vector<std::string> keys;
        for (int i = 0; i < 100; ++i)
            keys.push_back("Job/" + std::string(random() % 3, 'x') + std::to_string(random() % 60));
        // Rows in order with others in between.
        std::sort(keys.begin(), keys.begin() + 40);
        std::sort(keys.begin() + 50, keys.end());
        for (std::string const& key : keys)
            keep(key);
        for (std::string const& key : keys)
            keep(key);
        cache.clear();
    }
}

TEST_F(KeyCache, Clear_ForgetsAll)
{
    cache["b"];
    cache["a"];
    cache.clear();
    pool.Clear();
    char const* const a = cache["a"];
    EXPECT_STREQ(a, "a");
    EXPECT_EQ(cache["a"], a);
}
