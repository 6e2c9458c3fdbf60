#include "comgui/foundation/short_compare.h"

#include <gtest/gtest.h>
#include <memory>
#include <random>
#include <string>

using namespace comgui::detail;

namespace
{
// In a block of exactly its size, so that a sanitizer sees each byte that is read beyond.
class EXACT
{
public:
    explicit EXACT(std::string const& bytes) : m_bytes(new char[bytes.size()]), m_size(bytes.size())
    {
        bytes.copy(m_bytes.get(), m_size);
    }

    char const* Begin() const { return m_bytes.get(); }
    std::size_t Size() const { return m_size; }

private:
    std::unique_ptr<char[]> m_bytes;
    std::size_t m_size;
};

int Sign(int number) { return (number > 0) - (number < 0); }

void ExpectAsTheStandardDoes(std::string const& left, std::string const& right)
{
    EXACT const a(left);
    EXACT const b(right);
    EXPECT_EQ(SameBytes(a.Begin(), b.Begin(), a.Size()), left == right);
    EXPECT_EQ(Sign(CompareBytes(a.Begin(), b.Begin(), a.Size())), Sign(left.compare(right)));
}
}  // namespace

TEST(ShortCompare, OfBytesThatDifferAtOnePlace_TellsThatPlace)
{
    std::mt19937 random(3);
    for (std::size_t size = 0; size <= 40; ++size)
    {
        std::string text(size, '\0');
        for (char& c : text)
            c = static_cast<char>(random());
        ExpectAsTheStandardDoes(text, text);
        for (std::size_t at = 0; at < size; ++at)
            for (int const change : {1, 127, 128, 255})
            {
                std::string other = text;
                other[at] = static_cast<char>(other[at] + change);
                ExpectAsTheStandardDoes(text, other);
            }
    }
}

TEST(ShortCompare, OfBytesThatDifferAtTwoPlaces_TheFirstCounts)
{
    for (std::size_t size = 2; size <= 24; ++size)
        for (std::size_t first = 0; first + 1 < size; ++first)
            for (std::size_t second = first + 1; second < size; ++second)
            {
                std::string low(size, 'm');
                std::string high(size, 'm');
                low[first] = 'a';
                high[second] = 'a';
                ExpectAsTheStandardDoes(low, high);
                ExpectAsTheStandardDoes(high, low);
            }
}

TEST(SizeToZero, IsThatOfTheBytesInFront)
{
    for (std::size_t size = 0; size <= 40; ++size)
        for (char const other : {'\x01', '\x80', '\xFF', 'x'})
        {
            EXPECT_EQ(SizeToZero(EXACT(std::string(size, other)).Begin(), size), size);
            for (std::size_t first = 0; first < size; ++first)
                for (std::size_t second = first; second < size; ++second)
                {
                    std::string text(size, other);
                    text[first] = text[second] = '\0';
                    EXPECT_EQ(SizeToZero(EXACT(text).Begin(), size), first);
                }
        }
}
