// Steady writers over PostgreSQL in several processes, each program with a store of its own.
#pragma once

#include "standin/server/store/postgres/PostgresStore.h"
#include "tests/store/SteadyWriter.h"
#include "tests/support/ChildProcess.h"
#include "tests/support/sanitizers.h"
#include <chrono>
#include <gtest/gtest.h>
#include <limits>
#include <memory>
#include <string>
#include <thread>
#include <vector>

// The journal is kept short: who is away for a moment has no gap in its feed all the same. On a busy machine
// many processes take longer to come back than the grace that programs have by default.
inline standin::PostgresOptions OptionsOfWriters(std::string const& schema)
{
    standin::PostgresOptions options;
    options.schema = schema;
    options.limits.journalKept = 20;
    options.grace = std::chrono::seconds(3);
    return options;
}

class WriterProcesses
{
public:
    static constexpr int EachHas = 4;  // writers

    // The site is to be there already. steps: of each writer. each: writers of a process.
    WriterProcesses(int processes, std::string const& uri, standin::PostgresOptions const& options,
                    long long steps = std::numeric_limits<long long>::max(), int each = EachHas)
        : m_each(each)
    {
        for (int process = 0; process < processes; ++process)
            m_children.push_back(std::make_unique<ChildProcess>(
                [this, process, uri, options, steps](ChildProcess::Report const&)
                { Work(process * m_each, uri, options, steps); }));
    }
    ~WriterProcesses() { board->isGivenUp = board->isOver = true; }

    int Count() const { return static_cast<int>(m_children.size()) * m_each; }

    bool HaveDone(long long steps) const
    {
        for (int i = 0; i < Count(); ++i)
            if (Writer(i).steps < steps)
                return false;
        return true;
    }

    long long StepsOfAll() const
    {
        long long all = 0;
        for (int i = 0; i < Count(); ++i)
            all += Writer(i).steps;
        return all;
    }

    // Waits until every writer has done so many steps more; gives up after a minute, false.
    bool AwaitSteps(long long more) const
    {
        return AwaitMore([](WRITERS_BOARD::WRITER const& writer) { return writer.steps.load(); }, more);
    }

    // Expects that every writer gets an answer to a commit that begins after this call, and soon.
    void ExpectAnswers(std::chrono::seconds limit) const
    {
        auto const start = std::chrono::steady_clock::now();
        EXPECT_TRUE(AwaitMore([](WRITERS_BOARD::WRITER const& writer) { return writer.answers.load(); }, 2));
        EXPECT_LT(std::chrono::steady_clock::now() - start, limit * (IsSanitized ? 4 : 1));
    }

    // Expects that all of them end well.
    void Finish()
    {
        board->isOver = true;
        AwaitEnd();
    }
    void AwaitEnd() const
    {
        for (auto const& child : m_children)
            EXPECT_EQ(child->Wait(), 0);
    }

    std::shared_ptr<WRITERS_BOARD> const board = WRITERS_BOARD::Make();

private:
    void Work(int first, std::string const& uri, standin::PostgresOptions const& options,
              long long steps) const
    {
        std::vector<std::unique_ptr<standin::PostgresStore>> stores;
        std::vector<std::thread> writers;
        for (int i = 0; i < m_each; ++i)
            stores.push_back(std::make_unique<standin::PostgresStore>(uri, ContentOfWriters, options));
        for (int i = 0; i < m_each; ++i)
            writers.emplace_back(
                [&, i] { SteadyWriter(*stores[static_cast<std::size_t>(i)], *board, first + i).Run(steps); });
        for (std::thread& writer : writers)
            writer.join();
    }

    WRITERS_BOARD::WRITER const& Writer(int i) const { return board->writers[static_cast<std::size_t>(i)]; }

    template <typename Number>
    bool AwaitMore(Number const& number, long long more) const
    {
        std::vector<long long> goals;
        for (int i = 0; i < Count(); ++i)
            goals.push_back(number(Writer(i)) + more);
        auto const end = std::chrono::steady_clock::now() + std::chrono::minutes(1);
        for (int i = 0; i < Count(); ++i)
            while (number(Writer(i)) < goals[static_cast<std::size_t>(i)])
            {
                if (std::chrono::steady_clock::now() > end)
                    return false;
                std::this_thread::sleep_for(std::chrono::milliseconds(1));
            }
        return true;
    }

    int const m_each;
    std::vector<std::unique_ptr<ChildProcess>> m_children;
};
