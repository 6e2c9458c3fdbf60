// Keeps exceptions inside the module: whoever calls one of its functions was compiled elsewhere. Keeps
// callers out of it that would wait for threads which are not there. And lets no caller's thread be cancelled
// in here: it is cancelled once it is back.
#pragma once

#include "standin/server/files/ForkedChild.h"
#include "standin/server/files/NotCancelled.h"
#include "standin/server/files/RefusableCall.h"
#include "standin/server/files/Report.h"
#include <exception>

namespace standin
{
[[gnu::noinline, gnu::cold]] inline void TellOfFailure(char const* reason) noexcept
{
    NotCancelled const here;
    RefusableRead read;
    Report({"a call failed", *reason ? ": " : "", reason}, "ComGUI.Bundle: ");
    read.Refuse();
}

// For reads, which have to be fast: only the feed blocks in them, and looks after that itself.
template <typename Result, typename Work>
Result GuardedRead(Result failure, Work const& work) noexcept
{
    if (IsForkedChild())
    {
        TellOfFailure("this process is a copy of one that has a site open; start a program anew instead");
        return failure;
    }
    try
    {
        return work();
    }
    catch (std::exception const& error)
    {
        TellOfFailure(error.what());
    }
    catch (...)
    {
        TellOfFailure("");
    }
    return failure;
}

// What work returns, or failure if it throws or if this is a child made by fork; stderr then tells why.
template <typename Result, typename Work>
Result Guarded(Result failure, Work const& work) noexcept
{
    NotCancelled const here;
    return GuardedRead(failure, work);
}
}  // namespace standin
