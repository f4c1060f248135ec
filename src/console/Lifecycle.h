#pragma once

#include <exception>
#include <string>

namespace lineprobe {
class ConsoleDisplay;
class ConsoleSystemView;
class PhoneViewMgr;
class TrunkViewMgr;
class View;
}  // namespace lineprobe

// Process-wide objects of the console, made once by start-up and never freed. Null until
// set: a signal can arrive at any point of start-up, and the shutdown skips what is not
// there yet.
extern lineprobe::ConsoleDisplay* g_curDisplay;
extern lineprobe::ConsoleSystemView* g_sysView;
extern lineprobe::View* g_SystemView;
extern lineprobe::PhoneViewMgr* g_phoneViewMgr;
extern lineprobe::View* g_TrunkViewWindow;
extern lineprobe::TrunkViewMgr* g_trunkViewMgr;
extern lineprobe::View* g_CmdProcessorView;

// Longest the shutdown waits for another thread to let go of the screen before it goes on
// without the display lock.
constexpr int SHUTDOWN_DISPLAY_WAIT_MS = 2000;

// Longest the shutdown waits while stopping the views makes no progress. Stopping asks
// the boards to cancel their subscriptions, one request after another, and each request
// ends within its time-out, so slow or silent boards only make it slow. A request that the
// signal interrupted on the thread that now runs the shutdown could hold it up for good:
// when no request has ended for this long the process ends all the same, with the terminal
// put back.
constexpr unsigned int SHUTDOWN_STALL_LIMIT_S = 10;

// Longest the shutdown waits for the pager to go after asking it to; then it is killed.
constexpr int PAGER_END_WAIT_MS = 1000;

// Handles the command line of an invocation with arguments (argc and argv without the
// program name): prints the version, the help path or the complaint, and returns the
// index at which it stopped.
int ProcessCmdLineArgs(int argc, char** argv);

// Handler of SIGINT, SIGTERM, SIGUSR1 and SIGHUP, and the only way the process ends in
// normal use, a keyboard gone for good included: logs the cause, ends the pager, tells the
// operator, stops every view, ends curses and exits with status 1. Returns only to a shutdown it
// interrupted on the same thread, which then goes on to the end.
void terminate_app(int sig);

// What an exception that nothing caught says to the operator, in one line: for a relay
// that cannot be reached, "cannot reach the relay at HOST:PORT: " and why.
std::string DescribeUncaught(std::exception_ptr failure);

// The terminate handler, installed first thing by start-up. The process still ends by
// abort, but the terminal is put back first, and what failed goes to the error log (when
// it is open) and to the real standard error, where the operator reads it on the normal
// screen.
[[noreturn]] void ReportUncaughtAndAbort();
