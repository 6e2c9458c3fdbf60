// The filter's answers once it has been asked often enough to find them by hash: those of its sets.
#include "comgui/ticket/PARTIAL_MODE.h"

#include "tests/support/Allocations.h"
#include <gtest/gtest.h>
#include <new>
#include <optional>
#include <random>
#include <set>
#include <string>
#include <thread>
#include <utility>
#include <vector>

namespace
{
// The two sets, asked as the rule says.
struct PLAIN_MODE
{
    void Change(std::string pattern, bool isRemoval)
    {
        if (pattern.empty())
            return;
        bool const isPrefix = PARTIAL_MODE::wildcard(pattern);
        if (isRemoval)
            isPrefix ? prefixes.erase(pattern) : keys.erase(pattern);
        else
            isPrefix ? prefixes.insert(pattern) : static_cast<void>(keys.insert(pattern));
    }

    bool Selects(std::string const& key) const
    {
        return keys.count(key) != 0 || prefixes.find(key) != prefixes.end();
    }

    std::set<std::string> keys;
    STRINGPREFIXSET prefixes;
};

PARTIAL_MODE Mode(std::vector<std::string> const& patterns)
{
    PARTIAL_MODE mode(nullptr);
    for (std::string const& pattern : patterns)
        mode.insert(pattern);
    return mode;
}

// None if there is no memory for it.
std::optional<PARTIAL_MODE> ModeIfItCanBe(std::vector<std::string> const& patterns)
{
    try
    {
        return Mode(patterns);
    }
    catch (std::bad_alloc const&)
    {
        return std::nullopt;
    }
}

// More often than it has patterns.
PARTIAL_MODE const& Asked(PARTIAL_MODE const& mode)
{
    for (int i = 0; i < 1000; ++i)
        EXPECT_FALSE(mode.multi_contains("a key that nobody selects"));
    return mode;
}

bool Selects(PARTIAL_MODE const& mode, std::string const& key) { return Asked(mode).multi_contains(key); }
}  // namespace

TEST(PATTERN_INDEX, WholeKeys_SelectThemselvesOnly)
{
    PARTIAL_MODE const mode = Mode({"System/Use", "a", "", "exactly 16 bytes", "one of 17 bytes.."});
    EXPECT_TRUE(Selects(mode, "System/Use"));
    EXPECT_TRUE(Selects(mode, "a"));
    EXPECT_TRUE(Selects(mode, "exactly 16 bytes"));
    EXPECT_TRUE(Selects(mode, "one of 17 bytes.."));
    for (char const* const other :
         {"", "System/User", "System/Us", "aa", "exactly 16 bytes.", "one of 17 bytes."})
        EXPECT_FALSE(Selects(mode, other)) << other;
}

TEST(PATTERN_INDEX, Prefixes_SelectWhatBeginsWithThem)
{
    PARTIAL_MODE const mode = Mode({"Job/*", "System/Folders/Linearisation/*", "Queue*"});
    for (char const* const key : {"Job/", "Job/X", "Queue", "Queue/1", "System/Folders/Linearisation/LAB"})
        EXPECT_TRUE(Selects(mode, key)) << key;
    for (char const* const key : {"", "Job", "job/X", "Queu", "System/Folders/Linearisation"})
        EXPECT_FALSE(Selects(mode, key)) << key;
}

TEST(PATTERN_INDEX, EmptyPrefix_SelectsEveryKey)
{
    PARTIAL_MODE const mode = Mode({"*"});
    for (int i = 0; i < 100; ++i)
        EXPECT_TRUE(mode.multi_contains(std::string(static_cast<std::size_t>(i % 50), 'x')));
}

// A prefix and a key of the same text are two patterns.
TEST(PATTERN_INDEX, PrefixAndKeyOfOneText_AreTwo)
{
    PARTIAL_MODE mode = Mode({"Job", "Job*"});
    EXPECT_TRUE(Selects(mode, "Jobs"));
    mode.erase("Job*");
    EXPECT_FALSE(Selects(mode, "Jobs"));
    EXPECT_TRUE(Selects(mode, "Job"));
}

TEST(PATTERN_INDEX, EachChange_ShowsAtOnce)
{
    PARTIAL_MODE mode = Mode({"a", "b*"});
    Asked(mode);
    mode.insert("c");
    EXPECT_TRUE(mode.multi_contains("c"));
    EXPECT_TRUE(Selects(mode, "c"));
    mode.erase("c");
    EXPECT_FALSE(mode.multi_contains("c"));
    EXPECT_FALSE(Selects(mode, "c"));
    mode.insert("d*");
    EXPECT_TRUE(Selects(mode, "dd"));
    mode.erase("d*");
    EXPECT_FALSE(Selects(mode, "dd"));
    mode.clear();
    EXPECT_FALSE(Selects(mode, "a"));
    EXPECT_FALSE(Selects(mode, "bb"));
}

TEST(PATTERN_INDEX, Copy_GoesItsOwnWay)
{
    PARTIAL_MODE first = Mode({"a", "b*"});
    Asked(first);
    PARTIAL_MODE second = first;
    first.clear();
    EXPECT_TRUE(Selects(second, "a"));
    EXPECT_FALSE(Selects(first, "a"));
    first = Mode({"c"});
    Asked(first);
    second = first;
    EXPECT_FALSE(Selects(second, "a"));
    EXPECT_TRUE(Selects(second, "c"));
}

TEST(PATTERN_INDEX, WhatWasMovedAway_LeavesNothingBehind)
{
    PARTIAL_MODE first = Mode({"a key of more than a few bytes", "a prefix of more than a few bytes*"});
    Asked(first);
    PARTIAL_MODE second = std::move(first);
    EXPECT_TRUE(Selects(second, "a key of more than a few bytes"));
    first.clear();  // NOLINT(bugprone-use-after-move): what it may hold now is not said
    EXPECT_FALSE(Selects(first, "a key of more than a few bytes"));
    first = std::move(second);
    EXPECT_TRUE(Selects(first, "a prefix of more than a few bytes and what follows"));
    second.clear();  // NOLINT(bugprone-use-after-move)
    EXPECT_FALSE(Selects(second, "a prefix of more than a few bytes and what follows"));
}

TEST(PATTERN_INDEX, ModeThatIsAssignedToItself_AnswersAsItsSetsDo)
{
    PARTIAL_MODE mode = Mode({"a key of more than a few bytes", "a prefix of more than a few bytes*"});
    Asked(mode);
    PARTIAL_MODE& same = mode;
    mode = same;
    EXPECT_TRUE(Selects(mode, "a key of more than a few bytes"));
    mode = std::move(same);  // what it holds then is not said, but nothing of it may be gone
    mode.insert("b");
    EXPECT_TRUE(Selects(mode, "b"));
    EXPECT_EQ(mode.multi_contains("a key of more than a few bytes"),
              PARTIAL_MODE(mode).multi_contains("a key of more than a few bytes"));
}

// Whatever an assignment has changed by then, the answers are those of the sets as they are.
TEST(PATTERN_INDEX, AssignmentWithoutMemory_LeavesNoAnswersOfBefore)
{
    std::vector<std::string> const patterns{"a key of many bytes", "a prefix of many bytes*"};
    PARTIAL_MODE const other = Mode({"another key of many bytes", "another prefix of many bytes/*"});
    int const failures = FailEachAllocation(
        [&]
        {
            std::optional<PARTIAL_MODE> mode = ModeIfItCanBe(patterns);
            if (!mode)
                return;
            for (int i = 0; i < 10; ++i)
                EXPECT_FALSE(mode->multi_contains("nothing"));
            bool isAssigned = true;
            try
            {
                mode = other;
            }
            catch (std::bad_alloc const&)
            {
                isAssigned = false;
            }
            FailingAllocation::Stop();
            PARTIAL_MODE const copy = *mode;
            for (char const* const key : {"a key of many bytes", "another key of many bytes",
                                          "a prefix of many bytes", "another prefix of many bytes/"})
                EXPECT_EQ(mode->multi_contains(key), copy.multi_contains(key)) << key;
            EXPECT_TRUE(!isAssigned || mode->multi_contains("another key of many bytes"));
        },
        [](bool) {});
    EXPECT_GT(failures, 8);
}

TEST(PATTERN_INDEX, WithoutMemoryForATable_AnswersComeFromTheSets)
{
    std::vector<std::string> const patterns{"a key of many bytes", "a prefix of many bytes*"};
    std::string const key = "a key of many bytes";
    std::string const covered = "a prefix of many bytes and more";
    int const failures = FailEachAllocation(
        [&]
        {
            std::optional<PARTIAL_MODE> const mode = ModeIfItCanBe(patterns);
            for (int i = 0; mode && i < 10; ++i)
            {
                EXPECT_TRUE(mode->multi_contains(key));
                EXPECT_TRUE(mode->multi_contains(covered));
                EXPECT_FALSE(mode->multi_contains("another"));
            }
        },
        [](bool) {});
    EXPECT_GT(failures, 7);
}

// As many sizes as a table looks for, and one more.
TEST(PATTERN_INDEX, PrefixesOfSixteenAndSeventeenSizes_AreFound)
{
    for (std::size_t const sizes : {15u, 16u, 17u})
    {
        PARTIAL_MODE mode(nullptr);
        for (std::size_t size = 1; size <= sizes; ++size)
            mode.insert(std::string(size, static_cast<char>('A' + size)) + "*");
        for (std::size_t size = 1; size <= sizes; ++size)
        {
            char const letter = static_cast<char>('A' + size);
            EXPECT_TRUE(Selects(mode, std::string(size, letter) + "x")) << sizes;
            EXPECT_FALSE(Selects(mode, std::string(size - 1, letter) + "x")) << sizes;
        }
    }
}

// So many that each size cannot be looked for.
TEST(PATTERN_INDEX, PrefixesOfManySizes_AreFoundToo)
{
    PARTIAL_MODE mode(nullptr);
    for (std::size_t size = 1; size <= 40; ++size)
        mode.insert(std::string(size, static_cast<char>('A' + size)) + "*");
    mode.insert("whole");
    for (std::size_t size = 1; size <= 40; ++size)
    {
        char const letter = static_cast<char>('A' + size);
        EXPECT_TRUE(Selects(mode, std::string(size, letter) + "x"));
        EXPECT_FALSE(Selects(mode, std::string(size - 1, letter) + "x"));
    }
    EXPECT_TRUE(Selects(mode, "whole"));
}

// Bytes of which few differ, so that patterns begin alike, cover each other and hold zeros.
TEST(PATTERN_INDEX, RandomPatterns_SelectAsTheSetsDo)
{
    std::mt19937 random(20260101);
    auto const text = [&]
    {
        std::string result(random() % 2 ? 0 : 15, 'p');
        for (std::size_t size = random() % 6; size > 0; --size)
            result += "ab/\0"[random() % 4];
        return result;
    };
    for (int round = 0; round < 300; ++round)
    {
        PARTIAL_MODE mode(nullptr);
        PLAIN_MODE plain;
        for (int change = 0; change < 40; ++change)
        {
            std::string const pattern = text() + (random() % 2 ? "*" : "");
            bool const isRemoval = random() % 4 == 0;
            isRemoval ? mode.erase(pattern) : mode.insert(pattern);
            plain.Change(pattern, isRemoval);
            for (std::size_t i = random() % 60; i > 0; --i)
            {
                std::string const key = text();
                ASSERT_EQ(mode.multi_contains(key), plain.Selects(key)) << key;
            }
        }
    }
}

TEST(PATTERN_INDEX, ManyThreads_MayAskAtOnce)
{
    std::vector<std::string> patterns;
    for (int i = 0; i < 200; ++i)
        patterns.push_back("Job/" + std::to_string(i) + (i % 5 == 0 ? "/*" : ""));
    for (int round = 0; round < 20; ++round)
    {
        PARTIAL_MODE const mode = Mode(patterns);
        std::vector<int> selected(4);
        std::vector<std::thread> threads;
        for (int& count : selected)
            threads.emplace_back(
                [&]
                {
                    for (int i = 0; i < 1000; ++i)
                        count += mode.multi_contains("Job/" + std::to_string(i % 200)) ? 1 : 0;
                });
        for (std::thread& thread : threads)
            thread.join();
        for (int const count : selected)
            EXPECT_EQ(count, 800);
    }
}
