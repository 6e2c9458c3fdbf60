// What is kept of a refused call, in the thread that made it.
#include "standin/server/files/RefusableCall.h"

#include "comgui/module/TicketSlots.h"
#include "standin/module/HostCalls.h"
#include "standin/server/files/Report.h"
#include "tests/support/Allocations.h"
#include <gtest/gtest.h>
#include <stdexcept>
#include <thread>

using namespace standin;

namespace
{
std::string const LongLine(100, 'x');  // no string has room for it in itself

void RefuseWith(std::string const& line)
{
    RefusableCall call;
    RefusableCall::Note({line});
    call.Refuse();
}

class ReasonOfACall : public testing::Test
{
protected:
    ReasonOfACall() { RefusableCall::TakeReason(); }  // another test's
};
using ReasonOfARead = ReasonOfACall;
using Reports = ReasonOfACall;
using CallsOfAHost = ReasonOfACall;

class Throwing : public HostCalls<comgui::plugin::TicketSlots>
{
    bool Get(char const*, PARAM_TYPE, void*, int) override { throw std::runtime_error("told to\nfail"); }
    bool GetTable(GETMULTIPAR*) override { return false; }
    bool Set(char const*, PARAM_TYPE, void const*, int) override { throw 7; }
    bool SetTable(SETMULTIPAR*) override { return false; }
    bool Walk(SWALKPARAMETERS_ACTION, void*, char const*, int) override { return false; }
    bool Option(int, void*) override { return false; }
};

std::string StderrOf(std::function<void()> const& work)
{
    testing::internal::CaptureStderr();
    work();
    return testing::internal::GetCapturedStderr();
}
}  // namespace

TEST_F(ReasonOfACall, IsTheLastLineOfARefusedOne_AndIsGivenOnce)
{
    RefusableCall call;
    RefusableCall::Note({"first"});
    RefusableCall::Note({"se", "cond"});
    EXPECT_EQ(RefusableCall::TakeReason(), "") << "it has not been refused yet";
    EXPECT_EQ(call.Ended(7, false), 7);
    EXPECT_EQ(RefusableCall::TakeReason(), "second");
    EXPECT_EQ(RefusableCall::TakeReason(), "");
}

TEST_F(ReasonOfACall, OneThatSucceeds_LeavesTheReasonOfBefore)
{
    RefuseWith("before");
    {
        RefusableCall call;
        RefusableCall::Note({"no reason, as the call succeeds"});
        EXPECT_EQ(call.Ended(7, true), 7);
    }
    EXPECT_EQ(RefusableCall::TakeReason(), "before");
}

TEST_F(ReasonOfACall, OneThatIsRefusedWithoutALine_ClearsIt)
{
    RefuseWith("before");
    {
        RefusableCall call;
        call.Refuse();
    }
    EXPECT_EQ(RefusableCall::TakeReason(), "");
}

TEST_F(ReasonOfACall, WithinAnother_IsItsOwn)
{
    RefusableCall outer;
    RefusableCall::Note({"outer"});
    RefuseWith("inner");
    EXPECT_EQ(RefusableCall::TakeReason(), "inner");
    outer.Refuse();
    EXPECT_EQ(RefusableCall::TakeReason(), "outer");
}

TEST_F(ReasonOfACall, OutsideOfCalls_NothingIsNoted)
{
    RefuseWith("before");
    RefusableCall::Note({"of no call"});
    EXPECT_EQ(StderrOf([] { Report(std::string("of no call")); }), "of no call\n");
    EXPECT_EQ(RefusableCall::TakeReason(), "before");
    RefusableCall call;
    call.Refuse();
    EXPECT_EQ(RefusableCall::TakeReason(), "");
}

TEST_F(ReasonOfACall, IsOneLineWithoutControlCharacters)
{
    RefuseWith("a\nb\tc\x7F");
    EXPECT_EQ(RefusableCall::TakeReason(), "a?b?c?");
}

TEST_F(ReasonOfACall, BelongsToItsThread)
{
    RefuseWith("here");
    std::thread(
        []
        {
            EXPECT_EQ(RefusableCall::TakeReason(), "");
            RefuseWith("there");
            EXPECT_EQ(RefusableCall::TakeReason(), "there");
        })
        .join();
    EXPECT_EQ(RefusableCall::TakeReason(), "here");
}

// A client's own thread_local may call the module when the thread's reason is gone.
TEST_F(ReasonOfACall, WhenItsThreadEnds_IsNoneAndDoesNoHarm)
{
    static std::string atTheEnd;
    struct CALLING_LAST
    {
        ~CALLING_LAST()
        {
            RefuseWith(LongLine);
            atTheEnd = "reason: " + RefusableCall::TakeReason();
        }
    };
    std::thread(
        []
        {
            static thread_local CALLING_LAST last;  // made first, so it goes last
            [[maybe_unused]] CALLING_LAST* const made = &last;
            RefuseWith(LongLine);
        })
        .join();
    EXPECT_EQ(atTheEnd, "reason: ");
}

TEST_F(ReasonOfACall, WithoutMemoryForIt_IsNoneAndNotTheOneOfBefore)
{
    RefuseWith("before");
    int failures = 0;
    for (bool hasHappened = true; hasHappened; failures += hasHappened ? 1 : 0)
    {
        FailingAllocation const failing(failures);
        RefuseWith(LongLine);
        hasHappened = failing.HasHappened();
        FailingAllocation::Stop();
        EXPECT_EQ(RefusableCall::TakeReason(), hasHappened ? "" : LongLine);
    }
    EXPECT_GT(failures, 0);
}

TEST_F(ReasonOfARead, IsKeptWhenItFails)
{
    RefusableRead read;
    RefusableCall::Note({"line"});
    read.Refuse();
    EXPECT_EQ(RefusableCall::TakeReason(), "line");
}

TEST_F(ReasonOfARead, WithinACall_IsThatOfTheCall)
{
    RefuseWith("before");
    RefusableCall call;
    {
        RefusableRead read;
        RefusableCall::Note({"line"});
        read.Refuse();
    }
    EXPECT_EQ(RefusableCall::TakeReason(), "before") << "the call may succeed all the same";
    call.Refuse();
    EXPECT_EQ(RefusableCall::TakeReason(), "line");
}

TEST_F(Reports, AreOneLineOnStderr_AndTheReasonOfARefusedCallWithoutTheProgram)
{
    RefusableCall call;
    EXPECT_EQ(StderrOf([] { Report({"a ", "line"}, "Program: "); }), "Program: a line\n");
    call.Refuse();
    EXPECT_EQ(RefusableCall::TakeReason(), "a line");
}

TEST_F(Reports, WithoutMemory_AreTheSameOnStderr)
{
    std::string const line = "Program: " + LongLine + " and " + LongLine + "\n";
    int failures = 0;
    for (bool hasHappened = true; hasHappened; failures += hasHappened ? 1 : 0)
    {
        testing::internal::CaptureStderr();
        {
            FailingAllocation const failing(failures);
            Report({LongLine, " and ", LongLine}, "Program: ");
            hasHappened = failing.HasHappened();
            FailingAllocation::Stop();
        }
        EXPECT_EQ(testing::internal::GetCapturedStderr(), line);
    }
    EXPECT_GT(failures, 0);
}

TEST_F(CallsOfAHost, WhatIsThrown_IsToldOnStderrAndIsTheReason)
{
    Throwing ticket;
    STICKET_ACCESS const& table = *ticket.Access();
    RefuseWith("before");
    EXPECT_EQ(
        StderrOf([&] { EXPECT_EQ(table.SGETPARAMETER(table.Instance, "K", PARAM_INT, nullptr, 0), 0); }),
        "ComGUI.Bundle: a call failed: told to\nfail\n");
    EXPECT_EQ(RefusableCall::TakeReason(), "a call failed: told to?fail");
    EXPECT_EQ(
        StderrOf([&] { EXPECT_EQ(table.SSETPARAMETER(table.Instance, "K", PARAM_INT, nullptr, 0), 0); }),
        "ComGUI.Bundle: a call failed\n");
    EXPECT_EQ(RefusableCall::TakeReason(), "a call failed");
}
