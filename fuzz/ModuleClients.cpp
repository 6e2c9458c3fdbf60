#include "fuzz/ModuleClients.h"

#include "comgui/ticket/TICKET_ID.h"
#include <climits>

// Mostly the one ticket that there is at the beginning: calls that have nothing to do with each other show
// little.
ADDRESS NextAddress(INPUT& input)
{
    if (input.Among(4) != 3)
        return {3, 1};
    constexpr int types[] = {3, 3, 3, 7, 0, 17, 99, 3, -1, 100, INT_MIN};
    constexpr int ids[] = {1,         2, 3, 1, 0, LastId, 1, TICKET_ID_NONE, TICKET_ID_ALL, TICKET_ID_NEXT,
                           LastId + 1};
    int const type = types[input.Among(11)];
    int const id = ids[input.Among(11)];
    return {type, type == 0 && id > 0 ? 0 : id};  // tickets of type 0 would stay for good
}

int NextPosition(INPUT& input)
{
    constexpr int positions[] = {-1, 0, -1, 0, 1, 2, 5, -2, -2, -3, LastId, LastId + 1, INT_MAX, INT_MIN};
    return positions[input.Among(14)];
}

PARAM_TYPE NextType(INPUT& input)
{
    constexpr int types[] = {PARAM_INT,        PARAM_STRING,  PARAM_COUNT, PARAM_NONE,
                             PARAM_BINSTRING,  PARAM_DOUBLE,  PARAM_INT64, PARAM_UNSIGNED,
                             PARAM_UNSIGNED64, PARAM_POINTER, -1,          10};
    unsigned const choice = input.Among(20);
    return static_cast<PARAM_TYPE>(choice < std::size(types) ? types[choice] : types[choice % 2]);
}

char const* KEYS::Next(INPUT& input)
{
    static constexpr char const* keys[] = {"A",
                                           "A",
                                           "A",
                                           "B",
                                           "Job/Name",
                                           "A",
                                           "Job/Name2",
                                           "A*",
                                           "\xC3\x84",
                                           "a rather long key that no short string takes",
                                           "System/Folders/Temp",
                                           "System/UseFolderVariables",
                                           "",
                                           nullptr};
    unsigned const choice = input.Among(15);
    return choice < 14 ? keys[choice] : m_texts.emplace_back(input.Text(input.Among(20))).c_str();
}

char const* const* KEYS::NextTable(INPUT& input)
{
    if (input.Among(8) == 7)
        return nullptr;
    auto& table = m_tables.emplace_back();
    for (unsigned count = input.Among(4); count > 0; --count)
        if (char const* const key = Next(input))
            table.push_back(key);
    table.push_back(nullptr);
    return table.data();
}

void LIMITS::Set(ADDRESS address, char const* const* keys)
{
    auto& limit = m_keys[address];
    limit.clear();
    for (; keys && *keys; ++keys)
        limit.emplace_back(*keys);
}

bool LIMITS::Selects(ADDRESS address, std::string const& key) const
{
    auto const limit = m_keys.find(address);
    if (limit == m_keys.end() || limit->second.empty())
        return true;
    return std::any_of(limit->second.begin(), limit->second.end(),
                       [&key](std::string const& one) {
                           return one == key ||
                                  (one.ends_with('*') && key.starts_with(one.substr(0, one.size() - 1)));
                       });
}

void LISTENER::Call(void* user, int kind, int argA, int argB, int code, void* data)
{
    auto const& listener = *static_cast<LISTENER const*>(user);
    COMGUI_MUST(!listener.isOver);
    COMGUI_MUST(kind == 1 || kind == 4 || kind == 5 || kind == 6);
    COMGUI_MUST(argB > 0 && (kind == 6 || (ADDRESS{code, argA}.IsValid())));
    auto const* record = static_cast<SETMULTIPAR const*>(data);
    COMGUI_MUST((record != nullptr) == (kind == 1 || kind == 6));
    for (; record && record->key; ++record)
    {
        COMGUI_MUST(*record->key && record->pos >= -1 && record->pos <= LastId);
        COMGUI_MUST(record->type != PARAM_NONE || !record->value);
        if (record->type == PARAM_STRING)
            COMGUI_MUST(std::strlen(static_cast<char const*>(record->value)) < 4096);
    }
    int value = 0;
    listener.access->MGETPARAMETER(listener.access->Instance, code, argA, "A", PARAM_INT, &value, -1);
}

CLIENTS::CLIENTS(bool compared) : isCompared(compared)
{
    char const* const users[] = {"admin", "operator"};
    for (std::size_t i = 0; i < sessions.size(); ++i)
    {
        CLIENT_SESSION& session = sessions[i];
        session.handle = site.LogIn(users[i]);
        session.access = site.Container(session.handle);
        COMGUI_MUST(session.handle && session.access);
        session.isAdministrator = i == 0;
        session.ownTicket = i == 0 ? 1 : 2;
        session.mayEnd = i == 1;
        session.listener.access = session.access;
    }
}

void CLIENTS::LogOut(CLIENT_SESSION& session)
{
    int const code = site.module->LogoutEntry(site.module.Instance(), session.handle);
    bool const hadEnded = session.hasEnded.exchange(true);
    COMGUI_MUST(code == 0 || code == 103);
    COMGUI_MUST(!isCompared || code == (hadEnded ? 103 : 0));
    if (code == 0)
        session.listener.isOver = true;
}
