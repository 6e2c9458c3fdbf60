// Managers whose session has a container, and words for what goes to one.
#pragma once

#include "tests/session/FakeModule.h"

using comgui::test::CALL;
using comgui::test::ContainerFake;
using comgui::test::SLOT;

inline char const Key[] = "Key";
inline char const Umlaut[] = "K\xC3\xA4y";

inline CALL Operation(int type, int id, int op, void* arg = nullptr)
{
    return {SLOT::OPERATION, type, id, {}, PARAM_NONE, 0, op, arg};
}

// What a slot was asked to do, without where it shall put what it finds.
inline std::vector<CALL> WithoutAddresses(std::vector<CALL> calls)
{
    for (CALL& call : calls)
        call.arg = nullptr;
    return calls;
}

// Logged in, with the fake as the session's container and another one beside it.
class Tickets : public WithManager
{
protected:
    Tickets()
    {
        LogIn();
        Reset();
    }

    void Reset()
    {
        module.calls.clear();
        fake.calls.clear();
        other.calls.clear();
    }

    // Logged in, and no container.
    void LoseTheContainer()
    {
        module.container = nullptr;
        manager.Login(nullptr, nullptr, nullptr, -1);
    }

    ContainerFake other;
};

class TicketsLoggedOut : public Tickets
{
protected:
    TicketsLoggedOut()
    {
        manager.Logout();
        Reset();
    }
};
