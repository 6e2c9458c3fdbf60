#include "comgui/ticket/BIN_STRING_BUFFER.h"

#include <gtest/gtest.h>
#include <memory>
#include <vector>

namespace
{
BIN_STRING_BUFFER BufferOf(std::string const& bytes) { return BIN_STRING_BUFFER(BIN_STRING(bytes)); }

std::string BytesOf(BIN_STRING_BUFFER const& buffer)
{
    return {buffer.BinString()->begin(), buffer.BinString()->end()};
}

// Short enough to lie inside the object, and too long for it.
class BIN_STRING_BUFFER_OF : public testing::TestWithParam<std::string>
{
};
INSTANTIATE_TEST_SUITE_P(Lengths, BIN_STRING_BUFFER_OF,
                         testing::Values("a", std::string("\0b\0", 3), std::string(15, 'c'),
                                         std::string(16, 'd'), std::string(1000, 'e')),
                         [](auto const& bytes) { return "Bytes" + std::to_string(bytes.param.size()); });
}  // namespace

TEST_P(BIN_STRING_BUFFER_OF, Made_CopiesTheBytes)
{
    std::string source = GetParam();
    BIN_STRING_BUFFER const buffer = BufferOf(source);
    source.assign(source.size(), '_');
    EXPECT_TRUE(buffer.BinString()->valid());
    EXPECT_NE(buffer.BinString()->data, source.data());
    EXPECT_EQ(BytesOf(buffer), GetParam());
}

TEST_P(BIN_STRING_BUFFER_OF, Copy_PointsAtItsOwnBytes)
{
    auto source = std::make_unique<BIN_STRING_BUFFER>(BufferOf(GetParam()));
    BIN_STRING_BUFFER const copy(*source);
    EXPECT_NE(copy.BinString()->data, source->BinString()->data);
    source.reset();
    EXPECT_EQ(BytesOf(copy), GetParam());
}

TEST_P(BIN_STRING_BUFFER_OF, ConstructionFromARvalue_PointsAtItsOwnBytes)
{
    auto source = std::make_unique<BIN_STRING_BUFFER>(BufferOf(GetParam()));
    BIN_STRING_BUFFER const moved(std::move(*source));
    source.reset();
    EXPECT_EQ(BytesOf(moved), GetParam());
}

TEST_P(BIN_STRING_BUFFER_OF, Assignment_PointsAtItsOwnBytes)
{
    auto source = std::make_unique<BIN_STRING_BUFFER>(BufferOf(GetParam()));
    BIN_STRING_BUFFER target = BufferOf("other");
    target = *source;
    EXPECT_NE(target.BinString()->data, source->BinString()->data);
    source.reset();
    EXPECT_EQ(BytesOf(target), GetParam());
}

TEST_P(BIN_STRING_BUFFER_OF, AssignmentToItself_ChangesNothing)
{
    BIN_STRING_BUFFER buffer = BufferOf(GetParam());
    BIN_STRING_BUFFER const& same = buffer;
    buffer = same;
    EXPECT_EQ(BytesOf(buffer), GetParam());
}

TEST_P(BIN_STRING_BUFFER_OF, GrowingVector_KeepsEveryViewRight)
{
    std::vector<BIN_STRING_BUFFER> buffers;
    for (int i = 0; i < 20; ++i)
        buffers.push_back(BufferOf(GetParam()));
    for (BIN_STRING_BUFFER const& buffer : buffers)
        EXPECT_EQ(BytesOf(buffer), GetParam());
}

TEST(BIN_STRING_BUFFER, OfAnInvalidView_HasANullView)
{
    for (BIN_STRING const& invalid : {BIN_STRING(), BIN_STRING("abc", 0), BIN_STRING(nullptr, 3)})
    {
        BIN_STRING_BUFFER const buffer(invalid);
        EXPECT_EQ(buffer.BinString()->data, nullptr);
        EXPECT_EQ(buffer.BinString()->size, 0u);
        BIN_STRING_BUFFER const copy(buffer);
        EXPECT_EQ(copy.BinString()->data, nullptr);
    }
}

TEST(BIN_STRING_BUFFER, AssignmentOfAnInvalidOne_LeavesANullView)
{
    BIN_STRING_BUFFER buffer = BufferOf("abc");
    buffer = BIN_STRING_BUFFER(BIN_STRING());
    EXPECT_FALSE(buffer.BinString()->valid());
    EXPECT_EQ(buffer.BinString()->data, nullptr);
}

TEST(BIN_STRING_BUFFER, Order_IsThatOfStrings)
{
    std::vector<std::string> const sorted = {"",
                                             std::string("\0", 1),
                                             std::string("\0\0", 2),
                                             "a",
                                             std::string("a\0", 2),
                                             "ab",
                                             "b",
                                             "\x7F",
                                             "\x80",
                                             "\xFF"};
    for (std::size_t left = 0; left < sorted.size(); ++left)
        for (std::size_t right = 0; right < sorted.size(); ++right)
            EXPECT_EQ(BufferOf(sorted[left]) < BufferOf(sorted[right]), left < right) << left << ' ' << right;
}
