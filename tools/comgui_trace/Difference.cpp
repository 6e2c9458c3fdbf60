#include "tools/comgui_trace/Difference.h"

#include "tools/shared/Trouble.h"
#include <algorithm>

namespace tracing
{
namespace
{
using Lines = std::vector<std::string>;

constexpr long MostEdits = 5000;  // what is kept to find the way back grows with the square

// By E. W. Myers: the furthest that so many edits reach on each diagonal, and the way back from the end.
std::vector<DifferingLine> ShortestEdit(Lines const& before, Lines const& after)
{
    auto const n = static_cast<long>(before.size());
    auto const m = static_cast<long>(after.size());
    std::vector<std::vector<long>> reached;  // by the number of edits, by the diagonal + edits
    std::vector<long> furthest(static_cast<std::size_t>(2 * (n + m) + 3));
    auto const at = [&furthest, middle = n + m + 1](long diagonal) -> long&
    { return furthest[static_cast<std::size_t>(diagonal + middle)]; };
    auto const isDown = [&at](long diagonal, long edits)
    { return diagonal == -edits || (diagonal != edits && at(diagonal - 1) < at(diagonal + 1)); };
    bool isThere = false;
    for (long edits = 0; !isThere; ++edits)
    {
        if (edits > MostEdits)
            throw tools::Trouble("the traces differ in more than " + std::to_string(MostEdits) + " lines");
        reached.emplace_back(furthest.begin() + (n + m + 1 - edits - 1),
                             furthest.begin() + (n + m + 1 + edits + 2));
        for (long diagonal = -edits; diagonal <= edits && !isThere; diagonal += 2)
        {
            long x = isDown(diagonal, edits) ? at(diagonal + 1) : at(diagonal - 1) + 1;
            while (x < n && x - diagonal < m &&
                   before[static_cast<std::size_t>(x)] == after[static_cast<std::size_t>(x - diagonal)])
                ++x;
            at(diagonal) = x;
            isThere = x >= n && x - diagonal >= m;
        }
    }
    std::vector<DifferingLine> lines;
    long x = n;
    long y = m;
    for (auto edits = static_cast<long>(reached.size()) - 1; x > 0 || y > 0; --edits)
    {
        auto const was = [&seen = reached[static_cast<std::size_t>(edits)], edits](long diagonal)
        { return seen[static_cast<std::size_t>(diagonal + edits + 1)]; };
        long const diagonal = x - y;
        bool const down = diagonal == -edits || (diagonal != edits && was(diagonal - 1) < was(diagonal + 1));
        long const fromX = edits == 0 ? 0 : down ? was(diagonal + 1) : was(diagonal - 1);
        long const fromY = edits == 0 ? 0 : fromX - (down ? diagonal + 1 : diagonal - 1);
        while (x > fromX && y > fromY &&
               before[static_cast<std::size_t>(x - 1)] == after[static_cast<std::size_t>(y - 1)])
        {
            lines.push_back({DifferingLine::Same, &before[static_cast<std::size_t>(--x)]});
            --y;
        }
        if (edits == 0)
            break;
        if (down)
            lines.push_back({DifferingLine::Added, &after[static_cast<std::size_t>(--y)]});
        else
            lines.push_back({DifferingLine::Removed, &before[static_cast<std::size_t>(--x)]});
    }
    std::reverse(lines.begin(), lines.end());
    return lines;
}
}  // namespace

std::vector<DifferingLine> Difference(Lines const& before, Lines const& after, std::size_t around)
{
    auto const all = ShortestEdit(before, after);
    std::vector<bool> isShown(all.size());
    for (std::size_t i = 0; i < all.size(); ++i)
        if (all[i].kind != DifferingLine::Same)
            for (std::size_t near = i < around ? 0 : i - around; near <= std::min(i + around, all.size() - 1);
                 ++near)
                isShown[near] = true;
    std::vector<DifferingLine> shown;
    for (std::size_t i = 0; i < all.size(); ++i)
        if (isShown[i])
            shown.push_back(all[i]);
    return shown;
}
}  // namespace tracing
