#pragma once

#include "framework/virtualObject.h"

class TKSMutex;

namespace tolk {

// Not recursive. Doubles as a binary signal: another thread may unlock what one locked.
class Mutex : public virtualObject {
  public:
    Mutex();
    ~Mutex() override;
    Mutex(const Mutex&) = delete;
    Mutex& operator=(const Mutex&) = delete;

    void lock();
    void unlock();
    bool tryLock();
    bool tryLock(unsigned int ms, unsigned int stepMs);

  private:
    TKSMutex* mutex;
};

// Holds a Mutex for a scope, also while an exception leaves it.
class MutexGuard {
  public:
    explicit MutexGuard(Mutex& m) : mutex(m) { mutex.lock(); }
    ~MutexGuard() { mutex.unlock(); }
    MutexGuard(const MutexGuard&) = delete;
    MutexGuard& operator=(const MutexGuard&) = delete;

  private:
    Mutex& mutex;
};

}  // namespace tolk
