// Random tables through the library's writer and back through JSON.
#include "tests/tools/Streams.h"
#include "tools/ticketstream/Trouble.h"
#include "tools/ticketstream/diff.h"
#include "tools/ticketstream/json.h"
#include "tools/ticketstream/make.h"
#include <bit>
#include <gtest/gtest.h>
#include <random>

using namespace ticketstream;
using StreamOracle::RECORD;

namespace
{
class Dice
{
public:
    explicit Dice(unsigned int seed) : m_random(seed) {}

    unsigned int Below(unsigned int limit) { return static_cast<unsigned int>(m_random() % limit); }

    // Small, near a border of a number form, or anything.
    unsigned long long Bits()
    {
        static constexpr unsigned int borders[] = {0, 7, 8, 15, 16, 31, 32, 53, 63};
        switch (Below(3))
        {
        case 0:
            return Below(300);
        case 1:
            return (1ull << borders[Below(std::size(borders))]) + Below(3) - 1;
        default:
            return m_random();
        }
    }

    double Real()
    {
        switch (Below(4))
        {
        case 0:
            return std::bit_cast<float>(static_cast<unsigned int>(m_random()));
        case 1:
            return static_cast<double>(static_cast<long long>(Bits()));
        case 2:
            return Below(2) ? 0.1 : -0.0;
        default:
            return std::bit_cast<double>(m_random());
        }
    }

    // Any bytes but zero, UTF-8 or not, now and then long enough for the next form of a tag.
    std::string Text()
    {
        std::string text;
        unsigned int const size = Below(40) == 0 ? 2040 + Below(16) : Below(18);
        char const* const alphabet = Below(2) ? "ab/\xC3\xA4" : "ab\xC3\xFF\"\\\x01";
        while (text.size() < size)
            text += alphabet[Below(Below(2) ? 2 : 5)];
        return text;
    }

    std::string Key(std::string const& previous)
    {
        return previous.substr(0, Below(static_cast<unsigned int>(previous.size()) + 1)) +
               Text().substr(0, 200);
    }

    RECORD Record(std::string const& key, int pos)
    {
        unsigned long long const bits = Bits();
        switch (Below(8))
        {
        case 0:
            return StreamOracle::Delete(key, pos);
        case 1:
            return StreamOracle::Int(key, static_cast<int>(bits), pos);
        case 2:
            return StreamOracle::Double(key, Real(), pos);
        case 3:
            return StreamOracle::Text(key, Text(), pos);
        case 4:
            return StreamOracle::Bytes(key, Text() + std::string(Below(3), '\0'), pos);
        case 5:
            return StreamOracle::Int64(key, static_cast<long long>(bits), pos);
        case 6:
            return StreamOracle::Unsigned(key, static_cast<unsigned int>(bits), pos);
        default:
            return StreamOracle::Unsigned64(key, bits, pos);
        }
    }

    std::string Stream()
    {
        std::vector<RECORD> records;
        std::string key;
        int pos = -1;
        for (unsigned int left = Below(12); left > 0; --left)
        {
            key = Below(3) ? key : Key(key);
            pos = Below(3) ? pos : static_cast<int>(Below(20)) - 2;
            records.push_back(Record(key, pos));
        }
        return Streams::Written(records);
    }

private:
    std::mt19937_64 m_random;
};

std::string JsonOf(std::string const& stream)
{
    tools::Output out;
    PrintJson(stream, out);
    return out.Text();
}
}  // namespace

TEST(RandomTables, ThroughJsonAndBack_GiveTheSameBytes)
{
    for (unsigned int seed = 0; seed < 3000; ++seed)
    {
        std::string const stream = Dice(seed).Stream();
        std::string const json = JsonOf(stream);
        ASSERT_EQ(HexOf(MakeStream(json)), HexOf(stream)) << "seed " << seed << '\n' << json;
    }
}

TEST(RandomOperations, ThroughJsonAndBack_GiveTheSameBytes)
{
    for (unsigned int seed = 0; seed < 500; ++seed)
    {
        Dice dice(seed);
        MTICKET_BINSTREAM::Write writer(0);
        for (unsigned int left = dice.Below(5); left > 0; --left)
        {
            static constexpr int codes[] = {2, 7, 105, 106, 108};
            int const id = static_cast<int>(dice.Bits());
            writer.PutSetMultipar(static_cast<int>(left), id, dice.Stream());
            writer.PutOperation(static_cast<int>(left), id, Streams::Code(codes[dice.Below(5)]),
                                dice.Below(2) ? dice.Stream() : dice.Text());
            std::string const key = dice.Text();
            char const* const keys[] = {key.c_str(), nullptr};
            writer.PutPartialTableOperation(static_cast<int>(left), id, STICKET_OP_SET_PARTIAL, keys);
        }
        std::string stream;
        writer.GetAndClear(stream);
        std::string const json = JsonOf(stream);
        ASSERT_EQ(HexOf(MakeStream(json)), HexOf(stream)) << "seed " << seed << '\n' << json;
    }
}

// Streams that no writer makes: what comes back need not be the same bytes, but it must mean the same.
TEST(SpoiltStreams, ThatCanBeRead_MeanTheSameAfterJson)
{
    int good = 0;
    for (unsigned int seed = 0; seed < 4000; ++seed)
    {
        Dice dice(seed);
        std::string stream = dice.Below(4) ? dice.Stream() : Streams::Container();
        if (!stream.empty())
            stream[dice.Below(static_cast<unsigned int>(stream.size()))] = static_cast<char>(dice.Bits());
        std::string json;
        try
        {
            json = JsonOf(stream);
        }
        catch (BrokenStream const&)
        {
            continue;
        }
        ++good;
        std::string const again = MakeStream(json);
        tools::Output out;
        ASSERT_TRUE(Diff(stream, again, out)) << "seed " << seed << '\n' << out.Text();
        ASSERT_EQ(JsonOf(again), json) << "seed " << seed;
    }
    EXPECT_GT(good, 500);
}
