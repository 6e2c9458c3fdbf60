#include "tests/client/TroubledTickets.h"

#include "comgui/ticket/BIN_STRING.h"
#include <chrono>
#include <deque>
#include <limits>
#include <mutex>
#include <thread>
#include <utility>

namespace
{
TICKET_TROUBLE* trouble = nullptr;
MTICKET_ACCESS real{};        // its functions
STICKET_ACCESS realTicket{};  // likewise

// Counts an order of so many down; whether this call is one of them.
bool Take(std::atomic<int>& orders)
{
    int left = orders;
    while (left > 0 && !orders.compare_exchange_weak(left, left - 1))
    {
    }
    return left > 0;
}

struct WALK
{
    SWALKPARAMETERS_ACTION action;
    void* context;
    bool isBroken = false;
};

bool Pass(void* context, char const* key, PARAM_TYPE type, void const* word, int pos)
{
    auto& walk = *static_cast<WALK*>(context);
    bool const isNull = trouble->textsAreNull && type == PARAM_STRING;
    bool const goesOn = walk.action(walk.context, key, type, isNull ? nullptr : word, pos);
    if (!trouble->afterFirstValue)
        return goesOn;
    std::exchange(trouble->afterFirstValue, nullptr)();
    walk.isBroken = true;
    return false;
}

int WalkKeysNow(void* instance, SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit)
{
    if (trouble->sessionIsOver || Take(trouble->refusedWalks))
        return 0;
    int const one = 1;
    for (int pos = 0; trouble->walksNeverEnd; ++pos)
        if (!action(context, "Endless", PARAM_INT, &one, pos))
            return 1;
    BIN_STRING const endless("x", std::numeric_limits<unsigned long>::max());
    if (trouble->bytesAreEndless && !action(context, "Bytes", PARAM_BINSTRING, &endless, 0))
        return 1;
    WALK walk{action, context};
    return realTicket.SWALKPARAMETERS(instance, Pass, &walk, prefix, limit);
}

int WalkKeys(void* instance, SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit)
{
    int const result = WalkKeysNow(instance, action, context, prefix, limit);
    if (trouble->afterWalk)
        std::exchange(trouble->afterWalk, nullptr)();
    return result;
}

int WalkTickets(void* instance, MWALKTICKETS_ACTION action, void* context, int type)
{
    if (trouble->sessionIsOver)
        return 0;
    for (int id = 0; trouble->walksNeverEnd && type != 0; ++id)
        if (!action(context, type, id, nullptr))
            return 1;
    return real.MWALKTICKETS(instance, action, context, type);
}

// With the slots of tickets in front; lives to the end of the process, as tables of a module do.
STICKET_ACCESS const* TroubledTicket(STICKET_ACCESS const* ticket)
{
    static std::mutex lock;
    static std::deque<STICKET_ACCESS> tickets;
    std::lock_guard const held(lock);
    realTicket = *ticket;
    tickets.push_back(*ticket);
    tickets.back().SWALKPARAMETERS = WalkKeys;
    return &tickets.back();
}

int Operation(void* instance, int type, int id, TICKET_OP op, void* arg)
{
    if (trouble->sessionIsOver)
        return 0;
    if (op.GetInt() != MTICKET_OP_OPEN)
        return real.MOPERATION(instance, type, id, op, arg);
    if (Take(trouble->refusedOpens))
        return 0;
    int const result = real.MOPERATION(instance, type, id, op, arg);
    if (auto& ticket = *static_cast<STICKET_ACCESS const**>(arg); result != 0 && ticket)
        ticket = TroubledTicket(ticket);
    if (trouble->afterOpening)
        std::exchange(trouble->afterOpening, nullptr)();
    return result;
}

int Get(void* instance, int type, int id, char const* key, PARAM_TYPE what, void* value, int pos)
{
    if (trouble->sessionIsOver)
        return 0;
    int const result = real.MGETPARAMETER(instance, type, id, key, what, value, pos);
    if (what == PARAM_STRING && trouble->textsAreNull)
        *static_cast<char const**>(value) = nullptr;
    if (what == PARAM_NONE && trouble->afterTypeQuery)
        std::exchange(trouble->afterTypeQuery, nullptr)();
    return result;
}

int GetTable(void* instance, int type, int id, GETMULTIPAR* table)
{
    return trouble->sessionIsOver ? 0 : real.MGETMULTIPAR(instance, type, id, table);
}

int SwitchNotification(void* instance, int type, int id, int notification, bool isOn, char const* const* keys)
{
    ++trouble->switchesBegun;
    for (int i = 0; trouble->switchingStands && i < 20000; ++i)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    int const result = isOn && Take(trouble->refusedSwitches)
                           ? 0
                           : real.MENDISNOTIF(instance, type, id, notification, isOn, keys);
    ++trouble->switchesDone;
    return result;
}
}  // namespace

MTICKET_ACCESS const* Troubled(MTICKET_ACCESS const* container, TICKET_TROUBLE& orders)
{
    static std::deque<MTICKET_ACCESS> containers;
    if (!container)
        return nullptr;
    trouble = &orders;
    real = *container;
    MTICKET_ACCESS& troubled = containers.emplace_back(real);
    troubled.MGETPARAMETER = Get;
    troubled.MGETMULTIPAR = GetTable;
    troubled.MWALKTICKETS = WalkTickets;
    troubled.MOPERATION = Operation;
    troubled.MENDISNOTIF = SwitchNotification;
    return &troubled;
}
