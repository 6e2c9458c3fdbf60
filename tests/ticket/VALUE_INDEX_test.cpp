#include "comgui/ticket/VALUE_INDEX.h"

#include <gtest/gtest.h>
#include <random>
#include <set>
#include <string>
#include <unordered_set>

using namespace comgui::detail;

namespace
{
// Numbers of which as many fall together as the test wants.
template <HASH Different>
struct COLLIDING
{
    using VALUE = int;
    using ENTRY = int;

    static HASH Hash(int number, HASH) { return static_cast<HASH>(number) % Different; }
    static HASH HashOf(int number, HASH seed) { return Hash(number, seed); }
    static bool Same(int entry, int number) { return entry == number; }
    static int* Make(void* place, int number, HASH, POOL&) { return new (place) int(number); }
};

// Numbers that share a place and differ in the upper half of their hash, or the reverse.
template <unsigned int PlaceBits, unsigned int MarkBits>
struct MARKED : COLLIDING<1>
{
    static HASH Hash(int number, HASH)
    {
        auto const bits = static_cast<HASH>(number);
        return (bits & ((HASH(1) << PlaceBits) - 1)) | (bits >> PlaceBits & ((HASH(1) << MarkBits) - 1))
                                                           << 32;
    }
    static HASH HashOf(int number, HASH seed) { return Hash(number, seed); }
};

// Numbers of which some cannot be made.
struct FAILING : COLLIDING<1000>
{
    static int* Make(void* place, int number, HASH hash, POOL& pool)
    {
        if (isFailing)
            throw std::bad_alloc();
        return COLLIDING::Make(place, number, hash, pool);
    }
    static inline bool isFailing = false;
};

template <typename INDEX>
void ExpectASetOf(int limit, int count)
{
    POOL pool;
    INDEX index(pool);
    std::mt19937 random(1);
    std::vector<int const*> known(static_cast<std::size_t>(limit));
    std::set<int const*> addresses;
    for (int i = 0; i < count; ++i)
    {
        auto const number = static_cast<std::size_t>(random()) % known.size();
        int const* const kept = &index.Keep(static_cast<int>(number));
        ASSERT_EQ(*kept, static_cast<int>(number));
        if (known[number])
            ASSERT_EQ(kept, known[number]);
        else
            ASSERT_TRUE(addresses.insert(kept).second);
        known[number] = kept;
    }
}
}  // namespace

TEST(VALUE_INDEX, ValuesOfOneHash_AreToldApart) { ExpectASetOf<VALUE_INDEX<COLLIDING<1>>>(500, 5000); }

TEST(VALUE_INDEX, ValuesOfFewHashes_AreToldApart) { ExpectASetOf<VALUE_INDEX<COLLIDING<7>>>(1000, 10000); }

TEST(VALUE_INDEX, ValuesOfOnePlaceAndManyMarks_AreToldApart)
{
    ExpectASetOf<VALUE_INDEX<MARKED<0, 32>>>(1000, 10000);
    ExpectASetOf<VALUE_INDEX<MARKED<2, 3>>>(1000, 10000);
}

TEST(VALUE_INDEX, ValuesOfManyPlacesAndOneMark_AreToldApart)
{
    ExpectASetOf<VALUE_INDEX<MARKED<32, 0>>>(1000, 10000);
    ExpectASetOf<VALUE_INDEX<MARKED<16, 16>>>(100000, 300000);
}

TEST(VALUE_INDEX, ManyValues_AreToldApart) { ExpectASetOf<VALUE_INDEX<COLLIDING<1000000>>>(100000, 300000); }

TEST(VALUE_INDEX, ValueThatCannotBeMade_LeavesTheOthersAndIsMadeTheNextTime)
{
    POOL pool;
    VALUE_INDEX<FAILING> index(pool);
    std::vector<int const*> kept;
    for (int number = 0; number < 100; ++number)
    {
        FAILING::isFailing = true;
        EXPECT_THROW(index.Keep(number), std::bad_alloc);
        FAILING::isFailing = false;
        kept.push_back(&index.Keep(number));
    }
    for (int number = 0; number < 100; ++number)
    {
        EXPECT_EQ(*kept[static_cast<std::size_t>(number)], number);
        EXPECT_EQ(&index.Keep(number), kept[static_cast<std::size_t>(number)]);
    }
}

TEST(VALUE_INDEX, Clear_DropsTheValueThatCameLast)
{
    POOL pool;
    VALUE_INDEX<COLLIDING<7>> index(pool);
    index.Keep(5);
    index.Clear();
    pool.Clear();
    EXPECT_EQ(index.Keep(5), 5);
    EXPECT_EQ(index.Keep(6), 6);
}

TEST(HashOfBytes, EveryByte_Counts)
{
    constexpr HASH seed = 0x123456789ABCDEF1;
    for (std::size_t size = 1; size <= 70; ++size)
    {
        std::string bytes(size, 'x');
        std::unordered_set<HASH> seen = {HashOfBytes(bytes.data(), size, seed)};
        for (char& byte : bytes)
            for (char const other : {'y', '\0', '\xFF'})
            {
                byte = other;
                seen.insert(HashOfBytes(bytes.data(), size, seed));
                byte = 'x';
            }
        EXPECT_EQ(seen.size(), 1 + 3 * size) << "texts of " << size << " bytes";
    }
}

TEST(HashOfBytes, PlaceInMemory_DoesNotCount)
{
    std::string const bytes = "0123456789012345678901234567890123456789";
    for (std::size_t size = 0; size < 32; ++size)
        for (std::size_t shift = 0; shift < 8; ++shift)
        {
            std::string const moved = std::string(shift, '#') + bytes.substr(0, size) + '#';
            EXPECT_EQ(HashOfBytes(moved.data() + shift, size, 1), HashOfBytes(bytes.data(), size, 1));
        }
}

TEST(HashOfBytes, Seed_Counts)
{
    EXPECT_NE(HashOfBytes("abc", 3, 1), HashOfBytes("abc", 3, 2));
    EXPECT_NE(HashOfNumber(5, 1), HashOfNumber(5, 2));
}
