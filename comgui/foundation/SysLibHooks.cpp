// A file of their own for the hooks, so that no compiler sees at the place of a call that they are empty, and
// the calls remain for a program that brings its own.
#include "comgui/foundation/SysLib.h"

void SysLib::MUTEX_INSTANCE::InitID() {}

void SysLib::MUTEX_INSTANCE::Logger(MUTEX_INSTANCE const&, eWHAT) {}
