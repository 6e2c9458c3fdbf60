// One of the programs that site_load starts. It logs in, says "ready", works from "go END" (nanoseconds of
// CLOCK_MONOTONIC) on until then, says "written COUNT", hears "expect COUNT" and answers with its figures, a
// line of JSON. COUNT: how many timed values it wrote, and how many were written by all.
#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

struct LoadTask
{
    bool reads = false;
    bool writes = false;
    bool watches = false;
    bool verifies = false;  // instead: reads at the end what the writers have left
    int number = 0;         // of this client, from 0 up
    std::vector<int> writers;
    double changesPerSecond = 0;  // of this client; 0: as fast as it can
    double readsPerSecond = 0;
    std::int64_t run = 0;  // a number of this run's own, below 2^20
    std::string user;
    std::string password;

    NLOHMANN_DEFINE_TYPE_INTRUSIVE(LoadTask, reads, writes, watches, verifies, number, writers,
                                   changesPerSecond, readsPerSecond, run, user, password)
};

// The exit code of the program.
int RunLoadClient(LoadTask const& task);
