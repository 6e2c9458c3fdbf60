#include "tests/module/ModuleProgram.h"

#include "comgui/foundation/stracpy.h"
#include "comgui/session/TCommandRecord.h"
#include "comgui/session/TJobIdentification.h"
#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/TICKET_OP.h"
#include "standin/module/ModuleCodes.h"
#include "tests/module/ModelFiles.h"
#include "tests/module/PlainTicket.h"
#include "tests/module/ValueText.h"
#include "tests/support/Files.h"
#include <algorithm>
#include <cstring>
#include <thread>
#include <utility>

using namespace standin;
namespace fs = std::filesystem;

namespace
{
constexpr int OwnType = 60;
constexpr char Unread = 'Z';

std::size_t SizeOfNumber(PARAM_TYPE type) { return type == PARAM_INT || type == PARAM_UNSIGNED ? 4 : 8; }

bool IsText(PARAM_TYPE type) { return type == PARAM_STRING || type == PARAM_BINSTRING; }

struct KEY_TABLE
{
    explicit KEY_TABLE(std::vector<std::string> const& keys)
    {
        for (std::string const& key : keys)
            pointers.push_back(key.c_str());
        pointers.push_back(nullptr);
    }
    std::vector<char const*> pointers;
};

struct WRITE_TABLE
{
    explicit WRITE_TABLE(std::vector<MODEL_RECORD> const& steps)
    {
        for (MODEL_RECORD const& step : steps)
            records.push_back(
                {step.key->c_str(), step.type, 0, words.emplace_back(step).Get(), step.pos, true, {}});
        records.emplace_back();
    }
    std::string Oks() const
    {
        std::string oks;
        for (std::size_t i = 0; i + 1 < records.size(); ++i)
            oks += records[i].ok ? '1' : '0';
        return "[" + oks + "]";
    }
    std::deque<VALUE_WORD> words;
    std::vector<SETMULTIPAR> records;
};

bool IsProgress(std::string const& call)
{
    return call.find(" Job/Progress@") != call.npos && call.find('@') == call.rfind('@');
}
}  // namespace

// Room for whatever a read gives.
union MODULE_PROGRAM::READ_WORD
{
    char bytes[16];
    char const* text;
    BIN_STRING binary;
    void* pointer;
    int number;
    unsigned long count;

    READ_WORD() { std::memset(bytes, Unread, sizeof bytes); }
    bool IsUntouched() const
    {
        return std::all_of(bytes, bytes + sizeof bytes, [](char byte) { return byte == Unread; });
    }

    // What would be the value word of a write of it.
    void const* Word(PARAM_TYPE type) const
    {
        return type == PARAM_STRING    ? text
               : type == PARAM_POINTER ? pointer
                                       : static_cast<void const*>(bytes);
    }
};

MODULE_PROGRAM::MODULE_PROGRAM(fs::path folder, int number) : m_folder(std::move(folder)), m_number(number)
{
    MODULE_AT_SITE::UseSite((m_folder / "site").string());
    m_ownListener.onCall = [this] { std::lock_guard const wait(m_gate); };
    LogInOwn();
    ++m_ownCalls;
    m_own.access->MCREATETICKET(m_own.access->Instance, OwnType, m_number, nullptr);
}

// Anew, so that it is the newest session: what may go with the end of older ones is not kept for it.
void MODULE_PROGRAM::LogInOwn()
{
    RECORD record;
    if (int const code = m_module->LoginEntry(m_module.Instance(), &record))
        throw std::runtime_error("the test's own session is refused by " + std::to_string(code));
    void* const before = std::exchange(m_own.handle, record.hSession);
    m_own.access = m_module->GetClientContainerEntry(m_module.Instance(), m_own.handle);
    int id = 0;
    Register(m_own.handle, &m_ownListener, id);
    char const* const noKeys[] = {nullptr};
    m_own.access->MENDISNOTIF(m_own.access->Instance, OwnType, m_number, id, true, noKeys);
    if (before)
        m_module->LogoutEntry(m_module.Instance(), before);
}

std::string MODULE_PROGRAM::Run(STEP const& step)
{
    using ANSWER = std::string (MODULE_PROGRAM::*)(STEP const&);
    static std::map<ACTION, ANSWER> const answers{{ACTION::LogIn, &MODULE_PROGRAM::LogIn},
                                                  {ACTION::LogOut, &MODULE_PROGRAM::LogOut},
                                                  {ACTION::Read, &MODULE_PROGRAM::Read},
                                                  {ACTION::ReadTable, &MODULE_PROGRAM::ReadTable},
                                                  {ACTION::Write, &MODULE_PROGRAM::Write},
                                                  {ACTION::WriteTable, &MODULE_PROGRAM::WriteTable},
                                                  {ACTION::Open, &MODULE_PROGRAM::Open},
                                                  {ACTION::Close, &MODULE_PROGRAM::Close},
                                                  {ACTION::Create, &MODULE_PROGRAM::Create},
                                                  {ACTION::CreateNext, &MODULE_PROGRAM::CreateNext},
                                                  {ACTION::Delete, &MODULE_PROGRAM::Delete},
                                                  {ACTION::Limit, &MODULE_PROGRAM::Limit},
                                                  {ACTION::Operate, &MODULE_PROGRAM::OperateAnything},
                                                  {ACTION::WhoAmI, &MODULE_PROGRAM::WhoAmI},
                                                  {ACTION::TicketData, &MODULE_PROGRAM::TicketData},
                                                  {ACTION::WalkTickets, &MODULE_PROGRAM::AllOfWalk},
                                                  {ACTION::WalkValues, &MODULE_PROGRAM::AllOfWalk},
                                                  {ACTION::Register, &MODULE_PROGRAM::Register},
                                                  {ACTION::Enable, &MODULE_PROGRAM::Switch},
                                                  {ACTION::Disable, &MODULE_PROGRAM::Switch},
                                                  {ACTION::Hold, &MODULE_PROGRAM::Hold},
                                                  {ACTION::Release, &MODULE_PROGRAM::Release},
                                                  {ACTION::Flood, &MODULE_PROGRAM::WriteTable},
                                                  {ACTION::Put, &MODULE_PROGRAM::Carry},
                                                  {ACTION::Get, &MODULE_PROGRAM::Carry},
                                                  {ACTION::PrepareJob, &MODULE_PROGRAM::PrepareJob},
                                                  {ACTION::SendJob, &MODULE_PROGRAM::SendJob},
                                                  {ACTION::OpenFile, &MODULE_PROGRAM::OpenFile},
                                                  {ACTION::CloseFile, &MODULE_PROGRAM::CloseFile}};
    return (this->*answers.at(step.action))(step);
}

std::string MODULE_PROGRAM::Shown(std::string text) const
{
    std::string const folder = m_folder.string();
    for (auto found = text.find(folder); found != text.npos; found = text.find(folder, found))
        text.replace(found, folder.size(), "~");
    // The mark of a job's folder is drawn by the server.
    std::string const mark = "Job/FolderMark@";
    for (auto found = text.find(mark); found != text.npos; found = text.find(mark, found + 1))
    {
        auto const begin = text.find('\'', found) + 1;
        text.replace(begin, text.find('\'', begin) - begin, "MARK");
    }
    return text;
}

std::string MODULE_PROGRAM::Path(std::string const& text) const
{
    return text.starts_with('~') ? m_folder.string() + text.substr(1) : text;
}

// --- sessions

std::string MODULE_PROGRAM::LogIn(STEP const& step)
{
    RECORD record(step.source.c_str(), step.target.c_str());
    TLogin const before = record;
    int const code = m_module->LoginEntry(m_module.Instance(), &record);
    bool const isAsBefore = std::memcmp(&record, &before, sizeof before) == 0;
    if (code != 0)
        return std::to_string(code) + (isAsBefore ? "" : ", and the record has changed");
    Who(step) = SESSION{};
    Who(step).handle = record.hSession;
    Who(step).access = m_module->GetClientContainerEntry(m_module.Instance(), record.hSession);
    return "0 role " + std::to_string(record.iUserRole) + " stamp " + std::to_string(record.iClientStamp);
}

// A session that prepared jobs may or may not be told itself that they go with it.
std::string MODULE_PROGRAM::LogOut(STEP const& step)
{
    SESSION& session = Who(step);
    std::string const changed = WhatHasChanged(session);
    if (!m_isHeld)
        LogInOwn();
    int const code = m_module->LogoutEntry(m_module.Instance(), session.handle);
    session.handedOut.clear();
    if (session.listener != NoListener)
    {
        CLIENT_HERE& client = m_clients[session.listener];
        auto const calls = client.listener->Calls();
        while (client.seen < calls.size() && calls[client.seen].starts_with("deleted 3/"))
            ++client.seen;
        session.listener = NoListener;
    }
    return std::to_string(code) + changed;
}

// --- what was handed out

void MODULE_PROGRAM::Keep(SESSION& session, PARAM_TYPE type, void const* word)
{
    if (type == PARAM_STRING)
    {
        auto const* const text = static_cast<char const*>(word);
        session.handedOut.push_back({text, {text, std::strlen(text) + 1}});
    }
    else if (type == PARAM_BINSTRING)
    {
        auto const& binary = *static_cast<BIN_STRING const*>(word);
        session.handedOut.push_back({binary.data, {static_cast<char const*>(binary.data), binary.size}});
    }
}

std::string MODULE_PROGRAM::WhatHasChanged(SESSION& session)
{
    for (HANDED_OUT const& each : session.handedOut)
        if (std::memcmp(each.address, each.bytes.data(), each.bytes.size()) != 0)
            return ", but what was handed out as \"" + each.bytes + "\" has changed";
    return "";
}

// --- values

std::string MODULE_PROGRAM::TakeRead(SESSION& session, PARAM_TYPE type, READ_WORD const& word)
{
    if (type == PARAM_NONE)
        return "type " + std::to_string(word.number);
    if (type == PARAM_COUNT)
        return "count " + std::to_string(word.count);
    Keep(session, type, word.Word(type));
    return Shown(TextOf(type, word.Word(type)));
}

STICKET_ACCESS const* MODULE_PROGRAM::TableOf(STEP const& step)
{
    if (step.session == STEP::Files)
        return m_files[static_cast<std::size_t>(step.table)];
    auto const& tables = Who(step).tables;
    bool const isContainer = step.table == STEP::Container || tables.empty();
    return isContainer ? nullptr : tables[static_cast<std::size_t>(step.table) % tables.size()];
}

std::string MODULE_PROGRAM::Read(STEP const& step)
{
    MODEL_RECORD const& record = step.records[0];
    READ_WORD word;
    void* const out = record.isNull ? nullptr : &word;
    char const* const key = record.key ? record.key->c_str() : nullptr;
    STICKET_ACCESS const* const table = TableOf(step);
    MTICKET_ACCESS const* const access = Who(step).access;
    int const result = table ? table->SGETPARAMETER(table->Instance, key, record.type, out, record.pos)
                             : access->MGETPARAMETER(access->Instance, step.type, step.id, key, record.type,
                                                     out, record.pos);
    if (result == 0)
        return word.IsUntouched() ? "0" : "0, but the value was touched";
    return std::to_string(result) + " [" + TakeRead(Who(step), record.type, word) + "]";
}

std::string MODULE_PROGRAM::ReadTable(STEP const& step)
{
    std::deque<READ_WORD> words;
    std::vector<GETMULTIPAR> records;
    for (MODEL_RECORD const& record : step.records)
        records.push_back({record.key->c_str(),
                           record.type,
                           0,
                           record.isNull ? nullptr : &words.emplace_back(),
                           record.pos,
                           true,
                           {}});
    records.emplace_back();
    GETMULTIPAR* const given = step.isNullTable ? nullptr : records.data();
    STICKET_ACCESS const* const table = TableOf(step);
    MTICKET_ACCESS const* const access = Who(step).access;
    int const result = table ? table->SGETMULTIPAR(table->Instance, given)
                             : access->MGETMULTIPAR(access->Instance, step.type, step.id, given);
    if (!given)
        return std::to_string(result);
    std::string line = std::to_string(result) + " [";
    for (std::size_t i = 0; i < step.records.size(); ++i)
    {
        READ_WORD const* const word = static_cast<READ_WORD const*>(records[i].value);
        bool const isGood = records[i].ok || !word || word->IsUntouched();
        line += i ? ";" : "";
        line += !isGood ? "touched" : records[i].ok ? TakeRead(Who(step), records[i].type, *word) : "-";
    }
    return line + "]";
}

std::string MODULE_PROGRAM::Write(STEP const& step)
{
    MODEL_RECORD const& record = step.records[0];
    char const* const key = record.key ? record.key->c_str() : nullptr;
    VALUE_WORD const word(record);
    STICKET_ACCESS const* const table = TableOf(step);
    MTICKET_ACCESS const* const access = Who(step).access;
    return std::to_string(
        table ? table->SSETPARAMETER(table->Instance, key, record.type, word.Get(), record.pos)
              : access->MSETPARAMETER(access->Instance, step.type, step.id, key, record.type, word.Get(),
                                      record.pos));
}

std::string MODULE_PROGRAM::WriteTable(STEP const& step)
{
    std::vector<MODEL_RECORD> const records = step.Records();
    WRITE_TABLE writes(records);
    SETMULTIPAR* const given = step.isNullTable ? nullptr : writes.records.data();
    STICKET_ACCESS const* const table = TableOf(step);
    MTICKET_ACCESS const* const access = Who(step).access;
    int const result = table ? table->SSETMULTIPAR(table->Instance, given)
                             : access->MSETMULTIPAR(access->Instance, step.type, step.id, given);
    return std::to_string(result) + (given ? " " + writes.Oks() : "");
}

// --- tickets

int MODULE_PROGRAM::Operate(STEP const& step, int code, void* arg)
{
    TICKET_OP op(MTICKET_OP_OPEN);
    op.SetInt(code);
    MTICKET_ACCESS const* const access = Who(step).access;
    return access->MOPERATION(access->Instance, step.type, step.id, op, arg);
}

std::string MODULE_PROGRAM::NumberOf(SESSION& session, STICKET_ACCESS const* table)
{
    auto known = std::find(session.tables.begin(), session.tables.end(), table);
    if (known == session.tables.end())
        known = session.tables.insert(known, table);
    return "table " + std::to_string(known - session.tables.begin());
}

std::string MODULE_PROGRAM::Open(STEP const& step)
{
    STICKET_ACCESS const* table = nullptr;
    int const result = Operate(step, MTICKET_OP_OPEN, &table);
    return result && table ? NumberOf(Who(step), table) : result || table ? "half open" : "-";
}

std::string MODULE_PROGRAM::Close(STEP const& step)
{
    bool flag = true;
    return std::to_string(Operate(step, MTICKET_OP_CLOSE, &flag));
}

std::string MODULE_PROGRAM::Create(STEP const& step)
{
    KEY_TABLE const keys(step.keys);
    MTICKET_ACCESS const* const access = Who(step).access;
    STICKET_ACCESS const* const table = access->MCREATETICKET(
        access->Instance, step.type, step.id, step.isNullTable ? nullptr : keys.pointers.data());
    return table ? NumberOf(Who(step), table) : "-";
}

std::string MODULE_PROGRAM::CreateNext(STEP const& step)
{
    STEP next = step;
    next.id = TICKET_ID_NEXT;
    int id = -1;
    int const result = Operate(next, MTICKET_OP_CREATE_NEXT, &id);
    return result == (id >= 0) ? std::to_string(id) : "half made";
}

std::string MODULE_PROGRAM::Delete(STEP const& step)
{
    return std::to_string(Operate(step, MTICKET_OP_DELETE, nullptr));
}

std::string MODULE_PROGRAM::OperateAnything(STEP const& step)
{
    return std::to_string(Operate(step, step.number, nullptr));
}

std::string MODULE_PROGRAM::Limit(STEP const& step)
{
    KEY_TABLE keys(step.keys);
    return std::to_string(
        Operate(step, STICKET_OP_SET_PARTIAL, step.isNullTable ? nullptr : keys.pointers.data()));
}

std::string MODULE_PROGRAM::WhoAmI(STEP const& step)
{
    STICKET_ACCESS const* const table = TableOf(step);
    STICKET_OPTION_WHOAMI who{};
    int const result = table ? table->SOPTION(table->Instance, STICKET_OP_WHOAMI, &who) : 0;
    return result ? std::to_string(result) + " " + std::to_string(static_cast<int>(who.word0)) + "/" +
                        std::to_string(static_cast<int>(who.word8))
                  : "0";
}

// The XML is read back as a ticket file.
std::string MODULE_PROGRAM::TicketData(STEP const& step)
{
    int size = 0;
    auto const copy = [&](void* buffer)
    {
        return m_module->GetTicketDataEntry(m_module.Instance(), Who(step).handle, step.type, step.id, 0,
                                            &size, buffer);
    };
    int const code = copy(nullptr);
    if (code != MODULE_BUFFER_TOO_SMALL)
        return std::to_string(code);
    std::string xml(static_cast<std::size_t>(size), '?');
    if (int const again = copy(xml.data()))
        return "then " + std::to_string(again);
    fs::path const file = m_folder / "data.xml";
    WriteFile(file, xml);
    return "0\n" + TextOfFile(file);
}

std::string MODULE_PROGRAM::TextOfFile(fs::path const& file)
{
    STICKET_ACCESS const* ticket = m_module->STicketFactory->CreateTicket(file.c_str());
    if (!ticket)
        return "no ticket: " + ContentOf(file);
    SESSION nobody;
    std::string text = TextOfTable(nobody, ticket);
    m_module->STicketFactory->DestroyTicket(&ticket);
    return text;
}

// --- walks

std::string MODULE_PROGRAM::TextOfTable(SESSION& session, STICKET_ACCESS const* ticket)
{
    struct CONTEXT
    {
        MODULE_PROGRAM& program;
        SESSION& session;
        std::string text{};
    } context{*this, session};
    auto const action = [](void* pointer, char const* key, PARAM_TYPE type, void const* word, int pos)
    {
        auto& to = *static_cast<CONTEXT*>(pointer);
        to.program.Keep(to.session, type, word);
        to.text += WalkedLine(key, pos, TextOf(type, word)) + "\n";
        return true;
    };
    return ticket->SWALKPARAMETERS(ticket->Instance, action, &context, "", 8000) ? Shown(context.text)
                                                                                 : "gone\n";
}

int MODULE_PROGRAM::WalkTickets(STEP const& step, PLACE const& place)
{
    struct CONTEXT
    {
        MODULE_PROGRAM& program;
        SESSION& session;
        PLACE const& place;
    } context{*this, Who(step), place};
    auto const action = [](void* pointer, int type, int id, STICKET_ACCESS const* ticket)
    {
        auto& to = *static_cast<CONTEXT*>(pointer);
        return to.place(
            [&]
            {
                return std::to_string(type) + "/" + std::to_string(id) + "\n" +
                       to.program.TextOfTable(to.session, ticket);
            });
    };
    MTICKET_ACCESS const* const access = Who(step).access;
    return access->MWALKTICKETS(access->Instance, action, &context, step.type);
}

// Numbers stay where they are as long as the table of a session's ticket, of a file until the key is written.
int MODULE_PROGRAM::WalkValues(STEP const& step, PLACE const& place)
{
    struct CONTEXT
    {
        MODULE_PROGRAM& program;
        SESSION& session;
        PLACE const& place;
        bool keepsNumbers;
    } context{*this, Who(step), place, step.session != STEP::Files};
    auto const action = [](void* pointer, char const* key, PARAM_TYPE type, void const* word, int pos)
    {
        auto& to = *static_cast<CONTEXT*>(pointer);
        to.program.Keep(to.session, type, word);
        if (to.keepsNumbers && !IsText(type) && type != PARAM_POINTER)
            to.session.handedOut.push_back({word, {static_cast<char const*>(word), SizeOfNumber(type)}});
        std::string line = to.program.Shown(WalkedLine(key, pos, TextOf(type, word)));
        return to.place([&] { return line; });
    };
    STICKET_ACCESS const* const table = TableOf(step);
    return table->SWALKPARAMETERS(table->Instance, action, &context, step.source.c_str(), 8000);
}

std::string MODULE_PROGRAM::AllOfWalk(STEP const& step)
{
    std::string all;
    int places = 0;
    auto const place = [&](std::function<std::string()> const& text)
    {
        all += text() + "\n";
        return ++places != step.stop;
    };
    int const result =
        step.action == ACTION::WalkTickets ? WalkTickets(step, place) : WalkValues(step, place);
    return std::to_string(result) + "\n" + all;
}

std::string MODULE_PROGRAM::Everything()
{
    std::string all;
    STEP step;
    for (step.type = 0; step.type < 100; ++step.type)
    {
        auto const place = [&](std::function<std::string()> const& text)
        {
            all += text();
            return true;
        };
        std::swap(Who(step), m_own);
        if (step.type != OwnType)
            WalkTickets(step, place);
        std::swap(Who(step), m_own);
    }
    return all;
}

// --- notifications

int MODULE_PROGRAM::Register(void* hSession, LISTENER* listener, int& id)
{
    STICKET_ACCESS const* request = m_module->STicketFactory->CreateTicket(nullptr);
    auto const set = [&](char const* key, void const* pointer)
    { request->SSETPARAMETER(request->Instance, key, PARAM_POINTER, pointer, -1); };
    if (listener)
        set("pGUI2Notification", reinterpret_cast<void const*>(&LISTENER::Call));
    set("pUser", listener);
    int const code = m_module->SendCommandEntry(m_module.Instance(), hSession, "local.set.callback", 0,
                                                const_cast<STICKET_ACCESS*>(request));
    request->SGETPARAMETER(request->Instance, "iGUINotificationID", PARAM_INT, &id, -1);
    m_module->STicketFactory->DestroyTicket(&request);
    return code;
}

std::string MODULE_PROGRAM::Register(STEP const& step)
{
    int id = -1;
    if (step.number == 0)
        return std::to_string(Register(Who(step).handle, nullptr, id));
    auto listener = std::make_unique<LISTENER>();
    int const code = Register(Who(step).handle, listener.get(), id);
    if (code != 0)
        return std::to_string(code);
    Who(step).listener = m_clients.size();
    m_clients.push_back({std::move(listener), id});
    return "0 id " + std::to_string(id);
}

std::string MODULE_PROGRAM::Switch(STEP const& step)
{
    KEY_TABLE const keys(step.keys);
    SESSION const& session = Who(step);
    int const newest = session.listener == NoListener ? -1 : m_clients[session.listener].id;
    bool const isOn = step.action == ACTION::Enable;
    return std::to_string(session.access->MENDISNOTIF(
        session.access->Instance, step.type, step.id, step.number ? step.number : newest, isOn,
        isOn && !step.isNullTable ? keys.pointers.data() : nullptr));
}

// The test's own client is called, and does not return.
std::string MODULE_PROGRAM::Hold(STEP const&)
{
    m_gate.lock();
    m_isHeld = true;
    WriteOwnTicket();
    while (m_ownListener.running == 0)
        std::this_thread::yield();
    return "held";
}

std::string MODULE_PROGRAM::Release(STEP const&)
{
    m_isHeld = false;
    m_gate.unlock();
    return "released";
}

// Of which the test's own client is told.
void MODULE_PROGRAM::WriteOwnTicket()
{
    ++m_ownCalls;
    m_own.access->MSETPARAMETER(m_own.access->Instance, OwnType, m_number, "Own", PARAM_INT, &m_number, -1);
}

// One thread calls one client after the other, so what comes behind everything else shows that all is told.
std::string MODULE_PROGRAM::News()
{
    WriteOwnTicket();
    if (m_ownListener.Wait(m_ownCalls).size() != m_ownCalls)
        return "the test's own client was not told as often as it should be\n";
    std::string news;
    for (CLIENT_HERE& client : m_clients)
        news += NewsOf(client);
    return Shown(news);
}

// How often a job's progress is told depends on the time that it takes.
std::string MODULE_PROGRAM::NewsOf(CLIENT_HERE& client)
{
    std::string news;
    auto const calls = client.listener->Calls();
    for (; client.seen < calls.size(); ++client.seen)
        if (!IsProgress(calls[client.seen]))
            news += calls[client.seen] + "\n";
    bool const isOrderly = !client.listener->overlapped && client.listener->sharesKeys;
    if (news.empty() && isOrderly)
        return "";
    return "notification id " + std::to_string(client.id) + ":\n" + news +
           (isOrderly ? "" : "calls overlapped, or records of one key were apart\n");
}

// --- files and jobs

// Transfers that were left for later come one after the other, so the one behind them shows that they are
// told.
void MODULE_PROGRAM::AwaitTransfers()
{
    std::string const name = "fence" + std::to_string(m_number);
    fs::path const file = m_folder / "site" / "temp" / name;
    std::string source = Path("~/local/small");
    std::string target = "$(TEMP)/" + name;
    ++m_ownCalls;
    m_module->PutFileEntry(m_module.Instance(), m_own.handle, source.data(), target.data());
    while (!fs::exists(file))
        std::this_thread::sleep_for(std::chrono::microseconds(50));
    fs::remove(file);
}

std::string MODULE_PROGRAM::Carry(STEP const& step)
{
    bool const isPut = step.action == ACTION::Put;
    bool const isLater = step.number == 1;
    fs::path const fetched = Path(FetchedFile);
    fs::remove(fetched);
    std::string source = Path(step.source);
    std::string target = Path(step.target);
    // What others have changed is told before the end of the transfer.
    char const* name = nullptr;
    m_own.access->MGETPARAMETER(m_own.access->Instance, 0, 0, "System/Name", PARAM_STRING, &name, -1);
    auto const entry = isPut ? (isLater ? m_module->PutFileEntry : m_module->PutFileSyncEntry)
                             : (isLater ? m_module->GetFileEntry : m_module->GetFileSyncEntry);
    int const code = entry(m_module.Instance(), Who(step).handle, source.data(), target.data());
    if (isLater)
        AwaitTransfers();
    if (isPut)
        return std::to_string(code);
    return std::to_string(code) + ", " + (fs::exists(fetched) ? ContentLine(ContentOf(fetched)) : "nothing");
}

std::string MODULE_PROGRAM::PrepareJob(STEP const& step)
{
    TCommandRecord record{};
    record.nMagic = 0x49494949;
    record.nSize = sizeof record;
    record.iArgA = step.number;
    record.iArgC = step.stop;
    stracpy(record.szText2, ("$(JOB)/" + step.source).c_str(), sizeof record.szText2);
    int const code = m_module->SendCommandEntry(m_module.Instance(), Who(step).handle, "remote.job.prepare",
                                                sizeof record, &record);
    return std::to_string(code) +
           (code == MODULE_UNKNOWN_SESSION ? "" : " id " + std::to_string(record.iResult));
}

std::string MODULE_PROGRAM::SendJob(STEP const& step)
{
    char upload[] = "$(UPLOADJOB)";
    TJobIdentification record{};
    record.nSize = sizeof record;
    record.pszUploadFolder = upload;
    std::string path = Path(step.source);
    std::string name = step.target;
    return std::to_string(
        m_module->SendJobEntry(m_module.Instance(), Who(step).handle, &record, path.data(), name.data()));
}

std::string MODULE_PROGRAM::Folders()
{
    std::string text;
    for (std::string const& name : NamesIn(m_folder / "site" / "temp"))
        text += "temp " + name + ": " + ContentLine(ContentOf(m_folder / "site" / "temp" / name)) + "\n";
    fs::path const jobs = m_folder / "site" / "job";
    std::map<int, fs::path> folders;
    for (std::string const& name : NamesIn(jobs))
        folders[std::stoi(name)] = jobs / name;
    for (auto const& [id, folder] : folders)
        for (std::string const& name : NamesIn(folder))
            if (!name.starts_with('.'))
                text += "job " + std::to_string(id) + " " + name + ": " +
                        ContentLine(ContentOf(folder / name)) + "\n";
    for (int file = 0; file < TicketFiles; ++file)
        text += "file\n" + TextOfFile(m_folder / TicketFileName(file));
    return text;
}

// --- ticket files

std::string MODULE_PROGRAM::OpenFile(STEP const& step)
{
    std::string const path = (m_folder / TicketFileName(step.number)).string();
    STICKET_ACCESS const*& ticket = m_files[static_cast<std::size_t>(step.table)];
    ticket = m_module->STicketFactory->CreateTicket(step.number < 0 ? nullptr : path.c_str());
    return ticket ? "open" : "-";
}

std::string MODULE_PROGRAM::CloseFile(STEP const& step)
{
    std::string const changed = WhatHasChanged(Who(step));
    Who(step).handedOut.clear();
    m_module->STicketFactory->DestroyTicket(&m_files[static_cast<std::size_t>(step.table)]);
    return m_files[static_cast<std::size_t>(step.table)] ? "still open" : "closed" + changed;
}
