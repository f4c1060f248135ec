#include "console/ObserverTexts.h"

#include <cstdio>

namespace vx7diag {

const std::string g_CallStateStr[] = {
    "Null                 ", "Accepted             ", "Connected            ",
    "ConnectedPendXfer    ", "Delivered            ", "Dialing              ",
    "Disconnected         ", "DialReady            ", "Failed               ",
    "Idle                 ", "Initiated            ", "Offered              ",
    "Hold                 ", "HoldPendXfer         ", "Originated           ",
    "Proceeding           ", "Unknown              ", "Alerting             ",
    "IncomingProceeding   ", "Rejected             ", "Detected             ",
    "DialTone             ",
};

// "Active" carries two tabs where the others carry blanks; on screen the tabs push the
// blanks past the end of the field.
const std::string g_ChanStateStr[] = {
    "                          ", "Active\t\t           ",      "ActivePending             ",
    "Alarm                     ", "OutOfService              ", "Maintenance               ",
    "OutOfServiceLocal         ", "MaintenanceLocal          ", "Idle                      ",
    "IdlePending               ", "Null                      ", "FinishingCalls            ",
    "Unknown                   ", "OutOfServiceMediaDetached ", "OutOfServiceRemote        ",
};

const std::string g_ReasonStr[] = {
    "                          ", "Busy                      ", "CallCompletion            ",
    "Canceled                  ", "Congestion                ", "DestBusy                  ",
    "DestAddrBad               ", "DestOutOfOrder            ", "DestUnobtainable          ",
    "Forward                   ", "Incompatible              ", "IncomingCall              ",
    "NewCall                   ", "NoAnswer                  ", "Normal                    ",
    "NetworkAlarm              ", "PickUp                    ", "ProtocolError             ",
    "Redirection               ", "RemoteTermination         ", "Rejection                 ",
    "SIT                       ", "SITCustIrreg              ", "SITNoCircuit              ",
    "SITReorder                ", "Transfer                  ", "Unavailable               ",
    "Unknown                   ", "UnallocatedNumber         ", "NoRoute                   ",
    "NumberChanged             ", "OutOfOrder                ", "InvalidFormat             ",
    "ChanUnavailable           ", "ChanUnacceptable          ", "ChanNotImplemented        ",
    "NoChan                    ", "NoResponse                ", "FacilityNotSubscribed     ",
    "FacilityNotImplemented    ", "ServiceNotImplemented     ", "BarredInbound             ",
    "BarredOutbound            ", "DestIncompatible          ", "BearerCapUnavailable      ",
    "NormalUnspecified         ", "ReqTimedout               ", "RemoteRetrieve            ",
    "RemoteReconnect           ", "LocalTimeout              ", "Ack                       ",
    "NoRingback                ",
};

const std::string g_LineStateStr[] = {"InService       ", "Out of Service  "};

const std::string g_LineStateReasonStr[] = {"Null          ", "Diagnostics   ", "Startup       ",
                                            "Maintenance   ", "Standby       ", "Alarm         "};

namespace {

// The text of an unknown value is made in a buffer of the calling thread, which prints it
// before it looks up the next value.
const char* Lookup(const std::string* table, std::size_t count, unsigned int value, char* unknown,
                   std::size_t width) {
    if (value < count) {
        return table[value].c_str();
    }
    std::snprintf(unknown, width + 1, "?%-*u", static_cast<int>(width - 1), value);
    return unknown;
}

thread_local char t_unknownText[32];

}  // namespace

const char* ConsoleCallStateText(unsigned int state) {
    return Lookup(g_CallStateStr, CALL_STATE_STR_COUNT, state, t_unknownText, 21);
}

const char* ConsoleChanStateText(unsigned int state) {
    return Lookup(g_ChanStateStr, CHAN_STATE_STR_COUNT, state, t_unknownText, 26);
}

const char* ConsoleReasonText(unsigned int reason) {
    return Lookup(g_ReasonStr, REASON_STR_COUNT, reason, t_unknownText, 26);
}

const char* ConsoleLineStateReasonText(unsigned int reason) {
    return Lookup(g_LineStateReasonStr, LINE_STATE_REASON_STR_COUNT, reason, t_unknownText, 14);
}

}  // namespace vx7diag
