// Figures of the console end to end, the real lineprobe in tmux against vx7sim:
//  - start-up with the farm of 33 boards of 4 lines of 30 channels: time from launch to the
//    prompt, and the requests the relay answered meanwhile;
//  - events drawn per second with 10 phone views and 10 trunk views open: bursts of
//    bipolar-violation events on the 10 lines, timed until every row's counter shows the
//    burst's last value (a lost event would leave a counter short).
// Run: console_perf [events per line, default 2000]. Not a test: it asserts nothing.
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <thread>

#include "ConsoleScreen.h"
#include "SimServer.h"
#include "TerminalSession.h"

using namespace lineprobe::testing;
using Clock = std::chrono::steady_clock;

namespace {

long StatsField(const std::string& stats, const std::string& name) {
    const auto at = stats.find(" " + name + "=");
    return at == std::string::npos ? -1 : std::atol(stats.c_str() + at + name.size() + 2);
}

double Seconds(Clock::duration d) {
    return std::chrono::duration<double>(d).count();
}

}  // namespace

int main(int argc, char** argv) {
    const int perLine = argc > 1 ? std::atoi(argv[1]) : 2000;
    const std::string farm = LINEPROBE_FARMS_DIR "/big33.toml";
    SimServer sim(farm);
    if (!sim.Running()) {
        std::fprintf(stderr, "vx7sim did not start\n");
        return 1;
    }

    TerminalOptions options;
    options.env.emplace_back("REMOTE_TKHOST", sim.Address());
    options.env.emplace_back("VX7_FARM", farm);
    const std::string before = sim.Control("stats");
    const auto launched = Clock::now();
    TerminalSession session(options);
    if (!session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT, std::chrono::seconds(60))) {
        std::fprintf(stderr, "no prompt\n%s\n", session.Dump().c_str());
        return 1;
    }
    const double startup = Seconds(Clock::now() - launched);
    const std::string after = sim.Control("stats");
    std::printf("start-up, 33 boards x 4 lines x 30 channels: %.3f s to the prompt, %ld requests\n",
                startup, StatsField(after, "requests") - StatsField(before, "requests"));

    CommandRunner commands(session);
    for (int board = 0; board < 10; ++board) {
        const std::string b = std::to_string(board);
        if (!commands.Run("phone " + b + " 1 1") || !commands.Run("trunk " + b + " 2")) {
            std::fprintf(stderr, "views not opened\n%s\n", session.Dump().c_str());
            return 1;
        }
    }

    const std::string eventsBefore = sim.Control("stats");
    const auto start = Clock::now();
    for (int board = 0; board < 10; ++board) {
        sim.Control("bpv " + std::to_string(board) + " 2 " + std::to_string(perLine));
    }
    const std::string last = std::to_string(perLine);
    bool all = false;
    while (!all && Clock::now() - start < std::chrono::seconds(120)) {
        all = true;
        for (int row = 1; row <= 9 && all; ++row) {
            all = session.TextAt(TRUNK_ROW0 + row, WINDOW_COL0 + 85, last.size()) == last;
        }
        if (!all) {
            std::this_thread::sleep_for(std::chrono::milliseconds(5));
        }
    }
    const double drawn = Seconds(Clock::now() - start);
    const std::string eventsAfter = sim.Control("stats");
    const long events = StatsField(eventsAfter, "events") - StatsField(eventsBefore, "events");
    if (!all) {
        std::fprintf(stderr, "rows did not reach %d\n%s\n", perLine, session.Dump().c_str());
        return 1;
    }
    // The tenth trunk row lies below the window: its counter is checked by the others'.
    std::printf(
        "events: %ld sent, every visible row at its last value after %.3f s: %.0f events/s\n",
        events, drawn, static_cast<double>(events) / drawn);
    return session.StillRunning() ? 0 : 1;
}
