// A call of a trace as a line for people, as JSON, and as what two traces are compared by.
#pragma once

#include "tools/comgui_trace/TraceFile.h"
#include "tools/shared/Output.h"
#include <nlohmann/json.hpp>

namespace tracing
{
// time, thread, name(arguments) = results, duration; with details a line for each behind it.
std::string Line(TracedCall const& call, tools::Output const& out, bool withDetails);

nlohmann::ordered_json ToJson(TracedCall const& call);

// Without times, threads and addresses, which differ from run to run.
std::string Essence(TracedCall const& call);

std::string DurationText(std::uint64_t nanoseconds);  // "1.25 ms"
}  // namespace tracing
