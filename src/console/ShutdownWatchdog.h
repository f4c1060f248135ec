#pragma once

namespace lineprobe {

// Ends a shutdown that has stopped getting on, and only that: a slow one may take as long
// as it needs. Ticks once a second on SIGALRM, on whichever thread the signal reaches;
// each tick reads `progress`, a count that grows as the shutdown gets on, and when it has
// not moved for `quietLimitS` ticks in a row calls `overdue`, which must end the process.
// Both functions run in the signal handler and must be async-signal-safe. One watchdog
// per process, started once.
void StartShutdownWatchdog(unsigned int quietLimitS, unsigned long (*progress)(),
                           void (*overdue)());

}  // namespace lineprobe
