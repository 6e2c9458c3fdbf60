// The folders of a site when it is opened: what the system ticket says of them, and what processes that were
// killed have left there.
#pragma once

#include "standin/server/sessions/TicketService.h"
#include "standin/server/tickets/FolderTable.h"
#include <filesystem>

namespace standin
{
// A setting that keeps clients from coming to an end when they read the folders.
struct FolderFault
{
    std::string_view key;
    std::string line;     // for the person who runs the program: key, value and remedy
    TicketValue value{};  // to be put in its place: a harmless one
};
std::vector<FolderFault> FaultsOf(FolderSettings const& settings);

// Removes job folders without a job in the site's own folder for jobs, if that is where jobs are; other
// programs may make and delete jobs meanwhile, also such that this one has not heard of. Throws StoreError.
void SweepJobFolders(Store& store, TicketService& tickets, std::filesystem::path const& site);

// For a site that begins anew, alone with it: its old jobs are not lost, nor taken for those of the new
// tickets.
void SetJobFoldersAside(std::filesystem::path const& jobs);
}  // namespace standin
