// What the plug-in of the tests does wrong with tickets, by order: its container is the real one with some
// slots in front of it.
#pragma once

#include "comgui/ticket/MTICKET_ACCESS.h"
#include <atomic>
#include <functional>

struct TICKET_TROUBLE
{
    std::atomic<bool> sessionIsOver{false};    // for every slot
    std::atomic<int> refusedOpens{0};          // so many
    std::atomic<int> refusedSwitches{0};       // of notifications, on; likewise
    std::atomic<int> refusedWalks{0};          // over the keys of a ticket; likewise
    std::atomic<bool> walksNeverEnd{false};    // over tickets and keys, until the action ends them
    std::atomic<bool> bytesAreEndless{false};  // of the walks over keys: one value more of an impossible size
    std::atomic<bool> textsAreNull{false};     // in reads and in walks over keys
    std::atomic<bool> switchingStands{false};  // of notifications: until that ends, or for twenty seconds
    std::function<void()> afterOpening{};      // of a ticket; once
    std::function<void()> afterFirstValue{};   // of a walk over keys, which breaks off then, as a success
    std::function<void()> afterWalk{};         // over keys, also a refused one; once
    std::function<void()> afterTypeQuery{};    // of a read; once

    // What happened.
    std::atomic<int> switchesBegun{0};
    std::atomic<int> switchesDone{0};
};

// That container with what the orders put in front of it; null for null.
MTICKET_ACCESS const* Troubled(MTICKET_ACCESS const* container, TICKET_TROUBLE& orders);
