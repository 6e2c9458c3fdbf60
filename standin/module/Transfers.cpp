#include "standin/module/Transfers.h"

#include "standin/module/ModuleCodes.h"
#include "standin/server/files/Report.h"
#include <cstring>

namespace standin
{
namespace
{
using Request = TransferService::Request;

int Carry(Container const& container, Request::Direction direction, char const* source, char const* target)
{
    if (!source || !target)
        return MODULE_INVALID_ARGUMENT;
    return container.Server().Transfers().Carry(container.Session(), {direction, source, target});
}

int Begin(Container const& container, Request::Direction direction, char const* source, char const* target)
{
    if (!source || !target)
        return MODULE_INVALID_ARGUMENT;
    return container.Server().Transfers().CarryLater(container.Session(), {direction, source, target});
}
}  // namespace

int PutFile(Container const& container, char const* localPath, char const* serverPath)
{
    return Carry(container, Request::ToServer, localPath, serverPath);
}

int GetFile(Container const& container, char const* serverPath, char const* localPath)
{
    return Carry(container, Request::ToClient, serverPath, localPath);
}

int BeginPutFile(Container const& container, char const* localPath, char const* serverPath)
{
    return Begin(container, Request::ToServer, localPath, serverPath);
}

int BeginGetFile(Container const& container, char const* serverPath, char const* localPath)
{
    return Begin(container, Request::ToClient, serverPath, localPath);
}

int SendJob(Container const& container, TJobIdentification const* record, char const* localPath,
            char const* leafName)
{
    bool const isRecord = record && record->nSize == sizeof(TJobIdentification) && record->pszUploadFolder;
    if (!isRecord || !localPath || !leafName)
        return MODULE_INVALID_ARGUMENT;
    if (std::strcmp(record->pszUploadFolder, "$(UPLOADJOB)") != 0)
    {
        Report("a job was refused: its folder is " + ForMessages(record->pszUploadFolder) +
               "; jobs come into $(UPLOADJOB), their own folder");
        return MODULE_PATH_REFUSED;
    }
    return container.Server().Jobs().Send(container.Session(), localPath, leafName);
}
}  // namespace standin
