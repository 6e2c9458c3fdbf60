// The folder of a job: $(JOB)/ID, which comes and goes with the job's ticket.
#pragma once

#include "standin/server/Descriptor.h"
#include "standin/server/FolderTable.h"

namespace standin
{
// Makes it and opens it. What lies there belongs to no job any more, since the ticket is new, and goes.
// Throws TransferError.
Descriptor MakeJobFolder(FolderTable const& table, int id);

// With all that is in it. What cannot be removed stays, and is told on stderr; the id may be given again.
void RemoveJobFolder(FolderTable const& table, int id);
}  // namespace standin
