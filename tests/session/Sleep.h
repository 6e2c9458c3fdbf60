// What wxSleep does in this program: a test that need not wait puts something in its place.
#pragma once

#include <functional>

extern std::function<void(int seconds)> insteadOfSleeping;  // empty: it sleeps
