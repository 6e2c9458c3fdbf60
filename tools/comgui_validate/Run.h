// Runs a check in a process of its own, so that a crash or a hang of the plug-in is a result like any other.
#pragma once

#include "tools/comgui_validate/Check.h"
#include <chrono>
#include <string>

namespace validate
{
enum class Outcome
{
    Passed,
    Failed,
    Skipped,
};

struct Verdict
{
    Outcome outcome = Outcome::Passed;
    Broken broken{};       // of a failure
    std::string reason{};  // of a skipped check
    std::string output{};  // what the process has printed
    std::chrono::duration<double> time{};
};

Verdict Run(Check const& check, Options const& options);
}  // namespace validate
