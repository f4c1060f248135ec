#include "framework/Mutex.h"

#include "transport/TKSCommon.h"

namespace tolk {

Mutex::Mutex() : mutex(new TKSMutex()) {}
Mutex::~Mutex() {
    delete mutex;
}
void Mutex::lock() {
    mutex->lock();
}
void Mutex::unlock() {
    mutex->unlock();
}
bool Mutex::tryLock() {
    return mutex->tryLock();
}
bool Mutex::tryLock(unsigned int ms, unsigned int stepMs) {
    return mutex->tryLock(ms, stepMs);
}

}  // namespace tolk
