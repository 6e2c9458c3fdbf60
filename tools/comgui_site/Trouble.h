// How a command ends early. The texts are one line each; they may hold what files and tickets hold, so they
// are cleaned before they are shown.
#pragma once

#include "tools/shared/Trouble.h"
#include <stdexcept>

namespace comgui_site
{
using tools::ClosedPipe;
using tools::Trouble;

// The command line asks for what does not exist.
class WrongUse : public std::runtime_error
{
public:
    using std::runtime_error::runtime_error;
};

// The person at the terminal, or the system, wants the program to end.
class Interrupted : public std::runtime_error
{
public:
    Interrupted() : std::runtime_error("interrupted") {}
};
}  // namespace comgui_site
