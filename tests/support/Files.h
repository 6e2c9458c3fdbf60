// What lies on disk, as tests put it there and ask for it. Failures throw.
#pragma once

#include <filesystem>
#include <string>
#include <string_view>
#include <vector>

void WriteFile(std::filesystem::path const& file, std::string_view content);  // over an older one
std::string ContentOf(std::filesystem::path const& file);
std::vector<std::string> NamesIn(std::filesystem::path const& folder);  // sorted
