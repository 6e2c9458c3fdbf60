// How a process ends that calls through null: EXPECT_EXIT(statement, Faults, "").
#pragma once

#include "tests/support/sanitizers.h"
#include <csignal>
#include <sys/wait.h>

inline bool Faults(int status)
{
    if (IsSanitized)
        return !WIFEXITED(status) || WEXITSTATUS(status) != 0;  // a sanitizer takes the signal and reports
    return WIFSIGNALED(status) && WTERMSIG(status) == SIGSEGV;
}
