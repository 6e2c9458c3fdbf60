#include "comgui/testing/TemporaryFolder.h"
#include "tests/corefoundation/Held.h"
#include "tests/corefoundation/UUIDTexts.h"
#include "tests/support/BundleOnDisk.h"

#include <atomic>
#include <functional>
#include <gtest/gtest.h>
#include <latch>
#include <thread>
#include <vector>

using comgui::test::TemporaryFolder;

namespace
{
constexpr int threadCount = 4;
constexpr int rounds = 200;

// Runs work rounds times in each of several threads that start together.
void Together(std::function<void()> const& work)
{
    std::latch start(threadCount);
    std::vector<std::thread> threads;
    threads.reserve(threadCount);
    for (int thread = 0; thread < threadCount; ++thread)
    {
        threads.emplace_back(
            [&]
            {
                start.arrive_and_wait();
                for (int round = 0; round < rounds; ++round)
                    work();
            });
    }
    for (auto& thread : threads)
        thread.join();
}

class Threads : public testing::Test
{
protected:
    Threads()
    {
        bundle.LinkExecutable(COMGUI_TEST_PLUGIN);
        bundle.AddFactory(typeA, factory1, "StatelessFactory");
    }

    TemporaryFolder const folder;
    BundleOnDisk bundle{folder.Path()};
    std::atomic<int> failures{0};
};

TEST_F(Threads, RetainingAndReleasingOneObject_LeaveItWithItsOwner)
{
    auto const text = MakeString(typeA);
    Together([&] { CFRelease(CFRetain(text.get())); });
    EXPECT_TRUE(Held<CFUUIDRef>(CFUUIDCreateFromString(kCFAllocatorDefault, text.get())));
}

TEST_F(Threads, OpeningUsingAndClosingOneBundle_EachGetAnInstance)
{
    Together(
        [&]
        {
            auto const plugIn = OpenPlugIn(bundle.Path());
            if (!FactoriesOf(plugIn, typeA) || MakeInstance(factory1, typeA) == nullptr)
                ++failures;
        });
    EXPECT_EQ(failures, 0);
    EXPECT_EQ(MakeInstance(factory1, typeA), nullptr);
}

TEST_F(Threads, FirstInstancesAskedForAtOnce_ComeFromOneImage)
{
    auto const plugIn = OpenPlugIn(bundle.Path());
    std::atomic<void*> seen{nullptr};
    Together(
        [&]
        {
            void* const instance = MakeInstance(factory1, typeA);
            void* const before = seen.exchange(instance);
            if (instance == nullptr || (before != nullptr && before != instance))
                ++failures;
        });
    EXPECT_EQ(failures, 0);
}

TEST_F(Threads, BundleThatClosesWhileOthersAskForItsFactory_ServesOrIsGone)
{
    auto const lasting = OpenPlugIn(bundle.Path());
    BundleOnDisk passing(folder.Path(), "Passing.Bundle");
    passing.LinkExecutable(COMGUI_TEST_PLUGIN);
    passing.AddFactory(typeA, factory1, "StatelessFactory");
    std::atomic<bool> done{false};
    std::thread asking(
        [&]
        {
            while (!done)
            {
                if (MakeInstance(factory1, typeA) == nullptr)  // one bundle or the other has it at any time
                    ++failures;
            }
        });
    Together([&] { OpenPlugIn(passing.Path()).reset(); });
    done = true;
    asking.join();
    EXPECT_EQ(failures, 0);
}
}  // namespace
