// The display lock, and the shutdown that must get past it: the shutdown runs in a signal
// handler, on whichever thread got the signal, and must end the process with status 1 even
// when another thread keeps the screen; its watchdog cuts a stop that makes no progress, and
// only such a stop.
#include <gtest/gtest.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <future>
#include <sstream>
#include <string>
#include <thread>

#include "console/ConsoleDisplay.h"
#include "console/DisplayGuard.h"
#include "console/Lifecycle.h"
#include "console/Redirect.h"
#include "console/ShutdownWatchdog.h"

// The shutdown runs whole inside the signal handler, curses and exit included, by design;
// the thread checker would report each of those calls.
extern "C" const char* __tsan_default_options() {
    return "report_signal_unsafe=0";
}

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

TEST(DisplayGuard, NestsOnOneThreadAndKeepsOtherThreadsOutWhileHeld) {
    std::atomic<bool> entered{false};
    std::thread other;
    {
        // Nested, so that a whole row can be held across its prints and refresh.
        DisplayGuard row;
        DisplayGuard print;
        EXPECT_TRUE(row.Owns());
        EXPECT_TRUE(print.Owns());
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

class ShutdownTest : public ::testing::Test {
  protected:
    void SetUp() override {
        std::string pattern = (std::filesystem::temp_directory_path() / "lp-shut-XXXXXX").string();
        ASSERT_NE(mkdtemp(pattern.data()), nullptr);
        dir_ = pattern;
        log_ = dir_ / "lineprobe.log";
    }
    void TearDown() override { std::filesystem::remove_all(dir_); }

    std::string Log() const {
        std::ifstream file(log_);
        std::ostringstream text;
        text << file.rdbuf();
        return text.str();
    }

    std::filesystem::path dir_;
    std::filesystem::path log_;
};

TEST_F(ShutdownTest, LogsTheCauseAndExitsWithOne) {
    for (const auto& [sig, name] : {std::pair{SIGINT, "SIGINT"}, std::pair{SIGTERM, "SIGTERM"},
                                    std::pair{SIGUSR1, "SIGUSR1"}, std::pair{SIGHUP, "SIGHUP"}}) {
        EXPECT_EXIT(
            {
                Redirect(std::cout, log_.c_str());
                g_curDisplay = ConsoleDisplay::GetDisplay();
                terminate_app(sig);
            },
            ::testing::ExitedWithCode(1), "");
        EXPECT_EQ(Log(), std::string("terninating app due to ") + name + "\n");
    }
}

TEST_F(ShutdownTest, RaisedSignalEndsTheProcessBeforeRaiseReturns) {
    EXPECT_EXIT(
        {
            Redirect(std::cout, log_.c_str());
            signal(SIGUSR1, terminate_app);
            raise(SIGUSR1);
            std::cout << "raise returned" << std::endl;
            std::exit(0);
        },
        ::testing::ExitedWithCode(1), "");
    EXPECT_EQ(Log(), "terninating app due to SIGUSR1\n");
}

TEST_F(ShutdownTest, DoesNotHangWhenAnotherThreadKeepsTheScreen) {
    EXPECT_EXIT(
        {
            Redirect(std::cout, log_.c_str());
            g_curDisplay = ConsoleDisplay::GetDisplay();
            std::promise<void> held;
            std::thread keeper([&held] {
                DisplayGuard guard;
                held.set_value();
                for (;;) {
                    pause();
                }
            });
            held.get_future().wait();
            keeper.detach();
            terminate_app(SIGTERM);
        },
        ::testing::ExitedWithCode(1), "");
    EXPECT_EQ(Log(), "terninating app due to SIGTERM\n");
}

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
            StartShutdownWatchdog(2, Steps, Overdue);
            // Three seconds in all, one step every half second.
            for (int step = 0; step < 6; ++step) {
                std::this_thread::sleep_for(500ms);
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
            while (std::chrono::steady_clock::now() - start < 10s) {
                std::this_thread::sleep_for(100ms);
            }
            std::exit(0);
        },
        ::testing::ExitedWithCode(7), "");
}

}  // namespace
}  // namespace lineprobe
