#pragma once

#include <chrono>
#include <string>

namespace lineprobe {

// The pager runs as a child of its own, started without a shell so that whatever the
// file's path holds (blanks, semicolons) reaches it as one argument. It stays in the
// tool's process group and so in the terminal's foreground, where the keys typed at the
// terminal reach it and the tool's own signal handlers stay in force.

// Runs `program` (looked up on the path) on `file` and waits for it to end. Returns its
// wait status, or -1 with errno set when it could not be started. Once the shutdown has
// taken the pager over (EndPager), the calling thread never returns: the process is
// about to end, and the screen is no longer this thread's to go back to.
int RunPager(const char* program, const std::string& file);

// For the shutdown, in a signal handler on any thread: ends the pager that is running,
// if any, and reaps it, so that nothing of the tool is left reading the terminal. The
// pager gets SIGTERM, so that it can put the terminal back, and SIGKILL when it is
// still there after `bound`. Later calls of RunPager park their thread. True when a
// pager was running.
bool EndPager(std::chrono::milliseconds bound);

}  // namespace lineprobe
