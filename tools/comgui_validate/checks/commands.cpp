// Named commands, and the data of a ticket.
#include "comgui/session/TCommandRecord.h"
#include "tools/comgui_validate/Session.h"

#include <algorithm>
#include <cstring>
#include <filesystem>

namespace validate
{
namespace
{
TCommandRecord NewRecord()
{
    TCommandRecord record{};
    record.nMagic = 0x49494949;
    record.nSize = sizeof record;
    return record;
}

int Send(Session& session, char const* command, TCommandRecord& record)
{
    return session.Send(command, sizeof record, &record);
}

void ExpectHead(Trial& trial, TCommandRecord const& record)
{
    trial.Expect("M3", record.nMagic == 0x49494949 && record.nSize == sizeof record,
                 "another nMagic or nSize", "those of the host");
}

void Unknown(Trial& trial)
{
    Session session(trial);
    for (char const* const command : {"remote.no.such.command", "local.no.such.command", "", "nonsense"})
    {
        TCommandRecord record = NewRecord();
        trial.ExpectFailure("M1", Send(session, command, record));
    }
}

void IsAlive(Trial& trial)
{
    Session session(trial);
    TCommandRecord record = NewRecord();
    record.iArgB = 1;
    record.iResult = -1;
    trial.ExpectZero("M2", Send(session, "remote.system.isalive", record));
    trial.Expect("M2", record.iResult >= 0, "iResult " + std::to_string(record.iResult), "0 or above");
    ExpectHead(trial, record);
}

// The text has no end behind its length: what follows must not be read.
void Folders(Trial& trial)
{
    Session session(trial);
    std::string const folder = std::filesystem::temp_directory_path();
    std::string text = folder + "/behind the end";
    for (char const* const command : {"local.set.previewfolder", "local.set.thumbnailfolder"})
        trial.ExpectZero("M4", session.Send(command, static_cast<int>(folder.size()), text.data()));
}

void Prepare(Trial& trial)
{
    Session session(trial);
    TCommandRecord record = NewRecord();
    record.iArgA = -1;
    record.iResult = -1;
    std::string const path = "$(JOB)/ComGUIValidate.pdf";
    std::copy(path.begin(), path.end(), record.szText2);
    if (Send(session, "remote.job.prepare", record) != 0)
        throw Skipped("the server prepares no job");
    trial.Expect("M5", record.iResult >= 0, "0, and iResult " + std::to_string(record.iResult),
                 "an answer of 0 or above");
    ExpectHead(trial, record);
}

void TicketData(Trial& trial)
{
    Session session(trial);
    Module& module = trial.GetModule();
    std::vector<char> buffer(1 << 20);
    for (int const capacity : {0, 16, static_cast<int>(buffer.size())})
    {
        std::fill(buffer.begin(), buffer.end(), '\x5A');
        int size = capacity;
        trial.Calling("GetTicketDataEntry(instance, session, 0, 0, 0, &size, buffer) with a size of " +
                      std::to_string(capacity));
        (void)module.table.GetTicketDataEntry(module.instance, session.Handle(), 0, 0, 0, &size,
                                              buffer.data());
        bool const isInside =
            std::all_of(buffer.begin() + capacity, buffer.end(), [](char byte) { return byte == '\x5A'; });
        trial.Expect("M6", isInside, "a change behind the buffer", "no more than its size");
    }
}
}  // namespace

std::vector<Check> CommandChecks()
{
    return {{"commands.unknown", Unknown},
            {"commands.is-alive", IsAlive},
            {"commands.folders", Folders},
            {"commands.prepare", Prepare},
            {"commands.ticket-data", TicketData}};
}
}  // namespace validate
