// A million notifications from four threads at once, while the queue is drained.
#include "tests/session/NotificationQueue.h"

#include <array>
#include <atomic>
#include <thread>

namespace
{
constexpr int Threads = 4;
constexpr int PerThread = 250000;

using Flood = NotificationQueue;
}  // namespace

TEST_F(Flood, OfAMillionNotificationsFromFourThreads_LosesNoneAndKeepsEachThreadsOrder)
{
    std::atomic<int> writing{Threads};
    std::vector<std::thread> threads;
    for (int thread = 0; thread < Threads; ++thread)
        threads.emplace_back(
            [&writing, thread]
            {
                for (int number = 0; number < PerThread; ++number)
                {
                    SETMULTIPAR table[] = {Record("Key", PARAM_INT, &number, -1), {}};
                    ComGUIManager::fGUI2NOTIFICATION(nullptr, 1, thread, 0, 3, table);
                }
                --writing;
            });

    std::array<int, Threads> next = {};
    int outOfOrder = 0;
    bool wasLast = false;
    while (!wasLast)
    {
        wasLast = writing == 0;  // before the take: what came until then is in it
        for (auto const& notification : TakeNotifications())
        {
            int& expected = next.at(static_cast<std::size_t>(notification->NotifArgA));
            if (notification->NotifNumber != expected++)
                ++outOfOrder;
        }
    }
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(outOfOrder, 0);
    EXPECT_EQ(next, (std::array{PerThread, PerThread, PerThread, PerThread}));
    EXPECT_EQ(Size(), 0u);
}
