// Writers that go on through every break of their stores, in any number of processes, and what they have
// done, so that a test can find out whether anything was lost, made twice, or made by half.
#pragma once

#include "standin/server/store/Store.h"
#include "standin/server/store/StoreContent.h"
#include <array>
#include <atomic>
#include <functional>
#include <memory>
#include <string>

struct CHANGE;

// What the writers of all processes know of each other. Made before the processes are.
struct WRITERS_BOARD
{
    static constexpr int Most = 16;
    static constexpr standin::TicketAddress Shared{4, 1};  // counted up by all
    static constexpr int AppendedType = 5;                 // one ticket for each step of each writer

    struct WRITER
    {
        std::atomic<long long> steps{0};          // done; three changes each
        std::atomic<long long> answers{0};        // of the store, to commits
        std::atomic<standin::Sequence> heard{0};  // of the feed
    };
    std::array<WRITER, Most> writers;
    std::atomic<bool> isOver{false};     // they end after the step that they are at
    std::atomic<bool> isGivenUp{false};  // they throw
    std::atomic<int> torn{0};            // changes of which a part was seen
    std::atomic<int> gaps{0};            // in somebody's feed
    std::atomic<int> buried{0};          // programs, all of which live

    static std::shared_ptr<WRITERS_BOARD> Make();
};

// What every board's site begins with.
standin::StoreContent ContentOfWriters();

// One program: a thread that writes, another one that follows the feed, and a third that clears up, as every
// program has them.
class SteadyWriter
{
public:
    SteadyWriter(standin::Store& store, WRITERS_BOARD& board, int index);

    // So many steps, or until the board says so.
    void Run(long long steps);

private:
    void Step(long long number);
    void Do(std::function<CHANGE()> const& plan);
    bool IsMade(CHANGE const& change);
    void Follow(standin::Sequence until);
    void FollowOnce(standin::Sequence& heard);
    void ClearUp();
    void Persist(std::function<void()> const& call);

    standin::Store& m_store;
    WRITERS_BOARD& m_board;
    WRITERS_BOARD::WRITER& m_own;
    int const m_index;
    std::uint64_t m_number = 0;
    std::atomic<bool> m_isDone{false};
};

// Expects that the site holds what the writers have done, once and whole.
void ExpectWorkOf(WRITERS_BOARD const& board, int writers, standin::Store& store);
