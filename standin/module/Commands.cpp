#include "standin/module/Commands.h"

#include "comgui/session/TCommandRecord.h"
#include "standin/module/ModuleCodes.h"
#include "standin/module/ValueWords.h"
#include "standin/server/files/RefusableCall.h"
#include "standin/server/files/Report.h"
#include <algorithm>
#include <cstring>
#include <iterator>

namespace standin
{
namespace
{
// What the client gives; argA is the ticket's id, argB the notification id, code the ticket's type.
using ClientCallback = void (*)(void* user, int kind, int argA, int argB, int code, void* data);

void Notify(ClientCallback callback, void* user, Notification const& notification)
{
    std::vector<SETMULTIPAR> records(notification.parameters.size() + 1);
    std::vector<BIN_STRING> binaries(notification.parameters.size());
    for (std::size_t i = 0; i < notification.parameters.size(); ++i)
    {
        ChangedParameter const& change = notification.parameters[i];
        records[i].key = change.key->CStr();
        records[i].type = change.value.type;
        records[i].value = change.value.type == PARAM_NONE ? nullptr : WordOf(change.value, binaries[i]);
        records[i].pos = change.pos;
        records[i].ok = true;
    }
    bool const isTransfer = notification.kind == TransferEnded;
    callback(user, notification.kind, isTransfer ? notification.code : notification.ticket.id,
             notification.id, notification.ticket.type,
             notification.parameters.empty() ? nullptr : records.data());
}

void* PointerIn(STICKET_ACCESS const& ticket, char const* key)
{
    void* pointer = nullptr;
    ticket.SGETPARAMETER(ticket.Instance, key, PARAM_POINTER, &pointer, -1);
    return pointer;
}

int SetCallback(Container const& container, STICKET_ACCESS const* ticket)
{
    if (!ticket)
        return MODULE_INVALID_ARGUMENT;
    auto const callback = reinterpret_cast<ClientCallback>(PointerIn(*ticket, "pGUI2Notification"));
    if (!callback)
        return MODULE_INVALID_ARGUMENT;
    void* const user = PointerIn(*ticket, "pUser");

    NotificationService& service = container.Server().Notifications();
    int const id = service.NewId();
    // The answer first: nobody could ever switch off what came under an id that did not arrive.
    if (!ticket->SSETPARAMETER(ticket->Instance, "iGUINotificationID", PARAM_INT, &id, -1))
        return MODULE_INVALID_ARGUMENT;
    bool const registered = service.Register(container.Session(), id,
                                             [callback, user](Notification const& notification)
                                             { Notify(callback, user, notification); });
    return registered ? MODULE_DONE : MODULE_UNKNOWN_SESSION;
}

int GetReason(STICKET_ACCESS const* ticket)
{
    if (!ticket)
        return MODULE_INVALID_ARGUMENT;
    std::string const reason = RefusableCall::TakeReason();
    bool const isThere = !reason.empty();
    bool const isTaken =
        ticket->SSETPARAMETER(ticket->Instance, "Reason/Text", isThere ? PARAM_STRING : PARAM_NONE,
                              isThere ? reason.c_str() : nullptr, -1);
    return isTaken ? MODULE_DONE : MODULE_INVALID_ARGUMENT;
}

int GetProgress(Container const& container, STICKET_ACCESS const* ticket)
{
    if (!ticket)
        return MODULE_INVALID_ARGUMENT;
    auto const progress = container.Server().Transfers().ProgressOf(container.Session());
    SETMULTIPAR table[3] = {};
    long long numbers[] = {progress ? progress->done : 0, progress ? progress->size : 0};
    char const* const keys[] = {"Transfer/Done", TransferSizeKey};
    for (std::size_t i = 0; i < std::size(keys); ++i)
    {
        table[i].key = keys[i];
        table[i].type = progress ? PARAM_INT64 : PARAM_NONE;
        table[i].value = progress ? &numbers[i] : nullptr;
        table[i].pos = -1;
    }
    bool const isTaken = ticket->SSETMULTIPAR(ticket->Instance, table) && table[0].ok && table[1].ok;
    return isTaken ? MODULE_DONE : MODULE_INVALID_ARGUMENT;
}

TCommandRecord* RecordIn(int size, void* data)
{
    constexpr unsigned Magic = 0x49494949;
    auto* const record = static_cast<TCommandRecord*>(data);
    bool const isRecord = record && size == sizeof *record && record->nMagic == Magic;
    return isRecord && record->nSize == sizeof *record ? record : nullptr;
}

int IsAlive(Container const& container, TCommandRecord& record)
{
    record.iResult = container.Server().IsReachable() ? MODULE_DONE : MODULE_SITE_UNAVAILABLE;
    return record.iResult;
}

// The name of the job's file comes as $(JOB)/NAME. iArgA is the job's queue, iArgC the number of copies.
int PrepareJob(Container const& container, TCommandRecord& record)
{
    record.iResult = -1;
    constexpr std::string_view Folder = "$(JOB)/";
    std::string_view const text(record.szText2, strnlen(record.szText2, sizeof record.szText2));
    if (!text.starts_with(Folder))
    {
        Report("a job was refused: its file is to be $(JOB)/NAME, not " + ForMessages(text));
        return MODULE_PATH_REFUSED;
    }
    JobIntake::Announcement announcement;
    announcement.name = text.substr(Folder.size());
    announcement.isCut = text.size() == sizeof record.szText2;
    announcement.queue = record.iArgA;
    announcement.copies = record.iArgC;
    return container.Server().Jobs().Prepare(container.Session(), announcement, record.iResult);
}

int SetFolder(Container const& container, Session::ClientFolder which, int size, char const* text)
{
    if (!text || size <= 0)
        return MODULE_INVALID_ARGUMENT;
    std::string const name(text, strnlen(text, static_cast<std::size_t>(size)));
    auto const isControl = [](unsigned char byte) { return byte < 0x20 || byte == 0x7F; };
    std::filesystem::path const folder = name;
    if (!folder.is_absolute() || std::any_of(name.begin(), name.end(), isControl))
    {
        Report(ForMessages(name) + ": no absolute path of a folder");
        return MODULE_PATH_REFUSED;
    }
    std::error_code error;
    if (!std::filesystem::is_directory(folder, error))
    {
        Report(name + ": no folder; make it first");
        return MODULE_NOT_A_FILE;
    }
    container.Session().SetFolder(which, folder);
    return MODULE_DONE;
}

int RunSessionsCommand(Container const& container, std::string_view name, int size, void* data)
{
    if (name == "local.set.callback")
        return SetCallback(container, static_cast<STICKET_ACCESS const*>(data));
    if (name == "local.get.progress")
        return GetProgress(container, static_cast<STICKET_ACCESS const*>(data));
    if (name == "local.set.previewfolder")
        return SetFolder(container, Session::PreviewFolder, size, static_cast<char const*>(data));
    if (name == "local.set.thumbnailfolder")
        return SetFolder(container, Session::ThumbnailFolder, size, static_cast<char const*>(data));
    auto const work = name == "remote.system.isalive" ? IsAlive
                      : name == "remote.job.prepare"  ? PrepareJob
                                                      : nullptr;
    if (!work)
        return MODULE_NOT_SUPPORTED;
    TCommandRecord* const record = RecordIn(size, data);
    return record ? work(container, *record) : MODULE_INVALID_ARGUMENT;
}
}  // namespace

int RunCommand(Container const* container, char const* command, int size, void* data)
{
    std::string_view const name = command ? command : "";
    if (name == "local.get.reason")
        return GetReason(static_cast<STICKET_ACCESS const*>(data));
    if (!container)
        return MODULE_UNKNOWN_SESSION;
    return command ? RunSessionsCommand(*container, name, size, data) : MODULE_INVALID_ARGUMENT;
}
}  // namespace standin
