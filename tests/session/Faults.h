// How a process ends that calls through null: EXPECT_EXIT(statement, Faults, "").
#pragma once

#include <csignal>
#include <sys/wait.h>

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
#    define TESTS_SANITIZED 1
#elif defined(__has_feature)
#    if __has_feature(address_sanitizer) || __has_feature(thread_sanitizer)
#        define TESTS_SANITIZED 1
#    endif
#endif

inline bool Faults(int status)
{
#ifdef TESTS_SANITIZED
    return !WIFEXITED(status) || WEXITSTATUS(status) != 0;  // a sanitizer takes the signal and reports
#else
    return WIFSIGNALED(status) && WTERMSIG(status) == SIGSEGV;
#endif
}
