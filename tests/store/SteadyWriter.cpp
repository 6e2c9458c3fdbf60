#include "tests/store/SteadyWriter.h"

#include "tests/store/StoreContract.h"
#include <chrono>
#include <new>
#include <set>
#include <stdexcept>
#include <sys/mman.h>
#include <thread>

using namespace standin;
using namespace std::chrono_literals;

namespace
{
constexpr char const* OwnKeys[] = {"A", "B", "C", "D", "E"};

TicketAddress OwnTicket(int index) { return {3, index + 1}; }
}  // namespace

std::shared_ptr<WRITERS_BOARD> WRITERS_BOARD::Make()
{
    void* const memory =
        mmap(nullptr, sizeof(WRITERS_BOARD), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    if (memory == MAP_FAILED)
        throw std::bad_alloc();
    return {new (memory) WRITERS_BOARD, [](WRITERS_BOARD* board) { munmap(board, sizeof *board); }};
}

StoreContent ContentOfWriters()
{
    StoreContent content = OneTicket(WRITERS_BOARD::Shared, "Count", 0);
    for (int i = 0; i < WRITERS_BOARD::Most; ++i)
    {
        CHANGE own = Creation(OwnTicket(i));
        for (char const* const key : OwnKeys)
            std::move(own).Put(key, 0, 0);
        content.tickets.push_back(std::move(own));
    }
    return content;
}

SteadyWriter::SteadyWriter(Store& store, WRITERS_BOARD& board, int index)
    : m_store(store), m_board(board), m_own(board.writers[static_cast<std::size_t>(index)]), m_index(index)
{
}

void SteadyWriter::Run(long long steps)
{
    Sequence const before = m_store.Committed();
    m_own.heard = before;
    std::thread follower([this, before] { Follow(before); });
    std::thread caretaker([this] { ClearUp(); });
    while (!m_board.isOver && m_own.steps < steps)
    {
        Step(m_own.steps + 1);
        ++m_own.steps;
    }
    m_isDone = true;
    m_store.Interrupt();
    follower.join();
    caretaker.join();
}

void SteadyWriter::Step(long long number)
{
    StoredValue const value = Integer(PARAM_INT64, number);
    Do(
        [&]
        {
            auto const state = StateOf(m_store, OwnTicket(m_index));
            for (auto const& [place, kept] : ValuesOf(m_store, OwnTicket(m_index)))
                m_board.torn += kept.value.integer == number - 1 ? 0 : 1;
            CHANGE change = WriteTo(OwnTicket(m_index), *state);
            for (char const* const key : OwnKeys)
                std::move(change).Put(key, 0, value);
            return change;
        });
    Do(
        [&]
        {
            auto const state = StateOf(m_store, WRITERS_BOARD::Shared);
            auto const count = ValuesOf(m_store, WRITERS_BOARD::Shared).at({"Count", 0}).value.integer;
            return WriteTo(WRITERS_BOARD::Shared, *state).Put("Count", 0, Integer(PARAM_INT64, count + 1));
        });
    Do(
        [&] {
            return CreationOfNext(WRITERS_BOARD::AppendedType)
                .Put("Writer", 0, m_index)
                .Put("Step", 0, value);
        });
}

// Makes a change, once, and plans it anew until it is made.
void SteadyWriter::Do(std::function<CHANGE()> const& plan)
{
    for (bool isMade = false; !isMade;)
    {
        ++m_number;
        std::optional<CHANGE> change;
        Persist([&] { change.emplace(plan()); });
        isMade = IsMade(*change);
    }
}

// A failure has had no effect, and of an outcome that did not come the store knows later.
bool SteadyWriter::IsMade(CHANGE const& change)
{
    CommitOutcome outcome;
    try
    {
        outcome = m_store.Commit(change, m_number);
    }
    catch (StoreError const&)
    {
        return false;
    }
    if (outcome.kind == CommitOutcome::Unknown)
    {
        std::optional<CommitOutcome> found;
        Persist([&] { found = m_store.FindCommit(m_number); });
        return found.has_value();
    }
    ++m_own.answers;
    return outcome.kind == CommitOutcome::Committed;
}

void SteadyWriter::Persist(std::function<void()> const& call)
{
    for (;;)
    {
        try
        {
            return call();
        }
        catch (StoreError const&)
        {
            if (m_board.isGivenUp)
                throw;
            std::this_thread::sleep_for(5ms);
        }
    }
}

void SteadyWriter::Follow(Sequence until)
{
    for (Sequence heard = until; !m_isDone || heard < m_store.Committed();)
    {
        try
        {
            m_store.WaitForChanges(heard, 1s);
            FollowOnce(heard);
        }
        catch (BrokenJournal const&)
        {
            ++m_board.gaps;
            return;
        }
        catch (StoreError const&)
        {
            if (m_board.isGivenUp)
                return;
            std::this_thread::sleep_for(5ms);
        }
        m_own.heard = heard;
    }
}

void SteadyWriter::FollowOnce(Sequence& heard)
{
    bool const isWhole = m_store.ChangesSince(heard,
                                              [&](CommittedChange&& change)
                                              {
                                                  m_board.gaps += change.sequence == heard + 1 ? 0 : 1;
                                                  heard = change.sequence;
                                              });
    m_board.gaps += isWhole ? 0 : 1;
}

void SteadyWriter::ClearUp()
{
    for (auto next = std::chrono::steady_clock::now(); !m_isDone; std::this_thread::sleep_for(10ms))
    {
        if (std::chrono::steady_clock::now() < next)
            continue;
        next = std::chrono::steady_clock::now() + 700ms;
        try
        {
            m_store.Maintain(m_own.heard);
            m_store.Bury([this](Estate const&) { ++m_board.buried; });
        }
        catch (StoreError const&)
        {
            // The next round comes.
        }
    }
}

void ExpectWorkOf(WRITERS_BOARD const& board, int writers, Store& store)
{
    EXPECT_EQ(board.torn, 0);
    EXPECT_EQ(board.gaps, 0);
    EXPECT_EQ(board.buried, 0);
    long long steps = 0;
    std::set<std::pair<long long, long long>> expected;
    for (int i = 0; i < writers; ++i)
    {
        long long const done = board.writers[static_cast<std::size_t>(i)].steps;
        steps += done;
        for (long long step = 1; step <= done; ++step)
            expected.emplace(i, step);
        for (auto const& [place, kept] : ValuesOf(store, OwnTicket(i)))
            EXPECT_EQ(kept.value.integer, done) << "of writer " << i << " in " << place.first;
    }
    EXPECT_EQ(ValuesOf(store, WRITERS_BOARD::Shared).at({"Count", 0}).value.integer, steps);
    long long twice = 0;
    for (TicketAddress const address : AddressesIn(store))
    {
        if (address.type != WRITERS_BOARD::AppendedType)
            continue;
        StoreValues const values = ValuesOf(store, address);
        twice += 1 - static_cast<long long>(expected.erase(
                         {values.at({"Writer", 0}).value.integer, values.at({"Step", 0}).value.integer}));
    }
    EXPECT_EQ(twice, 0);
    EXPECT_EQ(expected.size(), 0u) << "appended steps are lost";
    EXPECT_EQ(store.Committed(), static_cast<Sequence>(3 * steps + 1 + WRITERS_BOARD::Most));
}
