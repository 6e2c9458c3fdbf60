// How the kit runs an author's function for a host that was compiled elsewhere: no exception leaves it, and
// the thread is not cancelled within.
#pragma once

#include "comgui/module/Called.h"
#include "comgui/module/Codes.h"
#include <atomic>
#include <pthread.h>

namespace comgui::plugin
{
// A cancelled thread would leave locks held, or end the program in a function that lets no exception out. It
// is cancelled once it is back.
class NotCancelled
{
public:
    NotCancelled() { pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &m_before); }
    ~NotCancelled() { pthread_setcancelstate(m_before, nullptr); }
    NotCancelled(NotCancelled const&) = delete;
    NotCancelled& operator=(NotCancelled const&) = delete;

private:
    int m_before = PTHREAD_CANCEL_ENABLE;
};

// To be called where an exception has been caught: reports it, and gives its code.
[[gnu::noinline, gnu::cold]] inline int CodeOfException(Called& called) noexcept
{
    try
    {
        throw;
    }
    catch (Refused const& refused)
    {
        return refused.GetCode() != Done ? refused.GetCode() : Failed;
    }
    catch (std::exception const& error)
    {
        called.OnException(error.what());
    }
    catch (...)
    {
        called.OnException("");
    }
    return Failed;
}

// A read: whether work has succeeded.
template <typename Work>
int RunRead(Called& called, Work const& work) noexcept
{
    try
    {
        return work() ? 1 : 0;
    }
    catch (...)
    {
        CodeOfException(called);
        return 0;
    }
}

// Before a table's slot runs: nothing has succeeded but what the author says has, and a host looks at nothing
// else.
template <typename Record>
void ClearOk(Record* table)
{
    for (Record* record = table; record && record->key; ++record)
        record->ok = false;
}

// A function that gives a code.
template <typename Work>
int RunForCode(Called& called, Work const& work) noexcept
{
    NotCancelled const here;
    int code = Failed;
    auto const run = [&]() noexcept
    {
        try
        {
            code = work();
        }
        catch (...)
        {
            code = CodeOfException(called);
        }
        return code == Done;
    };
    try
    {
        called.Around(Call(run));
    }
    catch (...)
    {
        code = CodeOfException(called);
    }
    return code;
}

// Told of calls whose handles are nobody's: the module, of which a bundle has one.
inline constinit std::atomic<Called*> strays = nullptr;

inline int RunStray(int code) noexcept
{
    Called* const called = strays;
    return called ? RunForCode(*called, [code] { return code; }) : code;
}

// A slot: whether work has succeeded.
template <typename Work>
int RunSlot(Called& called, Work const& work) noexcept
{
    return RunForCode(called, [&]() -> int { return work() ? Done : Failed; }) == Done ? 1 : 0;
}
}  // namespace comgui::plugin
