// Failing allocations on demand: the test program's own operator new counts what is alive, and lets one
// allocation fail that a test has chosen. The library's allocations go through it as well. What is given back
// gets another content, so that whoever still reads it finds out.
#pragma once

#include <cstddef>
#include <gtest/gtest.h>

// Blocks from operator new that are not given back yet.
long LiveAllocations();

// What these blocks hold, in bytes, with what the heap rounds up.
std::size_t LiveBytes();

// While it lives the nth allocation from its making on throws std::bad_alloc, 0 being the next.
class FailingAllocation
{
public:
    explicit FailingAllocation(int n);
    ~FailingAllocation();
    FailingAllocation(FailingAllocation const&) = delete;
    FailingAllocation& operator=(FailingAllocation const&) = delete;

    bool HasHappened() const;

    // From here on nothing fails: the scenario has come to looking at what it got.
    static void Stop();
};

// Runs the scenario with its 1st, 2nd, 3rd ... allocation failing, until none is left to fail. The scenario
// keeps nothing allocated; check is told whether an allocation failed and looks at what came of it. How many
// allocations there were to fail.
template <typename SCENARIO, typename CHECK>
int FailEachAllocation(SCENARIO scenario, CHECK check)
{
    for (int n = 0; n < 10000; ++n)
    {
        long const before = LiveAllocations();
        bool hasHappened;
        {
            FailingAllocation const failing(n);
            scenario();
            hasHappened = failing.HasHappened();
        }
        EXPECT_EQ(LiveAllocations(), before) << "leaked after allocation " << n << " failed";
        check(hasHappened);
        if (!hasHappened || testing::Test::HasFailure())
            return n;
    }
    ADD_FAILURE() << "allocations without end";
    return 0;
}
