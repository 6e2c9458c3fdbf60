// A view into SysLib's lock: its hooks, and its calls of the system, are told in order and can fail.
#pragma once

#include "comgui/foundation/SysLib.h"
#include <functional>
#include <string>
#include <vector>

struct WATCHED_LOCK
{
    // What happened: "InitID", "init", "destroy", "lock", "unlock", or the number of a Logger event.
    std::vector<std::string> steps;
    // Called at each step, after it is noted and before the system is called.
    std::function<void(SysLib::MUTEX_INSTANCE const& instance, std::string const& step)> atStep;
    // The system's call of that name fails.
    std::string failing;
};

// Not null while a test watches; only one thread may lock meanwhile.
extern WATCHED_LOCK* watchedLock;
