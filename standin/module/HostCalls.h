// What every object of the module does whose functions a host calls, over a class of the plug-in kit: it
// keeps account of calls that are refused, and keeps callers out that would wait for threads which are not
// there. Reads, which have to be fast, ask MayRead themselves; only the feed blocks in them.
#pragma once

#include "comgui/module/Called.h"
#include "standin/server/files/ForkedChild.h"
#include "standin/server/files/NotCancelled.h"
#include "standin/server/files/RefusableCall.h"
#include "standin/server/files/Report.h"

namespace standin
{
[[gnu::noinline, gnu::cold]] inline void TellOfFailure(char const* reason) noexcept
{
    NotCancelled const here;
    RefusableRead read;
    Report({"a call failed", *reason ? ": " : "", reason}, "ComGUI.Bundle: ");
    read.Refuse();
}

// False in a child made by fork; stderr then tells why.
inline bool MayRead() noexcept
{
    if (!IsForkedChild()) [[likely]]
        return true;
    TellOfFailure("this process is a copy of one that has a site open; start a program anew instead");
    return false;
}

template <typename Base>
class HostCalls : public Base
{
public:
    using Base::Base;

    void Around(comgui::plugin::Call const& call) override
    {
        RefusableCall refusable;
        if (!MayRead() || !call())
            refusable.Refuse();
    }

    void OnException(char const* reason) noexcept override { TellOfFailure(reason); }
};
}  // namespace standin
