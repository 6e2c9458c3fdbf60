#include "bench/site/SoakRunner.h"

#include "bench/site/Errands.h"
#include <csignal>
#include <sstream>

namespace
{
constexpr auto Patience = std::chrono::seconds(90);  // with a program that lives: one that is silent hangs
}

SoakRunner::SoakRunner(Setting const& setting, std::string kind, int number, bool isLongLived)
    : m_setting(setting), m_kind(std::move(kind)), m_number(number), m_isLongLived(isLongLived)
{
    if (m_kind == Writer)
        m_lane.emplace(number, setting.wrongs);
}

std::vector<std::string> SoakRunner::Command(unsigned seed, bool isFirst) const
{
    auto const text = [](auto number) { return std::to_string(number); };
    std::string const own = Program::OwnFile();
    std::string const number = text(m_number);
    std::string const writers = text(m_setting.writers);
    return LoggingTo(
        m_setting.stderrFile,
        m_lane ? std::vector<std::string>{own, "--as-writer", number, writers, text(m_lane->Block()),
                                          text(seed), text(m_setting.pause.count())}
               : std::vector<std::string>{own, "--as-client", m_kind, number, writers, text(seed),
                                          text(isFirst ? 1 : 0), m_setting.folder.string()});
}

void SoakRunner::Start(unsigned seed, bool isFirst)
{
    m_program = std::make_unique<Program>(Command(seed, isFirst));
    m_lastLine = Clock::now();
    m_isReady = m_isTold = m_saidBye = m_wasRefused = false;
    ++m_starts;
}

void SoakRunner::Read()
{
    if (!m_program)
        return;  // its turn to start comes
    auto const now = Clock::now();
    while (auto const line = m_program->Line(now))
    {
        NotePause(now);
        Take(*line);
    }
    if (!m_program->HasEnded() && !m_stopped.isOn && now - std::max(m_lastLine, m_stopped.end) > Patience)
    {
        m_setting.wrongs.Take(Name(), "hung", "says nothing any more");
        Kill();
    }
}

// A pause for which others' disturbances, or its own, are the reason is none.
void SoakRunner::NotePause(Clock::time_point now)
{
    if (m_isReady && !WasHalted(m_lastLine) && !WasFull(m_lastLine))
        m_longestPause = std::max(m_longestPause, now - m_lastLine - m_setting.heldUp(m_lastLine));
    m_lastLine = now;
}

void SoakRunner::Take(std::string const& line)
{
    std::istringstream words(line);
    std::string kind;
    std::int64_t number = 0;
    words >> kind >> number;
    if (kind == "refused" && m_setting.mayBeRefused(*this))
    {
        m_wasRefused = true;
        return;
    }
    if (m_lane)
    {
        m_isReady = true;
        return m_lane->Take(line);
    }
    if (kind == "ready")
        m_isReady = true;
    else if (kind == "did")
        m_done += number;
    else if (kind == "bye")
        m_saidBye = true;
    else if (kind == "found" || kind == "saved")
        TakeSaved(kind, static_cast<int>(number));
    else
        m_setting.wrongs.Take(Name(), kind, line);
}

// One more may have been saved whose report is missing.
void SoakRunner::TakeSaved(std::string const& kind, int number)
{
    if (kind == "found" && number != m_saved && number != m_saved + 1)
        m_setting.wrongs.Take(Name(), "lost",
                              "ticket file " + std::to_string(m_saved) + " was saved, " +
                                  std::to_string(number) + " is there");
    m_saved = number;
}

void SoakRunner::Kill()
{
    m_program->Kill();
    while (auto const line = m_program->Line(Clock::now() + Patience))
        Take(*line);
    m_stopped.isOn = m_full.isOn = false;
}

bool SoakRunner::HasEnded() const
{
    if (!m_program->HasEnded())
        return false;
    int const code = m_program->Wait();
    // It may die on purpose behind its last word.
    bool const isGood = m_saidBye ? code <= 0 : m_wasRefused;
    if (!isGood && code != -1)
        m_setting.wrongs.Take(Name(), "ended", "has ended by itself with " + std::to_string(code));
    else if (!isGood)
        m_setting.wrongs.Take(Name(), "ended", "was ended by a signal that soak has not sent");
    return true;
}

void SoakRunner::AwaitEnd()
{
    while (auto const line = m_program->Line(Clock::now() + Patience))
        Take(*line);
    if (!m_program->HasEnded())
    {
        m_setting.wrongs.Take(Name(), "hung", "does not end");
        Kill();
    }
    else
        static_cast<void>(HasEnded());
}

void SoakRunner::Stop()
{
    m_program->Signal(SIGSTOP);
    m_stopped.isOn = true;
}

void SoakRunner::Continue()
{
    m_program->Signal(SIGCONT);
    m_stopped = {false, Clock::now()};
}

void SoakRunner::FillDisk(bool isFull)
{
    SetDiskFull(m_program->Id(), isFull);
    m_full = {isFull, Clock::now()};
}
