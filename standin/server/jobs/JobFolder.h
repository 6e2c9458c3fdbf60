// The folder of a job: $(JOB)/ID, which comes and goes with the job's ticket. The administrator may have
// given $(JOB) a place where other programs have folders, too. So the server marks each that it makes by an
// empty file in it, whose name only the job's ticket tells, and takes no other away.
#pragma once

#include "standin/server/files/Descriptor.h"
#include "standin/server/tickets/FolderTable.h"
#include <filesystem>

namespace standin
{
inline constexpr char JobMarkKey[] = "Job/FolderMark";

std::string NewJobMark();  // none comes twice

// Whether MakeJobFolder would find nothing in its way.
bool IsJobFolderFree(FolderTable const& table, int id);

// Makes it and opens it. Throws TransferError, also if there is one of that number with something in it:
// whose that is nobody here knows.
Descriptor MakeJobFolder(FolderTable const& table, int id, std::string_view mark);

// The folder's name is on the disk when this returns. Throws TransferError.
void FlushJobFolder(FolderTable const& table);

// With all that is in it, if it has that mark. It loses its name first, so that another job may have it at
// once. What cannot be removed stays, and is reported on stderr.
void RemoveJobFolder(FolderTable const& table, int id, std::string_view mark);

// By its name, what RemoveJobFolder has left when it was broken off.
bool IsJobFolderOnItsWayOut(std::filesystem::path const& folder);

// The same for a folder that belongs to no ticket: if it has any mark, or nothing in it, or is on its way
// out.
void RemoveStrayJobFolder(std::filesystem::path const& folder);
}  // namespace standin
