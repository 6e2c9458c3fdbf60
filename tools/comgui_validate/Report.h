// The results of a validation, for people and for programs.
#pragma once

#include "tools/comgui_validate/Run.h"
#include "tools/shared/Output.h"
#include <string>
#include <vector>

namespace validate
{
struct Result
{
    std::string check;
    Verdict verdict;
};

// Lines for one result; of a check that passed, one.
std::string Lines(Result const& result, tools::Output const& output);

std::string Summary(std::vector<Result> const& results);

// An object with the results, their counts, and the rules that are broken.
std::string ToJson(std::vector<Result> const& results, std::string const& bundle);

// As build servers read it.
std::string ToJUnit(std::vector<Result> const& results);

bool HasFailure(std::vector<Result> const& results);
}  // namespace validate
