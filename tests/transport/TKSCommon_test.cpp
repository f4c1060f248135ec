#include "transport/TKSCommon.h"

#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <vector>

#include "transport/IsaSync.h"

namespace {

TEST(TKSMutex, TryLockIsABinarySignal) {
    TKSMutex m;
    EXPECT_TRUE(m.tryLock());
    EXPECT_FALSE(m.tryLock());
    m.unlock();
    EXPECT_TRUE(m.tryLock());
    m.unlock();
    m.unlock();  // unlocking an open signal leaves it open, once
    EXPECT_TRUE(m.tryLock());
    EXPECT_FALSE(m.tryLock());
}

TEST(TKSMutex, StepLargerThanTheTimeOutTriesOnce) {
    TKSMutex m;
    m.lock();
    EXPECT_FALSE(m.tryLock(5, 10));
    m.unlock();
    EXPECT_TRUE(m.tryLock(5, 10));
}

TEST(TKSCommon, SleepChecksItsLimit) {
    tks_sleep_ms(0);
    tks_sleep_ms(1);
    EXPECT_DEATH(tks_sleep_ms(1001), "miliseconds <= 1000");
}

TEST(TKSCommon, HostInitSucceeds) {
    EXPECT_EQ(0, TKSHostInit());
    TKSHostCleanup();
}

struct Recorder {
    std::vector<int> order;
};

std::vector<int>* g_order = nullptr;

void* recordOne(void* arg) {
    g_order->push_back(static_cast<int>(reinterpret_cast<std::intptr_t>(arg)));
    return nullptr;
}

void* throwingCleanup(void*) {
    throw std::runtime_error("cleanup");
}

class CleanupStack : public ::testing::Test {
  protected:
    void SetUp() override { g_order = &order; }
    void TearDown() override { g_order = nullptr; }
    std::vector<int> order;
    std::atomic<int> status{TKSThread::RUNNING};
    TKSMutex runLock;
};

void* arg(int v) {
    return reinterpret_cast<void*>(static_cast<std::intptr_t>(v));
}

TEST_F(CleanupStack, PopReportsWhatRemainsAndRunsOnlyWhenAsked) {
    TKSThread::control c(status, runLock);
    EXPECT_EQ(0, c.popCleanup(1));
    c.pushCleanup(recordOne, arg(1));
    c.pushCleanup(recordOne, arg(2));
    EXPECT_EQ(1, c.popCleanup(0));
    EXPECT_TRUE(order.empty());
    EXPECT_EQ(0, c.popCleanup(1));
    EXPECT_EQ(std::vector<int>({1}), order);
}

TEST_F(CleanupStack, DestructorRunsTheRestNewestFirstAndOpensRunLock) {
    runLock.lock();
    {
        TKSThread::control c(status, runLock);
        c.pushCleanup(recordOne, arg(1));
        c.pushCleanup(recordOne, arg(2));
        c.pushCleanup(recordOne, arg(3));
    }
    EXPECT_EQ(std::vector<int>({3, 2, 1}), order);
    EXPECT_TRUE(runLock.tryLock());
}

TEST_F(CleanupStack, ThrowingCleanupIsReportedAndReRaised) {
    TKSThread::control c(status, runLock);
    c.pushCleanup(recordOne, arg(1));
    c.pushCleanup(throwingCleanup, nullptr);
    testing::internal::CaptureStderr();
    EXPECT_THROW(c.popCleanup(1), std::runtime_error);
    std::string err = testing::internal::GetCapturedStderr();
    EXPECT_EQ("ERROR: in ~TKSThread::control::popCleanup, cleanup threw exception\n", err);
    // The failed entry is gone; the one below it is still there.
    EXPECT_EQ(0, c.popCleanup(1));
    EXPECT_EQ(std::vector<int>({1}), order);
}

TEST(TKSThread, JoinOnANeverStartedThreadReturnsAtOnce) {
    TKSThread t([](void*, void*) -> void* { return nullptr; }, 0);
    t.join();
    EXPECT_EQ(TKSThread::NOT_RUNNING, t.getStatus());
}

struct Counted {
    static int alive;
    Counted() { ++alive; }
    virtual ~Counted() { --alive; }
};
int Counted::alive = 0;

struct Derived : Counted {};

TEST(RefPtr, LastOwnerDeletes) {
    {
        isa::RefPtr<Counted> a(new Counted);
        {
            isa::RefPtr<Counted> b(a);
            isa::RefPtr<Counted> c;
            c = b;
            EXPECT_EQ(a.Get(), c.Get());
        }
        EXPECT_EQ(1, Counted::alive);
    }
    EXPECT_EQ(0, Counted::alive);
}

TEST(RefPtr, SelfAssignmentKeepsTheObject) {
    isa::RefPtr<Counted> a(new Counted);
    isa::RefPtr<Counted>& alias = a;
    a = alias;
    EXPECT_EQ(1, Counted::alive);
    EXPECT_NE(nullptr, a.Get());
    a.Detach();
    EXPECT_EQ(0, Counted::alive);
    EXPECT_EQ(nullptr, a.Get());
}

TEST(RefPtr, AssignmentReleasesTheOldObject) {
    isa::RefPtr<Counted> a(new Counted);
    isa::RefPtr<Counted> b(new Counted);
    EXPECT_EQ(2, Counted::alive);
    a = b;
    EXPECT_EQ(1, Counted::alive);
    isa::RefPtr<Counted> fromDerived = isa::RefPtr<Derived>(new Derived);
    EXPECT_EQ(2, Counted::alive);
    isa::RefPtr<Counted> null(nullptr);
    isa::RefPtr<Counted> nullCopy(null);
    EXPECT_EQ(nullptr, static_cast<Counted*>(nullCopy));
}

TEST(CriticalSection, IsNotRecursiveAndGuardTracksItsState) {
    isa::CriticalSection cs;
    {
        isa::AutoCriticalSection guard(cs);
        EXPECT_FALSE(cs.TryEnter());
        guard.Leave();
        EXPECT_TRUE(cs.TryEnter());
        cs.Leave();
        guard.Enter();
        EXPECT_FALSE(cs.TryEnter());
    }
    EXPECT_TRUE(cs.TryEnter());
    cs.Leave();
}

}  // namespace
