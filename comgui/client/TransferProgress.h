// How far a transfer is. A plain value.
#pragma once

#include <chrono>
#include <optional>

namespace comgui
{
struct TransferProgress
{
    long long done = 0;                        // bytes
    std::optional<long long> total;            // bytes, where it is known
    double rate = 0;                           // bytes a second, over the last seconds
    std::optional<std::chrono::seconds> rest;  // until the end at that rate
};
}  // namespace comgui
