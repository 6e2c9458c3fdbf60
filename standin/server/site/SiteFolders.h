// The folders of a site when it is opened: what the system ticket says of them, and what processes that were
// killed have left there. Whoever calls these has the site.
#pragma once

#include "standin/server/store/Storage.h"
#include "standin/server/tickets/FolderTable.h"
#include <filesystem>

namespace standin
{
FolderSettings FoldersIn(Storage& storage);

// A setting that keeps clients from coming to an end when they read the folders.
struct FolderFault
{
    std::string_view key;
    std::string line;     // for the person who runs the program: key, value and remedy
    StoredValue value{};  // to be put in its place: a harmless one
};
std::vector<FolderFault> FaultsOf(FolderSettings const& settings);

// Removes jobs that were announced and never came, job folders without a job in the site's own folder for
// jobs, and the beginnings of files in the server's folders: everywhere below the site, and in those that lie
// elsewhere themselves, if the process that left them has ended.
void SweepTransfers(Storage& storage, std::filesystem::path const& site);

// For a site that begins anew: its old jobs are not lost, nor taken for those of the new tickets.
void SetJobFoldersAside(std::filesystem::path const& jobs);
}  // namespace standin
