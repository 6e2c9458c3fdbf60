// Waits for Ctrl-C and its like. Made before any thread, it blocks them in all of them, so that none is lost.
#pragma once

#include <chrono>
#include <csignal>

class EndSignals
{
public:
    EndSignals();

    // Whether one has come, or comes within that time. Then the next one ends the program at once.
    bool WaitFor(std::chrono::milliseconds time) const;

    static void Raise();  // as if somebody had ended the program from outside

private:
    sigset_t m_signals;
};
