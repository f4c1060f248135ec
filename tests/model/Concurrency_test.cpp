// Event publishers while events flow on their readers' threads, and the relay restore's tasks.
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "RecordingObserver.h"
#include "SimFixture.h"
#include "model/AllAlarms.h"
#include "model/RelayRestore.h"
#include "model/TrunkState.h"
#include "model/VX7EventPublisher.h"
#include "model/VX7EventZLGLogger.h"

namespace {

using namespace vx7diag;

class PublisherConcurrency : public SimFixture {
  protected:
    static void SetUpTestSuite() { UseFarm(""); }
    static inline AllAlarms allAlarms;
    static inline TrunkState trunkState;
};

// Observers come and go on the console thread while a burst of events is being delivered on the
// publisher's reader thread: every event that reaches an observer is whole and of its trunk.
TEST_F(PublisherConcurrency, AttachAndDetachWhileEventsFlow) {
    auto publisher = std::make_unique<VX7EventPublisher>(1, 1, 1);
    isa::RefPtr<Observer> steady(new RecordingObserver);
    auto& recorder = *static_cast<RecordingObserver*>(steady.Get());
    ASSERT_TRUE(publisher->Attach(steady, &allAlarms));
    Control("bpv 1 1 300");
    for (int i = 0; i < 20; ++i) {
        isa::RefPtr<Observer> passing(new RecordingObserver);
        ASSERT_TRUE(publisher->Attach(passing, &allAlarms));
        ASSERT_TRUE(publisher->Attach(passing, &trunkState));
        EXPECT_EQ(publisher->Detach(passing, trunkState), 0);
        EXPECT_EQ(publisher->Detach(passing, allAlarms), 1);
    }
    EXPECT_NE(recorder.WaitFor("Alarm Event:  board=1 trunk=1 type=Bipolar Violation Saturation"),
              "");
    for (const std::string& text : recorder.Texts()) {
        EXPECT_EQ(text.rfind("Alarm Event:  board=1 trunk=1 type=", 0), 0u) << text;
    }
    EXPECT_EQ(publisher->Detach(steady, allAlarms), 0);
}

// Two publishers share the process-wide aspect: an event in delivery for one never shows the
// board, trunk or channel of the other, and a logger attached to both serialises its writes.
TEST_F(PublisherConcurrency, TwoTrunksOneAspect) {
    VX7EventPublisher first(1, 1, 1);
    VX7EventPublisher second(1, 2, 1);
    isa::RefPtr<Observer> one(new RecordingObserver);
    isa::RefPtr<Observer> two(new RecordingObserver);
    isa::RefPtr<Observer> logger(new VX7EventZLGLogger);
    ASSERT_TRUE(first.Attach(one, &allAlarms));
    ASSERT_TRUE(second.Attach(two, &allAlarms));
    ASSERT_TRUE(first.Attach(logger, &allAlarms));
    ASSERT_TRUE(second.Attach(logger, &allAlarms));
    testing::internal::CaptureStdout();
    Control("ferr 1 1 300");
    Control("ferr 1 2 300");
    auto& r1 = *static_cast<RecordingObserver*>(one.Get());
    auto& r2 = *static_cast<RecordingObserver*>(two.Get());
    for (int i = 0; i < 500 && (r1.Texts().size() < 300 || r2.Texts().size() < 300); ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    testing::internal::GetCapturedStdout();
    EXPECT_EQ(r1.Texts(),
              std::vector<std::string>(
                  300, "Alarm Event:  board=1 trunk=1 type=Frame Error Saturation state=Active"));
    EXPECT_EQ(r2.Texts(),
              std::vector<std::string>(
                  300, "Alarm Event:  board=1 trunk=2 type=Frame Error Saturation state=Active"));
}

// A view that goes while its line is busy: the publisher is destroyed with events in flight,
// and nothing on the reader thread reaches it afterwards.
TEST_F(PublisherConcurrency, PublisherDestroyedWhileEventsFlow) {
    for (int round = 0; round < 5; ++round) {
        auto publisher = std::make_unique<VX7EventPublisher>(1, 2, 1);
        isa::RefPtr<Observer> watcher(new RecordingObserver);
        ASSERT_TRUE(publisher->Attach(watcher, &allAlarms));
        Control("bpv 1 2 200");
        std::this_thread::sleep_for(std::chrono::milliseconds(2 * round));
        publisher.reset();
    }
    // The line keeps working for a new publisher.
    VX7EventPublisher fresh(1, 2, 1);
    isa::RefPtr<Observer> watcher(new RecordingObserver);
    ASSERT_TRUE(fresh.Attach(watcher, &trunkState));
    Control("line 1 2 out 1");
    EXPECT_EQ(static_cast<RecordingObserver*>(watcher.Get())->WaitFor("Trunk State"),
              "Trunk State board=1 trunk=2 state=Out Of Service reason=Diagnostic");
    Control("line 1 2 in 0");
}

using namespace std::chrono_literals;

bool WaitFor(const std::atomic<int>& value, int atLeast) {
    const auto deadline = std::chrono::steady_clock::now() + 5s;
    while (value.load() < atLeast) {
        if (std::chrono::steady_clock::now() > deadline) {
            return false;
        }
        std::this_thread::sleep_for(1ms);
    }
    return true;
}

// A view's task captures the view: once the view has removed it, it must neither be running
// (the view is about to be freed) nor run again.
TEST(RelayRestore, RemovedTaskHasFinishedAndNeverRunsAgain) {
    std::atomic<int> begun{0};
    std::atomic<int> ended{0};
    int id = RelayRestore::Add([&] {
        ++begun;
        std::this_thread::sleep_for(200ms);
        ++ended;
    });
    RelayRestore::RunAll();
    ASSERT_TRUE(WaitFor(begun, 1));
    RelayRestore::Remove(id);
    EXPECT_EQ(1, ended.load());

    std::atomic<int> other{0};
    int later = RelayRestore::Add([&] { ++other; });
    RelayRestore::RunAll();
    ASSERT_TRUE(WaitFor(other, 1));
    EXPECT_EQ(1, begun.load());
    RelayRestore::Remove(later);
}

TEST(RelayRestore, TasksRunInTheOrderTheyCameAndAFailingOneStopsNoOther) {
    std::vector<std::string> order;
    std::atomic<int> done{0};
    int first = RelayRestore::Add([&] { order.push_back("first"); });
    int failing = RelayRestore::Add([] { throw std::runtime_error("board gone"); });
    int last = RelayRestore::Add([&] {
        order.push_back("last");
        ++done;
    });
    RelayRestore::RunAll();
    ASSERT_TRUE(WaitFor(done, 1));
    EXPECT_EQ(std::vector<std::string>({"first", "last"}), order);
    for (int id : {first, failing, last}) {
        RelayRestore::Remove(id);
    }
}

}  // namespace
