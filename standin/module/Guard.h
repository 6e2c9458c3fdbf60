// Keeps exceptions inside the module: whoever calls one of its functions was compiled elsewhere. And keeps
// callers out of it that would wait for threads which are not there.
#pragma once

#include "standin/server/files/ForkedChild.h"
#include <cstdio>
#include <exception>

namespace standin
{
// What work returns, or failure if it throws or if this is a child made by fork; stderr then tells why.
template <typename Result, typename Work>
Result Guarded(Result failure, Work const& work) noexcept
{
    if (IsForkedChild())
    {
        std::fputs(
            "ComGUI.Bundle: a call failed: this process is a copy of one that has a site open; start a "
            "program anew instead\n",
            stderr);
        return failure;
    }
    try
    {
        return work();
    }
    catch (std::exception const& error)
    {
        std::fprintf(stderr, "ComGUI.Bundle: a call failed: %s\n", error.what());
    }
    catch (...)
    {
        std::fputs("ComGUI.Bundle: a call failed\n", stderr);
    }
    return failure;
}
}  // namespace standin
