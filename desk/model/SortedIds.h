// Numbers in ascending order, each once, with their places: what stands at an index and the index of a number
// are found in O(log n), and to add or remove one moves a few hundred at most. For one thread at a time.
#pragma once

#include <cstddef>
#include <optional>
#include <vector>

namespace desk
{
class SortedIds
{
public:
    void Assign(std::vector<int> ids);  // in any order; repeated ones count once

    // The index at which the id stands from now on, or stood; none if nothing changed.
    std::optional<std::size_t> Insert(int id);
    std::optional<std::size_t> Erase(int id);

    std::size_t Size() const { return m_size; }
    std::optional<int> At(std::size_t index) const;
    std::optional<std::size_t> IndexOf(int id) const;

private:
    struct Place
    {
        std::size_t block = 0;
        std::size_t offset = 0;
    };

    Place PlaceFor(int id) const;  // where it is, or where it belongs; there is at least one block
    bool IsAt(Place place, int id) const;
    std::size_t IndexOf(Place place) const;
    void ChangeCount(std::size_t block, std::size_t difference);
    void SplitIfLarge(std::size_t block);
    void CountAnew();

    std::size_t m_size = 0;
    std::vector<std::vector<int>> m_blocks;  // in ascending order, none of them empty

    // A tree of the blocks' sizes: the i-th, counted from 1, is the sum of as many blocks up to it as the
    // lowest bit of i says.
    std::vector<std::size_t> m_counts;
};
}  // namespace desk
