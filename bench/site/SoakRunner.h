// One place of soak, in which programs of a kind run one after another: starts them, reads what they report,
// and knows what happened to the one of the moment.
#pragma once

#include "bench/site/Lane.h"
#include "bench/site/SiteWatch.h"
#include "tests/support/Program.h"
#include <functional>
#include <memory>
#include <optional>

class SoakRunner
{
public:
    using Clock = Program::Clock;

    // What all runners of a run have in common.
    struct Setting
    {
        std::filesystem::path folder;      // for the files of the programs
        std::filesystem::path stderrFile;  // what they write there is much and expected
        int writers = 0;
        std::chrono::microseconds pause{};  // of a writer
        Wrongs& wrongs;
        std::function<bool(SoakRunner const& runner)> mayBeRefused;  // a change, now
        std::function<Clock::duration(Clock::time_point since)>
            heldUp;  // since then, by disturbances of others
    };

    static constexpr char Writer[] = "writer";

    // isLongLived: not to be ended before the run is.
    SoakRunner(Setting const& setting, std::string kind, int number, bool isLongLived);

    void Start(unsigned seed, bool isFirst);
    void Read();  // all lines that are there
    void Tell(std::string const& line) { m_isTold = m_program->Say(line); }
    void Kill();            // and reads what it still reported
    void AwaitEnd();        // of one that has been told to
    bool HasEnded() const;  // by itself, or told to; to be started anew

    void Stop();
    void Continue();
    void FillDisk(bool isFull);

    // Whether it was stopped or had a full disk at that time or later.
    bool WasHalted(Clock::time_point since) const { return m_stopped.Touches(since); }
    bool WasFull(Clock::time_point since) const { return m_full.Touches(since); }
    bool IsDisturbed() const { return m_stopped.isOn || m_full.isOn; }

    std::string const& Kind() const { return m_kind; }
    std::string Name() const { return m_kind + " " + std::to_string(m_number); }
    bool IsLongLived() const { return m_isLongLived; }
    bool IsWriter() const { return m_lane.has_value(); }
    bool IsReady() const { return m_isReady; }
    pid_t Id() const { return m_program->Id(); }
    int Output() const { return m_program->Output(); }
    Lane& TheLane() { return *m_lane; }
    Lane const& TheLane() const { return *m_lane; }
    std::int64_t Done() const { return m_lane ? m_lane->Changes() : m_done; }
    int Starts() const { return m_starts; }
    Clock::duration LongestPause() const { return m_longestPause; }

    void Sample() { m_samples.push_back(FootprintOf(Id()).value_or(Footprint{})); }
    std::vector<Footprint> const& Samples() const { return m_samples; }

private:
    struct Span
    {
        bool isOn = false;
        Clock::time_point end{};

        bool Touches(Clock::time_point since) const { return isOn || end >= since; }
    };

    void Take(std::string const& line);
    void TakeSaved(std::string const& kind, int number);
    void NotePause(Clock::time_point now);
    std::vector<std::string> Command(unsigned seed, bool isFirst) const;

    Setting const& m_setting;
    std::string const m_kind;
    int const m_number;
    bool const m_isLongLived;
    std::optional<Lane> m_lane;
    std::unique_ptr<Program> m_program;
    Clock::time_point m_lastLine{};
    Clock::duration m_longestPause{};
    Span m_stopped;
    Span m_full;
    bool m_isReady = false;
    bool m_isTold = false;
    bool m_saidBye = false;
    bool m_wasRefused = false;
    int m_saved = 0;  // of the editor
    int m_starts = 0;
    std::int64_t m_done = 0;
    std::vector<Footprint> m_samples;
};
