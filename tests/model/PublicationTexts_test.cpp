#include "model/PublicationTexts.h"

#include <gtest/gtest.h>

#include <string>

namespace {

using namespace vx7diag;

// The edges of each table: first and last entries, the holes inside and the values just
// past it, where an off-by-one or a read past the table would show.
struct Case {
    const char* (*text)(unsigned int);
    unsigned int value;
    const char* expected;
};

TEST(PublicationTexts, EdgesAndHolesOfEachTable) {
    const Case cases[] = {
        {ChanStateText, 0, "Unknown"},
        {ChanStateText, 10, "Null"},
        {ChanStateText, 11, "Unknown"},
        {ChanStateText, 12, "Unknown"},
        {ChanStateText, 13, "OutOfServiceMediaDetached"},
        {ChanStateText, 14, "OutOfServiceRemote"},
        {ChanStateText, 15, "Unknown"},
        {CallStateText, 0, "Null"},
        {CallStateText, 15, "Proceeding"},
        {CallStateText, 16, "Unknown"},
        {CallStateText, 17, "Alerting"},
        {CallStateText, 21, "DialTone"},
        {CallStateText, 22, "Unknown"},
        {CallStateText, 0xFFFFFFFF, "Unknown"},
        {TrunkStateText, 0x160F, "In Service"},
        {TrunkStateText, 0x1610, "Out Of Service"},
        {TrunkStateText, 0x1611, "Unknown"},
        {TrunkReasonText, 0, "Normal"},
        {TrunkReasonText, 5, "Alarm"},
        {TrunkReasonText, 6, "Unknown"},
        {AlarmTypeText, 0x1600, "unknown"},
        {AlarmTypeText, 0x1601, "Red"},
        {AlarmTypeText, 0x160E, "Transmit AIS TS16"},
        {AlarmTypeText, 0x160F, "unknown"},
        {AlarmTypeText, 0x1615, "unknown"},
        {AlarmTypeText, 0x1616, "Bipolar Violation Saturation"},
        {AlarmTypeText, 0x161A, "Out-Of-Frame Saturation"},
        {AlarmTypeText, 0x161B, "unknown"},
        {AlarmStateText, 0, "InActive"},
        {AlarmStateText, 1, "Active"},
        {AlarmStateText, 2, "Unknown"},
        {CallInfoText, 0x100000C, "Charge"},
        {CallInfoText, 0x2000007, "CallerId"},
        {CallInfoText, 0x100000D, "Unknown"},
        {CallInfoText, 0, "Unknown"},
    };
    for (const Case& c : cases) {
        EXPECT_STREQ(c.text(c.value), c.expected) << "value 0x" << std::hex << c.value;
    }
}

}  // namespace
