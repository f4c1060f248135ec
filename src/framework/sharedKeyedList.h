#pragma once

#include "framework/Mutex.h"
#include "framework/keyedList.h"

namespace tolk {

// keyedList behind its own lock. A pointer that a lookup returns is not protected once the
// lookup has returned: keep values that are read at once, such as pointers.
template <class K, class V>
class sharedKeyedList : public keyedList<K, V> {
  public:
    void toStream(std::ostream* os) const override {
        MutexGuard g(lock);
        keyedList<K, V>::toStream(os);
    }
    unsigned int length() const override {
        MutexGuard g(lock);
        return keyedList<K, V>::length();
    }
    V* element(const K& key) override {
        MutexGuard g(lock);
        return keyedList<K, V>::element(key);
    }
    V* operator[](K key) override { return element(key); }

    void set(K key, const V& value) {
        MutexGuard g(lock);
        keyedList<K, V>::set(key, value);
    }
    void unset(K key) {
        MutexGuard g(lock);
        keyedList<K, V>::unset(key);
    }
    // Copies the value out under the lock: what a reader on another thread should use.
    V get(const K& key) {
        MutexGuard g(lock);
        return *keyedList<K, V>::element(key);
    }
    // Sets only if the key is absent, in one locked step; false if it was present.
    bool setIfAbsent(K key, const V& value) {
        MutexGuard g(lock);
        try {
            keyedList<K, V>::element(key);
            return false;
        } catch (const typename list<V>::OutOfBoundsError&) {
        }
        keyedList<K, V>::set(key, value);
        return true;
    }

  private:
    mutable Mutex lock;
};

}  // namespace tolk
