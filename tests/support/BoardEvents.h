#pragma once

// What the tests of the board emulation share: framework addresses of farm addresses, texts in
// fixed-size fields, and the unsolicited messages that reach a registered callback.

#include <gtest/gtest.h>

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <cstring>
#include <mutex>
#include <vector>

#include "framework/Addressable.h"
#include "framework/Msg.h"
#include "platform/farm/Addresses.h"
#include "platform/tkhost/tkhost.h"

namespace testsupport {

inline tolk::CompDesc_t cd(const farm::Address& a) {
    return tolk::CompDesc_t(a.instance, a.board, a.processor, a.component, a.node);
}

inline void setText(tolk::staticList<char>& l, const char* s) {
    unsigned int n = static_cast<unsigned int>(std::strlen(s)) + 1;
    l.realloc(n);
    std::memcpy(l.data(), s, n);
}

// One unsolicited message: the instance of the proxy it reached, and the first six
// big-endian words of its body (a short last word padded with zero bytes).
struct Event {
    std::uint32_t source;
    std::vector<std::uint32_t> words;
};

// Every event that reached the callback `take`, in order, for the test to wait on.
class BoardEvents {
  public:
    static BoardEvents& get() {
        static BoardEvents box;
        return box;
    }
    static void take(tolk::Addressable* a, tolk::Msg* m) {
        Event e{a->getTgtDesc().instance, {}};
        const unsigned char* p = tkMsgBody(m->getMsgRef());
        for (unsigned int off = 0; off < m->getSize() && e.words.size() < 6; off += 4) {
            std::uint32_t v = 0;
            for (unsigned int i = 0; i < 4; ++i) {
                v = (v << 8) | (off + i < m->getSize() ? p[off + i] : 0u);
            }
            e.words.push_back(v);
        }
        delete m;
        BoardEvents& box = get();
        std::lock_guard<std::mutex> g(box.lock_);
        box.events_.push_back(std::move(e));
        box.cv_.notify_all();
    }

    // The words of the events so far, once there are `n` or five seconds have passed.
    std::vector<std::vector<std::uint32_t>> waitFor(std::size_t n) {
        std::unique_lock<std::mutex> g(lock_);
        cv_.wait_for(g, std::chrono::seconds(5), [&] { return events_.size() >= n; });
        std::vector<std::vector<std::uint32_t>> words;
        for (const Event& e : events_) {
            words.push_back(e.words);
        }
        return words;
    }
    // The first event that satisfies `pred` within five seconds.
    template <class P>
    bool waitUntil(P pred, Event* found = nullptr) {
        std::unique_lock<std::mutex> g(lock_);
        return cv_.wait_for(g, std::chrono::seconds(5), [&] {
            for (const Event& e : events_) {
                if (pred(e)) {
                    if (found != nullptr) {
                        *found = e;
                    }
                    return true;
                }
            }
            return false;
        });
    }
    void clear() {
        std::lock_guard<std::mutex> g(lock_);
        events_.clear();
    }

  private:
    std::mutex lock_;
    std::condition_variable cv_;
    std::vector<Event> events_;
};

}  // namespace testsupport
