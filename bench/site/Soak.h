// A run of soak: programs of all kinds on one site, disturbed at random moments, and all that is checked.
#pragma once

#include "bench/site/Errands.h"
#include "bench/site/SoakRunner.h"
#include "tests/support/SmallDisk.h"
#include <deque>
#include <map>
#include <random>

struct SoakOptions
{
    double seconds = 600;
    int writers = 3;
    double rate = 200;           // changes a second of each writer, at most
    double interval = 300;       // ms between two disturbances, on average
    double longestPause = 5000;  // ms of a living program; 0: not judged
    double buriedWithin = 3000;  // ms, from a program's death until nothing of it is left
    unsigned seed = std::random_device()();
};

class Soak
{
public:
    // site: has been made and is in the environment. disk: where it is. folder: for files of the programs and
    // what they write to stderr.
    Soak(SoakOptions const& options, std::filesystem::path site, SmallDisk const& disk,
         std::filesystem::path folder);

    bool Run();  // whether every promise held

private:
    using Clock = Program::Clock;

    enum Treatment
    {
        Kill,
        Stop,
        Fill,  // its disk
        End,
        FillAll,  // the disk of the site
    };
    struct Disturbance
    {
        SoakRunner* runner;  // null: all of them
        Treatment treatment;
        Clock::time_point begin;
        Clock::time_point end;
    };
    struct Span
    {
        Clock::time_point begin;
        Clock::time_point end;
    };
    struct Unfinished
    {
        Clock::time_point first;
        bool isTold = false;
    };

    void AddRunners();
    void StartAll();
    void Start(SoakRunner& runner, bool isFirst = false);
    void WorkUntil(Clock::time_point end);
    void ReadUntil(Clock::time_point end);
    void Watch();  // what is due

    void Disturb();
    void Begin(SoakRunner& runner, Treatment treatment);
    void BeginFillAll();
    void Undo(Disturbance const& disturbance);
    void Release(Clock::time_point now);
    Clock::duration Length(Treatment treatment);

    // Whether others may have been held up or refused since then: a program was stopped for long, or the disk
    // full.
    static bool HoldsUpOthers(Disturbance const& disturbance);
    bool MayHoldUp(Clock::time_point since) const;
    Clock::duration HeldUp(Clock::time_point since) const;
    void NoteOwnPause();
    bool MayBeRefused(SoakRunner const& runner) const;

    void AskInfo();
    void TakeInfo(ErrandResult const& result);
    void Check(std::filesystem::path const& site, bool hasFiles);
    void Backup();
    void CompareCopy(std::filesystem::path const& copy, std::vector<Lane::Past> const& past);
    bool Must(ErrandResult const& result, char const* what);
    void LookForUnfinished();
    void Sample();

    void Finish();
    void EndShortLived();
    void CompareLanes();
    void AwaitQuiet();
    std::string WhatIsLeft();
    void EndLongLived();
    std::string Expected() const;

    void Tell() const;
    void Judge();
    void JudgeFootprints();
    void JudgeDatabase();
    void Summary() const;
    void RunErrands();
    double Elapsed() const { return std::chrono::duration<double>(Clock::now() - m_began).count(); }
    std::int64_t Changes() const;

    SoakOptions const m_options;
    std::filesystem::path const m_site;
    SmallDisk const& m_disk;
    std::filesystem::path const m_folder;
    std::mt19937 m_random;
    Wrongs m_wrongs;
    SoakRunner::Setting const m_setting;
    std::deque<SoakRunner> m_runners;
    Errands m_errands;
    Clock::time_point const m_began = Clock::now();

    std::vector<Disturbance> m_disturbances;  // that last
    std::deque<Span> m_holdUps;
    std::deque<Span> m_ownPauses;
    Clock::time_point m_lastRound{};
    Clock::duration m_longestOwnPause{};
    std::map<int, Clock::time_point> m_due;  // what Watch() does next, and when
    std::map<Treatment, int> m_treated;
    std::map<pid_t, Clock::time_point> m_dead;
    std::map<std::string, Unfinished> m_unfinished;
    int m_backups = 0;
    int m_checks = 0;
    std::size_t m_programs = 0;  // as the newest info has it, with the jobs and the length of the journal
    std::size_t m_jobs = 0;
    std::uint64_t m_journal = 0;
    std::uint64_t m_longestJournal = 0;
    std::vector<std::uintmax_t> m_databaseSizes;  // at the quarters, with how much was appended then
    std::vector<std::int64_t> m_appended;
};
