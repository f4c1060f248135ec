#pragma once

#include "framework/list.h"

namespace tolk {

template <class T>
class link {
  public:
    explicit link(const T& v) : value(v) {}
    virtual ~link() = default;

    link* next = nullptr;
    link* previous = nullptr;
    T value;
};

// Doubly linked list that remembers the last position touched, so that a walk with
// ascending indexes costs one step per index.
template <class T>
class linkedList : public list<T> {
  public:
    linkedList() = default;
    linkedList(const linkedList& other) : list<T>() { linkedList::operator=(other); }
    ~linkedList() override { clear(); }

    void toStream(std::ostream* os) const override {
        *os << "{";
        for (link<T>* n = head; n != nullptr; n = n->next) {
            if (n != head) {
                *os << " ";
            }
            detail::printElement(*os, n->value);
        }
        *os << "}";
    }

    virtual T* element(unsigned int i) {
        if (i >= this->len) {
            throw typename list<T>::OutOfBoundsError(i);
        }
        if (i == 0 || cursor == nullptr) {
            cursor = head;
            cursorIndex = 0;
        }
        while (cursorIndex < i) {
            cursor = cursor->next;
            ++cursorIndex;
        }
        while (cursorIndex > i) {
            cursor = cursor->previous;
            --cursorIndex;
        }
        return &cursor->value;
    }

    virtual linkedList& operator=(const linkedList& other) {
        if (&other == this) {
            return *this;
        }
        clear();
        for (link<T>* n = other.head; n != nullptr; n = n->next) {
            append(n->value);
        }
        return *this;
    }

    virtual T* operator[](unsigned int i) { return element(i); }

    void insert(unsigned int i, const T& x) {
        if (i > this->len) {
            throw typename list<T>::OutOfBoundsError(i);
        }
        link<T>* node = new link<T>(x);
        if (i == this->len) {
            node->previous = tail;
            if (tail != nullptr) {
                tail->next = node;
            } else {
                head = node;
            }
            tail = node;
        } else {
            link<T>* at = nodeAt(i);
            node->next = at;
            node->previous = at->previous;
            if (at->previous != nullptr) {
                at->previous->next = node;
            } else {
                head = node;
            }
            at->previous = node;
        }
        ++this->len;
        cursor = node;
        cursorIndex = i;
    }

    void append(const T& x) { insert(this->len, x); }

    T remove(unsigned int i) {
        if (i >= this->len) {
            throw typename list<T>::OutOfBoundsError(i);
        }
        link<T>* node = nodeAt(i);
        T v = node->value;
        link<T>* after = node->next;
        if (node->previous != nullptr) {
            node->previous->next = node->next;
        } else {
            head = node->next;
        }
        if (node->next != nullptr) {
            node->next->previous = node->previous;
        } else {
            tail = node->previous;
        }
        delete node;
        --this->len;
        if (after != nullptr) {
            cursor = after;
            cursorIndex = i;
        } else if (tail != nullptr) {
            cursor = tail;
            cursorIndex = this->len - 1;
        } else {
            cursor = nullptr;
            cursorIndex = 0;
        }
        return v;
    }

    // Leaves the cursor alone: the read-only access for shared readers.
    T value(unsigned int i) const {
        if (i >= this->len) {
            throw typename list<T>::OutOfBoundsError(i);
        }
        link<T>* n = head;
        for (unsigned int k = 0; k < i; ++k) {
            n = n->next;
        }
        return n->value;
    }

  private:
    link<T>* nodeAt(unsigned int i) {
        element(i);
        return cursor;
    }

    void clear() {
        while (this->len != 0) {
            remove(0);
        }
    }

    link<T>* head = nullptr;
    link<T>* tail = nullptr;
    link<T>* cursor = nullptr;
    unsigned int cursorIndex = 0;
};

}  // namespace tolk
