#include "standin/module/ModuleSession.h"

#include "comgui/session/TCommandRecord.h"
#include "comgui/session/TJobIdentification.h"
#include "standin/module/ModuleCodes.h"
#include "standin/module/ValueWords.h"
#include "standin/server/files/Report.h"
#include "standin/server/tickets/TicketXml.h"
#include <algorithm>
#include <cstring>
#include <iterator>
#include <limits>

namespace standin
{
namespace
{
using comgui::plugin::Callback;
using comgui::plugin::ClientFolder;
using comgui::plugin::Transfer;
using Request = TransferService::Request;

void Tell(Callback const& callback, Notification const& notification)
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
    callback.Tell(notification.kind, isTransfer ? notification.code : notification.ticket.id, notification.id,
                  notification.ticket.type, notification.parameters.empty() ? nullptr : records.data());
}
}  // namespace

bool ModuleSession::HasEnded() const { return GetSession().Ended() || EveryCall().HasLostSession(); }

int ModuleSession::Command(std::string_view name, int size, void* data)
{
    EveryCall().PassCommand(name);
    return Session::Command(name, size, data);
}

int ModuleSession::TicketData(comgui::plugin::Address ticket, int format, int* size, void* buffer)
{
    EveryCall().PassFresh("GetTicketDataEntry", TicketAddress{ticket.type, ticket.id});
    if (!size)
        return MODULE_INVALID_ARGUMENT;
    if (format != 0)
        return MODULE_UNKNOWN_FORMAT;
    TicketAddress const address{ticket.type, ticket.id};
    std::string text;
    bool const exists = GetServer().Tickets().Look(GetSession(), address, 0,
                                                   [&](TicketSnapshot const& content, KeyFilter const* limit)
                                                   {
                                                       text = TicketXml::Of(address, content, limit).Text();
                                                       return true;
                                                   });
    if (!exists)
        return MODULE_UNKNOWN_TICKET;
    if (text.size() > static_cast<std::size_t>(std::numeric_limits<int>::max()))
        return MODULE_FAILED;  // the size has no room in an int
    int const room = buffer ? *size : 0;
    *size = static_cast<int>(text.size());
    if (!buffer || room < *size)
        return MODULE_BUFFER_TOO_SMALL;
    std::memcpy(buffer, text.data(), text.size());
    return MODULE_DONE;
}

int ModuleSession::Carry(Request const& request, Transfer wanted) const
{
    TransferService& transfers = GetServer().Transfers();
    return wanted == Transfer::Complete ? transfers.Carry(GetSession(), request)
                                        : transfers.CarryLater(GetSession(), request);
}

int ModuleSession::PutFile(std::string_view local, std::string_view server, Transfer wanted)
{
    EveryCall().Pass(wanted == Transfer::Complete ? "PutFileSyncEntry" : "PutFileEntry");
    return Carry({Request::ToServer, std::string(local), std::string(server)}, wanted);
}

int ModuleSession::GetFile(std::string_view server, std::string_view local, Transfer wanted)
{
    EveryCall().Pass(wanted == Transfer::Complete ? "GetFileSyncEntry" : "GetFileEntry");
    return Carry({Request::ToClient, std::string(server), std::string(local)}, wanted);
}

int ModuleSession::SendJob(TJobIdentification const& job, std::string_view path, std::string_view name)
{
    EveryCall().Pass("SendJobEntry");
    if (std::strcmp(job.pszUploadFolder, "$(UPLOADJOB)") != 0)
    {
        Report("a job was refused: its folder is " + ForMessages(job.pszUploadFolder) +
               "; jobs come into $(UPLOADJOB), their own folder");
        return MODULE_PATH_REFUSED;
    }
    return GetServer().Jobs().Send(GetSession(), std::string(path), std::string(name));
}

int ModuleSession::SetCallback(Callback callback, STICKET_ACCESS const& answer)
{
    NotificationService& service = GetServer().Notifications();
    int const id = service.NewId();
    // The answer first: nobody could ever switch off what came under an id that did not arrive.
    if (!Callback::PutId(answer, id))
        return MODULE_INVALID_ARGUMENT;
    bool const isRegistered = service.Register(
        GetSession(), id, [callback](Notification const& notification) { Tell(callback, notification); });
    return isRegistered ? MODULE_DONE : MODULE_UNKNOWN_SESSION;
}

int ModuleSession::IsAlive(TCommandRecord& record)
{
    record.iResult = GetServer().IsReachable() ? MODULE_DONE : MODULE_SITE_UNAVAILABLE;
    return record.iResult;
}

int ModuleSession::PrepareJob(TCommandRecord& record)
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
    return GetServer().Jobs().Prepare(GetSession(), announcement, record.iResult);
}

int ModuleSession::SetFolder(ClientFolder which, std::string_view path)
{
    std::string const name(path);
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
    GetSession().SetFolder(which == ClientFolder::Preview ? standin::Session::PreviewFolder
                                                          : standin::Session::ThumbnailFolder,
                           folder);
    return MODULE_DONE;
}

int ModuleSession::OtherCommand(std::string_view name, int, void* data)
{
    if (name == "local.get.progress")
        return GetProgress(static_cast<STICKET_ACCESS const*>(data));
    return MODULE_NOT_SUPPORTED;
}

int ModuleSession::GetProgress(STICKET_ACCESS const* ticket) const
{
    if (!ticket)
        return MODULE_INVALID_ARGUMENT;
    auto const progress = GetServer().Transfers().ProgressOf(GetSession());
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
}  // namespace standin
