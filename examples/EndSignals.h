// Waits for Ctrl-C and its like. Made before any thread, it blocks them in all of them, so that none is lost.
#pragma once

#include <csignal>

class EndSignals
{
public:
    EndSignals();
    void Wait() const;         // until one comes, or has come; the next one ends the program at once
    static bool ArePending();  // has one come that nobody has waited for?
    static void Raise();       // as if somebody had ended the program from outside

private:
    sigset_t m_signals;
};
