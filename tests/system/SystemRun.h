#pragma once

// Helpers shared by the whole-tool runs: how lineprobe is started against vx7sim, the
// resident memory of the lineprobe process, and settings that lengthen a run by hand.
#include <sys/types.h>

#include <chrono>
#include <cstdlib>
#include <fstream>
#include <optional>
#include <string>

#include "ConsoleScreen.h"
#include "SimServer.h"
#include "TerminalSession.h"

namespace lineprobe::testing {

using Clock = std::chrono::steady_clock;

// The suite also runs built with AddressSanitizer, lineprobe included: slower, and with a
// quarantine that holds freed memory, so the runs are shorter there and memory is not
// bounded.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
inline constexpr bool UNDER_SANITIZER = true;
#else
inline constexpr bool UNDER_SANITIZER = false;
#endif

// A whole-number setting from the environment, or the fallback when unset or not a number.
inline long EnvNumber(const char* name, long fallback) {
    const char* text = std::getenv(name);
    if (text == nullptr || *text == '\0') {
        return fallback;
    }
    char* end = nullptr;
    const long value = std::strtol(text, &end, 10);
    return *end == '\0' ? value : fallback;
}

// A lineprobe whose boards are behind the relay, with the relay's farm as its device map.
inline TerminalOptions ThroughRelay(const SimServer& sim, const std::string& farm) {
    TerminalOptions options;
    options.env.emplace_back("REMOTE_TKHOST", sim.Address());
    options.env.emplace_back("VX7_FARM", farm);
    options.unsetEnv.push_back("CORVO_ORVANE_DIR");
    return options;
}

inline long long MsSince(Clock::time_point start) {
    return std::chrono::duration_cast<std::chrono::milliseconds>(Clock::now() - start).count();
}

// VmRSS of a process in KiB, or nothing once the process is gone.
inline std::optional<long> RssKiB(pid_t pid) {
    std::ifstream status("/proc/" + std::to_string(pid) + "/status");
    for (std::string line; std::getline(status, line);) {
        if (line.rfind("VmRSS:", 0) == 0) {
            return std::atol(line.c_str() + 6);
        }
    }
    return std::nullopt;
}

inline std::string ProcessName(pid_t pid) {
    std::ifstream comm("/proc/" + std::to_string(pid) + "/comm");
    std::string name;
    std::getline(comm, name);
    return name;
}

}  // namespace lineprobe::testing
