// Keeps exceptions inside the module: whoever calls one of its functions was compiled elsewhere. Keeps
// callers out of it that would wait for threads which are not there. And lets no caller's thread be cancelled
// in here, where it would leave a lock held: it is cancelled once it is back.
#pragma once

#include "standin/server/files/ForkedChild.h"
#include <cstdio>
#include <exception>
#include <pthread.h>

namespace standin
{
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

// What work returns, or failure if it throws or if this is a child made by fork; stderr then tells why.
template <typename Result, typename Work>
Result Guarded(Result failure, Work const& work) noexcept
{
    NotCancelled const here;
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
