// Runs programs one after another beside what their starter does, and hands over what they wrote.
#pragma once

#include "tests/support/Program.h"
#include <deque>
#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <vector>

// That command, but its stderr goes to the end of a file.
std::vector<std::string> LoggingTo(std::filesystem::path const& file,
                                   std::vector<std::string> const& command);

struct ErrandResult
{
    int code = 0;  // -1: a signal ended it, or it was silent for too long
    std::vector<std::string> lines;
    Program::Clock::time_point began{};
};

class Errands
{
public:
    using Done = std::function<void(ErrandResult const& result)>;

    explicit Errands(std::filesystem::path stderrFile) : m_stderr(std::move(stderrFile)) {}

    // before: called when it is this program's turn.
    void Add(std::vector<std::string> command, Done done, std::function<void()> before = {});

    // Reads what has come, and starts the next one. To be called every now and then.
    void Proceed();
    bool AreDone() const { return m_waiting.empty() && !m_program; }

private:
    struct Errand
    {
        std::vector<std::string> command;
        Done done;
        std::function<void()> before;
    };

    void Finish(int code);

    std::filesystem::path const m_stderr;
    std::deque<Errand> m_waiting;
    Done m_done;
    std::unique_ptr<Program> m_program;
    ErrandResult m_result;
};
