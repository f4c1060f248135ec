// The shutdown's watchdog cuts a stop that makes no progress, and only such a stop.
#include "console/ShutdownWatchdog.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <cstdlib>
#include <thread>

namespace lineprobe {
namespace {

std::atomic<unsigned long> g_steps{0};

unsigned long Steps() {
    return g_steps.load();
}

[[noreturn]] void Overdue() {
    _exit(7);
}

TEST(ShutdownWatchdog, SlowStepsLongerThanTheLimitInAllAreNotCut) {
    EXPECT_EXIT(
        {
            StartShutdownWatchdog(3, Steps, Overdue);
            // Five seconds in all, one step every half second.
            for (int step = 0; step < 10; ++step) {
                std::this_thread::sleep_for(std::chrono::milliseconds(500));
                ++g_steps;
            }
            std::exit(0);
        },
        ::testing::ExitedWithCode(0), "");
}

TEST(ShutdownWatchdog, AStopWithoutProgressEndsAfterTheLimit) {
    EXPECT_EXIT(
        {
            StartShutdownWatchdog(2, Steps, Overdue);
            ++g_steps;
            const auto start = std::chrono::steady_clock::now();
            while (std::chrono::steady_clock::now() - start < std::chrono::seconds(10)) {
                std::this_thread::sleep_for(std::chrono::milliseconds(100));
            }
            std::exit(0);
        },
        ::testing::ExitedWithCode(7), "");
}

}  // namespace
}  // namespace lineprobe
