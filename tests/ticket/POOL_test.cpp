#include "comgui/ticket/POOL.h"

#include <cstring>
#include <gtest/gtest.h>
#include <new>
#include <random>
#include <vector>

using comgui::detail::POOL;

namespace
{
bool IsAligned(void const* place, std::size_t alignment)
{
    return reinterpret_cast<std::uintptr_t>(place) % alignment == 0;
}

// Takes pieces, fills each with a byte of its own, and looks whether all still hold theirs.
class Pool : public testing::Test
{
protected:
    void* Take(std::size_t size, std::size_t alignment = 1)
    {
        auto* const place = static_cast<unsigned char*>(pool.Take(size, alignment));
        EXPECT_TRUE(IsAligned(place, alignment)) << size << " bytes";
        pieces.push_back({place, size, static_cast<unsigned char>(pieces.size())});
        if (size != 0)
            std::memset(place, pieces.back().fill, size);
        return place;
    }

    void ExpectAllUnspoilt() const
    {
        for (PIECE const& piece : pieces)
            for (std::size_t i = 0; i < piece.size; ++i)
                ASSERT_EQ(piece.place[i], piece.fill) << "a piece of " << piece.size << " bytes, at " << i;
    }

    struct PIECE
    {
        unsigned char const* place;
        std::size_t size;
        unsigned char fill;
    };
    POOL pool;
    std::vector<PIECE> pieces;
};
}  // namespace

TEST_F(Pool, EveryAlignment_IsKept)
{
    for (std::size_t alignment = 1; alignment <= alignof(std::max_align_t); alignment *= 2)
        for (std::size_t size = 1; size < 40; ++size)
            Take(size, alignment);
    ExpectAllUnspoilt();
}

TEST_F(Pool, SmallPieces_LieInOneBlock)
{
    char* const first = static_cast<char*>(Take(8, 8));
    char* const second = static_cast<char*>(Take(8, 8));
    EXPECT_EQ(second, first + 8);
}

TEST_F(Pool, LargePiece_LosesNothingOfTheCurrentBlock)
{
    char* const before = static_cast<char*>(Take(8, 8));
    Take(1000000, 16);
    EXPECT_EQ(Take(8, 8), before + 8);
    ExpectAllUnspoilt();
}

TEST_F(Pool, PieceOfMoreThanAQuarterOfTheNextBlock_LosesNothingOfTheCurrentOne)
{
    char* const before = static_cast<char*>(Take(8, 8));
    Take(3000);
    EXPECT_EQ(Take(8, 8), before + 8);
    ExpectAllUnspoilt();
}

TEST_F(Pool, LargePieceFirst_IsAlignedAndWhole)
{
    Take(1000000, 16);
    Take(3);
    Take(1000000, 16);
    ExpectAllUnspoilt();
}

TEST_F(Pool, PiecesOfEverySize_DoNotOverlap)
{
    std::mt19937 random(1);
    for (int i = 0; i < 3000; ++i)
        Take(random() % (i % 50 == 0 ? 5000 : 100), std::size_t{1} << random() % 5);
    ExpectAllUnspoilt();
}

TEST_F(Pool, Clear_LeavesAPoolThatWorks)
{
    for (int round = 0; round < 3; ++round)
    {
        for (int i = 0; i < 1000; ++i)
            Take(100, 4);
        Take(1000000, 16);
        ExpectAllUnspoilt();
        pieces.clear();
        pool.Clear();
    }
    pool.Clear();
    Take(1);
    ExpectAllUnspoilt();
}

TEST_F(Pool, MoreThanThereIs_ThrowsAndChangesNothing)
{
    char* const before = static_cast<char*>(Take(8, 8));
    EXPECT_THROW(pool.Take(SIZE_MAX, 1), std::bad_alloc);
    EXPECT_THROW(pool.Take(SIZE_MAX - 15, 16), std::bad_alloc);
    EXPECT_EQ(Take(8, 8), before + 8);
    ExpectAllUnspoilt();
}
