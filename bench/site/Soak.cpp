#include "bench/site/Soak.h"

#include "bench/site/LaneTickets.h"
#include "tests/support/Files.h"
#include "tests/support/sanitizers.h"
#include <algorithm>
#include <iomanip>
#include <iostream>
#include <nlohmann/json.hpp>
#include <poll.h>
#include <thread>

namespace fs = std::filesystem;

namespace
{
using nlohmann::json;
using namespace std::chrono_literals;

constexpr auto LongStop = 1500ms;  // a write waits for two seconds before it is refused
constexpr auto Aftermath = 4s;     // until who was held up has gone on, and reported

struct Kind
{
    char const* name;
    int count;
    int longLived;  // of them
};

constexpr Kind Kinds[] = {
    {"listener", 2, 1}, {"slow-listener", 1, 1}, {"reader", 2, 1},  {"texts", 2, 1},  {"translator", 2, 1},
    {"carrier", 2, 1},  {"editor", 1, 0},        {"visitor", 1, 0}, {"forker", 1, 0},
};

Program::Clock::duration Milliseconds(double number)
{
    return std::chrono::microseconds(static_cast<std::int64_t>(1000 * number));
}

std::string Joined(std::vector<std::string> const& lines)
{
    std::string text;
    for (std::string const& line : lines)
        text += line + '\n';
    return text;
}

json JsonOf(ErrandResult const& result) { return json::parse(Joined(result.lines), nullptr, false); }

std::string Tool() { return (fs::path(Program::OwnFile()).parent_path() / "comgui_site").string(); }
}  // namespace

Soak::Soak(SoakOptions const& options, fs::path site, SmallDisk const& disk, fs::path folder)
    : m_options(options), m_site(std::move(site)), m_disk(disk), m_folder(std::move(folder)),
      m_random(options.seed), m_setting{
                                  m_folder,
                                  m_folder / "stderr",
                                  options.writers,
                                  std::chrono::microseconds(static_cast<std::int64_t>(1e6 / options.rate)),
                                  m_wrongs,
                                  [this](SoakRunner const& runner) { return MayBeRefused(runner); },
                                  [this](Clock::time_point since) { return HeldUp(since); }},
      m_errands(m_setting.stderrFile)
{
    for (char const* const kind : {"ended", "failed", "grown", "hung", "kept"})
        m_wrongs.Announce(kind);
    AddRunners();
}

// Listeners come first, since the first of them check that they hear everything from the beginning.
void Soak::AddRunners()
{
    for (Kind const& kind : Kinds)
        for (int i = 0; i < kind.count; ++i)
            m_runners.emplace_back(m_setting, kind.name, i, i < kind.longLived);
    for (int i = 0; i < m_options.writers; ++i)
        m_runners.emplace_back(m_setting, SoakRunner::Writer, i, false);
}

bool Soak::Run()
{
    StartAll();
    m_lastRound = Clock::now();
    for (int quarter = 1; quarter <= 4; ++quarter)
    {
        WorkUntil(m_began + Milliseconds(250 * m_options.seconds * quarter));
        Sample();
    }
    Finish();
    Judge();
    Summary();
    return m_wrongs.IsGood();
}

// --- programs ------------------------------------------------------------------------------------

void Soak::Start(SoakRunner& runner, bool isFirst)
{
    runner.Start(static_cast<unsigned>(m_random()), isFirst);
    m_dead.erase(runner.Id());
}

void Soak::StartAll()
{
    for (SoakRunner& runner : m_runners)
    {
        Start(runner, true);
        auto const deadline = Clock::now() + 60s;
        while (!runner.IsWriter() && !runner.IsReady() && Clock::now() < deadline)
        {
            for (SoakRunner& each : m_runners)
                each.Read();
            std::this_thread::sleep_for(1ms);
        }
    }
}

void Soak::WorkUntil(Clock::time_point end)
{
    std::exponential_distribution<> wait(1 / m_options.interval);
    while (Clock::now() < end)
    {
        ReadUntil(std::min(end, Clock::now() + Milliseconds(wait(m_random))));
        Disturb();
    }
}

void Soak::ReadUntil(Clock::time_point end)
{
    do
    {
        std::vector<pollfd> outputs;
        for (SoakRunner const& runner : m_runners)
            outputs.push_back({runner.Output(), POLLIN, 0});
        auto const left = std::chrono::ceil<std::chrono::milliseconds>(end - Clock::now()).count();
        poll(outputs.data(), outputs.size(), static_cast<int>(std::clamp<std::int64_t>(left, 0, 50)));
        NoteOwnPause();
        for (SoakRunner& runner : m_runners)
        {
            runner.Read();
            pid_t const process = runner.Id();
            if (!runner.HasEnded())
                continue;
            m_dead[process] = Clock::now();
            Start(runner);
        }
        Release(Clock::now());
        m_errands.Proceed();
        Watch();
    } while (Clock::now() < end);
}

void Soak::Watch()
{
    auto const isDue = [this](int which, Clock::duration every)
    {
        Clock::time_point& next = m_due.try_emplace(which, m_began + every).first->second;
        if (Clock::now() < next)
            return false;
        next = Clock::now() + every;
        return true;
    };
    if (isDue(0, 30s))
        Tell();
    if (!m_errands.AreDone())
        return;
    if (isDue(1, 15s))
        Backup();
    else if (isDue(2, 10s))
        Check(m_site, true);
    else if (isDue(3, 2s))
        AskInfo();
}

// --- disturbances --------------------------------------------------------------------------------

void Soak::Disturb()
{
    bool const isFull = std::any_of(m_disturbances.begin(), m_disturbances.end(),
                                    [](auto const& each) { return !each.runner; });
    if (m_disk.IsThere() && !isFull && m_random() % 100 == 0)
        return BeginFillAll();
    SoakRunner& runner = m_runners[m_random() % m_runners.size()];
    if (runner.IsDisturbed())
        return;
    auto const dice = m_random() % 100;
    if (runner.IsLongLived())
        return Begin(runner, dice < 60 ? Stop : Fill);
    Begin(runner, dice < 50 ? Kill : dice < 70 ? Stop : dice < 85 || runner.IsWriter() ? Fill : End);
}

// A few are stopped for longer than anybody waits for them.
Soak::Clock::duration Soak::Length(Treatment treatment)
{
    bool const isLong = treatment == Stop && m_random() % 10 == 0;
    return std::chrono::milliseconds(isLong ? 1500 + m_random() % 3000 : 50 + m_random() % 700);
}

void Soak::Begin(SoakRunner& runner, Treatment treatment)
{
    ++m_treated[treatment];
    auto const now = Clock::now();
    switch (treatment)
    {
    case Kill:
        m_dead[runner.Id()] = now;
        runner.Kill();
        return Start(runner);
    case End:
        return runner.Tell("end");
    case Stop:
        runner.Stop();
        break;
    case Fill:
        runner.FillDisk(true);
        break;
    case FillAll:
        return;
    }
    m_disturbances.push_back({&runner, treatment, now, now + Length(treatment)});
}

void Soak::BeginFillAll()
{
    ++m_treated[FillAll];
    auto const now = Clock::now();
    m_disk.Fill();
    m_disturbances.push_back({nullptr, FillAll, now, Clock::now() + Length(FillAll)});
}

void Soak::Undo(Disturbance const& disturbance)
{
    if (disturbance.treatment == FillAll)
        m_disk.Free();
    else if (disturbance.treatment == Fill)
        disturbance.runner->FillDisk(false);
    else
        disturbance.runner->Continue();
    if (HoldsUpOthers(disturbance))
        m_holdUps.push_back({disturbance.begin, Clock::now()});
}

void Soak::Release(Clock::time_point now)
{
    std::erase_if(m_disturbances,
                  [&](Disturbance const& disturbance)
                  {
                      if (now < disturbance.end)
                          return false;
                      Undo(disturbance);
                      return true;
                  });
    while (!m_holdUps.empty() && Clock::now() - m_holdUps.front().end > 60s)
        m_holdUps.pop_front();
}

bool Soak::HoldsUpOthers(Disturbance const& disturbance)
{
    return disturbance.treatment == FillAll ||
           (disturbance.treatment == Stop && Clock::now() - disturbance.begin >= LongStop);
}

bool Soak::MayHoldUp(Clock::time_point since) const
{
    return std::any_of(m_disturbances.begin(), m_disturbances.end(), HoldsUpOthers) ||
           std::any_of(m_holdUps.begin(), m_holdUps.end(),
                       [&](Span const& span) { return span.end + Aftermath >= since; });
}

Soak::Clock::duration Soak::HeldUp(Clock::time_point since) const
{
    Clock::duration heldUp = MayHoldUp(since) ? Aftermath : Clock::duration::zero();
    for (Span const& pause : m_ownPauses)
        if (pause.end > since)
            heldUp += pause.end - std::max(pause.begin, since);
    return heldUp;
}

// What soak itself did not read in time was no pause of the others.
void Soak::NoteOwnPause()
{
    auto const now = Clock::now();
    if (now - m_lastRound > 100ms)
    {
        m_ownPauses.push_back({m_lastRound, now});
        m_longestOwnPause = std::max(m_longestOwnPause, now - m_lastRound);
    }
    m_lastRound = now;
    while (!m_ownPauses.empty() && now - m_ownPauses.front().end > 60s)
        m_ownPauses.pop_front();
}

bool Soak::MayBeRefused(SoakRunner const& runner) const
{
    auto const now = Clock::now();
    return runner.WasFull(now - Aftermath) || MayHoldUp(now);
}

// --- what is looked at meanwhile -----------------------------------------------------------------

// Whether a program that soak has started did what it was for. If it did not, a stop may be the reason.
bool Soak::Must(ErrandResult const& result, char const* what)
{
    if (result.code != 0 && !MayHoldUp(result.began))
        m_wrongs.Take("comgui_site", "failed", std::string(what) + ": " + Joined(result.lines));
    return result.code == 0;
}

void Soak::AskInfo()
{
    LookForUnfinished();
    m_errands.Add({Tool(), m_site.string(), "info", "--json"},
                  [this](ErrandResult const& result)
                  {
                      if (Must(result, "info"))
                          TakeInfo(result);
                  });
}

void Soak::TakeInfo(ErrandResult const& result)
{
    json const info = JsonOf(result);
    if (!info.is_object())
        return m_wrongs.Take("comgui_site", "failed", "info: no JSON");
    auto const& oldest = info.at("oldestChangeInJournal");
    m_journal =
        oldest.is_null() ? 0 : info.at("newestChange").get<std::uint64_t>() - oldest.get<std::uint64_t>() + 1;
    m_longestJournal = std::max(m_longestJournal, m_journal);
    m_jobs = info.at("tickets").value(std::to_string(JobType), std::size_t{0});
    m_programs = info.at("programs").size();
    for (json const& program : info.at("programs"))
    {
        auto const dead = m_dead.find(program.at("process").get<pid_t>());
        if (dead == m_dead.end() || result.began - dead->second < Milliseconds(m_options.buriedWithin) ||
            MayHoldUp(dead->second))
            continue;
        m_wrongs.Take("site", "kept", "the dead program " + program.dump());
        m_dead.erase(dead);
    }
}

void Soak::LookForUnfinished()
{
    auto const now = Clock::now();
    auto const before = std::exchange(m_unfinished, {});
    for (std::string const& name : UnfinishedIn(m_site))
    {
        auto const known = before.find(name);
        Unfinished& file = m_unfinished[name] = known == before.end() ? Unfinished{now} : known->second;
        // Its program may have died just before it was seen first, or be stopped itself.
        if (now - file.first < Milliseconds(m_options.buriedWithin) + 3s || MayHoldUp(file.first) ||
            file.isTold)
            continue;
        m_wrongs.Take("site", "kept", name);
        file.isTold = true;
    }
}

// hasFiles: whether the files of the jobs are there too.
void Soak::Check(fs::path const& site, bool hasFiles)
{
    ++m_checks;
    m_errands.Add({Tool(), site.string(), "check", "--json"},
                  [this, hasFiles](ErrandResult const& result)
                  {
                      json const check = JsonOf(result);
                      if (!check.is_object())
                          return static_cast<void>(Must(result, "check"));
                      for (json const& problem : check.at("problems"))
                          if (hasFiles ||
                              problem.get<std::string>().find("the job's file") == std::string::npos)
                              m_wrongs.Take("comgui_site check", "failed", problem.get<std::string>());
                  });
}

// Restored in a second folder, a backup has at least what had been acknowledged when it began.
void Soak::Backup()
{
    auto const past = std::make_shared<std::vector<Lane::Past>>();
    fs::path const file = m_folder / "backup.db";
    fs::path const copy = m_folder / ("copy-" + std::to_string(++m_backups));
    m_errands.Add(
        {Tool(), m_site.string(), "backup", "--force", file.string()},
        [this, past, file, copy](ErrandResult const& result)
        {
            if (!Must(result, "backup"))
                return;
            m_errands.Add({Tool(), copy.string(), "restore", file.string()},
                          [this](ErrandResult const& restored) { Must(restored, "restore"); });
            Check(copy, false);
            CompareCopy(copy, *past);
        },
        [this, past]
        {
            for (SoakRunner const& runner : m_runners)
                if (runner.IsWriter())
                    past->push_back(runner.TheLane().Now());
        });
}

void Soak::CompareCopy(fs::path const& copy, std::vector<Lane::Past> const& past)
{
    m_errands.Add({"/usr/bin/env", "COMGUI_SITE=" + copy.string(), Program::OwnFile(), "--as-checker",
                   std::to_string(m_options.writers)},
                  [this, copy, past](ErrandResult const& result)
                  {
                      std::size_t lane = 0;
                      for (std::string const& line : result.lines)
                      {
                          if (line.starts_with("found") && lane < past.size())
                          {
                              Lane(static_cast<int>(lane), m_wrongs).CompareCopy(line, past[lane]);
                              ++lane;
                          }
                          else if (line.starts_with("disordered"))
                              m_wrongs.Take("a copy", "lost", line);
                      }
                      if (lane != past.size())
                          m_wrongs.Take("a copy", "failed", "cannot be read: " + Joined(result.lines));
                      fs::remove_all(copy);
                  });
}

void Soak::Sample()
{
    for (SoakRunner& runner : m_runners)
        if (runner.IsLongLived())
            runner.Sample();
    m_databaseSizes.push_back(DatabaseSizeOf(m_site));
    std::int64_t appended = 0;
    for (SoakRunner const& runner : m_runners)
        appended += runner.IsWriter() ? runner.TheLane().Now().appended : 0;
    m_appended.push_back(appended);
}

// --- the end -------------------------------------------------------------------------------------

void Soak::Finish()
{
    Release(Clock::time_point::max());
    ReadUntil(Clock::now() + Aftermath);  // what was refused is reported while it may be
    EndShortLived();
    RunErrands();
    CompareLanes();
    AwaitQuiet();
    EndLongLived();
    CompareLanes();  // by a program that finds the site left, and clears up what the last ones could not
    Check(m_site, true);
    AskInfo();
    RunErrands();
    if (m_programs != 0)
        m_wrongs.Take("site", "kept", std::to_string(m_programs) + " programs that have left");
    if (std::string const left = Joined(TemporaryIn(m_site)); !left.empty())
        m_wrongs.Take("site", "kept", left);
    if (fs::exists(m_site / "site.db-wal"))
        m_wrongs.Take("site", "kept", "site.db-wal, though the last program has left");
}

void Soak::RunErrands()
{
    while (!m_errands.AreDone())
    {
        m_errands.Proceed();
        std::this_thread::sleep_for(5ms);
    }
}

void Soak::EndShortLived()
{
    for (SoakRunner& runner : m_runners)
    {
        if (runner.IsLongLived())
            continue;
        m_dead[runner.Id()] = Clock::now();
        runner.Kill();
    }
}

// What is there by now has to be what the writers have reported.
void Soak::CompareLanes()
{
    m_errands.Add({Program::OwnFile(), "--as-checker", std::to_string(m_options.writers)},
                  [this](ErrandResult const& result)
                  {
                      auto runner = m_runners.begin();
                      bool isDone = false;
                      for (std::string const& line : result.lines)
                      {
                          runner = std::find_if(runner, m_runners.end(),
                                                [](SoakRunner const& each) { return each.IsWriter(); });
                          if (line.starts_with("found") && runner != m_runners.end())
                              (runner++)->TheLane().Take(line);
                          else if (line == "done")
                              isDone = true;
                          else
                              m_wrongs.Take("all lanes", line.substr(0, line.find(' ')), line);
                      }
                      if (!isDone)
                          m_wrongs.Take("checker", "failed", "does not finish");
                  });
    RunErrands();
}

// What is left of dead programs, or of work that is undone; empty if nothing is.
std::string Soak::WhatIsLeft()
{
    bool isMirrored = false;
    m_errands.Add({Tool(), m_site.string(), "export", "0/0"}, [&](ErrandResult const& result)
                  { isMirrored = Joined(result.lines) == ContentOf(m_site / "tickets" / "SYS_0000.xml"); });
    AskInfo();
    RunErrands();
    auto const longLived = static_cast<std::size_t>(std::count_if(
        m_runners.begin(), m_runners.end(), [](auto const& runner) { return runner.IsLongLived(); }));
    std::size_t jobs = 0;
    for (SoakRunner const& runner : m_runners)
        jobs += runner.IsWriter() ? runner.TheLane().Jobs() : 0;
    std::string left = Joined(UnfinishedIn(m_site));
    if (!isMirrored)
        left += "an old copy of the system ticket\n";
    if (m_programs != longLived)
        left += std::to_string(m_programs) + " programs instead of " + std::to_string(longLived) + '\n';
    if (m_jobs != jobs || JobFoldersIn(m_site) != jobs)
        left += std::to_string(m_jobs) + " jobs and " + std::to_string(JobFoldersIn(m_site)) +
                " folders of jobs instead of " + std::to_string(jobs) + '\n';
    return left;
}

void Soak::AwaitQuiet()
{
    auto const deadline = Clock::now() + Milliseconds(m_options.buriedWithin);
    std::string left = WhatIsLeft();
    while (!left.empty() && Clock::now() < deadline)
    {
        std::this_thread::sleep_for(100ms);
        left = WhatIsLeft();
    }
    if (!left.empty())
        m_wrongs.Take("site", "kept", left);
}

std::string Soak::Expected() const
{
    std::string expected;
    int lane = 0;
    for (SoakRunner const& runner : m_runners)
    {
        if (!runner.IsWriter())
            continue;
        Lane::Past const& now = runner.TheLane().Now();
        for (auto const& [type, count] : {std::pair(CounterType, now.counter),
                                          std::pair(TableType, now.table), std::pair(ListType, now.appended)})
            expected += " " + std::to_string(type) + " " + std::to_string(lane) + " " + std::to_string(count);
        ++lane;
    }
    return expected;
}

// The journal becomes short when everybody has heard everything.
void Soak::EndLongLived()
{
    std::string const end = "end" + Expected();
    for (SoakRunner& runner : m_runners)
        if (runner.IsLongLived() && runner.Kind() != "reader")
            runner.Tell(end);
    for (SoakRunner& runner : m_runners)
        if (runner.IsLongLived() && runner.Kind() != "reader")
            runner.AwaitEnd();
    JudgeDatabase();
    for (SoakRunner& runner : m_runners)
        if (runner.IsLongLived() && runner.Kind() == "reader")
        {
            runner.Tell(end);
            runner.AwaitEnd();
        }
}

// --- judgement -----------------------------------------------------------------------------------

void Soak::JudgeDatabase()
{
    constexpr std::uint64_t MostKept = 10000;  // changes in the journal that everybody has heard
    auto const deadline = Clock::now() + 30s;
    do
    {
        AskInfo();
        RunErrands();
        std::this_thread::sleep_for(100ms);
    } while (m_journal > MostKept && Clock::now() < deadline);
    if (m_journal > MostKept)
        m_wrongs.Take("site", "grown", "the journal keeps " + std::to_string(m_journal) + " changes");
}

void Soak::Judge()
{
    JudgeFootprints();
    // What was appended is there for good, in some bytes a value.
    auto const appended = static_cast<std::uintmax_t>(m_appended[3] - m_appended[1]);
    if (m_databaseSizes[3] > m_databaseSizes[1] + m_databaseSizes[1] / 2 + 100 * appended + 20'000'000)
        m_wrongs.Take("site", "grown",
                      "the database from " + std::to_string(m_databaseSizes[1]) + " bytes at half time to " +
                          std::to_string(m_databaseSizes[3]));
    for (SoakRunner const& runner : m_runners)
        if (m_options.longestPause > 0 && runner.LongestPause() > Milliseconds(m_options.longestPause))
            m_wrongs.Take(runner.Name(), "hung",
                          "has paused for " +
                              std::to_string(
                                  std::chrono::duration_cast<std::chrono::milliseconds>(runner.LongestPause())
                                      .count()) +
                              " ms");
}

// In the second half a program needs neither more memory nor more files than in the first, but for what
// chance and the allocator make of it; a sanitizer keeps what was freed.
void Soak::JudgeFootprints()
{
    constexpr double ShortestJudged = 120;  // seconds: before that, programs fill their caches
    for (SoakRunner const& runner : m_runners)
    {
        if (!runner.IsLongLived())
            continue;
        auto const& samples = runner.Samples();
        if (samples[3].files > samples[0].files + 12)
            m_wrongs.Take(runner.Name(), "grown",
                          std::to_string(samples[3].files) + " open files, instead of " +
                              std::to_string(samples[0].files));
        long const allowed = samples[1].kilobytes + samples[1].kilobytes / 4 + 8192;
        if (!IsSanitized && m_options.seconds >= ShortestJudged && samples[3].kilobytes > allowed)
            m_wrongs.Take(runner.Name(), "grown",
                          std::to_string(samples[3].kilobytes) + " kB of memory, instead of " +
                              std::to_string(samples[1].kilobytes));
    }
}

std::int64_t Soak::Changes() const
{
    std::int64_t changes = 0;
    for (SoakRunner const& runner : m_runners)
        changes += runner.IsWriter() ? runner.Done() : 0;
    return changes;
}

void Soak::Tell() const
{
    int disturbances = 0;
    for (auto const& [treatment, count] : m_treated)
        disturbances += count;
    std::cout << std::lround(Elapsed()) << " s: " << Changes() << " changes, " << disturbances
              << " disturbances, " << m_backups << " backups, " << m_checks << " checks; journal "
              << m_journal << ", database " << DatabaseSizeOf(m_site) / 1000 << " kB; " << m_wrongs.Text()
              << std::endl;
}

void Soak::Summary() const
{
    std::cout << std::left << std::setw(18) << "program" << std::right << std::setw(8) << "starts"
              << std::setw(12) << "done" << std::setw(10) << "pause/ms"
              << "   memory/MB (files) at the quarters\n"
              << std::fixed << std::setprecision(1);
    for (SoakRunner const& runner : m_runners)
    {
        std::cout << std::left << std::setw(18) << runner.Name() << std::right << std::setw(8)
                  << runner.Starts() << std::setw(12) << runner.Done() << std::setw(10)
                  << std::chrono::duration_cast<std::chrono::milliseconds>(runner.LongestPause()).count()
                  << "  ";
        for (Footprint const& sample : runner.Samples())
            std::cout << ' ' << static_cast<double>(sample.kilobytes) / 1000 << " (" << sample.files << ')';
        std::cout << '\n';
    }
    std::cout << "database/kB at the quarters:";
    for (std::uintmax_t const size : m_databaseSizes)
        std::cout << ' ' << size / 1000;
    auto const count = [this](Treatment treatment)
    { return m_treated.contains(treatment) ? m_treated.at(treatment) : 0; };
    std::cout << "; longest journal: " << m_longestJournal << " changes; soak itself paused for "
              << std::chrono::duration_cast<std::chrono::milliseconds>(m_longestOwnPause).count() << " ms\n"
              << count(Kill) << " killed, " << count(Stop) << " stopped, " << count(Fill)
              << " with a full disk, " << count(End) << " ended, " << count(FillAll)
              << " times the site's disk was full; " << m_backups << " backups, " << m_checks << " checks\n"
              << std::lround(Elapsed()) << " s, " << Changes() << " changes: " << m_wrongs.Text()
              << std::endl;
}
