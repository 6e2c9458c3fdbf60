// Lets the calling thread not be cancelled while this lives: it would leave a lock held, or end the program
// in a function that lets no exception out. It is cancelled later, where its owner says.
#pragma once

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
}  // namespace standin
