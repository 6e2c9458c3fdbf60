#include "desk/model/SortedIds.h"

#include <algorithm>
#include <bit>

namespace desk
{
namespace
{
constexpr std::size_t LargestBlock = 1024;

constexpr std::size_t LowestBit(std::size_t number) { return number & (~number + 1); }
}  // namespace

void SortedIds::Assign(std::vector<int> ids)
{
    std::sort(ids.begin(), ids.end());
    ids.erase(std::unique(ids.begin(), ids.end()), ids.end());
    m_size = ids.size();
    m_blocks.clear();
    for (std::size_t begin = 0; begin < ids.size();
         begin += LargestBlock / 2)  // half full: some will be added
    {
        auto const first = ids.begin() + static_cast<std::ptrdiff_t>(begin);
        auto const count = std::min(LargestBlock / 2, ids.size() - begin);
        m_blocks.emplace_back(first, first + static_cast<std::ptrdiff_t>(count));
    }
    CountAnew();
}

std::optional<std::size_t> SortedIds::Insert(int id)
{
    if (m_blocks.empty())
    {
        Assign({id});
        return 0;
    }
    Place const place = PlaceFor(id);
    if (IsAt(place, id))
        return std::nullopt;
    std::size_t const index = IndexOf(place);
    auto& block = m_blocks[place.block];
    block.insert(block.begin() + static_cast<std::ptrdiff_t>(place.offset), id);
    ++m_size;
    ChangeCount(place.block, 1);
    SplitIfLarge(place.block);
    return index;
}

std::optional<std::size_t> SortedIds::Erase(int id)
{
    std::optional<std::size_t> const index = IndexOf(id);
    if (!index)
        return std::nullopt;
    Place const place = PlaceFor(id);
    auto& block = m_blocks[place.block];
    block.erase(block.begin() + static_cast<std::ptrdiff_t>(place.offset));
    --m_size;
    if (!block.empty())
        ChangeCount(place.block, std::size_t{0} - 1);
    else
    {
        m_blocks.erase(m_blocks.begin() + static_cast<std::ptrdiff_t>(place.block));
        CountAnew();
    }
    return index;
}

std::optional<int> SortedIds::At(std::size_t index) const
{
    if (index >= m_size)
        return std::nullopt;
    std::size_t block = 0;
    for (std::size_t step = std::bit_floor(m_blocks.size()); step > 0; step /= 2)
        if (block + step <= m_counts.size() && m_counts[block + step - 1] <= index)
        {
            block += step;
            index -= m_counts[block - 1];
        }
    return m_blocks[block][index];
}

std::optional<std::size_t> SortedIds::IndexOf(int id) const
{
    if (m_blocks.empty())
        return std::nullopt;
    Place const place = PlaceFor(id);
    return IsAt(place, id) ? std::optional(IndexOf(place)) : std::nullopt;
}

SortedIds::Place SortedIds::PlaceFor(int id) const
{
    auto const beyond =
        std::upper_bound(m_blocks.begin(), m_blocks.end(), id,
                         [](int wanted, auto const& block) { return wanted < block.front(); });
    auto const block = beyond == m_blocks.begin() ? beyond : beyond - 1;
    auto const found = std::lower_bound(block->begin(), block->end(), id);
    return {static_cast<std::size_t>(block - m_blocks.begin()),
            static_cast<std::size_t>(found - block->begin())};
}

bool SortedIds::IsAt(Place place, int id) const
{
    auto const& block = m_blocks[place.block];
    return place.offset < block.size() && block[place.offset] == id;
}

std::size_t SortedIds::IndexOf(Place place) const
{
    std::size_t index = place.offset;
    for (std::size_t i = place.block; i > 0; i -= LowestBit(i))
        index += m_counts[i - 1];
    return index;
}

void SortedIds::ChangeCount(std::size_t block, std::size_t difference)
{
    for (std::size_t i = block + 1; i <= m_counts.size(); i += LowestBit(i))
        m_counts[i - 1] += difference;
}

void SortedIds::SplitIfLarge(std::size_t block)
{
    if (m_blocks[block].size() <= LargestBlock)
        return;
    auto const middle = m_blocks[block].begin() + LargestBlock / 2;
    std::vector<int> upper(middle, m_blocks[block].end());
    m_blocks[block].erase(middle, m_blocks[block].end());
    m_blocks.insert(m_blocks.begin() + static_cast<std::ptrdiff_t>(block) + 1, std::move(upper));
    CountAnew();
}

void SortedIds::CountAnew()
{
    m_counts.assign(m_blocks.size(), 0);
    for (std::size_t i = 1; i <= m_counts.size(); ++i)
    {
        m_counts[i - 1] += m_blocks[i - 1].size();
        if (std::size_t const next = i + LowestBit(i); next <= m_counts.size())
            m_counts[next - 1] += m_counts[i - 1];
    }
}
}  // namespace desk
