// Runs a program with the trace between it and its plug-in.
#pragma once

#include <string>
#include <vector>

namespace tracing
{
struct StartOptions
{
    std::string file{};    // empty: comgui-PROCESS.trace in the current folder
    std::string bundle{};  // the real plug-in; empty: the one that the program opens
    bool isOff = false;    // to be switched on later
    std::vector<std::string> program{};
};

// The program takes this process over. Throws tools::Trouble if it cannot be started.
[[noreturn]] void Start(StartOptions const& options);

// Turns the switch of the program that writes that trace. Throws tools::Trouble if none runs.
void Switch(std::string const& file, bool on);
}  // namespace tracing
