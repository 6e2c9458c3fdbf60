// What stops a command. The texts are one line each and made to be shown.
#pragma once

#include <stdexcept>

namespace tools
{
// The command cannot do what it was asked for: a file or the command line.
class Trouble : public std::runtime_error
{
public:
    using std::runtime_error::runtime_error;
};

// Nobody reads the output any more: the command ends and has nothing to say.
class ClosedPipe : public std::runtime_error
{
public:
    ClosedPipe() : std::runtime_error("closed pipe") {}
};
}  // namespace tools
