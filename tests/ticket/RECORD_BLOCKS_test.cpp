#include "comgui/ticket/RECORD_BLOCKS.h"

#include <gtest/gtest.h>
#include <vector>

using namespace comgui::detail;

namespace
{
class RecordBlocks : public testing::Test
{
protected:
    void Append(int count)
    {
        for (int i = 0; i < count; ++i)
            records.Append("key", PARAM_INT, &records, static_cast<int>(records.Size()));
    }

    // The positions of all records, which tell them apart.
    std::vector<int> Positions() const
    {
        std::vector<SETMULTIPAR> copies(records.Size());
        EXPECT_EQ(records.CopyTo(copies.data()), copies.data() + copies.size());
        std::vector<int> positions;
        for (SETMULTIPAR const& record : copies)
            positions.push_back(record.pos);
        return positions;
    }

    static std::vector<int> UpTo(int count)
    {
        std::vector<int> numbers;
        for (int i = 0; i < count; ++i)
            numbers.push_back(i);
        return numbers;
    }

    POOL pool;
    RECORD_BLOCKS records{pool};
};
}  // namespace

TEST_F(RecordBlocks, NewRecord_HoldsWhatItGot_AndZeros)
{
    records.Append("key", PARAM_INT, &pool, 7);
    SETMULTIPAR record = {};
    records.CopyTo(&record);
    EXPECT_STREQ(record.key, "key");
    EXPECT_EQ(record.type, PARAM_INT);
    EXPECT_EQ(record.value, &pool);
    EXPECT_EQ(record.pos, 7);
    EXPECT_EQ(record.reserved12, 0);
    EXPECT_FALSE(record.ok);
    for (char const byte : record.reserved29)
        EXPECT_EQ(byte, 0);
}

TEST_F(RecordBlocks, HoweverMany_StayInTheirOrder)
{
    for (int const count : {0, 1, 6, 1, 1, 7, 8, 1, 1000, 5000})
    {
        Append(count);
        ASSERT_EQ(Positions(), UpTo(static_cast<int>(records.Size())));
    }
    EXPECT_EQ(records.Size(), 6025u);
}

TEST_F(RecordBlocks, CopyFrom_StoresOverAllOfThem)
{
    for (int const count : {1, 8, 3000})
    {
        Append(count);
        std::vector<SETMULTIPAR> others(records.Size());
        for (std::size_t i = 0; i < others.size(); ++i)
            others[i].pos = static_cast<int>(2 * i);
        records.CopyFrom(others.data());
        std::vector<int> const positions = Positions();
        for (std::size_t i = 0; i < positions.size(); ++i)
            ASSERT_EQ(positions[i], static_cast<int>(2 * i));
    }
}

TEST_F(RecordBlocks, Clear_ForgetsAll)
{
    Append(100);
    records.Clear();
    pool.Clear();
    EXPECT_EQ(records.Size(), 0u);
    Append(3);
    EXPECT_EQ(Positions(), UpTo(3));
}
