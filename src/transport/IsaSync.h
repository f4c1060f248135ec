// Namespace isa: the plain critical section, its scope guard, and the shared-ownership pointer.
#pragma once

#include <pthread.h>

#include <atomic>
#include <cstdint>

namespace isa {

// One POSIX mutex with default attributes: not recursive.
class CriticalSection {
  public:
    CriticalSection() { pthread_mutex_init(&mutex, nullptr); }
    ~CriticalSection() { pthread_mutex_destroy(&mutex); }
    CriticalSection(const CriticalSection&) = delete;
    CriticalSection& operator=(const CriticalSection&) = delete;

    void Enter() { pthread_mutex_lock(&mutex); }
    void Leave() { pthread_mutex_unlock(&mutex); }
    bool TryEnter() { return pthread_mutex_trylock(&mutex) == 0; }

  private:
    pthread_mutex_t mutex;
};

class AutoCriticalSection {
  public:
    explicit AutoCriticalSection(CriticalSection& cs) : section(cs), locked(false) { Enter(); }
    ~AutoCriticalSection() {
        if (locked) {
            section.Leave();
        }
    }
    AutoCriticalSection(const AutoCriticalSection&) = delete;
    AutoCriticalSection& operator=(const AutoCriticalSection&) = delete;

    AutoCriticalSection& Enter() {
        section.Enter();
        locked = true;
        return *this;
    }
    AutoCriticalSection& Leave() {
        section.Leave();
        locked = false;
        return *this;
    }

  private:
    CriticalSection& section;
    bool locked;
};

// Shared ownership of an object with a virtual destructor. The count is atomic, so RefPtrs on
// one object may be copied and released on any threads at once; a RefPtr's own section guards
// its two fields when the same RefPtr is read by one thread while another assigns it.
template <class T>
class RefPtr {
  public:
    RefPtr(T* p = nullptr) : ptr(p), count(new std::atomic<std::int32_t>(1)) {}
    RefPtr(const RefPtr& other) { other.shareInto(ptr, count); }
    template <class U>
    RefPtr(const RefPtr<U>& other) {
        U* p;
        other.shareInto(p, count);
        ptr = p;
    }
    ~RefPtr() { release(ptr, count); }

    RefPtr& operator=(const RefPtr& other) {
        if (&other == this) {
            return *this;
        }
        T* newPtr;
        std::atomic<std::int32_t>* newCount;
        other.shareInto(newPtr, newCount);
        section.Enter();
        T* oldPtr = ptr;
        std::atomic<std::int32_t>* oldCount = count;
        ptr = newPtr;
        count = newCount;
        section.Leave();
        release(oldPtr, oldCount);
        return *this;
    }

    // Gives up this RefPtr's share; it then holds null with a count of its own.
    void Detach() {
        auto* fresh = new std::atomic<std::int32_t>(1);
        section.Enter();
        T* oldPtr = ptr;
        std::atomic<std::int32_t>* oldCount = count;
        ptr = nullptr;
        count = fresh;
        section.Leave();
        release(oldPtr, oldCount);
    }

    T* Get() const { return ptr; }
    operator T*() const { return ptr; }
    T* operator->() const { return ptr; }

  private:
    template <class U>
    friend class RefPtr;

    void shareInto(T*& p, std::atomic<std::int32_t>*& c) const {
        section.Enter();
        p = ptr;
        c = count;
        c->fetch_add(1, std::memory_order_relaxed);
        section.Leave();
    }
    template <class U>
    void shareInto(U*& p, std::atomic<std::int32_t>*& c) const {
        T* mine;
        shareInto(mine, c);
        p = mine;
    }
    static void release(T* p, std::atomic<std::int32_t>* c) {
        if (c->fetch_sub(1, std::memory_order_acq_rel) == 1) {
            delete p;
            delete c;
        }
    }

    T* ptr;
    std::atomic<std::int32_t>* count;
    mutable CriticalSection section;
};

}  // namespace isa
