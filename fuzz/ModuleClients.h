// The clients of the module in one input: two sessions with what is known of them, and the arguments that
// they choose for their calls, good and bad.
#pragma once

#include "fuzz/ModuleSite.h"
#include <array>
#include <atomic>
#include <deque>
#include <map>
#include <string>
#include <utility>
#include <vector>

inline constexpr int LastId = 0xFFFFFF;  // of a ticket; and the last position of a value

struct ADDRESS
{
    int type;
    int id;

    bool IsValid() const { return type >= 0 && type < 100 && id >= 0 && id <= LastId; }
    friend bool operator<(ADDRESS const& left, ADDRESS const& right)
    {
        return std::pair(left.type, left.id) < std::pair(right.type, right.id);
    }
};

ADDRESS NextAddress(INPUT& input);
int NextPosition(INPUT& input);
PARAM_TYPE NextType(INPUT& input);

// Keys that live as long as this, and tables of them.
class KEYS
{
public:
    char const* Next(INPUT& input);  // may be null

    // With a null behind it, or null itself.
    char const* const* NextTable(INPUT& input);

private:
    std::deque<std::string> m_texts;
    std::deque<std::vector<char const*>> m_tables;
};

// Which keys a session has limited itself to.
class LIMITS
{
public:
    void Set(ADDRESS address, char const* const* keys);
    bool Selects(ADDRESS address, std::string const& key) const;

private:
    std::map<ADDRESS, std::vector<std::string>> m_keys;
};

// A client's end of notifications; its address is the pUser.
struct LISTENER
{
    std::atomic<bool> isOver{false};  // nothing may come any more
    MTICKET_ACCESS const* access = nullptr;

    static void Call(void* user, int kind, int argA, int argB, int code, void* data);
};

// A session and what is known of it.
struct CLIENT_SESSION
{
    void* handle = nullptr;
    MTICKET_ACCESS const* access = nullptr;
    bool isAdministrator = false;
    int ownTicket = 0;    // its id
    bool mayEnd = false;  // by a step; of another the texts may be looked at from any thread
    std::atomic<bool> hasEnded{false};
    LIMITS limits;
    LISTENER listener;
    std::atomic<int> notification{-1};

    // As far as the user's rights go.
    bool MayWrite(ADDRESS address) const
    {
        bool const isOwn = address.type == 17 && address.id == ownTicket;
        return isAdministrator || isOwn || (address.type != 0 && address.type != 17);
    }
};

// An administrator, who stays, and an operator, who may log out.
class CLIENTS
{
public:
    explicit CLIENTS(bool compared);

    void LogOut(CLIENT_SESSION& session);

    MODULE_SITE& site = MODULE_SITE::Get();
    bool const isCompared;                  // each step with the model; so there is one thread
    std::atomic<bool> carriesFiles{false};  // at times of its own
    std::array<CLIENT_SESSION, 2> sessions;
};
