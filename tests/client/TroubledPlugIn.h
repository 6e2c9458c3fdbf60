// What the plug-in of the tests does wrong, by order. The plug-in is the package's own with some entries in
// front of it; it lives in a bundle of the test's, and its orders are looked up there by name.
#pragma once

#include "comgui/session/TLogin.h"
#include "tests/client/TroubledTickets.h"
#include <atomic>

struct TROUBLE
{
    std::atomic<bool> serverIsAway{false};
    std::atomic<bool> sessionIsGone{false};     // until the next login
    std::atomic<bool> loginsAreRefused{false};  // with code 42
    std::atomic<int> loginTakes{0};             // milliseconds more, as all that follow
    std::atomic<int> logoutTakes{0};            // before anything happens
    std::atomic<int> questionTakes{0};          // whether the session is alive
    std::atomic<int> putTakes{0};               // unless its session ends
    std::atomic<int> progressTakes{0};
    std::atomic<int> progressGrows{0};  // by so many bytes of a million with each question; 0: the real one
    std::atomic<int> ticketDataTakes{0};
    std::atomic<bool> hasNoContainer{false};
    std::atomic<bool> refusesCallbacks{false};
    TICKET_TROUBLE tickets{};
    std::atomic<bool> knowsNoNewCommands{false};  // those that only the package's own plug-in has

    // What happened.
    std::atomic<void (*)(void*, int, int, int, int, void*)> callback{nullptr};  // of the first session
    std::atomic<void*> callbackUser{nullptr};
    std::atomic<int> tries{0};   // logins, good or not
    std::atomic<int> logins{0};  // good ones
    std::atomic<int> logouts{0};
    std::atomic<int> questions{0};         // begun
    std::atomic<int> ticketData{0};        // begun
    std::atomic<int> puts{0};              // begun
    std::atomic<int> progress{0};          // questions begun
    std::atomic<TLogin*> newest{nullptr};  // the record of the last login, good or not
};
