#include "console/DisplayGuard.h"

#include <mutex>

namespace lineprobe {

namespace {

// Never destroyed: the process may exit while an event thread still holds it.
std::recursive_timed_mutex& DisplayMutex() {
    static auto* mutex = new std::recursive_timed_mutex;
    return *mutex;
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
    owns_ = DisplayMutex().try_lock_for(bound);
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
