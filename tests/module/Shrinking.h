// Makes a list that shows a failure as short as it can be made by leaving out parts of it.
#pragma once

#include <algorithm>
#include <cstddef>
#include <vector>

// fails: whether a list still shows the failure. It is asked until no single element can be left out any
// more, or as often as is said.
template <typename T, typename Fails>
std::vector<T> Shrunk(std::vector<T> list, Fails const& fails, int attempts)
{
    for (std::size_t length = std::max<std::size_t>(list.size() / 2, 1);;
         length = std::max<std::size_t>(length / 2, 1))
    {
        bool hasShrunk = false;
        for (std::size_t begin = list.size(); begin > 0 && attempts > 0;)
        {
            begin -= std::min(begin, length);
            std::vector<T> shorter = list;
            auto const first = shorter.begin() + static_cast<std::ptrdiff_t>(begin);
            shorter.erase(first, first + static_cast<std::ptrdiff_t>(std::min(length, list.size() - begin)));
            --attempts;
            if (!fails(shorter))
                continue;
            list = std::move(shorter);
            hasShrunk = true;
        }
        if (attempts == 0 || (length == 1 && !hasShrunk))
            return list;
    }
}
