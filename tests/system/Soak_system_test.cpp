// Soak: the real lineprobe in a terminal against vx7sim on the loopback interface, 10 phone
// views and 10 trunk views open, while vx7sim plays calls, alarms, error bursts and line
// state changes on all of them and the operator releases calls at the prompt. Afterwards
// every visible row must show the last state vx7sim sent for it, the prompt must answer,
// memory must have stayed flat after the first seconds, and the error log must be clean.
//
// LINEPROBE_SOAK_SECONDS lengthens the drive (default 25, 20 under a sanitizer),
// LINEPROBE_SOAK_SEED changes the sequence; scripts/soak runs the long form.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <cstdio>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include "SimServer.h"
#include "SystemRun.h"
#include "TerminalSession.h"

namespace lineprobe::testing {
namespace {

const std::string FARM = LINEPROBE_FARMS_DIR "/big33.toml";
constexpr int VIEWS = 10;
// Memory the process may gain once the views are open and the storm has run 10 s: room
// for allocator noise, far below what a leak of one block per event would add.
constexpr long RSS_GROWTH_BOUND_KIB = 1024;
// The error counters are four columns wide.
constexpr long COUNTER_CAP = 9000;

struct AlarmColumn {
    const char* name;
    int col;
    // "Sig" and "DChan" show that the signal or the D channel is good, so an alarm
    // blanks them where the other columns show X.
    bool inverted;
};

constexpr std::array<AlarmColumn, 7> ALARMS{{{"red", 54, false},
                                             {"yellow", 60, false},
                                             {"ais", 72, false},
                                             {"los", 42, true},
                                             {"loopback", 48, false},
                                             {"raicrc", 66, false},
                                             {"dchan", 78, true}}};

struct TrunkExpect {
    std::array<bool, ALARMS.size()> alarm{};
    long bpv = 0;
    long ferr = 0;
    bool inService = true;
};

// Releasing: the operator typed release; vx7sim is told nothing about the channel until
// its row shows that the call is gone. The tenth phone's row is below the window, so its
// call is never released.
enum class CallExpect { Null, Offered, Disconnected, Releasing };

const char* CallText(CallExpect c) {
    switch (c) {
        case CallExpect::Offered:
            return "Offered";
        case CallExpect::Disconnected:
            return "Disconnected";
        default:
            return "Null";  // after a release
    }
}

long StatsField(const std::string& stats, const std::string& name) {
    const auto at = stats.find(" " + name + "=");
    return at == std::string::npos ? -1 : std::atol(stats.c_str() + at + name.size() + 2);
}

std::string Field(const std::string& row, int col, std::size_t length) {
    if (static_cast<std::size_t>(col) >= row.size()) {
        return {};
    }
    std::string text = row.substr(static_cast<std::size_t>(col), length);
    text.erase(text.find_last_not_of(' ') + 1);
    return text;
}

// " name 'got' want 'want'" where they differ, nothing where they agree.
std::string Diff(const std::string& name, const std::string& got, const std::string& want) {
    return got == want ? "" : " " + name + " '" + got + "' want '" + want + "'";
}

// What a trunk row should read; empty when it does.
std::string TrunkMismatch(const std::string& row, const TrunkExpect& want) {
    std::string why = Diff("state", Field(row, WINDOW_COL0 + 8, 15),
                           want.inService ? "InService" : "Out of Service");
    for (std::size_t i = 0; i < ALARMS.size(); ++i) {
        const bool marked = row[static_cast<std::size_t>(WINDOW_COL0 + ALARMS[i].col)] == 'X';
        if (marked != (want.alarm[i] != ALARMS[i].inverted)) {
            why += std::string(" ") + ALARMS[i].name + (want.alarm[i] ? " on" : " off");
        }
    }
    return why + Diff("bpv", Field(row, WINDOW_COL0 + 85, 4), std::to_string(want.bpv)) +
           Diff("ferr", Field(row, WINDOW_COL0 + 92, 4), std::to_string(want.ferr));
}

// What a phone row should read; empty when it does. An offered call came in; a far-end
// hang-up ends it normally.
std::string PhoneMismatch(const std::string& row, CallExpect call) {
    const char* reason = call == CallExpect::Offered        ? "IncomingCall"
                         : call == CallExpect::Disconnected ? "Normal"
                                                            : nullptr;
    return Diff("state", Field(row, WINDOW_COL0 + 47, 20), CallText(call)) +
           (reason != nullptr ? Diff("reason", Field(row, WINDOW_COL0 + 70, 25), reason) : "");
}

TEST(Soak, TenPhoneAndTenTrunkViewsUnderAnEventStorm) {
    const auto driveFor =
        std::chrono::seconds(EnvNumber("LINEPROBE_SOAK_SECONDS", UNDER_SANITIZER ? 20 : 25));
    std::mt19937 random(static_cast<unsigned>(EnvNumber("LINEPROBE_SOAK_SEED", 8)));

    SimServer sim(FARM);
    ASSERT_TRUE(sim.Running());
    TerminalSession session(ThroughRelay(sim, FARM));
    ASSERT_TRUE(session.WaitForTextAt(PROMPT_ROW, PROMPT_COL, PROMPT, std::chrono::seconds(60)))
        << session.Dump();
    const pid_t pid = session.Pid();
    ASSERT_EQ(ProcessName(pid), "lineprobe");

    // Phones on trunk 2 and trunk views of trunk 1, so that a line taken out of service
    // ends no call the phones' rows are expected to show.
    CommandRunner commands(session);
    for (int board = 0; board < VIEWS; ++board) {
        const std::string b = std::to_string(board);
        ASSERT_TRUE(commands.Run("phone " + b + " 2 1", std::chrono::seconds(30)).returned)
            << session.Dump();
        ASSERT_EQ(commands.Result(), "phone view creaed successfully") << session.Dump();
        ASSERT_TRUE(commands.Run("trunk " + b + " 1", std::chrono::seconds(30)).returned)
            << session.Dump();
        ASSERT_EQ(commands.Result(), "trunk view creaed successfully") << session.Dump();
    }
    ASSERT_TRUE(session.WaitForTextAt(TRUNK_ROW0 + 9, WINDOW_COL0 + 8, "InService"))
        << session.Dump();

    std::vector<TrunkExpect> trunks(VIEWS);
    std::vector<CallExpect> phones(VIEWS, CallExpect::Null);
    auto control = [&](const std::string& line) {
        const std::string answer = sim.Control(line);
        EXPECT_EQ(answer.rfind("ok", 0), 0u) << line << ": " << answer;
        return answer.rfind("ok", 0) == 0;
    };

    const std::string statsBefore = sim.Control("stats");
    const auto start = Clock::now();
    std::optional<long> baseline;
    long peak = 0;
    auto lastSample = start;
    long operations = 0;
    long typed = 0;
    // One release at a time: each holds the prompt for the 1 s a refusal may take, so
    // typing faster would only queue lines.
    Clock::time_point lastRelease;
    while (Clock::now() - start < driveFor && !::testing::Test::HasFailure()) {
        const int view = static_cast<int>(random() % VIEWS);
        const std::string b = std::to_string(view);
        const unsigned pick = random() % 10;
        if (pick < 2) {
            CallExpect& call = phones[static_cast<std::size_t>(view)];
            // A released phone is used again once its row shows the call gone.
            if (call == CallExpect::Releasing &&
                Field(session.Row(PHONE_ROW0 + 1 + view), WINDOW_COL0 + 47, 20) == "Null") {
                call = CallExpect::Null;
            }
            if (call == CallExpect::Null) {
                control("call " + b + " 2 1 5550" + std::to_string(1000 + operations % 9000));
                call = CallExpect::Offered;
            } else if (call == CallExpect::Offered) {
                control("hangup " + b + " 2 1");
                call = CallExpect::Disconnected;
            } else if (call == CallExpect::Disconnected && view < VIEWS - 1 &&
                       Clock::now() - lastRelease > std::chrono::seconds(1)) {
                // The operator clears the call while the storm goes on.
                commands.TypeOnly("release " + b + " 2 1");
                lastRelease = Clock::now();
                ++typed;
                call = CallExpect::Releasing;
            }
        } else {
            TrunkExpect& trunk = trunks[static_cast<std::size_t>(view)];
            if (pick < 7) {
                const std::size_t a = random() % ALARMS.size();
                trunk.alarm[a] = !trunk.alarm[a];
                control("alarm " + b + " 1 " + ALARMS[a].name + (trunk.alarm[a] ? " on" : " off"));
            } else if (pick < 9) {
                const long n = 1 + static_cast<long>(random() % 40);
                long& counter = pick == 7 ? trunk.bpv : trunk.ferr;
                if (counter + n <= COUNTER_CAP) {
                    control((pick == 7 ? "bpv " : "ferr ") + b + " 1 " + std::to_string(n));
                    counter += n;
                }
            } else {
                trunk.inService = !trunk.inService;
                control("line " + b + " 1 " + (trunk.inService ? "in 0" : "out 3"));
            }
        }
        ++operations;
        const auto now = Clock::now();
        if (now - lastSample >= std::chrono::milliseconds(500)) {
            lastSample = now;
            const std::optional<long> rss = RssKiB(pid);
            ASSERT_TRUE(rss.has_value()) << "lineprobe is gone\n" << session.Dump();
            if (now - start >= std::chrono::seconds(10)) {
                if (!baseline) {
                    baseline = *rss;
                }
                peak = std::max(peak, *rss);
            }
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
    }
    ASSERT_FALSE(::testing::Test::HasFailure());
    const double drove = std::chrono::duration<double>(Clock::now() - start).count();

    // Every visible row comes to the last state sent; the tenth row of each window lies
    // below it and is not on the screen.
    std::string mismatch;
    const auto settle = Clock::now();
    do {
        mismatch.clear();
        const std::vector<std::string> screen = session.Screen();
        for (int view = 0; view < VIEWS - 1; ++view) {
            const auto v = static_cast<std::size_t>(view);
            const std::string trunk = TrunkMismatch(screen[TRUNK_ROW0 + 1 + v], trunks[v]);
            const std::string phone = PhoneMismatch(screen[PHONE_ROW0 + 1 + v], phones[v]);
            if (!trunk.empty()) {
                mismatch += "trunk " + std::to_string(view) + ".1:" + trunk + "\n";
            }
            if (!phone.empty()) {
                mismatch += "phone " + std::to_string(view) + ".2.1:" + phone + "\n";
            }
        }
        if (!mismatch.empty()) {
            std::this_thread::sleep_for(std::chrono::milliseconds(100));
        }
    } while (!mismatch.empty() && Clock::now() - settle < std::chrono::seconds(30));
    const double settled = std::chrono::duration<double>(Clock::now() - settle).count();
    EXPECT_EQ(mismatch, "") << session.Dump();

    // The prompt still answers, once every line typed during the storm has run.
    const CommandRunner::Outcome answer = commands.Run("bogus", std::chrono::seconds(60));
    ASSERT_TRUE(answer.returned) << session.Dump();
    EXPECT_EQ(commands.Result(), "Unrecgnized Command");
    EXPECT_TRUE(session.StillRunning());

    const std::string statsAfter = sim.Control("stats");
    const long events = StatsField(statsAfter, "events") - StatsField(statsBefore, "events");
    const std::optional<long> rssEnd = RssKiB(pid);
    ASSERT_TRUE(baseline.has_value()) << "the drive ended before 10 s";
    ASSERT_TRUE(rssEnd.has_value());
    peak = std::max(peak, *rssEnd);
    if (!UNDER_SANITIZER) {
        EXPECT_LE(peak - *baseline, RSS_GROWTH_BOUND_KIB)
            << "RSS " << *baseline << " KiB at 10 s, peak " << peak << " KiB";
    }

    const std::optional<std::string> errors = session.ReadErrLog();
    ASSERT_TRUE(errors.has_value());
    EXPECT_EQ(*errors, "") << "unexpected lines in lineprobe_err.log";

    std::printf(
        "soak: %.1f s, %ld control operations, %ld releases typed, "
        "%ld events (%.0f/s), rows settled %.2f s after the storm; RSS %ld KiB at 10 s, "
        "peak %ld KiB, %ld KiB at the end\n",
        drove, operations, typed, events, static_cast<double>(events) / drove, settled, *baseline,
        peak, *rssEnd);
    RecordProperty("events", static_cast<int>(events));
    RecordProperty("rss_growth_kib", static_cast<int>(peak - *baseline));
}

}  // namespace
}  // namespace lineprobe::testing
