#include "model/VX7EventPublisher.h"

#include <gtest/gtest.h>

#include <string>

#include "LogCapture.h"
#include "RecordingObserver.h"
#include "SimFixture.h"
#include "model/AllAlarms.h"
#include "model/BoardManager.h"
#include "model/Phone.h"
#include "model/TSCCallState.h"
#include "model/TSCChanState.h"
#include "model/TrunkState.h"

namespace {

using namespace vx7diag;

constexpr unsigned int kClusterFind = 0x800053;
constexpr unsigned int kDetectxEvts = 0x18;
constexpr unsigned int kCancelxEvts = 0x1C;

class Publisher : public SimFixture {
  protected:
    static void SetUpTestSuite() { UseFarm(""); }

    // The aspects are process-wide objects, as the console's factory makes them.
    static TSCCallState callState;
    static TSCChanState chanState;
    static TrunkState trunkState;
    static AllAlarms allAlarms;

    isa::RefPtr<Observer> first{new RecordingObserver};
    isa::RefPtr<Observer> second{new RecordingObserver};
    RecordingObserver& Recorder(isa::RefPtr<Observer>& o) {
        return *static_cast<RecordingObserver*>(o.Get());
    }
};

TSCCallState Publisher::callState;
TSCChanState Publisher::chanState;
TrunkState Publisher::trunkState;
AllAlarms Publisher::allAlarms;

// The components and clusters the publisher holds, named in one line.
std::string Held(const VX7EventPublisher& p) {
    return std::string(p.GetTsc() != nullptr ? "tsc " : "") +
           (p.GetLcon() != nullptr ? "lcon " : "") + (p.GetCas() != nullptr ? "cas " : "") +
           (p.GetChp() != nullptr ? "chp " : "") +
           (p.GetTscCluster() != nullptr ? "tscCluster " : "") +
           (p.GetLconCluster() != nullptr ? "lconCluster " : "");
}

TEST_F(Publisher, FirstObserverSubscribesSecondSendsNothing) {
    VX7EventPublisher publisher(1, 1, 2);
    EXPECT_EQ(publisher.Detach(first, callState), 0);
    ASSERT_TRUE(publisher.Attach(first, &callState));
    EXPECT_EQ(Held(publisher), "tsc tscCluster lconCluster ");
    EXPECT_EQ(publisher.GetCount(VX7EventPublisher::TSC_COMPONENT), 1u);

    // Had the second observer asked the board again, the refusal would have failed it.
    Refuse(kDetectxEvts);
    EXPECT_TRUE(publisher.Attach(second, &callState));
    EXPECT_EQ(publisher.GetCount(VX7EventPublisher::TSC_COMPONENT), 1u);
    EXPECT_FALSE(publisher.Attach(second, &callState));
    EXPECT_EQ(publisher.Detach(second, callState), 1);
    EXPECT_EQ(publisher.Detach(first, callState), 0);
}

// A refused subscription and a refused cluster search are failed attaches, not exceptions,
// and leave nothing behind.
TEST_F(Publisher, RefusedSubscriptionLeavesNothingBehind) {
    VX7EventPublisher publisher(1, 1, 3);
    Refuse(kDetectxEvts);
    EXPECT_FALSE(publisher.Attach(first, &callState));
    EXPECT_EQ(publisher.ObserverCount(callState), 0);
    EXPECT_EQ(Held(publisher), "");
    EXPECT_EQ(publisher.GetCount(VX7EventPublisher::TSC_COMPONENT), 0u);
    EXPECT_EQ(publisher.Detach(first, callState), 0);

    VX7EventPublisher searching(1, 1, 4);
    Refuse(kClusterFind);
    testsupport::LogCapture out;
    EXPECT_FALSE(searching.Attach(first, &callState));
    EXPECT_NE(out.Text().find("VX7EventPublisher::Attach - "), std::string::npos) << out.Text();
    EXPECT_EQ(searching.ObserverCount(callState), 0);
    EXPECT_EQ(Held(searching), "");
}

TEST_F(Publisher, ChannelAspectsShareOneTscUntilTheLastGoes) {
    VX7EventPublisher publisher(1, 1, 5);
    ASSERT_TRUE(publisher.Attach(first, &callState));
    tolk::TSC* shared = publisher.GetTsc();
    ASSERT_TRUE(publisher.Attach(first, &chanState));
    EXPECT_EQ(publisher.GetTsc(), shared);
    EXPECT_EQ(publisher.GetCount(VX7EventPublisher::TSC_COMPONENT), 2u);
    EXPECT_EQ(VX7EventPublisher::GetMyPublisher(shared), &publisher);

    EXPECT_EQ(publisher.Detach(first, chanState), 0);
    EXPECT_EQ(publisher.GetTsc(), shared);
    EXPECT_EQ(publisher.GetCount(VX7EventPublisher::TSC_COMPONENT), 1u);
    EXPECT_EQ(Held(publisher), "tsc tscCluster lconCluster ");

    EXPECT_EQ(publisher.Detach(first, callState), 0);
    EXPECT_EQ(Held(publisher), "");
    EXPECT_EQ(VX7EventPublisher::GetMyPublisher(shared), nullptr);

    // And everything is made again for the next observer.
    ASSERT_TRUE(publisher.Attach(second, &trunkState));
    EXPECT_EQ(Held(publisher), "lcon tscCluster lconCluster ");
    EXPECT_EQ(publisher.GetCount(VX7EventPublisher::LCON_COMPONENT), 1u);
}

TEST_F(Publisher, DestructorCancelsEverything) {
    tolk::TSC* tsc = nullptr;
    {
        VX7EventPublisher publisher(1, 1, 6);
        ASSERT_TRUE(publisher.Attach(first, &callState));
        ASSERT_TRUE(publisher.Attach(second, &trunkState));
        tsc = publisher.GetTsc();
        EXPECT_EQ(VX7EventPublisher::GetMyPublisher(tsc), &publisher);
    }
    EXPECT_EQ(VX7EventPublisher::GetMyPublisher(tsc), nullptr);
}

TEST_F(Publisher, SilentCancellationIsPrintedAndTheCountStays) {
    VX7EventPublisher publisher(1, 1, 7);
    ASSERT_TRUE(publisher.Attach(first, &callState));
    Silence(kCancelxEvts);
    testsupport::LogCapture out;
    EXPECT_EQ(publisher.Detach(first, callState), 0);
    std::string text = out.Text();
    EXPECT_EQ(text.rfind("UnSubscribe: TSC Component Timeout Exception.  Ignoring\n"
                         "Addressable::Timeout ObjSource: ",
                         0),
              0u)
        << text;
    EXPECT_EQ(publisher.GetCount(VX7EventPublisher::TSC_COMPONENT), 1u);
    EXPECT_NE(publisher.GetTsc(), nullptr);
    // The destructor still lets go of the component the board never released.
}

TEST_F(Publisher, LineEventsReachTheObserverWithTheirTrunk) {
    VX7EventPublisher publisher(1, 2, 1);
    ASSERT_TRUE(publisher.Attach(first, &allAlarms));
    ASSERT_TRUE(publisher.Attach(first, &trunkState));
    Control("alarm 1 2 red on");
    EXPECT_EQ(Recorder(first).WaitFor("Alarm Event:"),
              "Alarm Event:  board=1 trunk=2 type=Red state=Active");
    Control("line 1 2 out 3");
    EXPECT_EQ(Recorder(first).WaitFor("Trunk State"),
              "Trunk State board=1 trunk=2 state=Out Of Service reason=Maintenance");
    Control("line 1 2 in 0");
    Control("alarm 1 2 red off");
    EXPECT_EQ(Recorder(first).WaitFor("Alarm Event:  board=1 trunk=2 type=Red state=InActive"),
              "Alarm Event:  board=1 trunk=2 type=Red state=InActive");
    // A trunk's events do not reach the observers of another trunk.
    EXPECT_EQ(Recorder(first).WaitFor("Alarm Event:  board=1 trunk=1", 0, 200), "");
}

TEST_F(Publisher, CallStateEventsCarryTheChannel) {
    BoardManager manager(1);
    Phone caller(&manager, 1, 8);
    VX7EventPublisher publisher(1, 1, 8);
    ASSERT_TRUE(publisher.Attach(first, &callState));
    ASSERT_TRUE(publisher.Attach(second, &chanState));
    caller.SetDestAddr("5551222");
    unsigned int callId = caller.MakeCall("5551219", "5551222");
    ASSERT_NE(callId, 0u);
    std::string text = Recorder(first).WaitFor("Call State");
    EXPECT_EQ(text.rfind("Call State timestamp=", 0), 0u) << text;
    EXPECT_NE(text.find(" board=1 trunk=1 channel=8 state="), std::string::npos) << text;
    caller.DropCall(callId);
    caller.ReleaseCall(callId);
}

}  // namespace
