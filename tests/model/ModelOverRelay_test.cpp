// The model against vx7sim over the relay transport: the same operations as against the
// built-in emulation, with the boards on the other side of a TCP connection.
#include <gtest/gtest.h>

#include <cstdlib>
#include <string>

#include "RecordingObserver.h"
#include "SimFixture.h"
#include "SimServer.h"
#include "model/AllAlarms.h"
#include "model/BoardManager.h"
#include "model/Phone.h"
#include "model/Trunk.h"
#include "model/VX7EventPublisher.h"

namespace {

using namespace vx7diag;

class ModelOverRelay : public ::testing::Test {
  protected:
    void SetUp() override {
        ASSERT_TRUE(relay.Running());
        unsetenv("HOST");
        setenv("REMOTE_TKHOST", relay.Address().c_str(), 1);
    }
    void TearDown() override { unsetenv("REMOTE_TKHOST"); }
    lineprobe::testing::SimServer relay{LINEPROBE_FARMS_DIR "/default.toml"};
};

TEST_F(ModelOverRelay, DiscoveryCallsLinesAndEvents) {
    // The device map stays on this host; only the boards are behind the relay.
    SimFixture::UseFarm("");
    BoardManager manager(1);
    EXPECT_EQ(manager.GetBoardType(), BoardManager::DIGITAL_BOARD);
    EXPECT_EQ(manager.GetSignalingType(2), 4);

    Phone phone(&manager, 1, 9);
    unsigned int callId = phone.MakeCall("5551220", "5551221");
    EXPECT_NE(callId, 0u);
    EXPECT_EQ(phone.DropCall(callId), 0);

    Trunk trunk(1, 2);
    trunk.EnableLoopBack(2);
    EXPECT_EQ(trunk.GetLoopBackMode(), 2);
    trunk.DisableLoopBack();

    static AllAlarms alarms;
    VX7EventPublisher publisher(1, 2, 1);
    isa::RefPtr<Observer> watcher(new RecordingObserver);
    ASSERT_TRUE(publisher.Attach(watcher, &alarms));
    EXPECT_EQ(relay.Control("alarm 1 2 yellow on").rfind("ok", 0), 0u);
    EXPECT_EQ(static_cast<RecordingObserver*>(watcher.Get())->WaitFor("Alarm Event:"),
              "Alarm Event:  board=1 trunk=2 type=Yellow state=Active");
    relay.Control("alarm 1 2 yellow off");
    EXPECT_EQ(publisher.Detach(watcher, alarms), 0);

    relay.Control("refuse 1214");
    EXPECT_EQ(phone.MakeCall("5551220", "5551221"), 0u);
}

}  // namespace
