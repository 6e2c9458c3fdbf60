// What a thread polls for beside a socket, so that another one can wake it. For any thread.
#pragma once

#include "standin/server/files/Descriptor.h"

namespace standin::postgres
{
class Wakeup
{
public:
    Wakeup();  // throws StoreError

    void Wake() noexcept;                               // makes it readable
    void Clear() noexcept;                              // and no more
    int Number() const { return m_wokenEnd.Number(); }  // of the descriptor to poll

private:
    Descriptor m_wakingEnd, m_wokenEnd;
};
}  // namespace standin::postgres
