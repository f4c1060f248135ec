#include "model/Trunk.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "LogCapture.h"
#include "SimFixture.h"
#include "model/Guarded.h"

namespace {

using vx7diag::Trunk;
using vx7diag::TrunkStatus;

constexpr unsigned int kGetAlarms = 0x1602;
constexpr unsigned int kGetLineState = 0x1608;
constexpr unsigned int kSendAlarm = 0x160C;
constexpr unsigned int kTransmitRAI = 0x160B;

class TrunkTest : public SimFixture {
  protected:
    static void SetUpTestSuite() { UseFarm(""); }
};

// 257 and the unsigned form of -255 both end in the byte 1: they must not reach board 1's line.
TEST_F(TrunkTest, OnlyLinesOfTheFarmAreTrunks) {
    EXPECT_NO_THROW(Trunk(1, 1));
    EXPECT_THROW(Trunk(1, 3), vx7diag::BoardFailure);
    EXPECT_THROW(Trunk(33, 1), vx7diag::BoardFailure);
    EXPECT_THROW(Trunk(257, 1), vx7diag::BoardFailure);
    EXPECT_THROW(Trunk(static_cast<unsigned int>(-255), 1), vx7diag::BoardFailure);
}

TEST_F(TrunkTest, ServiceChangesTheLineState) {
    Trunk trunk(1, 1);
    unsigned int state = 0, reason = 0;
    trunk.PutOutOfService();
    ASSERT_EQ(trunk.GetTrunkState(state, reason), 0);
    EXPECT_EQ(state, Trunk::OUT_OF_SERVICE);
    EXPECT_EQ(reason, 4u);
    EXPECT_EQ(trunk.GetTrunkState(), Trunk::OUT_OF_SERVICE);
    trunk.PutInService();
    EXPECT_EQ(trunk.GetTrunkState(), Trunk::IN_SERVICE);
    // Putting it in service again is reported, not thrown.
    testsupport::LogCapture out;
    EXPECT_NO_THROW(trunk.PutInService());
    EXPECT_EQ(out.Text(), "Trunk already In Service\n");
}

TEST_F(TrunkTest, OtherRefusalsOfServicePrintTheException) {
    Trunk trunk(1, 2);
    Refuse(0x1610, 0x42);
    {
        testsupport::LogCapture out;
        trunk.PutInService();
        EXPECT_EQ(out.Text(), "");
    }
    testsupport::LogCapture out;
    trunk.PutOutOfService();
    EXPECT_EQ(out.Text().rfind("Addressable::UnexpectedMsg", 0), 0u) << out.Text();
}

TEST_F(TrunkTest, LoopBackModes) {
    Trunk trunk(1, 1);
    for (unsigned char mode : {1, 2}) {
        trunk.EnableLoopBack(mode);
        EXPECT_EQ(trunk.GetLoopBackMode(), mode);
    }
    trunk.DisableLoopBack();
    EXPECT_EQ(trunk.GetLoopBackMode(), 0);
}

TEST_F(TrunkTest, RefusedAlarmLeavesTheTrunkUsable) {
    Trunk trunk(1, 1);
    EXPECT_EQ(trunk.StartTransmitAlarm(kTransmitRAI), 0);
    EXPECT_EQ(trunk.StopTransmitAlarm(kTransmitRAI), 0);
    Refuse(kSendAlarm);
    {
        testsupport::LogCapture out;
        EXPECT_EQ(trunk.StartTransmitAlarm(kTransmitRAI), -1);
        EXPECT_NE(out.Text().find("Addressable::UnexpectedMsg"), std::string::npos);
    }
    unsigned int state = 0, reason = 0;
    EXPECT_EQ(trunk.GetTrunkState(state, reason), 0);
}

TEST_F(TrunkTest, StatusShowsTheActiveAlarms) {
    Trunk trunk(1, 1);
    trunk.PutInService();
    std::unique_ptr<TrunkStatus> status(TrunkStatus::TryCreate(&trunk));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->GetState(), Trunk::IN_SERVICE);
    EXPECT_EQ(status->GetRedCFA() + status->GetYellowCFA() + status->GetDChanCFA() +
                  status->GetBPVSCnt() + status->GetFERRCnt() + status->GetLOSCFA() +
                  status->GetLoopBackCFA(),
              0u);

    Control("alarm 1 1 red on");
    Control("alarm 1 1 los on");
    std::map<unsigned int, char> alarms = trunk.GetCurrentAlarms();
    EXPECT_EQ(alarms.count(0), 0u);
    EXPECT_EQ(alarms[0x1601], 1);
    status.reset(TrunkStatus::TryCreate(&trunk));
    Control("alarm 1 1 red off");
    Control("alarm 1 1 los off");
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->GetRedCFA(), 1u);
    EXPECT_EQ(status->GetLOSCFA(), 1u);
    EXPECT_EQ(status->GetYellowCFA(), 0u);
    EXPECT_EQ(status->GetLoopBackCFA(), 0u);
}

TEST_F(TrunkTest, StatusOfAnUnreadableLineStateStillReadsTheAlarms) {
    Trunk trunk(1, 1);
    Control("alarm 1 1 yellow on");
    Refuse(kGetLineState);
    std::unique_ptr<TrunkStatus> status(TrunkStatus::TryCreate(&trunk));
    Control("alarm 1 1 yellow off");
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->GetState(), Trunk::OUT_OF_SERVICE);
    EXPECT_EQ(status->GetReason(), 0u);
    EXPECT_EQ(status->GetYellowCFA(), 1u);
}

TEST_F(TrunkTest, UnreadableAlarmsMeanNoStatusButNoException) {
    Trunk trunk(1, 1);
    Refuse(kGetAlarms);
    EXPECT_THROW(TrunkStatus{&trunk}, tolk::Addressable::UnexpectedMsg);
    testsupport::LogCapture out;
    EXPECT_EQ(TrunkStatus::TryCreate(&trunk), nullptr);
    EXPECT_EQ(out.Text().rfind("TrunkStatus - Addressable::UnexpectedMsg", 0), 0u) << out.Text();
}

}  // namespace
