#include "fuzz/ModuleCaller.h"

#include "tests/server/FolderClient.h"
#include <array>

namespace
{
// What the folders of the system ticket are to a client.
bool CanBeRead(MODEL_TICKET const& system)
{
    standin::FolderSettings settings;
    for (auto const& [key, values] : system)
        if (values.begin()->first == 0)
        {
            auto const& [type, bytes] = values.begin()->second;
            standin::StoredValue value;
            value.type = type;
            value.bytes = bytes;
            if (type == PARAM_INT)
                std::memcpy(&value.integer, bytes.data(), sizeof(int));
            settings.Put(key, value);
        }
    return FoldersOfAClient(settings).has_value();
}

std::vector<bool> Done(std::vector<SETMULTIPAR> const& table)
{
    std::vector<bool> done;
    for (SETMULTIPAR const& record : table)
        done.push_back(record.ok);
    done.pop_back();
    return done;
}
}  // namespace

void MustBeACode(int code) { COMGUI_MUST(code == 0 || (code >= 101 && code <= 118)); }

void CALLER::Run()
{
    for (int steps = 0; steps < 60 && !m_input.IsEmpty(); ++steps)
        Step();
}

void CALLER::Step()
{
    static constexpr STEP steps[] = {
        &CALLER::Read,         &CALLER::Read,        &CALLER::Write,    &CALLER::Write,
        &CALLER::Write,        &CALLER::WriteTable,  &CALLER::Create,   &CALLER::Create,
        &CALLER::Delete,       &CALLER::ReadTable,   &CALLER::Open,     &CALLER::Close,
        &CALLER::UseOpened,    &CALLER::UseOpened,   &CALLER::Limit,    &CALLER::WalkTickets,
        &CALLER::GetData,      &CALLER::Switch,      &CALLER::Register, &CALLER::Command,
        &CALLER::PrepareJob,   &CALLER::SendJob,     &CALLER::PutFile,  &CALLER::GetFile,
        &CALLER::BeginFile,    &CALLER::CreateLocal, &CALLER::UseLocal, &CALLER::UseLocal,
        &CALLER::DestroyLocal, &CALLER::LogIn,       &CALLER::LogOut,   &CALLER::AskServer,
        &CALLER::WrongHandles, &CALLER::Translate};
    (this->*steps[m_input.Among(std::size(steps))])();
}

void CALLER::MustHoldItsTexts() const
{
    m_texts.MustStand();
    m_passingTexts.MustStand();
}

TEXTS* CALLER::TextsOf(CLIENT_SESSION const& session)
{
    bool const mayGo = session.mayEnd && !m_clients.isCompared;
    return mayGo ? nullptr : session.mayEnd ? &m_passingTexts : &m_texts;
}

std::optional<MODEL_TICKET> CALLER::Content(ADDRESS address) const
{
    return m_clients.isCompared ? m_site.Content(address.type, address.id) : std::nullopt;
}

std::optional<std::string> CALLER::Expected(CLIENT_SESSION const& session, ADDRESS address, char const* key,
                                            PARAM_TYPE type, int pos) const
{
    auto const content = Content(address);
    bool const isSeen = content && !session.hasEnded && key && session.limits.Selects(address, key);
    return isSeen ? ::Read(*content, key, type, pos) : std::nullopt;
}

void CALLER::Read()
{
    CLIENT_SESSION& session = NextSession();
    ADDRESS const address = NextAddress(m_input);
    char const* const key = m_keys.Next(m_input);
    PARAM_TYPE const type = NextType(m_input);
    int const pos = NextPosition(m_input);
    MTICKET_ACCESS const& access = *session.access;
    auto const value = ::Read(
        [&](void* out)
        { return access.MGETPARAMETER(access.Instance, address.type, address.id, key, type, out, pos); },
        type, TextsOf(session));
    COMGUI_MUST(!access.MGETPARAMETER(access.Instance, address.type, address.id, key, type, nullptr, pos));
    if (m_clients.isCompared)
        COMGUI_MUST(value == Expected(session, address, key, type, pos));
}

void CALLER::ReadTable()
{
    CLIENT_SESSION const& session = NextSession();
    ADDRESS const address = NextAddress(m_input);
    std::vector<GETMULTIPAR> table;
    std::vector<std::array<unsigned long long, 2>> places(m_input.Among(6));
    for (auto& place : places)
        if (char const* const key = m_keys.Next(m_input))
        {
            place.fill(~0ull);
            PARAM_TYPE const type = NextType(m_input);
            table.push_back({key, type, 0, &place, NextPosition(m_input), true, {}});
        }
    table.push_back({});
    MTICKET_ACCESS const& access = *session.access;
    int const result = access.MGETMULTIPAR(access.Instance, address.type, address.id, table.data());
    COMGUI_MUST(result == (session.hasEnded ? 0 : 1) || !m_clients.isCompared);
    for (GETMULTIPAR const& record : table)
    {
        if (!record.key)
            break;
        auto const& place = *static_cast<std::array<unsigned long long, 2> const*>(record.value);
        COMGUI_MUST(record.ok || (place[0] == ~0ull && place[1] == ~0ull));
        if (m_clients.isCompared)
            COMGUI_MUST(record.ok ==
                        Expected(session, address, record.key, record.type, record.pos).has_value());
    }
}

bool IsDone(MODEL_TICKET& content, char const* key, VALUE const& value, int pos, bool isSystem)
{
    if (!CanBeWritten(key, value, pos))
        return false;
    MODEL_TICKET after = content;
    Write(after, key, value, pos);
    auto const values = after.find(key);
    if (values != after.end() && values->second.rbegin()->first > LastId)
        return false;  // appended behind the last position
    if (isSystem && CanBeRead(content) && !CanBeRead(after))
        return false;
    content = std::move(after);
    return true;
}

void CALLER::MustBeDone(CLIENT_SESSION const& session, ADDRESS address, std::optional<MODEL_TICKET> before,
                        std::deque<RECORD> const& records, std::vector<bool> const& done) const
{
    if (!m_clients.isCompared)
        return;
    bool const isOpen = before && !session.hasEnded && session.MayWrite(address);
    bool const isSystem = address.type == 0 && address.id == 0;
    for (std::size_t i = 0; i < records.size(); ++i)
    {
        auto const& [key, value, pos] = records[i];
        bool const isSelected = isOpen && session.limits.Selects(address, key ? key : "");
        COMGUI_MUST(done[i] == (isSelected && IsDone(*before, key, value, pos, isSystem)));
    }
    COMGUI_MUST(Content(address) == before);
}

void CALLER::Write()
{
    CLIENT_SESSION const& session = NextSession();
    ADDRESS const address = NextAddress(m_input);
    std::deque<RECORD> records;
    RECORD const& record = records.emplace_back(m_keys, m_input);
    auto const before = Content(address);
    MTICKET_ACCESS const& access = *session.access;
    int const result = access.MSETPARAMETER(access.Instance, address.type, address.id, record.key,
                                            record.value.Type(), record.value.Word(), record.pos);
    COMGUI_MUST(result == 0 || result == 1);
    MustBeDone(session, address, before, records, {result == 1});
}

std::vector<SETMULTIPAR> CALLER::NextTable(std::deque<RECORD>& records)
{
    std::vector<SETMULTIPAR> table;
    for (unsigned count = m_input.Among(6); count > 0; --count)
    {
        RECORD const& record = records.emplace_back(m_keys, m_input);
        if (record.key)
            table.push_back(
                {record.key, record.value.Type(), 0, record.value.Word(), record.pos, count % 2 == 1, {}});
        else
            records.pop_back();
    }
    table.push_back({});
    return table;
}

void CALLER::WriteTable()
{
    CLIENT_SESSION const& session = NextSession();
    ADDRESS const address = NextAddress(m_input);
    std::deque<RECORD> records;
    auto table = NextTable(records);
    auto const before = Content(address);
    MTICKET_ACCESS const& access = *session.access;
    int const result = access.MSETMULTIPAR(access.Instance, address.type, address.id, table.data());
    auto const done = Done(table);
    COMGUI_MUST(result || std::none_of(done.begin(), done.end(), [](bool isDone) { return isDone; }));
    COMGUI_MUST(!access.MSETMULTIPAR(access.Instance, address.type, address.id, nullptr));
    MustBeDone(session, address, before, records, done);
}
