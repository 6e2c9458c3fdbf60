#include "desk/model/DroppedFiles.h"

#include <filesystem>
#include <optional>
#include <set>

namespace desk
{
namespace
{
std::optional<Refusal> RefusalOf(std::string const& path)
{
    namespace fs = std::filesystem;
    std::error_code problem;
    fs::path const place(std::u8string(path.begin(), path.end()));
    auto const type = fs::status(place, problem).type();
    switch (type)
    {
    case fs::file_type::regular:
        return fs::file_size(place, problem) == 0 && !problem ? std::optional(Refusal::Empty) : std::nullopt;
    case fs::file_type::directory:
        return Refusal::Folder;
    case fs::file_type::none:
    case fs::file_type::not_found:
        return Refusal::NotThere;
    default:
        return Refusal::NoFile;
    }
}
}  // namespace

DroppedFiles Sifted(std::vector<std::string> const& paths)
{
    DroppedFiles sorted;
    std::set<std::string> seen;
    for (std::string const& path : paths)
    {
        if (!seen.insert(path).second)
            continue;
        if (auto const why = RefusalOf(path))
            sorted.refused.push_back({path, *why});
        else
            sorted.files.push_back(path);
    }
    return sorted;
}
}  // namespace desk
