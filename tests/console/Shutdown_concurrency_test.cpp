// The shutdown runs in a signal handler, on whichever thread got the signal, and must
// end the process with status 1 even when another thread keeps the screen.
#include <gtest/gtest.h>
#include <unistd.h>

#include <csignal>
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

// The shutdown runs whole inside the signal handler, curses and exit included, by design;
// the thread checker would report each of those calls.
extern "C" const char* __tsan_default_options() {
    return "report_signal_unsafe=0";
}

namespace {

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

struct SignalCase {
    int sig;
    const char* line;
};

void PrintTo(const SignalCase& c, std::ostream* os) {
    *os << c.line;
}

class ShutdownLineTest : public ShutdownTest, public ::testing::WithParamInterface<SignalCase> {};

TEST_P(ShutdownLineTest, LogsTheCauseAndExitsWithOne) {
    const SignalCase c = GetParam();
    EXPECT_EXIT(
        {
            lineprobe::Redirect(std::cout, log_.c_str());
            g_curDisplay = lineprobe::ConsoleDisplay::GetDisplay();
            terminate_app(c.sig);
        },
        ::testing::ExitedWithCode(1), "");
    EXPECT_EQ(Log(), std::string(c.line) + "\n");
}

INSTANTIATE_TEST_SUITE_P(Signals, ShutdownLineTest,
                         ::testing::Values(SignalCase{SIGINT, "terninating app due to SIGINT"},
                                           SignalCase{SIGTERM, "terninating app due to SIGTERM"},
                                           SignalCase{SIGUSR1, "terninating app due to SIGUSR1"},
                                           SignalCase{SIGHUP, "terninating app due to SIGHUP"}));

TEST_F(ShutdownTest, RaisedSignalEndsTheProcessBeforeRaiseReturns) {
    EXPECT_EXIT(
        {
            lineprobe::Redirect(std::cout, log_.c_str());
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
            lineprobe::Redirect(std::cout, log_.c_str());
            g_curDisplay = lineprobe::ConsoleDisplay::GetDisplay();
            std::promise<void> held;
            std::thread keeper([&held] {
                lineprobe::DisplayGuard guard;
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

}  // namespace
