#pragma once

// The farm this process plays: the file named by VX7_FARM, or the built-in default farm (the
// bytes of farms/default.toml, compiled in). The device map and the board emulation both read
// it from here, so they always describe the same boards.

#include <memory>
#include <string>
#include <string_view>

#include "platform/farm/Farm.h"

namespace farm {

inline constexpr const char* kFarmEnvironment = "VX7_FARM";
// How the built-in farm is named in messages.
inline constexpr const char* kBuiltinFarmSource = "farms/default.toml (built in)";

// The compiled-in bytes of farms/default.toml.
std::string_view builtinFarmText();

struct FarmLoad {
    std::shared_ptr<const Farm> farm;  // null when the farm could not be read
    std::string error;                 // one line, "file:line:col: what is wrong", when null
    std::string source;                // the file, or kBuiltinFarmSource
};

// Loads on first use and keeps the result, failure included: a broken farm stays broken until
// resetActiveFarm(). A failure is written once to std::cerr, as its one line.
FarmLoad activeFarm();

// Forgets the loaded farm; the next activeFarm() reads VX7_FARM again.
void resetActiveFarm();

}  // namespace farm
