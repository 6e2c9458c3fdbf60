#include "bench/site/Errands.h"

namespace
{
constexpr auto Patience = std::chrono::minutes(3);  // with a program that checks a large site
}

std::vector<std::string> LoggingTo(std::filesystem::path const& file, std::vector<std::string> const& command)
{
    std::vector<std::string> logging{"/bin/sh", "-c", R"(exec "$@" 2>>"$0")", file.string()};
    logging.insert(logging.end(), command.begin(), command.end());
    return logging;
}

void Errands::Add(std::vector<std::string> command, Done done, std::function<void()> before)
{
    m_waiting.push_back({std::move(command), std::move(done), std::move(before)});
}

void Errands::Proceed()
{
    if (!m_program && !m_waiting.empty())
    {
        Errand errand = std::move(m_waiting.front());
        m_waiting.pop_front();
        if (errand.before)
            errand.before();
        m_done = std::move(errand.done);
        m_result = {0, {}, Program::Clock::now()};
        m_program = std::make_unique<Program>(LoggingTo(m_stderr, errand.command));
    }
    if (!m_program)
        return;
    auto const now = Program::Clock::now();
    while (auto line = m_program->Line(now))
        m_result.lines.push_back(std::move(*line));
    if (m_program->HasEnded())
        Finish(m_program->Wait());
    else if (now - m_result.began > Patience)
        Finish(-1);
}

// What it calls may add errands.
void Errands::Finish(int code)
{
    m_program.reset();
    m_result.code = code;
    m_done(m_result);
}
