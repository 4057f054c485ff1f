// The mutex of the platform layer.

#include "zvplat/quarks/synchronization.h"

#include <atomic>
#include <gtest/gtest.h>
#include <thread>

namespace {

TEST(Mutex, CanBeTakenTwiceOnOneThreadAndExcludesAnother)
{
    tMutex mutex;
    ASSERT_TRUE(mutex.isCreated());
    std::atomic<bool> entered{false};
    std::thread other;
    {
        const tMutexGuard outer(mutex);
        {
            const tMutexGuard inner(mutex);
        }
        other = std::thread([&] {
            const tMutexGuard guard(mutex);
            entered = true;
        });
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
        EXPECT_FALSE(entered) << "one release of two does not free it";
    }
    other.join();
    EXPECT_TRUE(entered);
}

} // namespace
