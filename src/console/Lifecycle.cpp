#include "console/Lifecycle.h"

#include <unistd.h>

#include <atomic>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <iostream>
#include <sstream>
#include <string>
#include <thread>

#include "console/ConsoleDisplay.h"
#include "console/DisplayGuard.h"
#include "console/Pager.h"
#include "console/PhoneViewMgr.h"
#include "console/Redirect.h"
#include "console/ShutdownWatchdog.h"
#include "console/TrunkViewMgr.h"
#include "console/Version.h"
#include "console/View.h"
#include "framework/Exception.h"
#include "framework/MsgQueue.h"
#include "transport/TKSMsgQueue.h"
#include "transport/TKSRemoteMsgQueue.h"

lineprobe::ConsoleDisplay* g_curDisplay = nullptr;
lineprobe::ConsoleSystemView* g_sysView = nullptr;
lineprobe::View* g_SystemView = nullptr;
lineprobe::PhoneViewMgr* g_phoneViewMgr = nullptr;
lineprobe::View* g_TrunkViewWindow = nullptr;
lineprobe::TrunkViewMgr* g_trunkViewMgr = nullptr;
lineprobe::View* g_CmdProcessorView = nullptr;

namespace {

constexpr const char* USAGE =
    "for help on using lineprobe, look in /usr/orvane/bin/lineprobe_help.txt";

const char* TerminationLine(int sig) {
    switch (sig) {
        case SIGINT:
            return "terninating app due to SIGINT";
        case SIGTERM:
            return "terninating app due to SIGTERM";
        case SIGUSR1:
            return "terninating app due to SIGUSR1";
        case SIGHUP:
            return "terninating app due to SIGHUP";
        default:
            return "terninating app due to an unexpected signal";
    }
}

std::atomic<std::thread::id> g_terminatingThread{};

// Stopping the views has stalled: end without them, the terminal put back first.
void ShutdownOverdue() {
    if (g_curDisplay != nullptr) {
        lineprobe::DisplayGuard guard{std::chrono::milliseconds(SHUTDOWN_DISPLAY_WAIT_MS)};
        g_curDisplay->Stop();
    }
    std::cerr << "stopping the views made no progress for " << SHUTDOWN_STALL_LIMIT_S
              << " s: shutdown completed without them" << std::endl;
    _exit(1);
}

}  // namespace

int ProcessCmdLineArgs(int argc, char** argv) {
    if (argc > 2) {
        std::cout << "invalid argument count" << std::endl;
        std::cout << "valid arguments are:" << std::endl;
        std::cout << "-v\tshow version" << std::endl;
        std::cout << "-h\thelp info " << std::endl;
        return 0;
    }
    for (int i = 0; i < argc; ++i) {
        const std::string arg = argv[i];
        if (arg == "-v") {
            std::cout << lineprobe::LINEPROBE_VERSION_STR << std::endl;
        } else if (arg == "-h") {
            std::cout << USAGE << std::endl;
        } else {
            std::cout << "invalid argument" << std::endl;
            std::cout << USAGE << std::endl;
            return i;
        }
    }
    return argc;
}

void terminate_app(int sig) {
    // A second signal while the shutdown runs: on the same thread (it interrupted the
    // handler) the first shutdown must be let go on; on another thread, wait for the
    // first one to end the process, so that no caller (quit among them) returns.
    std::thread::id none{};
    if (!g_terminatingThread.compare_exchange_strong(none, std::this_thread::get_id())) {
        if (none == std::this_thread::get_id()) {
            return;
        }
        for (;;) {
            pause();
        }
    }

    std::cout << TerminationLine(sig) << std::endl;

    // A pager that help started goes first, so that nothing of the tool is left reading
    // the terminal, and the screen comes back for the rest of the shutdown.
    const std::chrono::milliseconds wait(SHUTDOWN_DISPLAY_WAIT_MS);
    if (lineprobe::EndPager(std::chrono::milliseconds(PAGER_END_WAIT_MS)) &&
        g_curDisplay != nullptr) {
        lineprobe::DisplayGuard guard(wait);
        g_curDisplay->Resume();
    }

    if (g_CmdProcessorView != nullptr) {
        lineprobe::DisplayGuard guard(wait);
        g_CmdProcessorView->PrintString("starting app shutdown", 2, 1);
    }

    // Without the display lock: stopping a view waits for the board, and the events that
    // come meanwhile need the screen. Each stop is a series of requests, and each request
    // ends within its time-out: while they keep ending the shutdown gets on, however slow
    // the boards; when none has ended for a while, a stop is stuck for good.
    if (g_phoneViewMgr != nullptr || g_trunkViewMgr != nullptr) {
        lineprobe::StartShutdownWatchdog(SHUTDOWN_STALL_LIMIT_S, tolk::MsgQueue::endedRequests,
                                         ShutdownOverdue);
    }
    if (g_phoneViewMgr != nullptr) {
        g_phoneViewMgr->DestroyAllPhoneViews();
    }
    if (g_trunkViewMgr != nullptr) {
        g_trunkViewMgr->DestroyAllTrunkViews();
    }

    if (g_curDisplay != nullptr) {
        lineprobe::DisplayGuard guard(wait);
        g_curDisplay->Stop();
    }
    std::exit(1);
}

namespace {

// The relay as HOST:PORT, whether or not the user gave the port.
std::string RelayName(const char* given, int port) {
    std::string host = given != nullptr ? given : "";
    if (port <= 0) {
        return host;
    }
    return host.substr(0, host.find(':')) + ":" + std::to_string(port);
}

}  // namespace

std::string DescribeUncaught(std::exception_ptr failure) {
    if (!failure) {
        return "terminated without an exception";
    }
    try {
        std::rethrow_exception(failure);
    } catch (const TKSMsgQueue::CreationError& e) {
        std::string reason = e.getReason();
        if (reason.empty()) {
            reason = "the queue could not be opened";
        }
        if (e.getHostName()[0] == '\0') {
            return "cannot open a local message queue: " + reason;
        }
        return "cannot reach the relay at " + RelayName(e.getHostName(), e.getPort()) + ": " +
               reason;
    } catch (const TKSRemoteService_ComFailure& e) {
        return "lost the relay connection to " + RelayName(e.getHostName(), e.getPort());
    } catch (const TKSException&) {
        return "a transport failure that nothing handled";
    } catch (const tolk::Exception& e) {
        std::ostringstream text;
        text << "uncaught exception: " << e;
        return text.str();
    } catch (const std::exception& e) {
        return std::string("uncaught exception: ") + e.what();
    } catch (...) {
        return "uncaught exception of an unknown type";
    }
}

void ReportUncaughtAndAbort() {
    static std::atomic<bool> reporting{false};
    if (reporting.exchange(true)) {
        std::abort();
    }
    std::string line;
    try {
        line = DescribeUncaught(std::current_exception());
    } catch (...) {
        line = "uncaught exception";
    }
    if (g_curDisplay != nullptr) {
        lineprobe::DisplayGuard guard{std::chrono::milliseconds(SHUTDOWN_DISPLAY_WAIT_MS)};
        g_curDisplay->Stop();
    }
    // Once redirected, std::cerr is the error log, and the terminal's stream is the buffer
    // it had before.
    std::cerr << line << std::endl;
    if (lineprobe::sbuf_cerr != nullptr) {
        std::ostream terminal(lineprobe::sbuf_cerr);
        terminal << "lineprobe: " << line << std::endl;
    }
    std::abort();
}
