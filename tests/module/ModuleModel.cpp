#include "tests/module/ModuleModel.h"

#include "comgui/ticket/TICKET_ID.h"
#include "standin/module/ModuleCodes.h"
#include "tests/module/ValueText.h"
#include <algorithm>

using namespace standin;

namespace
{
constexpr int LargestTicketId = 0xFFFFFF;
constexpr int SystemType = 0;
constexpr int JobType = 3;
constexpr int QueueType = 7;
constexpr int UserType = 17;
constexpr PLAIN_ADDRESS None{TICKET_ID_NONE, TICKET_ID_NONE};

bool IsAddress(PLAIN_ADDRESS ticket)
{
    return ticket.first >= 0 && ticket.first < 100 && ticket.second >= 0 && ticket.second <= LargestTicketId;
}

bool IsWholeType(PLAIN_ADDRESS tickets)
{
    return tickets.second == TICKET_ID_ALL && IsAddress({tickets.first, 0});
}

std::string LineOf(PLAIN_ADDRESS ticket)
{
    return std::to_string(ticket.first) + "/" + std::to_string(ticket.second);
}

std::string Joined(std::vector<std::string> const& lines)
{
    std::string text;
    for (std::string const& line : lines)
        text += line + "\n";
    return text;
}

MODEL_RECORD Number(char const* key, int value) { return {key, PARAM_INT, -1, value, "", false}; }
MODEL_RECORD Text(char const* key, std::string value)
{
    return {key, PARAM_STRING, -1, 0, std::move(value), false};
}

PLAIN_CHANGE Reported(char const* key, std::string value)
{
    return {key, -1, {PARAM_STRING, std::move(value)}};
}

bool IsFileName(std::string const& name)
{
    return !name.empty() && name != ".." && name.find('/') == name.npos;
}

// The name behind the last slash.
std::string LeafOf(std::string const& path) { return path.substr(path.rfind('/') + 1); }

// Null for what is no file of the client's.
std::string const* LocalFile(std::string const& path)
{
    for (auto const& [name, content] : LocalFiles())
        if (path == "~/local/" + name)
            return &content;
    return nullptr;
}

int CodeOfSource(std::string const& path)
{
    if (LocalFile(path))
        return MODULE_DONE;
    return path == "~/local/folder" ? MODULE_NOT_A_FILE : MODULE_SOURCE_UNREADABLE;
}

std::optional<MODULE_MODEL::SERVER_FILE> ServerFile(std::string const& path, std::string const& leaf)
{
    auto const end = path.find(")/");
    if (!path.starts_with("$(") || end == path.npos)
        return std::nullopt;
    MODULE_MODEL::SERVER_FILE file{path.substr(2, end - 2), "", path.substr(end + 2)};
    if (auto const slash = file.name.find('/'); slash != file.name.npos)
    {
        file.folder = file.name.substr(0, slash);
        file.name.erase(0, slash + 1);
    }
    if (file.name.empty())
        file.name = leaf;
    bool const isGood = IsFileName(file.name) && file.folder != "..";
    return isGood ? std::optional(file) : std::nullopt;
}
}  // namespace

// --- the site

MODULE_MODEL::MODULE_MODEL()
{
    Make({SystemType, 0});
    Make({UserType, 1});
    Make({UserType, 2});
    WriteOwn(0, {SystemType, 0},
             {Text("System/Name", "Print Server"), Number("System/MasterSOAPPort", 50000),
              Number("System/UseFolderVariables", 3), Text("System/InstallFolder", "~/site"),
              Text("System/Folders/Temp", "$(INSTALL)/temp"), Text("System/Folders/Job", "$(INSTALL)/job")});
}

bool MODULE_MODEL::EndsNotifications(ACTION action)
{
    return action == ACTION::LogOut || action == ACTION::Register || action == ACTION::Disable ||
           action == ACTION::Hold;
}

std::optional<std::string> MODULE_MODEL::Run(STEP const& step)
{
    using ANSWER = std::function<LINE(MODULE_MODEL&, STEP const&)>;
    static std::map<ACTION, ANSWER> const answers{
        {ACTION::LogIn, &MODULE_MODEL::LogIn},
        {ACTION::LogOut, &MODULE_MODEL::LogOut},
        {ACTION::Read, &MODULE_MODEL::Read},
        {ACTION::ReadTable, &MODULE_MODEL::ReadTable},
        {ACTION::Write, &MODULE_MODEL::Write},
        {ACTION::WriteTable, &MODULE_MODEL::WriteTable},
        {ACTION::Open, &MODULE_MODEL::Open},
        {ACTION::Close, &MODULE_MODEL::Close},
        {ACTION::Create, &MODULE_MODEL::Create},
        {ACTION::CreateNext, &MODULE_MODEL::CreateNext},
        {ACTION::Delete, &MODULE_MODEL::Delete},
        {ACTION::Limit, &MODULE_MODEL::Limit},
        {ACTION::Operate, [](MODULE_MODEL&, STEP const&) { return "0"; }},
        {ACTION::WhoAmI, &MODULE_MODEL::WhoAmI},
        {ACTION::TicketData, &MODULE_MODEL::TicketData},
        {ACTION::Register, &MODULE_MODEL::Register},
        {ACTION::Enable, &MODULE_MODEL::Switch},
        {ACTION::Disable, &MODULE_MODEL::Switch},
        {ACTION::Hold, &MODULE_MODEL::Hold},
        {ACTION::Release, &MODULE_MODEL::Release},
        {ACTION::Flood, &MODULE_MODEL::Flood},
        {ACTION::Put, &MODULE_MODEL::Carry},
        {ACTION::Get, &MODULE_MODEL::Carry},
        {ACTION::PrepareJob, &MODULE_MODEL::PrepareJob},
        {ACTION::SendJob, &MODULE_MODEL::SendJob},
        {ACTION::OpenFile, &MODULE_MODEL::OpenFile},
        {ACTION::CloseFile, &MODULE_MODEL::CloseFile}};
    return MakesSense(step) ? answers.at(step.action)(*this, step) : std::nullopt;
}

// Who subscribes while a program is behind may be told of what was before, and the end of a transfer
// overtakes what is late: that is left open.
bool MODULE_MODEL::MakesSense(STEP const& step) const
{
    bool const isLeftOpen = step.action == ACTION::Register || step.action == ACTION::Enable ||
                            step.action == ACTION::Put || step.action == ACTION::Get;
    if (m_isFlooded && isLeftOpen)
        return false;
    if (FileOf(step))
        return FileOf(step)->isOpen != (step.action == ACTION::OpenFile);
    return step.action == ACTION::LogIn ? !Who(step).isAlive : Who(step).hasBegun;
}

MODULE_MODEL::TICKET_MODEL* MODULE_MODEL::Find(VISIT const& visit)
{
    auto const found = m_tickets.find(visit.ticket);
    bool const isIt = found != m_tickets.end() &&
                      (visit.incarnation == 0 || found->second.incarnation == visit.incarnation);
    return isIt ? &found->second : nullptr;
}

MODULE_MODEL::VISIT MODULE_MODEL::Make(PLAIN_ADDRESS ticket)
{
    m_tickets[ticket].incarnation = ++m_incarnations;
    for (PLAIN_NOTIFICATIONS& notifications : m_notifications)
        notifications.Created(ticket);
    return {ticket, m_incarnations};
}

void MODULE_MODEL::Remove(PLAIN_ADDRESS ticket)
{
    m_tickets.erase(ticket);
    for (PLAIN_NOTIFICATIONS& notifications : m_notifications)
        notifications.Deleted(ticket);
}

// For every other program a pointer is a deletion.
void MODULE_MODEL::Spread(std::size_t program, PLAIN_ADDRESS ticket, std::vector<PLAIN_CHANGE> const& changes)
{
    std::vector<PLAIN_CHANGE> theirs = changes;
    for (PLAIN_CHANGE& change : theirs)
        if (change.value.type == PARAM_POINTER)
            change.value = {};
    auto& seen = m_tickets[ticket].seen;
    for (std::size_t other = 0; other < std::size(seen); ++other)
        for (PLAIN_CHANGE const& change : theirs)
            if (other != program)
                seen[other].Make(change);
    m_notifications[program].Written(ticket, changes);
    m_notifications[1 - program].Written(ticket, theirs);
}

void MODULE_MODEL::WriteOwn(std::size_t program, PLAIN_ADDRESS ticket,
                            std::vector<MODEL_RECORD> const& records)
{
    std::vector<PLAIN_CHANGE> changes;
    for (MODEL_RECORD const& record : records)
        m_tickets[ticket].seen[program].Write(record, changes);
    Spread(program, ticket, changes);
}

// --- sessions

std::string MODULE_MODEL::LogIn(STEP const& step)
{
    bool const isAdministrator = step.source == "admin";
    bool const isUser = isAdministrator || step.source == "operator";
    if (!isUser || step.target != step.source)
        return std::to_string(MODULE_LOGIN_REFUSED);
    Who(step) = SESSION{};
    Who(step).hasBegun = true;
    Who(step).isAlive = true;
    Who(step).isAdministrator = isAdministrator;
    return isAdministrator ? "0 role 16 stamp 1" : "0 role 1 stamp 2";
}

// Its prepared jobs go. Whether it is told of that itself is left open. The test's own client registers anew.
std::string MODULE_MODEL::LogOut(STEP const& step)
{
    if (!Told(step).IsHeld())
        ++m_newestNotification[ProgramOf(step)];
    if (!Who(step).isAlive)
        return std::to_string(MODULE_UNKNOWN_SESSION);
    Who(step).isAlive = false;
    if (Who(step).client)
        Told(step).End(*Who(step).client);
    auto const prepared = m_prepared;
    std::erase_if(m_prepared, [&](PREPARED const& each) { return each.session == step.session; });
    for (PREPARED const& each : prepared)
        if (each.session == step.session && Find(each.job))
            Remove(each.job.ticket);
    return "0";
}

bool MODULE_MODEL::MayWrite(STEP const& step, PLAIN_ADDRESS ticket) const
{
    bool const isOwn = ticket == PLAIN_ADDRESS(UserType, 2);
    bool const isForAdministrators = ticket.first == SystemType || (ticket.first == UserType && !isOwn);
    return Who(step).isAlive && (Who(step).isAdministrator || !isForAdministrators);
}

// --- values

MODULE_MODEL::FILE_MODEL* MODULE_MODEL::FileOf(STEP const& step)
{
    return step.session == STEP::Files ? &m_files[step.table] : nullptr;
}

MODULE_MODEL::VISIT MODULE_MODEL::TargetOf(STEP const& step) const
{
    std::vector<TABLE> const& tables = Who(step).tables;
    if (step.table == STEP::Container || tables.empty())
        return {{step.type, step.id}, 0};
    TABLE const& table = tables[static_cast<std::size_t>(step.table) % tables.size()];
    return table.incarnation ? VISIT{table.ticket, table.incarnation} : VISIT{None, 0};
}

bool MODULE_MODEL::Sees(STEP const& step, PLAIN_ADDRESS ticket, std::string const& key) const
{
    auto const limit = Who(step).limits.find(ticket);
    return limit == Who(step).limits.end() || limit->second.Selects(key);
}

std::string MODULE_MODEL::Read(STEP const& step) const
{
    std::string const line = ReadTable(step);
    return line == "1 [-]" || line.starts_with('0') ? "0" : line;
}

std::string MODULE_MODEL::ReadTable(STEP const& step) const
{
    if (step.isNullTable)
        return "0";
    FILE_MODEL const* const file = FileOf(step);
    bool const isRefused = !file && !Who(step).isAlive;
    TICKET_MODEL const* const ticket = file || isRefused ? nullptr : Find(TargetOf(step));
    std::string line = isRefused ? "0 [" : "1 [";
    for (MODEL_RECORD const& record : step.records)
    {
        LINE found;
        if (file)
            found = file->content.Read(record);
        else if (ticket && record.key && Sees(step, TargetOf(step).ticket, *record.key))
            found = ticket->seen[ProgramOf(step)].Read(record);
        line += (&record == step.records.data() ? "" : ";") + found.value_or("-");
    }
    return line + "]";
}

std::string MODULE_MODEL::Write(STEP const& step)
{
    std::string oks;
    return WriteRecords(step, step.records, oks) && oks == "1" ? "1" : "0";
}

std::string MODULE_MODEL::WriteTable(STEP const& step)
{
    if (step.isNullTable)
        return "0";
    std::string oks;
    bool const isDone = WriteRecords(step, step.Records(), oks);
    return (isDone ? "1 [" : "0 [") + oks + "]";
}

bool MODULE_MODEL::WriteRecords(STEP const& step, std::vector<MODEL_RECORD> const& records, std::string& oks)
{
    std::vector<PLAIN_CHANGE> changes;
    if (FILE_MODEL* const file = FileOf(step))
    {
        for (MODEL_RECORD const& record : records)
            oks += file->content.Write(record, changes) ? '1' : '0';
        file->isChanged = file->isChanged || !changes.empty();
        return true;
    }
    VISIT const target = TargetOf(step);
    TICKET_MODEL* const ticket = MayWrite(step, target.ticket) ? Find(target) : nullptr;
    for (MODEL_RECORD const& record : records)
    {
        bool const isSeen = ticket && record.key && Sees(step, target.ticket, *record.key);
        oks += isSeen && ticket->seen[ProgramOf(step)].Write(record, changes) ? '1' : '0';
    }
    if (ticket)
        Spread(ProgramOf(step), target.ticket, changes);
    return ticket;
}

// --- tickets

std::string MODULE_MODEL::Open(STEP const& step)
{
    PLAIN_ADDRESS const ticket{step.type, step.id};
    return Who(step).isAlive && Find({ticket}) ? OpenNow(step, ticket) : "-";
}

// The table of the address, or another if that is still open for a ticket of before.
std::string MODULE_MODEL::OpenNow(STEP const& step, PLAIN_ADDRESS ticket)
{
    SESSION& session = Who(step);
    unsigned const incarnation = m_tickets.at(ticket).incarnation;
    auto const known = session.tableOf.find(ticket);
    bool const isUsable =
        known != session.tableOf.end() && (session.tables[known->second].openings == 0 ||
                                           session.tables[known->second].incarnation == incarnation);
    if (!isUsable)
    {
        session.tableOf[ticket] = session.tables.size();
        session.tables.push_back({ticket, incarnation});
    }
    TABLE& table = session.tables[session.tableOf[ticket]];
    table.incarnation = incarnation;
    ++table.openings;
    return "table " + std::to_string(session.tableOf[ticket]);
}

std::string MODULE_MODEL::Close(STEP const& step)
{
    SESSION& session = Who(step);
    auto const known = session.tableOf.find({step.type, step.id});
    if (!session.isAlive || known == session.tableOf.end() || session.tables[known->second].openings == 0)
        return "0";
    TABLE& table = session.tables[known->second];
    if (--table.openings == 0)
        table.incarnation = 0;
    return "1";
}

std::string MODULE_MODEL::Create(STEP const& step)
{
    PLAIN_ADDRESS const ticket{step.type, step.id};
    if (!IsAddress(ticket) || !MayWrite(step, ticket) || Find({ticket}))
        return "-";
    Make(ticket);
    Who(step).limits.erase(ticket);
    if (!step.keys.empty())
        Who(step).limits[ticket] = {step.keys};
    return OpenNow(step, ticket);
}

// The id above the largest, or else the smallest that is free.
int MODULE_MODEL::NextId(int type) const
{
    auto const behind = m_tickets.lower_bound({type + 1, 0});
    bool const isFirst = behind == m_tickets.begin() || std::prev(behind)->first.first != type;
    int const largest = isFirst ? 0 : std::prev(behind)->first.second;
    if (largest < LargestTicketId)
        return largest + 1;
    int id = 0;
    while (m_tickets.contains({type, id}))
        ++id;
    return id;
}

std::string MODULE_MODEL::CreateNext(STEP const& step)
{
    if (!IsAddress({step.type, 0}) || !MayWrite(step, {step.type, TICKET_ID_NEXT}))
        return "-1";
    PLAIN_ADDRESS const ticket{step.type, NextId(step.type)};
    Make(ticket);
    Who(step).limits.erase(ticket);
    return std::to_string(ticket.second);
}

std::string MODULE_MODEL::Delete(STEP const& step)
{
    PLAIN_ADDRESS const ticket{step.type, step.id};
    bool const isRefused = ticket.first == SystemType || !MayWrite(step, ticket) ||
                           (ticket.first == UserType && !Who(step).isAdministrator);
    if (isRefused || !Find({ticket}))
        return "0";
    Remove(ticket);
    return "1";
}

std::string MODULE_MODEL::Limit(STEP const& step)
{
    PLAIN_ADDRESS const ticket{step.type, step.id};
    if (!Who(step).isAlive || !Find({ticket}))
        return "0";
    Who(step).limits.erase(ticket);
    if (!step.keys.empty())
        Who(step).limits[ticket] = {step.keys};
    return "1";
}

std::string MODULE_MODEL::WhoAmI(STEP const& step) const
{
    if (FileOf(step))
        return "1 -1/-1";
    VISIT const target = TargetOf(step);
    bool const isOpen = step.table != STEP::Container && !Who(step).tables.empty();
    return Who(step).isAlive && isOpen && Find(target) ? "1 " + LineOf(target.ticket) : "0";
}

std::vector<std::string> MODULE_MODEL::LinesOf(STEP const& step, VISIT const& visit) const
{
    TICKET_MODEL const* const ticket = Who(step).isAlive ? Find(visit) : nullptr;
    if (!ticket)
        return {"gone"};
    return ticket->seen[ProgramOf(step)].Lines([&](std::string const& key)
                                               { return Sees(step, visit.ticket, key); });
}

std::string MODULE_MODEL::TicketData(STEP const& step) const
{
    PLAIN_ADDRESS const address{step.type, step.id};
    if (!Who(step).isAlive)
        return std::to_string(MODULE_UNKNOWN_SESSION);
    TICKET_MODEL const* const ticket = Find({address});
    if (!ticket)
        return std::to_string(MODULE_UNKNOWN_TICKET);
    PLAIN_TICKET plain = ticket->seen[ProgramOf(step)];
    plain.DropPointers();
    return "0\n" + Joined(plain.Lines([&](std::string const& key) { return Sees(step, address, key); }));
}

// --- walks

std::optional<std::vector<int>> MODULE_MODEL::BeginTickets(STEP const& step) const
{
    if (!Who(step).isAlive || !IsAddress({step.type, 0}))
        return std::nullopt;
    std::vector<int> ids;
    for (auto const& [address, ticket] : m_tickets)
        if (address.first == step.type)
            ids.push_back(address.second);
    return ids;
}

std::optional<MODULE_MODEL::VISIT> MODULE_MODEL::Visited(STEP const& step, int id) const
{
    TICKET_MODEL const* const ticket = Who(step).isAlive ? Find({{step.type, id}}) : nullptr;
    return ticket ? std::optional(VISIT{{step.type, id}, ticket->incarnation}) : std::nullopt;
}

std::string MODULE_MODEL::TextOf(STEP const& step, VISIT const& visit) const
{
    return LineOf(visit.ticket) + "\n" + Joined(LinesOf(step, visit));
}

bool MODULE_MODEL::HasValues(STEP const& step) const
{
    if (FileOf(step))
        return FileOf(step)->isOpen;
    return !Who(step).tables.empty();
}

std::optional<MODULE_MODEL::VALUE_WALK> MODULE_MODEL::BeginValues(STEP const& step)
{
    VALUE_WALK walk;
    walk.session = step.session;
    if (FILE_MODEL* const file = FileOf(step))
    {
        ++file->walks;
        walk.file = static_cast<std::size_t>(step.table);
        walk.keys = file->content.KeysWith(step.source);
        return walk;
    }
    VISIT const target = TargetOf(step);
    TICKET_MODEL const* const ticket = Who(step).isAlive ? Find(target) : nullptr;
    if (!ticket)
        return std::nullopt;
    walk.lines = ticket->seen[ProgramOf(step)].Lines(
        [&](std::string const& key)
        { return key.starts_with(step.source) && Sees(step, target.ticket, key); });
    return walk;
}

std::optional<std::string> MODULE_MODEL::NextValue(VALUE_WALK& walk) const
{
    if (!walk.file)
        return IsAlive(walk.session) && walk.next < walk.lines.size() ? LINE(walk.lines[walk.next++])
                                                                      : std::nullopt;
    for (; walk.next < walk.keys.size(); ++walk.next, walk.pos = 0)
    {
        std::string const& key = walk.keys[walk.next];
        if (auto const found = m_files[*walk.file].content.From(key, walk.pos))
        {
            walk.pos = found->first + 1;
            return WalkedLine(key, found->first, found->second);
        }
    }
    return std::nullopt;
}

void MODULE_MODEL::End(VALUE_WALK const& walk)
{
    if (walk.file)
        --m_files[*walk.file].walks;
}

// --- notifications

std::string MODULE_MODEL::Register(STEP const& step)
{
    if (!Who(step).isAlive)
        return std::to_string(MODULE_UNKNOWN_SESSION);
    if (step.number == 0)
        return std::to_string(MODULE_INVALID_ARGUMENT);
    if (Who(step).client)
        Told(step).End(*Who(step).client);
    Who(step).notification = ++m_newestNotification[ProgramOf(step)];
    Who(step).client = Told(step).Add(Who(step).notification);
    return "0 id " + std::to_string(Who(step).notification);
}

std::string MODULE_MODEL::Switch(STEP const& step)
{
    SESSION& session = Who(step);
    PLAIN_ADDRESS const tickets{step.type, step.id};
    bool const isOn = step.action == ACTION::Enable;
    bool const isEverything = tickets == PLAIN_ADDRESS(TICKET_ID_ALL, TICKET_ID_ALL) && !isOn;
    bool const isOwn =
        session.isAlive && session.client && (step.number == 0 || step.number == session.notification);
    bool const hasKeys = !isOn || !step.isNullTable;
    if (!isOwn || !hasKeys || !(isEverything || IsAddress(tickets) || IsWholeType(tickets)))
        return "0";
    if (isOn)
        Told(step).Enable(*session.client, tickets, {step.keys});
    else
        Told(step).Disable(*session.client, tickets);
    return "1";
}

MODULE_MODEL::LINE MODULE_MODEL::Hold(STEP const&)
{
    if (IsHeld())
        return std::nullopt;
    m_notifications[0].Hold();
    return "held";
}

MODULE_MODEL::LINE MODULE_MODEL::Release(STEP const&)
{
    if (!IsHeld())
        return std::nullopt;
    m_notifications[0].Release();
    m_isFlooded = false;
    return "released";
}

// Of use only while nobody is told; then clients are behind until that ends.
MODULE_MODEL::LINE MODULE_MODEL::Flood(STEP const& step)
{
    if (!IsHeld())
        return std::nullopt;
    m_isFlooded = true;
    return WriteTable(step);
}

// --- files and jobs

// Whether the folder can be used, as a code.
int MODULE_MODEL::CodeOfFolder(SERVER_FILE const& file, bool isPut) const
{
    bool const isOfJobs = file.variable == "JOB";
    if (!(isOfJobs && !isPut) && file.variable != "TEMP")
        return MODULE_PATH_REFUSED;
    if (file.folder.empty() || (isOfJobs && JobIn(file.folder)))
        return MODULE_DONE;
    return isPut ? MODULE_TARGET_UNWRITABLE : MODULE_SOURCE_UNREADABLE;
}

// Null for a folder of $(JOB) that has no job's file.
MODULE_MODEL::TICKET_MODEL const* MODULE_MODEL::JobIn(std::string const& folder) const
{
    for (auto const& [address, ticket] : m_tickets)
        if (address.first == JobType && !ticket.jobFile.empty() && std::to_string(address.second) == folder)
            return &ticket;
    return nullptr;
}

int MODULE_MODEL::Put(STEP const& step, SERVER_FILE const& to, std::string& content)
{
    if (int const code = CodeOfSource(step.source))
        return code;
    if (int const code = CodeOfFolder(to, true))
        return code;
    content = *LocalFile(step.source);
    m_temp[to.name] = content;
    return MODULE_DONE;
}

int MODULE_MODEL::Get(STEP const& step, SERVER_FILE const& from, std::string& content) const
{
    if (int const code = CodeOfFolder(from, false))
        return code;
    TICKET_MODEL const* const job = from.folder.empty() ? nullptr : JobIn(from.folder);
    bool const isInTemp = !job && from.variable == "TEMP" && m_temp.contains(from.name);
    if (!isInTemp && !(job && job->jobFile == from.name))
        return MODULE_SOURCE_UNREADABLE;
    if (step.target != FetchedFile)
        return MODULE_TARGET_UNWRITABLE;
    content = job ? job->jobContent : m_temp.at(from.name);
    return MODULE_DONE;
}

std::string MODULE_MODEL::Carry(STEP const& step)
{
    std::optional<std::string> fetched;
    int const code = CarryNow(step, fetched);
    if (step.action == ACTION::Put)
        return std::to_string(code);
    return std::to_string(code) + ", " + (fetched ? ContentLine(*fetched) : "nothing");
}

int MODULE_MODEL::CarryNow(STEP const& step, std::optional<std::string>& fetched)
{
    if (!Who(step).isAlive)
        return MODULE_UNKNOWN_SESSION;
    bool const isPut = step.action == ACTION::Put;
    bool const isLater = step.number == 1;
    auto const place = ServerFile(isPut ? step.target : step.source, isPut ? LeafOf(step.source) : "");
    if (!place)
        return MODULE_PATH_REFUSED;
    int const atOnce = isLater ? CodeOfFolder(*place, isPut) : MODULE_DONE;
    if (atOnce != MODULE_DONE)
        return atOnce;
    std::string content;
    int const code = isPut ? Put(step, *place, content) : Get(step, *place, content);
    if (!isPut && code == MODULE_DONE)
        fetched = content;
    if (isLater && Who(step).client)
        Told(step).TransferEnded(*Who(step).client, code,
                                 {Reported("Transfer/Source", "'" + step.source + "'"),
                                  Reported("Transfer/Target", "'" + step.target + "'"),
                                  Reported("Transfer/Code", std::to_string(code)),
                                  Reported("Transfer/Size", std::to_string(content.size()) + "ll")});
    return isLater ? int{MODULE_DONE} : code;
}

MODULE_MODEL::VISIT MODULE_MODEL::MakeJob(STEP const& step, std::string const& name, int queue, int copies)
{
    VISIT const job = Make({JobType, NextId(JobType)});
    std::vector<MODEL_RECORD> records{
        Number("Job/Prepared", 1),
        Number("Job/State", 0),
        Text("Job/Identification/Name", name),
        Text("Job/Identification/User", Who(step).isAdministrator ? "admin" : "operator"),
        Text("Job/Identification/RemoteEndpoint", "127.0.0.1:50106"),
        Text("Job/FolderMark", "MARK")};
    if (Find({{QueueType, queue}}))
        records.push_back(Number("Job/Queue", queue));
    if (copies > 0)
        records.push_back(Number("Job/Copies", copies));
    WriteOwn(ProgramOf(step), job.ticket, records);
    return job;
}

std::string MODULE_MODEL::PrepareJob(STEP const& step)
{
    if (!Who(step).isAlive)
        return std::to_string(MODULE_UNKNOWN_SESSION);
    if (!IsFileName(step.source))
        return std::to_string(MODULE_PATH_REFUSED) + " id -1";
    VISIT const job = MakeJob(step, step.source, step.number, step.stop);
    m_prepared.push_back({step.session, step.source, job});
    return "0 id " + std::to_string(job.ticket.second);
}

// Takes the newest job that was prepared under the name.
std::optional<MODULE_MODEL::VISIT> MODULE_MODEL::Claimed(STEP const& step)
{
    auto const isIt = [&](PREPARED const& each)
    { return each.session == step.session && each.name == step.target && Find(each.job); };
    auto const found = std::find_if(m_prepared.rbegin(), m_prepared.rend(), isIt);
    if (found == m_prepared.rend())
        return std::nullopt;
    VISIT const job = found->job;
    m_prepared.erase(std::next(found).base());
    return job;
}

std::string MODULE_MODEL::SendJob(STEP const& step)
{
    if (!Who(step).isAlive)
        return std::to_string(MODULE_UNKNOWN_SESSION);
    auto job = Claimed(step);
    int code = IsFileName(step.target) ? CodeOfSource(step.source) : MODULE_PATH_REFUSED;
    if (code == MODULE_DONE && LocalFile(step.source)->empty())
        code = MODULE_EMPTY_JOB;
    if (code != MODULE_DONE)
    {
        if (job)
            Remove(job->ticket);
        return std::to_string(code);
    }
    if (!job)
        job = MakeJob(step, step.target, 0, 0);
    std::string const folder = "$(JOB)/" + std::to_string(job->ticket.second);
    auto const size = static_cast<long long>(LocalFile(step.source)->size());
    WriteOwn(ProgramOf(step), job->ticket,
             {Text("Job/Identification/Name", step.target),
              Text("Job/Identification/User", Who(step).isAdministrator ? "admin" : "operator"),
              Text("Job/Identification/RemoteEndpoint", "127.0.0.1:50106"),
              Text("Job/File", folder + "/" + step.target),
              Text("Job/Folder", folder),
              {"Job/Size", PARAM_INT64, -1, size, "", false},
              Number("Job/State", 1),
              Number("Job/Progress", 100),
              {"Job/Prepared", PARAM_NONE, -1, 0, "", true}});
    Find(*job)->jobFile = step.target;
    Find(*job)->jobContent = *LocalFile(step.source);
    return "0";
}

std::string MODULE_MODEL::Folders() const
{
    std::string text;
    for (auto const& [name, content] : m_temp)
        text += "temp " + name + ": " + ContentLine(content) + "\n";
    for (auto const& [address, ticket] : m_tickets)
        if (!ticket.jobFile.empty())
            text += "job " + std::to_string(address.second) + " " + ticket.jobFile + ": " +
                    ContentLine(ticket.jobContent) + "\n";
    for (PLAIN_TICKET const& ticket : m_saved)
        text += "file\n" + Joined(ticket.Lines([](std::string const&) { return true; }));
    return text;
}

std::string MODULE_MODEL::Everything(std::size_t program) const
{
    std::string text;
    for (auto const& [address, ticket] : m_tickets)
        text += LineOf(address) + "\n" +
                Joined(ticket.seen[program].Lines([](std::string const&) { return true; }));
    return text;
}

// --- ticket files

std::string MODULE_MODEL::OpenFile(STEP const& step)
{
    FILE_MODEL& file = *FileOf(step);
    if (step.number >= TicketFiles)
        return "-";
    file = {true, step.number, false, 0, {}};
    if (step.number >= 0)
        file.content = m_saved[step.number];
    return "open";
}

// Not in the middle of a walk over it.
MODULE_MODEL::LINE MODULE_MODEL::CloseFile(STEP const& step)
{
    FILE_MODEL& file = *FileOf(step);
    if (file.walks)
        return std::nullopt;
    file.isOpen = false;
    file.content.DropPointers();
    if (file.file >= 0 && file.isChanged)
        m_saved[file.file] = file.content;
    return "closed";
}
