// The two logs, std::cout and std::cerr redirected to their files, which every thread writes;
// the display lock, and the shutdown that must get past it: the shutdown runs in a signal
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
#include <iostream>
#include <set>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

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

std::string Slurp(const std::filesystem::path& path) {
    std::ifstream file(path);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

// A fresh directory for the log files of one test, and std::cout and std::cerr put back on the
// buffers they had, whatever the test redirected them to.
class LogsTest : public ::testing::Test {
  protected:
    void SetUp() override {
        std::string pattern = (std::filesystem::temp_directory_path() / "lp-logs-XXXXXX").string();
        ASSERT_NE(mkdtemp(pattern.data()), nullptr);
        dir_ = pattern;
        out_ = dir_ / "lineprobe.log";
        err_ = dir_ / "lineprobe_err.log";
        savedCout_ = std::cout.rdbuf();
        savedCerr_ = std::cerr.rdbuf();
    }
    void TearDown() override {
        std::cout.rdbuf(savedCout_);
        std::cerr.rdbuf(savedCerr_);
        std::filesystem::remove_all(dir_);
    }

    std::filesystem::path dir_;
    std::filesystem::path out_;
    std::filesystem::path err_;
    std::streambuf* savedCout_ = nullptr;
    std::streambuf* savedCerr_ = nullptr;
};

TEST_F(LogsTest, CoutAndCerrGoToTheirOwnTruncatedFiles) {
    std::ofstream(out_) << "left over from the last run\n";

    ASSERT_TRUE(Redirect(std::cout, out_.c_str()));
    ASSERT_TRUE(Redirect(std::cerr, err_.c_str()));
    std::cout << "first line" << std::endl;
    std::cerr << "an error" << std::endl;

    EXPECT_EQ(Slurp(out_), "first line\n");
    EXPECT_EQ(Slurp(err_), "an error\n");
    EXPECT_EQ(sbuf_cout, savedCout_);
    EXPECT_EQ(sbuf_cerr, savedCerr_);
}

TEST_F(LogsTest, OtherStreamsAndUnopenableFilesAreRefused) {
    std::ostringstream other;
    const std::filesystem::path log = dir_ / "other.log";
    EXPECT_FALSE(Redirect(other, log.c_str()));
    EXPECT_FALSE(Redirect(std::clog, log.c_str()));
    EXPECT_FALSE(std::filesystem::exists(log));

    EXPECT_FALSE(Redirect(std::cout, (dir_ / "no-such-dir" / "lineprobe.log").c_str()));
    EXPECT_EQ(std::cout.rdbuf(), savedCout_);
}

constexpr int kWriters = 6;
constexpr int kLinesEach = 4000;

// The line that writer `w` writes as its `i`-th, of a length that varies from line to line.
std::string WrittenLine(const std::string& tag, int w, int i) {
    return tag + " writer " + std::to_string(w) + " line " + std::to_string(i) + " " +
           std::string(static_cast<std::size_t>(1 + (i * 7 + w) % 90), 'x') + " end";
}

// Every line of the file must be one that a writer wrote, whole, and each exactly once.
void ExpectEveryLineOnce(const std::filesystem::path& log, const std::string& tag) {
    std::set<std::string> unseen;
    for (int w = 0; w < kWriters; ++w) {
        for (int i = 0; i < kLinesEach; ++i) {
            unseen.insert(WrittenLine(tag, w, i));
        }
    }
    std::ifstream file(log);
    int wrong = 0;
    for (std::string line; std::getline(file, line);) {
        if (unseen.erase(line) == 0 && ++wrong <= 3) {
            ADD_FAILURE() << log.filename() << ": torn or repeated line \"" << line << "\"";
        }
    }
    EXPECT_EQ(wrong, 0) << log.filename();
    EXPECT_TRUE(unseen.empty()) << log.filename() << ": " << unseen.size() << " lines missing";
}

// Threads trace as the reader threads and the main thread do: each line in several pieces,
// ended by std::endl (cout) or '\n' on a unit-buffered stream (cerr), all at once.
TEST_F(LogsTest, LinesFromManyThreadsComeOutWholeAndExactlyOnce) {
    ASSERT_TRUE(Redirect(std::cout, out_.c_str()));
    ASSERT_TRUE(Redirect(std::cerr, err_.c_str()));

    std::vector<std::thread> writers;
    for (int w = 0; w < kWriters; ++w) {
        writers.emplace_back([w] {
            for (int i = 0; i < kLinesEach; ++i) {
                const std::string filler(static_cast<std::size_t>(1 + (i * 7 + w) % 90), 'x');
                std::cout << "trace writer " << w << " line " << i << " " << filler << " end"
                          << std::endl;
                std::cerr << "error writer " << w << " line " << i << " " << filler << " end"
                          << '\n';
            }
        });
    }
    for (std::thread& writer : writers) {
        writer.join();
    }
    std::cout.rdbuf(savedCout_);
    std::cerr.rdbuf(savedCerr_);

    ExpectEveryLineOnce(out_, "trace");
    ExpectEveryLineOnce(err_, "error");
}

// A line begun but not ended when its thread finishes is neither lost nor spliced into the
// next line that another thread writes.
TEST_F(LogsTest, UnfinishedLineOfAnEndedThreadIsWrittenWhole) {
    ASSERT_TRUE(Redirect(std::cout, out_.c_str()));

    std::thread([] { std::cout << "begun " << 1 << " but never ended"; }).join();
    std::cout << "main thread line" << std::endl;
    std::cout.rdbuf(savedCout_);

    EXPECT_EQ(Slurp(out_), "begun 1 but never ended\nmain thread line\n");
}

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

using ShutdownTest = LogsTest;

TEST_F(ShutdownTest, LogsTheCauseAndExitsWithOne) {
    for (const auto& [sig, name] : {std::pair{SIGINT, "SIGINT"}, std::pair{SIGTERM, "SIGTERM"},
                                    std::pair{SIGUSR1, "SIGUSR1"}, std::pair{SIGHUP, "SIGHUP"}}) {
        EXPECT_EXIT(
            {
                Redirect(std::cout, out_.c_str());
                g_curDisplay = ConsoleDisplay::GetDisplay();
                terminate_app(sig);
            },
            ::testing::ExitedWithCode(1), "");
        EXPECT_EQ(Slurp(out_), std::string("terninating app due to ") + name + "\n");
    }
}

TEST_F(ShutdownTest, RaisedSignalEndsTheProcessBeforeRaiseReturns) {
    EXPECT_EXIT(
        {
            Redirect(std::cout, out_.c_str());
            signal(SIGUSR1, terminate_app);
            raise(SIGUSR1);
            std::cout << "raise returned" << std::endl;
            std::exit(0);
        },
        ::testing::ExitedWithCode(1), "");
    EXPECT_EQ(Slurp(out_), "terninating app due to SIGUSR1\n");
}

TEST_F(ShutdownTest, DoesNotHangWhenAnotherThreadKeepsTheScreen) {
    EXPECT_EXIT(
        {
            Redirect(std::cout, out_.c_str());
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
    EXPECT_EQ(Slurp(out_), "terninating app due to SIGTERM\n");
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
