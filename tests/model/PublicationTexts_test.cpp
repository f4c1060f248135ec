#include "model/PublicationTexts.h"

#include <gtest/gtest.h>

#include <string>

namespace {

struct Case {
    const char* (*text)(unsigned int);
    unsigned int value;
    const char* expected;
};

class PublicationTexts : public ::testing::TestWithParam<Case> {};

TEST_P(PublicationTexts, ReadsAsTheTraceTables) {
    EXPECT_STREQ(GetParam().text(GetParam().value), GetParam().expected);
}

using namespace vx7diag;

INSTANTIATE_TEST_SUITE_P(
    ChanState, PublicationTexts,
    ::testing::Values(Case{ChanStateText, 0, "Unknown"}, Case{ChanStateText, 1, "Active"},
                      Case{ChanStateText, 2, "ActivePending"}, Case{ChanStateText, 3, "Alarm"},
                      Case{ChanStateText, 4, "OutOfService"}, Case{ChanStateText, 5, "Maintenance"},
                      Case{ChanStateText, 6, "OutOfServiceLocal"},
                      Case{ChanStateText, 7, "MaintenanceLocal"}, Case{ChanStateText, 8, "Idle"},
                      Case{ChanStateText, 9, "IdlePending"}, Case{ChanStateText, 10, "Null"},
                      Case{ChanStateText, 11, "Unknown"}, Case{ChanStateText, 12, "Unknown"},
                      Case{ChanStateText, 13, "OutOfServiceMediaDetached"},
                      Case{ChanStateText, 14, "OutOfServiceRemote"},
                      Case{ChanStateText, 15, "Unknown"}));

INSTANTIATE_TEST_SUITE_P(
    CallState, PublicationTexts,
    ::testing::Values(Case{CallStateText, 0, "Null"}, Case{CallStateText, 1, "Accepted"},
                      Case{CallStateText, 2, "Connected"},
                      Case{CallStateText, 3, "ConnectedPendXfer"},
                      Case{CallStateText, 4, "Delivered"}, Case{CallStateText, 5, "Dialing"},
                      Case{CallStateText, 6, "Disconnected"}, Case{CallStateText, 7, "DialReady"},
                      Case{CallStateText, 8, "Failed"}, Case{CallStateText, 9, "Idle"},
                      Case{CallStateText, 10, "Initiated"}, Case{CallStateText, 11, "Offered"},
                      Case{CallStateText, 12, "Hold"}, Case{CallStateText, 13, "HoldPendXfer"},
                      Case{CallStateText, 14, "Originated"}, Case{CallStateText, 15, "Proceeding"},
                      Case{CallStateText, 16, "Unknown"}, Case{CallStateText, 17, "Alerting"},
                      Case{CallStateText, 18, "IncomingProceeding"},
                      Case{CallStateText, 19, "Rejected"}, Case{CallStateText, 20, "Detected"},
                      Case{CallStateText, 21, "DialTone"}, Case{CallStateText, 22, "Unknown"},
                      Case{CallStateText, 0xFFFFFFFF, "Unknown"}));

INSTANTIATE_TEST_SUITE_P(
    Trunk, PublicationTexts,
    ::testing::Values(Case{TrunkStateText, 0x160F, "In Service"},
                      Case{TrunkStateText, 0x1610, "Out Of Service"},
                      Case{TrunkStateText, 0x1611, "Unknown"}, Case{TrunkReasonText, 0, "Normal"},
                      Case{TrunkReasonText, 1, "Diagnostic"}, Case{TrunkReasonText, 2, "Startup"},
                      Case{TrunkReasonText, 3, "Maintenance"}, Case{TrunkReasonText, 4, "Standby"},
                      Case{TrunkReasonText, 5, "Alarm"}, Case{TrunkReasonText, 6, "Unknown"}));

INSTANTIATE_TEST_SUITE_P(
    Alarms, PublicationTexts,
    ::testing::Values(
        Case{AlarmTypeText, 0x1600, "unknown"}, Case{AlarmTypeText, 0x1601, "Red"},
        Case{AlarmTypeText, 0x1602, "Yellow"}, Case{AlarmTypeText, 0x1603, "AIS"},
        Case{AlarmTypeText, 0x1604, "Loss of Signal (LOS)"},
        Case{AlarmTypeText, 0x1605, "Loopback"}, Case{AlarmTypeText, 0x1606, "RAI CRC"},
        Case{AlarmTypeText, 0x1607, "TS16 Red"}, Case{AlarmTypeText, 0x1608, "TS16 AIS"},
        Case{AlarmTypeText, 0x1609, "TS16 Yellow"}, Case{AlarmTypeText, 0x160A, "D Channel"},
        Case{AlarmTypeText, 0x160B, "Transmit RAI"}, Case{AlarmTypeText, 0x160C, "Transmit AIS"},
        Case{AlarmTypeText, 0x160D, "Transmit RAI TS16"},
        Case{AlarmTypeText, 0x160E, "Transmit AIS TS16"}, Case{AlarmTypeText, 0x160F, "unknown"},
        Case{AlarmTypeText, 0x1612, "unknown"}, Case{AlarmTypeText, 0x1615, "unknown"},
        Case{AlarmTypeText, 0x1616, "Bipolar Violation Saturation"},
        Case{AlarmTypeText, 0x1617, "Frame Error Saturation"},
        Case{AlarmTypeText, 0x1618, "Errored Seconds Saturation"},
        Case{AlarmTypeText, 0x1619, "Consecutively Errored Seconds Saturation"},
        Case{AlarmTypeText, 0x161A, "Out-Of-Frame Saturation"},
        Case{AlarmTypeText, 0x161B, "unknown"}, Case{AlarmStateText, 0, "InActive"},
        Case{AlarmStateText, 1, "Active"}, Case{AlarmStateText, 2, "Unknown"}));

INSTANTIATE_TEST_SUITE_P(CallInfo, PublicationTexts,
                         ::testing::Values(Case{CallInfoText, 0x100000C, "Charge"},
                                           Case{CallInfoText, 0x2000007, "CallerId"},
                                           Case{CallInfoText, 0x100000D, "Unknown"},
                                           Case{CallInfoText, 0, "Unknown"}));

}  // namespace
