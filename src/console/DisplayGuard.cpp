#include "console/DisplayGuard.h"

#include <mutex>
#include <thread>

namespace lineprobe {

namespace {

// Never destroyed: the process may exit while an event thread still holds it.
std::recursive_mutex& DisplayMutex() {
    static auto* mutex = new std::recursive_mutex;
    return *mutex;
}

// Polls rather than using a timed lock: the timed wait of the standard library goes
// through a call that thread checkers do not follow, and this wait is only ever taken
// on the way out of the process.
bool TryLockFor(std::chrono::milliseconds bound) {
    const auto deadline = std::chrono::steady_clock::now() + bound;
    for (;;) {
        if (DisplayMutex().try_lock()) {
            return true;
        }
        if (std::chrono::steady_clock::now() >= deadline) {
            return false;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
}

// Set on a thread whose bounded wait failed; see the bounded constructor.
thread_local bool t_gaveUpOnLock = false;

}  // namespace

DisplayGuard::DisplayGuard() {
    if (t_gaveUpOnLock) {
        return;
    }
    DisplayMutex().lock();
    owns_ = true;
}

DisplayGuard::DisplayGuard(std::chrono::milliseconds bound) {
    if (t_gaveUpOnLock) {
        return;
    }
    owns_ = TryLockFor(bound);
    if (!owns_) {
        t_gaveUpOnLock = true;
    }
}

DisplayGuard::~DisplayGuard() {
    if (owns_) {
        DisplayMutex().unlock();
    }
}

}  // namespace lineprobe
