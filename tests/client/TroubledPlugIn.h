// What the plug-in of the tests does wrong, by order. The plug-in is the package's own with some entries in
// front of it; it lives in a bundle of the test's, and its orders are looked up there by name.
#pragma once

#include "tests/client/TroubledTickets.h"
#include <atomic>

struct TROUBLE
{
    std::atomic<bool> serverIsAway{false};
    std::atomic<bool> sessionIsGone{false};     // until the next login
    std::atomic<bool> loginsAreRefused{false};  // with code 42
    std::atomic<int> loginTakes{0};             // milliseconds more
    std::atomic<bool> hasNoContainer{false};
    std::atomic<bool> refusesCallbacks{false};
    TICKET_TROUBLE tickets{};
    std::atomic<bool> knowsNoNewCommands{false};  // those that only the package's own plug-in has
};
