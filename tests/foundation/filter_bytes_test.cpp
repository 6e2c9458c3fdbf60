// The forms of the filter's loop against the loop that anyone would write.
#include "comgui/foundation/filter_bytes.h"

#include <gtest/gtest.h>
#include <memory>
#include <random>
#include <string>
#include <string_view>

using namespace comgui::detail;

namespace
{
std::string Appended(std::string const& table, std::string const& text)
{
    std::string result;
    for (char const c : text)
        if (char const entry = table[static_cast<unsigned char>(c)])
            result += entry;
    return result;
}

// In a block of exactly the text's size, as a filter may write no more than it reads.
std::string Filtered(FILTER_BYTES* filter, std::string const& table, std::string const& text)
{
    std::unique_ptr<char[]> const in(new char[text.size()]);
    std::unique_ptr<char[]> const out(new char[text.size()]);
    text.copy(in.get(), text.size());
    return std::string(out.get(), filter(table.data(), in.get(), text.size(), out.get()));
}

struct FORM
{
    char const* name;
    FILTER_BYTES* filter;
};

class FilterBytes : public testing::TestWithParam<FORM>
{
protected:
    void SetUp() override
    {
        if (IsWide() && GetParam().filter == FilterBytesOneByOne)
            GTEST_SKIP() << "this processor has no wide form";
    }

    static bool IsWide() { return std::string_view(GetParam().name) == "Wide"; }
};

std::mt19937 generator(7);

// So many of 100 bytes are removed, the others replaced at random.
std::string Table(unsigned removed)
{
    std::string table(256, '\0');
    for (char& entry : table)
        entry = static_cast<char>(generator() % 100 < removed ? 0 : 1 + generator() % 255);
    return table;
}

std::string Text(std::size_t size)
{
    std::string text(size, '\0');
    for (char& c : text)
        c = static_cast<char>(generator());
    return text;
}
}  // namespace

TEST_P(FilterBytes, GivesTheEntriesThatAreNot0)
{
    for (unsigned const removed : {0u, 1u, 20u, 50u, 99u, 100u})
    {
        std::string const table = Table(removed);
        for (std::size_t size = 0; size < 300; ++size)
        {
            std::string const text = Text(size);
            ASSERT_EQ(Filtered(GetParam().filter, table, text), Appended(table, text)) << size;
        }
    }
}

TEST_P(FilterBytes, LooksUpEachOfThe256Bytes)
{
    std::string text;
    for (int c = 0; c < 256; ++c)
        text += static_cast<char>(c);
    for (int round = 0; round < 50; ++round)
    {
        std::string const table = Table(10);
        ASSERT_EQ(Filtered(GetParam().filter, table, text), Appended(table, text));
    }
}

INSTANTIATE_TEST_SUITE_P(Forms, FilterBytes,
                         testing::Values(FORM{"OneByOne", FilterBytesOneByOne},
                                         FORM{"Wide", QuickestFilterBytes()}),
                         [](auto const& form) { return std::string(form.param.name); });
