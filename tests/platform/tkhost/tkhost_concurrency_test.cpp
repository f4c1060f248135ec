#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <thread>

#include "platform/tkhost/tkhost.h"
#include "platform/tkhost/tkhost_switch.h"

namespace {

using namespace std::chrono_literals;

struct BoundQueue {
    TKQueueHandle q = tkQueueOpen();
    TKCompDesc addr{};
    BoundQueue() { EXPECT_EQ(TK_OK, tkQueueBind(q, &addr)); }
    ~BoundQueue() { tkQueueClose(q); }
};

TEST(TkSwitchBlocking, ReadWakesWhenABlockArrives) {
    BoundQueue a;
    std::atomic<unsigned int> type{0};
    std::thread reader([&] {
        TKMsg32Bit* m = nullptr;
        if (tkMsgRead(a.q, 0, &m) == TK_OK) {
            type = m->type;
            tkMsgFree(m);
        }
    });
    std::this_thread::sleep_for(20ms);
    TKMsg32Bit* m = nullptr;
    tkMsgAllocate(4, &m);
    m->type = 99;
    tkMsgFieldPut(m, TK_FIELD_TGT, &a.addr);
    ASSERT_EQ(TK_OK, tkMsgWrite(a.q, m, 0));
    reader.join();
    EXPECT_EQ(99u, type.load());
}

class TkSwitchWake : public ::testing::TestWithParam<bool> {};

TEST_P(TkSwitchWake, CloseOrUnbindWakesABlockedReader) {
    TKQueueHandle q = tkQueueOpen();
    TKCompDesc addr{};
    ASSERT_EQ(TK_OK, tkQueueBind(q, &addr));
    std::atomic<int> status{-1};
    std::thread reader([&] {
        TKMsg32Bit* m = nullptr;
        status = tkMsgRead(q, 0, &m);
        tkMsgFree(m);
    });
    std::this_thread::sleep_for(20ms);
    if (GetParam()) {
        tkQueueClose(q);
    } else {
        tkQueueUnbind(q, addr);
    }
    reader.join();
    EXPECT_EQ(TK_ERR_CLOSED, status.load());
    if (!GetParam()) {
        tkQueueClose(q);
    }
}

INSTANTIATE_TEST_SUITE_P(CloseAndUnbind, TkSwitchWake, ::testing::Bool());

TEST(TkSwitchBlocking, ManyWritersOneReaderLoseNothing) {
    BoundQueue a;
    constexpr int kWriters = 4, kEach = 500;
    std::vector<std::thread> writers;
    for (int w = 0; w < kWriters; ++w) {
        writers.emplace_back([&] {
            for (int i = 0; i < kEach; ++i) {
                TKMsg32Bit* m = nullptr;
                tkMsgAllocate(0, &m);
                tkMsgFieldPut(m, TK_FIELD_TGT, &a.addr);
                tkMsgWrite(a.q, m, 0);
            }
        });
    }
    int got = 0;
    while (got < kWriters * kEach) {
        TKMsg32Bit* m = nullptr;
        ASSERT_EQ(TK_OK, tkMsgRead(a.q, 0, &m));
        tkMsgFree(m);
        ++got;
    }
    for (auto& t : writers) {
        t.join();
    }
    EXPECT_EQ(kWriters * kEach, got);
}

}  // namespace
