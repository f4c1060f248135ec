#pragma once

namespace lineprobe {

constexpr float LINEPROBE_VERSION = 1.0f;
constexpr const char* LINEPROBE_VERSION_STR = "lineprobe version 1.0";

}  // namespace lineprobe
