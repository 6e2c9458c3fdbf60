#include "EndSignals.h"

#include <pthread.h>
#include <unistd.h>

EndSignals::EndSignals()
{
    sigemptyset(&m_signals);
    for (int const signal : {SIGINT, SIGTERM, SIGHUP})
        sigaddset(&m_signals, signal);
    pthread_sigmask(SIG_BLOCK, &m_signals, nullptr);
}

bool EndSignals::WaitFor(std::chrono::milliseconds time) const
{
    auto const seconds = std::chrono::duration_cast<std::chrono::seconds>(time);
    timespec const limit{seconds.count(), std::chrono::nanoseconds(time - seconds).count()};
    if (sigtimedwait(&m_signals, nullptr, &limit) <= 0)
        return false;
    pthread_sigmask(SIG_UNBLOCK, &m_signals, nullptr);  // somebody may be in a hurry
    return true;
}

void EndSignals::Raise() { kill(getpid(), SIGTERM); }
