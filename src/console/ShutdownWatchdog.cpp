#include "console/ShutdownWatchdog.h"

#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <csignal>

namespace lineprobe {

namespace {

std::atomic<unsigned long (*)()> g_progress{nullptr};
std::atomic<void (*)()> g_overdue{nullptr};
std::atomic<unsigned int> g_quietLimit{0};
std::atomic<unsigned long> g_lastSeen{0};
std::atomic<unsigned int> g_quietTicks{0};

void Tick(int) {
    const int savedErrno = errno;
    const unsigned long seen = g_progress.load()();
    if (seen != g_lastSeen.exchange(seen)) {
        g_quietTicks = 0;
    } else if (++g_quietTicks >= g_quietLimit.load()) {
        g_overdue.load()();
    }
    alarm(1);
    errno = savedErrno;
}

}  // namespace

void StartShutdownWatchdog(unsigned int quietLimitS, unsigned long (*progress)(),
                           void (*overdue)()) {
    g_progress = progress;
    g_overdue = overdue;
    g_quietLimit = quietLimitS;
    g_lastSeen = progress();
    g_quietTicks = 0;
    signal(SIGALRM, Tick);
    alarm(1);
}

}  // namespace lineprobe
