#pragma once

// Helpers shared by the whole-tool runs: the resident memory of the lineprobe process, and
// settings that lengthen a run by hand.
#include <sys/types.h>

#include <chrono>
#include <cstdlib>
#include <fstream>
#include <optional>
#include <string>

#include "ConsoleScreen.h"

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
