// Whether a site makes sense: what its tickets, users and jobs say of one another and of the files. The pages
// and rows of a database are looked at by its engine.
#pragma once

#include "standin/server/store/Store.h"
#include <filesystem>
#include <functional>
#include <string>
#include <vector>

namespace comgui_site
{
// A line for each problem. Programs may change the site meanwhile: what they have just put right is none.
// progress: tickets done, of how many.
std::vector<std::string> ProblemsOf(standin::Store& store, std::filesystem::path const& folder,
                                    std::function<void(long long, long long)> const& progress);
}  // namespace comgui_site
