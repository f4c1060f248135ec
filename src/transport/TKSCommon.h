// Threads, signals, sleeps and the transport's exceptions, directly on POSIX threads.
#pragma once

#include <pthread.h>

#include <atomic>
#include <condition_variable>
#include <mutex>

#include "platform/tkhost/tkhost.h"

class TKSException {
  public:
    virtual ~TKSException() = default;
};

class TKSResource_CreationError : public virtual TKSException {};

class TKSMsgRef;

// Base of whatever registers a member callback with a TKSMsgQueue.
class TKSAsyncMsgReceiver {
  public:
    virtual ~TKSAsyncMsgReceiver() = default;
};
using TKSAsyncMethod = int (TKSAsyncMsgReceiver::*)(TKSMsgRef&);
using TKSAsyncFn = int (*)(TKSMsgRef&);

// A lock that is also a binary signal: any thread may unlock what another locked.
class TKSMutex {
  public:
    class CreationError : public TKSException {};

    TKSMutex();
    virtual ~TKSMutex();
    TKSMutex(const TKSMutex&) = delete;
    TKSMutex& operator=(const TKSMutex&) = delete;

    void lock();
    void unlock();
    bool tryLock();
    // Waits up to (ms / stepMs) * stepMs milliseconds, woken the moment the signal is given.
    // stepMs must not be 0.
    bool tryLock(unsigned int ms, unsigned int stepMs);

  private:
    std::mutex m;
    std::condition_variable cv;
    bool locked = false;
};

class TKSRunnable {
  public:
    virtual ~TKSRunnable() = default;
};

class TKSThread {
  public:
    enum ThreadStatus { RUNNING = 0, NOT_RUNNING = 1 };

    class Exception : public virtual TKSException {};
    class AlreadyActive : public Exception {};
    class CreationError : public Exception, public TKSResource_CreationError {};

    using MemberBody = void* (TKSRunnable::*)(void* control, void* arg);
    using PlainBody = void* (*)(void* control, void* arg);
    using MemberCleanup = void* (TKSRunnable::*)(void*);
    using PlainCleanup = void* (*)(void*);

    class control {
      public:
        control(std::atomic<int>& status, TKSMutex& runLock);
        ~control();
        control(const control&) = delete;
        control& operator=(const control&) = delete;

        void pushCleanup(PlainCleanup fn, void* arg);
        void pushCleanup(void* obj, MemberCleanup fn, void* arg);
        // Returns 0 when the stack was empty, otherwise whether entries remain.
        int popCleanup(int execute);
        // If cancelled: runs the cleanups and ends the calling thread (by unwinding to its frame,
        // so a body must not swallow exceptions it doesn't know around this call).
        void testCancel();
        bool cancelled() const { return status.load() == NOT_RUNNING; }

      private:
        struct Entry {
            PlainCleanup plain;
            void* obj;
            MemberCleanup member;
            void* arg;
            Entry* next;
        };
        void runAll();

        std::atomic<int>& status;
        TKSMutex& runLock;
        Entry* top = nullptr;
    };

    TKSThread(void* obj, MemberBody body, unsigned int stackSize);
    TKSThread(PlainBody body, unsigned int stackSize);
    virtual ~TKSThread();
    TKSThread(const TKSThread&) = delete;
    TKSThread& operator=(const TKSThread&) = delete;

    void start(void* arg);
    void cancel();
    void join();

    int getStatus() const { return status.load(); }
    void* getResult() const { return result; }
    pthread_t getThreadId() const { return threadId; }
    // Set before start: the thread deletes this object when its body has ended.
    void setSelfDelete(int on) { selfDelete = on; }

  private:
    static void* frame(void* self);

    std::atomic<int> status{NOT_RUNNING};
    TKSMutex runLock;
    control ctl;
    unsigned int stackSize;
    std::atomic<int> selfDelete{0};
    pthread_t threadId{};
    void* startArg = nullptr;
    void* result = nullptr;
    void* obj = nullptr;
    MemberBody member = nullptr;
    PlainBody plain = nullptr;
};

// Detached threads that leave no handle; the body gets control 0.
void TKSAbandonedThread_create(TKSThread::PlainBody fn, void* arg, unsigned int stackSize);
void TKSAbandonedThread_create(void* obj, TKSThread::MemberBody fn, void* arg,
                               unsigned int stackSize);

// Programming errors stop the process in every build type, naming the expression and the file.
[[noreturn]] void tksAssertFail(const char* expr, const char* file, int line);
#define TKS_ASSERT(expr) ((expr) ? (void)0 : tksAssertFail(#expr, __FILE__, __LINE__))

TKStatus TKSHostInit();
void TKSHostCleanup();

void tks_sleep(unsigned int seconds);
// milliseconds must be at most 1000.
void tks_sleep_ms(unsigned int milliseconds);
