// What a client does with the folders of the system ticket, step by step and in the plainest way.
#pragma once

#include "standin/server/tickets/FolderTable.h"
#include <algorithm>
#include <optional>
#include <string>
#include <utility>
#include <vector>

// Its folders by variable, none while it does not use them; nothing if it never comes to an end.
inline std::optional<std::vector<std::pair<std::string, std::string>>>
FoldersOfAClient(standin::FolderSettings const& settings)
{
    std::vector<std::pair<std::string, std::string>> mappings;
    int const flags = settings.use & 3;
    for (std::size_t row = 0; flags && row < standin::FolderRows.size(); ++row)
    {
        std::string value = settings.values[row];
        if (value.empty())
            continue;
        std::replace(value.begin(), value.end(), '\\', '/');
        if (value.back() == '/')
            value.pop_back();
        for (int turn = 0; value.size() >= 4 && value[0] == '$' && value[1] == '('; ++turn)
        {
            if (turn == 1000)
                return std::nullopt;
            auto const end = value.find(')');
            if (!(flags & 1) || end == std::string::npos)
                continue;
            for (auto const& [variable, folder] : mappings)
                if (variable == value.substr(2, end - 2))
                {
                    value = folder + value.substr(end + 1);
                    break;
                }
        }
        mappings.emplace_back(standin::FolderRows[row].variable, value);
    }
    return mappings;
}
