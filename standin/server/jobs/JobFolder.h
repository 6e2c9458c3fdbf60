// The folder of a job: $(JOB)/ID, which comes and goes with the job's ticket. The administrator may have
// given $(JOB) a place where other programs have folders, too. So the server marks each that it makes by an
// empty file in it, whose name only the job's ticket tells, and takes no other away.
#pragma once

#include "standin/server/files/Descriptor.h"
#include "standin/server/tickets/FolderTable.h"
#include <filesystem>
#include <functional>
#include <map>
#include <string>
#include <string_view>

namespace standin
{
inline constexpr char JobMarkKey[] = "Job/FolderMark";

std::string NewJobMark();  // none comes twice

// Whether MakeJobFolder would find nothing in its way.
bool IsJobFolderFree(FolderTable const& table, int id);

// Makes it and opens it. Throws TransferError, also if there is one of that number with something in it:
// whose that is nobody here knows.
Descriptor MakeJobFolder(FolderTable const& table, int id, std::string_view mark);

// The names of the folders in $(JOB) are on the disk when this returns. Throws TransferError.
void FlushFolderForJobs(FolderTable const& table);

// With all that is in it, if it has that mark. It loses its name first, so that another job may have it at
// once. What cannot be removed stays, and is reported on stderr.
void RemoveJobFolder(FolderTable const& table, int id, std::string_view mark);

// Those in a folder for jobs that have a job's number for a name, by that; links not followed.
std::map<int, std::filesystem::path> NumberedFolders(std::filesystem::path const& jobs);

// What is known of the jobs at the moment of the question. What they throw passes through.
struct KnownJobs
{
    std::function<bool(int id)> exists;
    std::function<bool(int id, std::string_view mark)> hasMark;  // there is such a job, with that mark
};

// Removes from a folder for jobs what those have left that are gone: numbered folders with a mark or nothing
// in them, and what RemoveJobFolder was removing when it was broken off. If that was about to be given back,
// it is now. A job's ticket has to be there before its folder.
void SweepJobFolders(std::filesystem::path const& jobs, KnownJobs const& known);
}  // namespace standin
