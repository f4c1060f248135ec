#pragma once

#include <ostream>

#include "framework/linkedList.h"

namespace tolk {

template <class K, class V>
class keyLink {
  public:
    keyLink() = default;
    keyLink(const K& k, const V& v) : key(k), value(v) {}
    virtual ~keyLink() = default;

    K key{};
    V value{};
};

template <class K, class V>
std::ostream& operator<<(std::ostream& os, const keyLink<K, V>& kl) {
    os << "{Key: ";
    detail::printElement(os, kl.key);
    os << " Value: ";
    detail::printElement(os, kl.value);
    return os << "}";
}

// Lookup by linear search. A later set() of a key hides an earlier one until unset().
template <class K, class V>
class keyedList : public list<V> {
  public:
    keyedList() = default;
    ~keyedList() override = default;

    void toStream(std::ostream* os) const override {
        *os << "{";
        unsigned int n = entries.length();
        for (unsigned int i = 0; i < n; ++i) {
            keyLink<K, V> kl = entries.value(i);
            if (i != 0) {
                *os << " ";
            }
            detail::printElement(*os, kl.key);
            *os << " ";
            detail::printElement(*os, kl.value);
        }
        *os << "}";
    }

    // The entries live in the inner list; the count of the base stays 0.
    unsigned int length() const override { return entries.length(); }

    virtual V* element(const K& key) { return &entries.element(find(key))->value; }
    virtual V* operator[](K key) { return element(key); }

    void set(K key, const V& value) { entries.insert(0, keyLink<K, V>(key, value)); }
    void unset(K key) { entries.remove(find(key)); }

  protected:
    unsigned int find(const K& key) {
        unsigned int n = entries.length();
        for (unsigned int i = 0; i < n; ++i) {
            if (entries.element(i)->key == key) {
                return i;
            }
        }
        throw typename list<V>::OutOfBoundsError(0xFFFFFFFFu);
    }

    linkedList<keyLink<K, V>> entries;
};

}  // namespace tolk
