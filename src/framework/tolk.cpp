#include "framework/tolk.h"

#include <atomic>

#include "transport/TKSCommon.h"

namespace tolk {

namespace {
// Atomic only so that a stray concurrent caller cannot tear a value; ids are issued by threads
// that the system runs one at a time, and no ordering is implied.
std::atomic<unsigned int> nextObjId{1000};
std::atomic<unsigned int> nextTransId{10000};
}  // namespace

int tolkInit() {
    return TKSHostInit();
}
void tolkCleanup() {
    TKSHostCleanup();
}

unsigned int getUniqueObjId() {
    return nextObjId.fetch_add(1, std::memory_order_relaxed);
}
unsigned int getUniqueTransId() {
    return nextTransId.fetch_add(1, std::memory_order_relaxed);
}

void sleep(unsigned int seconds) {
    tks_sleep(seconds);
}
void sleep_ms(unsigned int ms) {
    tks_sleep_ms(ms);
}

}  // namespace tolk
