#pragma once

namespace lineprobe {
class ConsoleDisplay;
class View;
}  // namespace lineprobe

// Process-wide objects of the console, made once by start-up and never freed. Null until
// set: a signal can arrive at any point of start-up, and the shutdown skips what is not
// there yet.
//
// The system view (g_sysView, g_SystemView) and the two view managers (g_phoneViewMgr,
// g_trunkViewMgr, with g_TrunkViewWindow) join here with the board model.
extern lineprobe::ConsoleDisplay* g_curDisplay;
extern lineprobe::View* g_CmdProcessorView;

// Longest the shutdown waits for another thread to let go of the screen before it goes on
// without the display lock.
constexpr int SHUTDOWN_DISPLAY_WAIT_MS = 2000;

// Handles the command line of an invocation with arguments (argc and argv without the
// program name): prints the version, the help path or the complaint, and returns the
// index at which it stopped.
int ProcessCmdLineArgs(int argc, char** argv);

// Handler of SIGINT, SIGTERM and SIGUSR1, and the only way the process ends in normal
// use: logs the cause, tells the operator, stops every view, ends curses and exits with
// status 1. Returns only to a shutdown it interrupted on the same thread, which then
// goes on to the end.
void terminate_app(int sig);
