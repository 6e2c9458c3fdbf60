// Managers whose session has a container, for tests of what goes to one.
#pragma once

#include "tests/session/FakeModule.h"

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
