// Logins and logouts, with records as a host makes them.
#include "tools/comgui_validate/Session.h"
#include "comgui/session/TCommandRecord.h"
#include "comgui/session/TJobIdentification.h"
#include <cstring>

namespace validate
{
namespace
{
// The fields that the host fills in and that stay its own, as one text.
std::string HostsFields(TLogin const& record)
{
    return std::string("size ") + std::to_string(record.nSize) + ", user " + Quoted(record.szUser) +
           ", host " + Quoted(record.szServerHost) + ", port " + std::to_string(record.iServerPort) +
           ", local port " + std::to_string(record.iLocalPort) + ", local address " +
           Quoted(record.szLocalAddress) + ", notifications " + std::to_string(record.iGUINotificationID) +
           ", password " + (std::strlen(record.szPassword) > 0 ? "set" : "empty");
}

template <std::size_t Size>
bool Ends(char const (&text)[Size])
{
    return std::memchr(text, '\0', Size) != nullptr;
}

void MustLogIn(Trial& trial, Record& record)
{
    if (record.Initialize() != 0)
        throw Skipped("the record cannot be initialised; see session.initialize");
    trial.ExpectZero("R2", record.LogIn());
}

void Initialize(Trial& trial)
{
    Record record(trial);
    std::string const before = HostsFields(*record.Get());
    trial.ExpectZero("R1", record.Initialize());
    trial.Expect("R1", HostsFields(*record.Get()) == before, HostsFields(*record.Get()), before);
}

void LogIn(Trial& trial)
{
    Record record(trial);
    if (record.Initialize() != 0)
        throw Skipped("the record cannot be initialised; see session.initialize");
    std::string const before = HostsFields(*record.Get());
    record->hSession = nullptr;
    record->iUserRole = -12345;
    trial.ExpectZero("R2", record.LogIn());
    trial.Expect("R2", record->hSession, "a null hSession", "a handle");
    trial.Expect("R2", record->iUserRole != -12345, "an untouched iUserRole", "the user's role");
    trial.Expect("R2", record->iClientStamp >= 0, "the user's ticket " + std::to_string(record->iClientStamp),
                 "a ticket id");
    trial.Expect("R3", Ends(record->szLocalEndPoint), "a szLocalEndPoint without an end",
                 "a zero byte in it");
    trial.Expect("R2", record->szLocalEndPoint[0] != '\0', "an empty szLocalEndPoint",
                 "a text that names this client");
    trial.Expect("R3", HostsFields(*record.Get()) == before, HostsFields(*record.Get()), before);
    record.LogOut();
}

// Whatever is wrong in it must not stay in the way.
void RefusedThenRight(Trial& trial, Record& wrong)
{
    if (wrong.Initialize() != 0)
        throw Skipped("the record cannot be initialised; see session.initialize");
    trial.ExpectFailure("R4", wrong.LogIn());
    Record right(trial);
    if (right.Initialize() != 0)
        throw Skipped("the record cannot be initialised; see session.initialize");
    trial.ExpectZero("R4", right.LogIn());
    right.LogOut();
}

void WrongPassword(Trial& trial)
{
    Record wrong(trial);
    std::strcpy(wrong->szPassword, "not the password of anybody");
    RefusedThenRight(trial, wrong);
}

void UnknownUser(Trial& trial)
{
    Record wrong(trial);
    std::strcpy(wrong->szUser, "nobody-of-this-name");
    RefusedThenRight(trial, wrong);
}

bool HasContainer(Trial& trial, Record const& record)
{
    Module& module = trial.GetModule();
    trial.Calling("GetClientContainerEntry(instance, session)");
    return module.table.GetClientContainerEntry(module.instance, record->hSession) != nullptr;
}

void Twice(Trial& trial)
{
    Record first(trial);
    Record second(trial);
    MustLogIn(trial, first);
    second->iLocalPort += 1;
    if (second.Initialize() != 0)
        throw Skipped("the record cannot be initialised; see session.initialize");
    trial.ExpectZero("R5", second.LogIn());
    trial.Expect("R5", first->hSession != second->hSession, "the same handle twice", "two handles");
    bool const hadOne = HasContainer(trial, second);
    first.LogOut();
    trial.Expect("R7", HasContainer(trial, second) == hadOne, "no container after the other's logout",
                 "a session that goes on");
    second.LogOut();
}

void WithoutInitialize(Trial& trial)
{
    Record record(trial);
    if (record.LogIn() == 0)
        record.LogOut();
}

void LogOut(Trial& trial)
{
    Record record(trial);
    MustLogIn(trial, record);
    trial.ExpectZero("R7", record.LogOut());
}

// Every entry that takes a handle, with one that stands for no session.
void ExpectNoSession(Trial& trial, char const* rule, void* handle, bool endsWithLogout)
{
    Module& module = trial.GetModule();
    ComGUIModuleInterface const& table = module.table;
    char nowhere[] = "/nonexistent/file";
    char target[] = "$(TEMP)/ComGUIValidate";
    char name[] = "file";
    trial.Calling("GetClientContainerEntry(instance, handle without a session)");
    trial.Expect(rule, !table.GetClientContainerEntry(module.instance, handle), "a container", "null");
    TCommandRecord record{};
    record.nMagic = 0x49494949;
    record.nSize = sizeof record;
    trial.Calling(
        "SendCommandEntry(instance, handle without a session, \"remote.system.isalive\", 540, record)");
    trial.ExpectFailure(rule, table.SendCommandEntry(module.instance, handle, "remote.system.isalive",
                                                     sizeof record, &record));
    int size = 0;
    trial.Calling("GetTicketDataEntry(instance, handle without a session, 0, 0, 0, &size, null)");
    trial.ExpectFailure(rule, table.GetTicketDataEntry(module.instance, handle, 0, 0, 0, &size, nullptr));
    for (auto const& [entry, call] : {std::pair{table.PutFileEntry, "PutFileEntry"},
                                      {table.GetFileEntry, "GetFileEntry"},
                                      {table.PutFileSyncEntry, "PutFileSyncEntry"},
                                      {table.GetFileSyncEntry, "GetFileSyncEntry"}})
    {
        trial.Calling(std::string(call) + "(instance, handle without a session, texts)");
        trial.ExpectFailure(rule, entry(module.instance, handle, nowhere, target));
    }
    TJobIdentification job{};
    job.nSize = sizeof job;
    char folder[] = "$(UPLOADJOB)";
    job.pszUploadFolder = folder;
    trial.Calling("SendJobEntry(instance, handle without a session, job, path, name)");
    trial.ExpectFailure(rule, table.SendJobEntry(module.instance, handle, &job, nowhere, name));
    if (!endsWithLogout)
        return;
    trial.Calling("LogoutEntry(instance, handle without a session)");
    trial.ExpectFailure(rule, table.LogoutEntry(module.instance, handle));
}

void NullHandle(Trial& trial) { ExpectNoSession(trial, "R9", nullptr, true); }

void StaleHandle(Trial& trial)
{
    Record record(trial);
    MustLogIn(trial, record);
    record.LogOut();
    ExpectNoSession(trial, "R8", record->hSession, true);
}

void Again(Trial& trial)
{
    Record record(trial);
    MustLogIn(trial, record);
    record.LogOut();
    trial.ExpectZero("R10", record.Initialize());
    trial.ExpectZero("R10", record.LogIn());
    record.LogOut();
}

void Uninitialize(Trial& trial)
{
    Module& module = trial.GetModule();
    for (auto const& [entry, call] : {std::pair{module.table.UninitializeEntry, "UninitializeEntry"},
                                      {module.table.UninitializeAsyncEntry, "UninitializeAsyncEntry"}})
    {
        Record record(trial);
        MustLogIn(trial, record);
        record.LogOut();
        trial.Calling(std::string(call) + "(instance, record)");
        trial.ExpectZero("R11", entry(module.instance, record.Get()));
    }
}
}  // namespace

std::vector<Check> SessionChecks()
{
    return {
        {"session.initialize", Initialize},
        {"session.login", LogIn},
        {"session.wrong-password", WrongPassword},
        {"session.unknown-user", UnknownUser},
        {"session.twice", Twice},
        {"session.without-initialize", WithoutInitialize},
        {"session.logout", LogOut},
        {"session.stale-handle", StaleHandle},
        {"session.null-handle", NullHandle},
        {"session.again", Again},
        {"session.uninitialize", Uninitialize},
    };
}
}  // namespace validate
