#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <iostream>
#include <sstream>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "transport/IsaSync.h"
#include "transport/TKSCommon.h"
#include "transport/TKSWholeLine.h"

namespace {

using namespace std::chrono_literals;
using Clock = std::chrono::steady_clock;

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

TEST_F(CleanupStack, PopRunsOnlyWhenAskedAndTheDestructorRunsTheRestNewestFirst) {
    runLock.lock();
    {
        TKSThread::control c(status, runLock);
        EXPECT_EQ(0, c.popCleanup(1));
        for (int i = 1; i <= 4; ++i) {
            c.pushCleanup(recordOne, arg(i));
        }
        // The answer is whether entries remain, not how many.
        EXPECT_EQ(1, c.popCleanup(0));
        EXPECT_TRUE(order.empty());
        EXPECT_EQ(1, c.popCleanup(1));
        EXPECT_EQ(std::vector<int>({3}), order);
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

TEST(TKSMutexSignal, AnotherThreadReleasesAWaiterAtOnceNotAtTheNextStep) {
    TKSMutex gate;
    gate.lock();
    std::thread opener([&] {
        std::this_thread::sleep_for(20ms);
        gate.unlock();
    });
    auto t0 = Clock::now();
    // A wait that looked again only every step would sit here for 20 s.
    EXPECT_TRUE(gate.tryLock(60000, 20000));
    EXPECT_LT(Clock::now() - t0, 10s);
    opener.join();
}

TEST(TKSMutexSignal, TryLockIsABinarySignalAndItsTimeOutKeepsItsLength) {
    TKSMutex gate;
    EXPECT_TRUE(gate.tryLock());
    EXPECT_FALSE(gate.tryLock());
    gate.unlock();
    gate.unlock();  // unlocking an open signal leaves it open, once
    EXPECT_TRUE(gate.tryLock());
    auto t0 = Clock::now();
    EXPECT_FALSE(gate.tryLock(100, 10));
    EXPECT_GE(Clock::now() - t0, 100ms);
    EXPECT_FALSE(gate.tryLock(0, 10));
    // A step larger than the time-out tries once.
    EXPECT_FALSE(gate.tryLock(5, 10));
    gate.unlock();
    EXPECT_TRUE(gate.tryLock(5, 10));
}

struct Body : TKSRunnable {
    std::atomic<int> runs{0};
    std::atomic<bool> release{false};
    void* run(void*, void* arg) {
        ++runs;
        while (!release.load()) {
            std::this_thread::sleep_for(1ms);
        }
        return arg;
    }
};

TEST(TKSThread, StartRunsTheMemberBodyAndJoinWaitsForIt) {
    Body body;
    // A stack smaller than the default is raised to it, not refused.
    TKSThread t(static_cast<TKSRunnable*>(&body), static_cast<TKSThread::MemberBody>(&Body::run),
                1);
    t.join();  // before any start: returns at once
    EXPECT_EQ(TKSThread::NOT_RUNNING, t.getStatus());
    int token = 0;
    t.start(&token);
    EXPECT_EQ(TKSThread::RUNNING, t.getStatus());
    EXPECT_THROW(t.start(nullptr), TKSThread::AlreadyActive);
    body.release = true;
    t.join();
    EXPECT_EQ(TKSThread::NOT_RUNNING, t.getStatus());
    EXPECT_EQ(&token, t.getResult());
    EXPECT_EQ(1, body.runs.load());
    // A thread that ended can be started again.
    t.start(nullptr);
    t.join();
    EXPECT_EQ(2, body.runs.load());
}

std::atomic<int> g_cleanups{0};
void* countCleanup(void*) {
    ++g_cleanups;
    return nullptr;
}

TEST(TKSThread, CancelIsNoticedByTestCancelWhichRunsTheCleanups) {
    g_cleanups = 0;
    static std::atomic<bool> started;
    started = false;
    TKSThread t(
        [](void* control, void*) -> void* {
            auto* c = static_cast<TKSThread::control*>(control);
            c->pushCleanup(countCleanup, nullptr);
            c->pushCleanup(countCleanup, nullptr);
            started = true;
            for (;;) {
                c->testCancel();
                std::this_thread::sleep_for(1ms);
            }
        },
        0);
    t.start(nullptr);
    while (!started.load()) {
        std::this_thread::sleep_for(1ms);
    }
    t.cancel();
    t.join();
    EXPECT_EQ(2, g_cleanups.load());
    EXPECT_EQ(TKSThread::NOT_RUNNING, t.getStatus());
}

// Records its own end, so that a test can see who deleted it.
class SelfDeleting : public TKSThread {
  public:
    explicit SelfDeleting(std::atomic<int>& deletions)
        : TKSThread(static_cast<TKSRunnable*>(&body),
                    static_cast<TKSThread::MemberBody>(&Body::run), 0),
          deletions(deletions) {}
    ~SelfDeleting() override { ++deletions; }
    Body body;

  private:
    std::atomic<int>& deletions;
};

TEST(TKSThread, SelfDeletingThreadDeletesItsObjectOnceWhenTheBodyEnds) {
    std::atomic<int> deletions{0};
    auto* t = new SelfDeleting(deletions);
    t->setSelfDelete(1);
    t->start(nullptr);
    EXPECT_EQ(0, deletions.load());
    t->body.release = true;
    for (int i = 0; i < 5000 && deletions.load() == 0; ++i) {
        std::this_thread::sleep_for(1ms);
    }
    std::this_thread::sleep_for(10ms);
    EXPECT_EQ(1, deletions.load());
}

TEST(TKSThread, ExceptionFromABodyEndsOnlyThatThread) {
    TKSThread t([](void*, void*) -> void* { throw 42; }, 0);
    testing::internal::CaptureStderr();
    t.start(nullptr);
    t.join();
    std::string err = testing::internal::GetCapturedStderr();
    EXPECT_NE(std::string::npos, err.find("exception left a thread body"));
    EXPECT_EQ(TKSThread::NOT_RUNNING, t.getStatus());
}

TEST(TKSWholeLine, ReportsOfThreadsWritingAtOnceArriveWholeAndKeepTheirManipulators) {
    testing::internal::CaptureStderr();
    auto report = [](char who) {
        for (int i = 0; i < 400; ++i) {
            TKSWholeLine() << "report " << who << " of type 0x" << std::hex << 0x1214 << std::dec
                           << " number " << i << std::endl;
        }
    };
    std::thread a(report, 'a');
    std::thread b(report, 'b');
    a.join();
    b.join();
    std::cerr << 255 << std::endl;
    std::istringstream err(testing::internal::GetCapturedStderr());
    int whole = 0;
    std::string line;
    while (std::getline(err, line) && line != "255") {
        ASSERT_THAT(line, testing::MatchesRegex("report [ab] of type 0x1214 number [0-9]+"));
        ++whole;
    }
    EXPECT_EQ(800, whole);
    EXPECT_EQ("255", line) << "std::hex of a report reached std::cerr";
}

TEST(TKSThread, DestructorStopsARunningThread) {
    static std::atomic<bool> ended;
    ended = false;
    {
        TKSThread t(
            [](void* control, void*) -> void* {
                auto* c = static_cast<TKSThread::control*>(control);
                while (!c->cancelled()) {
                    std::this_thread::sleep_for(1ms);
                }
                ended = true;
                return nullptr;
            },
            0);
        t.start(nullptr);
    }
    EXPECT_TRUE(ended.load());
}

TEST(TKSThread, AbandonedThreadRunsWithoutControl) {
    static std::atomic<void*> seenControl;
    static std::atomic<bool> done;
    seenControl = reinterpret_cast<void*>(1);
    done = false;
    TKSAbandonedThread_create(
        [](void* control, void*) -> void* {
            seenControl = control;
            done = true;
            return nullptr;
        },
        nullptr, 0);
    while (!done.load()) {
        std::this_thread::sleep_for(1ms);
    }
    EXPECT_EQ(nullptr, seenControl.load());
}

struct Counted {
    static std::atomic<int> alive;
    Counted() { ++alive; }
    virtual ~Counted() { --alive; }
};
std::atomic<int> Counted::alive{0};

struct Derived : Counted {};

TEST(RefPtrConcurrency, CountSurvivesConcurrentCopyAndRelease) {
    for (int round = 0; round < 20; ++round) {
        auto* shared = new isa::RefPtr<Counted>(new Counted);
        std::atomic<bool> go{false};
        std::vector<std::thread> threads;
        for (int t = 0; t < 4; ++t) {
            threads.emplace_back([&, copy = *shared]() mutable {
                while (!go.load()) {
                }
                for (int i = 0; i < 2000; ++i) {
                    isa::RefPtr<Counted> a(copy);
                    isa::RefPtr<Counted> b;
                    b = a;
                    a.Detach();
                }
            });
        }
        delete shared;
        go = true;
        for (auto& t : threads) {
            t.join();
        }
        EXPECT_EQ(0, Counted::alive.load());
    }
}

TEST(RefPtrConcurrency, OneRefPtrReadWhileAnotherThreadAssignsIt) {
    isa::RefPtr<Counted> slot(new Counted);
    std::atomic<bool> stop{false};
    std::thread reader([&] {
        while (!stop.load()) {
            isa::RefPtr<Counted> copy(slot);
            EXPECT_NE(nullptr, copy.Get());
        }
    });
    for (int i = 0; i < 2000; ++i) {
        slot = isa::RefPtr<Counted>(new Counted);
    }
    stop = true;
    reader.join();
    EXPECT_EQ(1, Counted::alive.load());
}

TEST(RefPtr, LastOwnerDeletesAndAssignmentReleasesTheOldObject) {
    {
        isa::RefPtr<Counted> a(new Counted);
        isa::RefPtr<Counted> b(new Counted);
        isa::RefPtr<Counted>& alias = a;
        a = alias;
        EXPECT_EQ(2, Counted::alive.load());
        {
            isa::RefPtr<Counted> c(a);
            c = b;
            EXPECT_EQ(b.Get(), c.Get());
            a = c;
            EXPECT_EQ(1, Counted::alive.load());
        }
        isa::RefPtr<Counted> fromDerived = isa::RefPtr<Derived>(new Derived);
        EXPECT_EQ(2, Counted::alive.load());
        fromDerived.Detach();
        EXPECT_EQ(nullptr, fromDerived.Get());
        EXPECT_EQ(1, Counted::alive.load());
        isa::RefPtr<Counted> null(nullptr);
        isa::RefPtr<Counted> nullCopy(null);
        EXPECT_EQ(nullptr, static_cast<Counted*>(nullCopy));
    }
    EXPECT_EQ(0, Counted::alive.load());
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
