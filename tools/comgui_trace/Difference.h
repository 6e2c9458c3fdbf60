// Where two sequences of lines differ: the shortest edit that makes one of the other.
#pragma once

#include <string>
#include <vector>

namespace tracing
{
struct DifferingLine
{
    enum Kind
    {
        Removed,
        Added,
        Same,
    };
    Kind kind;
    std::string const* line;  // of the sequences that were compared
};

// In order. Same lines are left out but for so many around the others.
std::vector<DifferingLine> Difference(std::vector<std::string> const& before,
                                      std::vector<std::string> const& after, std::size_t around);
}  // namespace tracing
