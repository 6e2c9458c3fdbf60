#include "tests/session/Sleep.h"

#include <dlfcn.h>
#include <wx/utils.h>

std::function<void(int seconds)> insteadOfSleeping;

// The program's own definition comes before the one of any shared library.
void wxSleep(int seconds)
{
    if (insteadOfSleeping)
        return insteadOfSleeping(seconds);
    Dl_info self = {};
    dladdr(reinterpret_cast<void*>(&wxSleep), &self);
    reinterpret_cast<decltype(&wxSleep)>(dlsym(RTLD_NEXT, self.dli_sname))(seconds);
}
