// What a client sends and fetches: files and jobs. Each answers a ModuleCode.
#pragma once

#include "comgui/session/TJobIdentification.h"
#include "standin/module/Container.h"

namespace standin
{
// The source first, then the target. One of them is a server path, $(VARIABLE)/rest, the other is local.
int PutFile(Container const& container, char const* localPath, char const* serverPath);
int GetFile(Container const& container, char const* serverPath, char const* localPath);

// The same, but only begun when they return: the session is told of the end.
int BeginPutFile(Container const& container, char const* localPath, char const* serverPath);
int BeginGetFile(Container const& container, char const* serverPath, char const* localPath);

// The record must say "$(UPLOADJOB)", the job's own folder; its other words are not looked at.
int SendJob(Container const& container, TJobIdentification const* record, char const* localPath,
            char const* leafName);
}  // namespace standin
