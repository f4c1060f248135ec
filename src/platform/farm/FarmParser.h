#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "platform/farm/Farm.h"

namespace farm {

// Files larger than this are refused before parsing: a farm of 33 full boards is far smaller.
inline constexpr std::size_t kMaxFarmFileBytes = 1024 * 1024;

// Parses farm text. `source` names it in messages. On failure returns nothing and sets `error` to
// one line, "source:line:col: what is wrong". Never throws for any input.
std::optional<Farm> parseFarm(std::string_view text, std::string_view source, std::string& error);

// Reads and parses a farm file; an unreadable file gives "path: cannot read the farm file: why".
std::optional<Farm> loadFarmFile(const std::string& path, std::string& error);

}  // namespace farm
