#pragma once

#include <string>

namespace lineprobe {

// The pager runs as a child of its own, started without a shell so that whatever the
// file's path holds (blanks, semicolons) reaches it as one argument. It stays in the
// tool's process group and so in the terminal's foreground, where the keys typed at the
// terminal reach it and the tool's own signal handlers stay in force.

// Runs `program` (looked up on the path) on `file` and waits for it to end. Returns its
// wait status, or -1 with errno set when it could not be started.
int RunPager(const char* program, const std::string& file);

}  // namespace lineprobe
