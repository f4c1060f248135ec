#include "transport/TKSCommon.h"

#include <unistd.h>

#include <cassert>
#include <chrono>
#include <cstdlib>
#include <iostream>
#include <thread>

#include "transport/TKSWholeLine.h"

TKSMutex::TKSMutex() = default;
TKSMutex::~TKSMutex() = default;

void TKSMutex::lock() {
    std::unique_lock<std::mutex> lk(m);
    cv.wait(lk, [this] { return !locked; });
    locked = true;
}

void TKSMutex::unlock() {
    // Notified under the lock: the waiter may destroy this mutex as soon as it has it.
    std::lock_guard<std::mutex> lk(m);
    locked = false;
    cv.notify_one();
}

bool TKSMutex::tryLock() {
    std::lock_guard<std::mutex> lk(m);
    if (locked) {
        return false;
    }
    locked = true;
    return true;
}

bool TKSMutex::tryLock(unsigned int ms, unsigned int stepMs) {
    assert(stepMs != 0);
    if (stepMs == 0) {
        stepMs = 1;
    }
    // The wait ends when the signal is given, not at the next step; its bound is the whole
    // steps that fit in ms, which keeps the callers' 5000 and 1000 ms as they are.
    auto bound = std::chrono::milliseconds(std::uint64_t(ms / stepMs) * stepMs);
    // A reply usually comes within tens of microseconds: look again briefly before sleeping,
    // which saves the waiter a full wake-up.
    auto spinEnd = std::chrono::steady_clock::now() + std::chrono::microseconds(30);
    while (bound.count() > 0 && std::chrono::steady_clock::now() < spinEnd) {
        if (tryLock()) {
            return true;
        }
        std::this_thread::yield();
    }
    std::unique_lock<std::mutex> lk(m);
    if (!cv.wait_for(lk, bound, [this] { return !locked; })) {
        return false;
    }
    locked = true;
    return true;
}

TKSThread::control::control(std::atomic<int>& status, TKSMutex& runLock)
    : status(status), runLock(runLock) {}

TKSThread::control::~control() {
    runAll();
    runLock.unlock();
}

void TKSThread::control::pushCleanup(PlainCleanup fn, void* arg) {
    top = new Entry{fn, nullptr, nullptr, arg, top};
}

void TKSThread::control::pushCleanup(void* obj, MemberCleanup fn, void* arg) {
    top = new Entry{nullptr, obj, fn, arg, top};
}

int TKSThread::control::popCleanup(int execute) {
    Entry* e = top;
    if (e == nullptr) {
        return 0;
    }
    top = e->next;
    if (execute) {
        try {
            if (e->plain != nullptr) {
                e->plain(e->arg);
            } else if (e->member != nullptr) {
                (static_cast<TKSRunnable*>(e->obj)->*(e->member))(e->arg);
            }
        } catch (...) {
            TKSWholeLine() << "ERROR: in ~TKSThread::control::popCleanup, cleanup threw exception"
                           << std::endl;
            delete e;
            throw;
        }
    }
    delete e;
    return top != nullptr;
}

void TKSThread::control::runAll() {
    while (top != nullptr) {
        try {
            popCleanup(1);
        } catch (...) {
            // Already reported; the remaining cleanups still run.
        }
    }
}

namespace {

// Unwinds a cancelled body to its thread frame, which ends the thread.
struct CancelUnwind {};

}  // namespace

void TKSThread::control::testCancel() {
    if (status.load() == NOT_RUNNING) {
        runAll();
        throw CancelUnwind{};
    }
}

TKSThread::TKSThread(void* obj, MemberBody body, unsigned int stackSize)
    : ctl(status, runLock), stackSize(stackSize), obj(obj), member(body) {}

TKSThread::TKSThread(PlainBody body, unsigned int stackSize)
    : ctl(status, runLock), stackSize(stackSize), plain(body) {}

TKSThread::~TKSThread() {
    selfDelete = 0;
    // Joined even when the status already says "not running": the frame sets it just before it
    // lets go of runLock, and runLock must outlive that.
    cancel();
    join();
}

namespace {

// Out of line: some compilers see an uninitialised member pointer where the call is inlined.
[[gnu::noinline]] void* callMember(void* obj, TKSThread::MemberBody fn, void* control, void* arg) {
    return (static_cast<TKSRunnable*>(obj)->*fn)(control, arg);
}

void applyStackSize(pthread_attr_t& attr, unsigned int stackSize, bool& ok) {
    if (stackSize == 0) {
        return;
    }
    size_t deflt = 0;
    if (pthread_attr_getstacksize(&attr, &deflt) != 0) {
        ok = false;
        return;
    }
    size_t want = stackSize < deflt ? deflt : stackSize;
    if (pthread_attr_setstacksize(&attr, want) != 0) {
        ok = false;
    }
}

}  // namespace

void TKSThread::start(void* arg) {
    if (status.load() != NOT_RUNNING) {
        throw AlreadyActive();
    }
    // A thread that was cancelled keeps runLock until it has really ended.
    runLock.lock();
    startArg = arg;
    result = nullptr;
    status = RUNNING;

    pthread_attr_t attr{};
    const bool haveAttr = pthread_attr_init(&attr) == 0;
    bool ok = haveAttr;
    if (ok) {
        ok = pthread_attr_setdetachstate(&attr, PTHREAD_CREATE_DETACHED) == 0;
        applyStackSize(attr, stackSize, ok);
    }
    if (ok) {
        ok = pthread_create(&threadId, &attr, &TKSThread::frame, this) == 0;
    }
    if (haveAttr) {
        pthread_attr_destroy(&attr);
    }
    if (!ok) {
        status = NOT_RUNNING;
        runLock.unlock();
        throw CreationError();
    }
}

void TKSThread::cancel() {
    status = NOT_RUNNING;
}

void TKSThread::join() {
    runLock.lock();
    runLock.unlock();
}

void* TKSThread::frame(void* self) {
    auto* t = static_cast<TKSThread*>(self);
    void* r = nullptr;
    try {
        if (t->plain != nullptr) {
            r = t->plain(&t->ctl, t->startArg);
        } else {
            r = callMember(t->obj, t->member, &t->ctl, t->startArg);
        }
    } catch (const CancelUnwind&) {
    } catch (...) {
        // Nothing stands above a thread body; ending the process for it would take every other
        // thread down too. The thread ends, and the failure is on record.
        TKSWholeLine() << "ERROR: exception left a thread body; the thread has ended" << std::endl;
    }
    bool del = t->selfDelete.load() != 0;
    t->result = r;
    t->status = NOT_RUNNING;
    t->runLock.unlock();
    if (del) {
        delete t;
    }
    return r;
}

namespace {

struct Abandoned {
    TKSThread::PlainBody plain;
    void* obj;
    TKSThread::MemberBody member;
    void* arg;
};

void* abandonedFrame(void* p) {
    auto* rec = static_cast<Abandoned*>(p);
    Abandoned a = *rec;
    delete rec;
    try {
        if (a.plain != nullptr) {
            a.plain(nullptr, a.arg);
        } else {
            callMember(a.obj, a.member, nullptr, a.arg);
        }
    } catch (...) {
        TKSWholeLine() << "ERROR: exception left a thread body; the thread has ended" << std::endl;
    }
    return nullptr;
}

void startAbandoned(Abandoned* rec, unsigned int stackSize) {
    pthread_attr_t attr;
    bool ok = pthread_attr_init(&attr) == 0;
    if (ok) {
        ok = pthread_attr_setdetachstate(&attr, PTHREAD_CREATE_DETACHED) == 0;
        applyStackSize(attr, stackSize, ok);
    }
    pthread_t id;
    if (ok) {
        ok = pthread_create(&id, &attr, abandonedFrame, rec) == 0;
    }
    pthread_attr_destroy(&attr);
    if (!ok) {
        delete rec;
        throw TKSThread::CreationError();
    }
}

}  // namespace

void TKSAbandonedThread_create(TKSThread::PlainBody fn, void* arg, unsigned int stackSize) {
    startAbandoned(new Abandoned{fn, nullptr, nullptr, arg}, stackSize);
}

void TKSAbandonedThread_create(void* obj, TKSThread::MemberBody fn, void* arg,
                               unsigned int stackSize) {
    startAbandoned(new Abandoned{nullptr, obj, fn, arg}, stackSize);
}

TKStatus TKSHostInit() {
    return tkDrvSetInterface(0, 0);
}

void TKSHostCleanup() {}

void tks_sleep(unsigned int seconds) {
    ::sleep(seconds);
}

void tksAssertFail(const char* expr, const char* file, int line) {
    TKSWholeLine() << file << ":" << line << ": Assertion `" << expr << "' failed." << std::endl;
    std::abort();
}

void tks_sleep_ms(unsigned int miliseconds) {
    TKS_ASSERT(miliseconds <= 1000);
    ::usleep(miliseconds * 1000);
}
