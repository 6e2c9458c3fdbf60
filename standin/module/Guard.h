// Keeps exceptions inside the module: whoever calls one of its functions was compiled elsewhere.
#pragma once

#include <cstdio>
#include <exception>

namespace standin
{
// What work returns, or failure if it throws; stderr then tells why.
template <typename Result, typename Work>
Result Guarded(Result failure, Work const& work) noexcept
{
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
