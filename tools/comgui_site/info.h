// What there is to know of a site at a glance.
#pragma once

#include "standin/server/store/Store.h"
#include "tools/comgui_site/words.h"
#include <filesystem>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace comgui_site
{
struct SiteInfo
{
    std::filesystem::path folder;
    std::string database{};               // where it is, if not in the folder
    unsigned long long databaseSize = 0;  // in bytes, with the journal of the engine
    unsigned long long filesSize = 0;     // of everything else in the folder
    std::map<int, std::size_t> tickets;   // by type
    std::vector<standin::User> users;
    std::vector<standin::ProgramInfo> programs;  // but for this one
    std::vector<standin::SessionInfo> sessions;
    standin::Sequence newest = 0;
    standin::Sequence oldest = 0;  // in the journal; 0: that is empty
};

SiteInfo InfoOf(standin::Store& store, std::filesystem::path const& folder);

// The number of the first change in the journal, or the one that comes next if it is empty.
standin::Sequence BeginningOfJournal(standin::Store& store);

std::string TextOf(SiteInfo const& info);
Json JsonOf(SiteInfo const& info);
}  // namespace comgui_site
