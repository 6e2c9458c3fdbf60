// How the examples with a command line end, and what they say on the way.
#pragma once

#include <string>

extern char const ProgramName[];  // each program's own, for its messages

enum STATUS
{
    Good = 0,
    Refused = 1,  // the answer is no: what was asked for is not there, or was refused
    Trouble = 2,  // wrong command line, no server, no login, output that cannot be written
};

// Says on stderr what went wrong, on one line and harmless on a terminal; always false.
bool Fail(std::string const& what);

// Sends what was printed on its way. False if it cannot be written; says so the first time, unless it goes to
// a pipe that was closed: whoever closed it knows. Needs SIGPIPE ignored.
bool FlushOutput();
