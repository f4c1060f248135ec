#include "console/DisplayGuard.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <future>
#include <thread>

namespace lineprobe {
namespace {

using namespace std::chrono_literals;

// Holds the display lock on a thread of its own until released.
class Holder {
  public:
    Holder()
        : thread_([this] {
              DisplayGuard guard;
              held_.set_value();
              release_.get_future().wait();
          }) {
        held_.get_future().wait();
    }
    ~Holder() {
        release_.set_value();
        thread_.join();
    }

  private:
    std::promise<void> held_;
    std::promise<void> release_;
    std::thread thread_;
};

TEST(DisplayGuard, NestsOnOneThreadSoAWholeRowCanBeHeld) {
    DisplayGuard row;
    DisplayGuard print;
    DisplayGuard refresh;
    EXPECT_TRUE(row.Owns());
    EXPECT_TRUE(print.Owns());
    EXPECT_TRUE(refresh.Owns());
}

TEST(DisplayGuard, KeepsOtherThreadsOutWhileHeld) {
    std::atomic<bool> entered{false};
    std::thread other;
    {
        DisplayGuard guard;
        other = std::thread([&] {
            DisplayGuard inner;
            entered = true;
        });
        std::this_thread::sleep_for(50ms);
        EXPECT_FALSE(entered.load());
    }
    other.join();
    EXPECT_TRUE(entered.load());
}

TEST(DisplayGuard, BoundedWaitGivesUpAndTheThreadGoesOnWithoutTheLock) {
    Holder holder;
    // Run on a fresh thread: giving up marks the thread for good.
    std::async(std::launch::async, [] {
        const auto start = std::chrono::steady_clock::now();
        DisplayGuard bounded(100ms);
        EXPECT_FALSE(bounded.Owns());
        EXPECT_GE(std::chrono::steady_clock::now() - start, 100ms);
        // Had this one blocked, the test would hang: the holder never lets go meanwhile.
        DisplayGuard later;
        EXPECT_FALSE(later.Owns());
    }).get();
}

TEST(DisplayGuard, BoundedWaitSucceedsOnceTheHolderLetsGo) {
    auto holder = std::make_unique<Holder>();
    auto waiter = std::async(std::launch::async, [] {
        DisplayGuard bounded(10s);
        return bounded.Owns();
    });
    std::this_thread::sleep_for(20ms);
    holder.reset();
    EXPECT_TRUE(waiter.get());
}

}  // namespace
}  // namespace lineprobe
