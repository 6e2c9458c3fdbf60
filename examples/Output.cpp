#include "Output.h"

#include "Shown.h"
#include <atomic>
#include <cerrno>
#include <cstdio>
#include <cstring>

bool Fail(std::string const& what)
{
    std::fprintf(stderr, "%s: %s\n", ProgramName, Shown(what).c_str());
    return false;
}

bool FlushOutput()
{
    static std::atomic<bool> isGood = true;
    errno = EIO;  // where it is an earlier write that failed
    if (!isGood || (std::fflush(stdout) == 0 && std::ferror(stdout) == 0))
        return isGood;
    isGood = false;
    if (errno != EPIPE)
        Fail(std::string("the output cannot be written: ") + std::strerror(errno) +
             "; make room there, or send it elsewhere");
    return false;
}
