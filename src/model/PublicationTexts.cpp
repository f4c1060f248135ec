#include "model/PublicationTexts.h"

#include <array>
#include <utility>

#include "catalogue/generated/values.h"

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

namespace Alarm = tolk::wire::LCON::Alarm;

constexpr std::array<std::pair<unsigned int, const char*>, 19> kAlarmTypes{{
    {Alarm::RED, "Red"},
    {Alarm::YELLOW, "Yellow"},
    {Alarm::AIS, "AIS"},
    {Alarm::LOS, "Loss of Signal (LOS)"},
    {Alarm::LOOPBACK, "Loopback"},
    {Alarm::RAI_CRC, "RAI CRC"},
    {Alarm::TS16_RED, "TS16 Red"},
    {Alarm::TS16_AIS, "TS16 AIS"},
    {Alarm::TS16_YELLOW, "TS16 Yellow"},
    {Alarm::D_CHANNEL, "D Channel"},
    {Alarm::TRANSMIT_RAI, "Transmit RAI"},
    {Alarm::TRANSMIT_AIS, "Transmit AIS"},
    {Alarm::TRANSMIT_RAI_TS16, "Transmit RAI TS16"},
    {Alarm::TRANSMIT_AIS_TS16, "Transmit AIS TS16"},
    {Alarm::BPV_SATURATION, "Bipolar Violation Saturation"},
    {Alarm::FERR_SATURATION, "Frame Error Saturation"},
    {Alarm::ES_SATURATION, "Errored Seconds Saturation"},
    {Alarm::CES_SATURATION, "Consecutively Errored Seconds Saturation"},
    {Alarm::OOF_SATURATION, "Out-Of-Frame Saturation"},
}};

}  // namespace

const char* CallInfoText(unsigned int infoId) {
    switch (infoId) {
        case tolk::wire::TSC::InfoId::CHARGE:
            return "Charge";
        case tolk::wire::TSC::InfoId::CALLER_ID:
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
        case tolk::wire::LCON::LineState::IN_SERVICE:
            return "In Service";
        case tolk::wire::LCON::LineState::OUT_OF_SERVICE:
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
