// How many threads this process has.
#pragma once

#include <chrono>
#include <filesystem>
#include <iterator>
#include <thread>

inline std::ptrdiff_t Threads()
{
    auto const all = std::filesystem::directory_iterator("/proc/self/task");
    return std::distance(begin(all), end(all));
}

// A thread that was joined is counted for a moment longer: the system tells of its end before it takes it
// away. So this waits until there are that many, but not for ever, and gives how many there are.
inline std::ptrdiff_t ThreadsOnceThereAre(std::ptrdiff_t expected)
{
    auto const deadline = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    for (;;)
    {
        std::ptrdiff_t const count = Threads();
        if (count == expected || std::chrono::steady_clock::now() > deadline)
            return count;
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
}
