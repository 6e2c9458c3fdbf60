// How often each call was made, how often it failed, and how long it took.
#pragma once

#include "tools/comgui_trace/TraceFile.h"
#include "tools/shared/Output.h"
#include <nlohmann/json.hpp>
#include <vector>

namespace tracing
{
class Summary
{
public:
    void Add(TracedCall const& call);

    // dropped: records that were lost.
    std::string Text(unsigned long long dropped) const;
    nlohmann::ordered_json Json(unsigned long long dropped) const;

private:
    struct Figures
    {
        unsigned long long failed = 0;
        unsigned long long open = 0;
        std::vector<std::uint64_t> durations{};
    };

    std::vector<Figures> m_calls = std::vector<Figures>(static_cast<std::size_t>(trace::Call::Count));
};
}  // namespace tracing
