#include "EndSignals.h"

#include <algorithm>
#include <iterator>
#include <pthread.h>
#include <unistd.h>

namespace
{
constexpr int Ends[] = {SIGINT, SIGTERM, SIGHUP};
}

EndSignals::EndSignals()
{
    sigemptyset(&m_signals);
    for (int const signal : Ends)
        sigaddset(&m_signals, signal);
    pthread_sigmask(SIG_BLOCK, &m_signals, nullptr);
}

void EndSignals::Wait() const
{
    int signal = 0;
    sigwait(&m_signals, &signal);
    pthread_sigmask(SIG_UNBLOCK, &m_signals, nullptr);  // somebody may be in a hurry
}

bool EndSignals::ArePending()
{
    sigset_t pending;
    sigpending(&pending);
    return std::any_of(std::begin(Ends), std::end(Ends),
                       [&](int signal) { return sigismember(&pending, signal) == 1; });
}

void EndSignals::Raise() { kill(getpid(), SIGTERM); }
