#include "model/PublicationTexts.h"

#include <array>
#include <utility>

namespace vx7diag {

namespace {

constexpr const char* kUnknown = "Unknown";

template <std::size_t N>
const char* Lookup(const std::array<std::pair<unsigned int, const char*>, N>& table,
                   unsigned int value, const char* otherwise) {
    for (const auto& [number, text] : table) {
        if (number == value) {
            return text;
        }
    }
    return otherwise;
}

constexpr std::array<std::pair<unsigned int, const char*>, 13> kChanStates{{
    {1, "Active"},
    {2, "ActivePending"},
    {3, "Alarm"},
    {4, "OutOfService"},
    {5, "Maintenance"},
    {6, "OutOfServiceLocal"},
    {7, "MaintenanceLocal"},
    {8, "Idle"},
    {9, "IdlePending"},
    {10, "Null"},
    {12, "Unknown"},
    {13, "OutOfServiceMediaDetached"},
    {14, "OutOfServiceRemote"},
}};

constexpr std::array<const char*, 22> kCallStates{
    "Null",      "Accepted",     "Connected",          "ConnectedPendXfer",
    "Delivered", "Dialing",      "Disconnected",       "DialReady",
    "Failed",    "Idle",         "Initiated",          "Offered",
    "Hold",      "HoldPendXfer", "Originated",         "Proceeding",
    "Unknown",   "Alerting",     "IncomingProceeding", "Rejected",
    "Detected",  "DialTone",
};

constexpr std::array<const char*, 6> kReasons{
    "Normal", "Diagnostic", "Startup", "Maintenance", "Standby", "Alarm",
};

constexpr std::array<std::pair<unsigned int, const char*>, 19> kAlarmTypes{{
    {0x1601, "Red"},
    {0x1602, "Yellow"},
    {0x1603, "AIS"},
    {0x1604, "Loss of Signal (LOS)"},
    {0x1605, "Loopback"},
    {0x1606, "RAI CRC"},
    {0x1607, "TS16 Red"},
    {0x1608, "TS16 AIS"},
    {0x1609, "TS16 Yellow"},
    {0x160A, "D Channel"},
    {0x160B, "Transmit RAI"},
    {0x160C, "Transmit AIS"},
    {0x160D, "Transmit RAI TS16"},
    {0x160E, "Transmit AIS TS16"},
    {0x1616, "Bipolar Violation Saturation"},
    {0x1617, "Frame Error Saturation"},
    {0x1618, "Errored Seconds Saturation"},
    {0x1619, "Consecutively Errored Seconds Saturation"},
    {0x161A, "Out-Of-Frame Saturation"},
}};

}  // namespace

const char* CallInfoText(unsigned int infoId) {
    switch (infoId) {
        case 0x100000C:
            return "Charge";
        case 0x2000007:
            return "CallerId";
        default:
            return kUnknown;
    }
}

const char* ChanStateText(unsigned int chanState) {
    return Lookup(kChanStates, chanState, kUnknown);
}

const char* CallStateText(unsigned int callState) {
    return callState < kCallStates.size() ? kCallStates[callState] : kUnknown;
}

const char* TrunkStateText(unsigned int type) {
    switch (type) {
        case 0x160F:
            return "In Service";
        case 0x1610:
            return "Out Of Service";
        default:
            return kUnknown;
    }
}

const char* TrunkReasonText(unsigned int reason) {
    return reason < kReasons.size() ? kReasons[reason] : kUnknown;
}

const char* AlarmTypeText(unsigned int type) {
    return Lookup(kAlarmTypes, type, "unknown");
}

const char* AlarmStateText(unsigned int state) {
    switch (state) {
        case 0:
            return "InActive";
        case 1:
            return "Active";
        default:
            return kUnknown;
    }
}

}  // namespace vx7diag
