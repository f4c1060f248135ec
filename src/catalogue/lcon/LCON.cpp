#include "catalogue/lcon/LCON.h"

namespace tolk {

namespace {

constexpr unsigned int kSetProtocolLength = 32;

}  // namespace

LCON::LCON(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q) : Instance(target, q) {
    registerNullHandlers();
}

LCON::LCON(const Instance& other) : Instance(other) {
    registerNullHandlers();
}

LCON::LCON(const LCON& other) : Instance(other), LCON_Bodies() {
    registerNullHandlers();
}

void LCON::registerNullHandlers() {
    asyncRegisterMsgType(MsgSetLineStateCmplt_t::MsgType, static_cast<EvtCallback::MsgFn>(nullptr),
                         0);
}

LCON::~LCON() {
    endDispatch();
}

MsgBody* LCON::MsgBodyLookup(unsigned int type) {
    if (MsgBody* body = LCON_Bodies::msgLookup(type)) {
        return body;
    }
    return Instance::superMsgBodyLookup(type);
}

MsgBody* LCON::EvtBodyLookup(unsigned int group) {
    if (MsgBody* body = LCON_Bodies::evtLookup(group)) {
        return body;
    }
    return Instance::superEvtBodyLookup(group);
}

void LCON::ConfigureLine(MsgConfigureLine_t* body, MsgConfigureLineCmplt_t* ret) {
    request(MsgConfigureLine_t::MsgType, body, MsgConfigureLineCmplt_t::MsgType, ret);
}

void LCON::ConfigureLine(MsgConfigureLineCmplt_t* ret) {
    MsgConfigureLine_t body;
    request(MsgConfigureLine_t::MsgType, &body, MsgConfigureLineCmplt_t::MsgType, ret);
}

void LCON::GetAlarms(MsgGetAlarms_t* body, MsgGetAlarmsCmplt_t* ret) {
    request(MsgGetAlarms_t::MsgType, body, MsgGetAlarmsCmplt_t::MsgType, ret);
}

void LCON::GetAlarms(staticList<unsigned int>& Alarms, MsgGetAlarmsCmplt_t* ret) {
    GetAlarms(Alarms, 0xFFFFFFFF, ret);
}

void LCON::GetAlarms(staticList<unsigned int>& Alarms, unsigned int Count,
                     MsgGetAlarmsCmplt_t* ret) {
    MsgGetAlarms_t body(Count, Alarms);
    request(MsgGetAlarms_t::MsgType, &body, MsgGetAlarmsCmplt_t::MsgType, ret);
}

void LCON::GetDiagMode(MsgGetDiagMode_t* body, MsgGetDiagModeCmplt_t* ret) {
    request(MsgGetDiagMode_t::MsgType, body, MsgGetDiagModeCmplt_t::MsgType, ret);
}

void LCON::GetDiagMode(MsgGetDiagModeCmplt_t* ret) {
    MsgGetDiagMode_t body;
    request(MsgGetDiagMode_t::MsgType, &body, MsgGetDiagModeCmplt_t::MsgType, ret);
}

void LCON::GetFaults(MsgGetFaults_t* body, MsgGetFaultsCmplt_t* ret) {
    request(MsgGetFaults_t::MsgType, body, MsgGetFaultsCmplt_t::MsgType, ret);
}

void LCON::GetFaults(staticList<unsigned int>& Faults, MsgGetFaultsCmplt_t* ret) {
    GetFaults(Faults, 0xFFFFFFFF, ret);
}

void LCON::GetFaults(staticList<unsigned int>& Faults, unsigned int Count,
                     MsgGetFaultsCmplt_t* ret) {
    MsgGetFaults_t body(Count, Faults);
    request(MsgGetFaults_t::MsgType, &body, MsgGetFaultsCmplt_t::MsgType, ret);
}

void LCON::GetLineState(MsgGetLineState_t* body, MsgGetLineStateCmplt_t* ret) {
    request(MsgGetLineState_t::MsgType, body, MsgGetLineStateCmplt_t::MsgType, ret);
}

void LCON::GetLineState(MsgGetLineStateCmplt_t* ret) {
    MsgGetLineState_t body;
    request(MsgGetLineState_t::MsgType, &body, MsgGetLineStateCmplt_t::MsgType, ret);
}

void LCON::SendAlarm(MsgSendAlarm_t* body, MsgSendAlarmCmplt_t* ret) {
    request(MsgSendAlarm_t::MsgType, body, MsgSendAlarmCmplt_t::MsgType, ret);
}

void LCON::SendAlarm(unsigned int AlarmId, MsgSendAlarmCmplt_t* ret) {
    MsgSendAlarm_t body(AlarmId);
    request(MsgSendAlarm_t::MsgType, &body, MsgSendAlarmCmplt_t::MsgType, ret);
}

void LCON::SetDiagMode(MsgSetDiagMode_t* body, MsgSetDiagModeCmplt_t* ret) {
    request(MsgSetDiagMode_t::MsgType, body, MsgSetDiagModeCmplt_t::MsgType, ret);
}

void LCON::SetDiagMode(unsigned char Mode, MsgSetDiagModeCmplt_t* ret) {
    MsgSetDiagMode_t body(Mode);
    request(MsgSetDiagMode_t::MsgType, &body, MsgSetDiagModeCmplt_t::MsgType, ret);
}

void LCON::SetLineState(MsgSetLineState_t* body, MsgSetLineStateCmplt_t* ret) {
    request(MsgSetLineState_t::MsgType, body, MsgSetLineStateCmplt_t::MsgType, ret);
}

void LCON::SetLineState(unsigned int State, MsgSetLineStateCmplt_t* ret) {
    SetLineState(State, 0, 0, ret);
}

void LCON::SetLineState(unsigned int State, unsigned int Reason, MsgSetLineStateCmplt_t* ret) {
    SetLineState(State, Reason, 0, ret);
}

void LCON::SetLineState(unsigned int State, unsigned int Reason, unsigned int Priority,
                        MsgSetLineStateCmplt_t* ret) {
    MsgSetLineState_t body(State, Reason, Priority);
    request(MsgSetLineState_t::MsgType, &body, MsgSetLineStateCmplt_t::MsgType, ret);
}

void LCON::StartSetLineState(MsgSetLineState_t* body) {
    request(MsgSetLineState_t::MsgType, body);
}

void LCON::StartSetLineState(unsigned int State, unsigned int Reason, unsigned int Priority) {
    MsgSetLineState_t body(State, Reason, Priority);
    request(MsgSetLineState_t::MsgType, &body);
}

void LCON::TSPSetLineState(MsgTSPSetLineState_t* body) {
    request(MsgTSPSetLineState_t::MsgType, body);
}

void LCON::TSPSetLineState(unsigned int State, unsigned int Reason) {
    MsgTSPSetLineState_t body(State, Reason);
    request(MsgTSPSetLineState_t::MsgType, &body);
}

void LCON::StopAlarm(MsgStopAlarm_t* body) {
    request(MsgStopAlarm_t::MsgType, body);
}

void LCON::StopAlarm(unsigned int AlarmId) {
    MsgStopAlarm_t body(AlarmId);
    request(MsgStopAlarm_t::MsgType, &body);
}

void LCON::GetMetrics(MsgGetMetrics_t* body, MsgGetMetricsCmplt_t* ret) {
    request(MsgGetMetrics_t::MsgType, body, MsgGetMetricsCmplt_t::MsgType, ret);
}

void LCON::GetMetrics(unsigned int MetricsId, MsgGetMetricsCmplt_t* ret) {
    GetMetrics(MetricsId, 1, ret);
}

void LCON::GetMetrics(unsigned int MetricsId, unsigned char Mode, MsgGetMetricsCmplt_t* ret) {
    MsgGetMetrics_t body(MetricsId, Mode);
    request(MsgGetMetrics_t::MsgType, &body, MsgGetMetricsCmplt_t::MsgType, ret);
}

void LCON::SetVParm(Std_MsgSetVParm_t* body, Std_MsgSetVParmCmplt_t* ret) {
    request(Std_MsgSetVParm_t::MsgType, body, Std_MsgSetVParmCmplt_t::MsgType, ret);
}

void LCON::SetVParm(staticList<Std_MsgSetVParm_t::Parms_t>& Parms, Std_MsgSetVParmCmplt_t* ret) {
    SetVParm(Parms, static_cast<unsigned short>(0xFFFF), ret);
}

void LCON::SetVParm(staticList<Std_MsgSetVParm_t::Parms_t>& Parms, unsigned short Count,
                    Std_MsgSetVParmCmplt_t* ret) {
    Std_MsgSetVParm_t body(Count, Parms);
    request(Std_MsgSetVParm_t::MsgType, &body, Std_MsgSetVParmCmplt_t::MsgType, ret);
}

void LCON::GetVParm(Std_MsgGetVParm_t* body, Std_MsgGetVParmCmplt_t* ret) {
    request(Std_MsgGetVParm_t::MsgType, body, Std_MsgGetVParmCmplt_t::MsgType, ret);
}

void LCON::GetVParm(staticList<Std_MsgGetVParm_t::Parms_t>& Parms, Std_MsgGetVParmCmplt_t* ret) {
    GetVParm(Parms, static_cast<unsigned short>(0xFFFF), ret);
}

void LCON::GetVParm(staticList<Std_MsgGetVParm_t::Parms_t>& Parms, unsigned short Count,
                    Std_MsgGetVParmCmplt_t* ret) {
    Std_MsgGetVParm_t body(Count, Parms);
    request(Std_MsgGetVParm_t::MsgType, &body, Std_MsgGetVParmCmplt_t::MsgType, ret);
}

void LCON::SetProtocol(MsgTSPSetProtocol_t* body, MsgTSPSetProtocolCmplt_t* ret) {
    request(MsgTSPSetProtocol_t::MsgType, body, MsgTSPSetProtocolCmplt_t::MsgType, ret);
}

void LCON::SetProtocol(const staticList<char>& String, MsgTSPSetProtocolCmplt_t* ret) {
    staticList<char> text(String);
    if (text.length() > kSetProtocolLength) {
        text.realloc(kSetProtocolLength);
    }
    MsgTSPSetProtocol_t body(text);
    request(MsgTSPSetProtocol_t::MsgType, &body, MsgTSPSetProtocolCmplt_t::MsgType, ret);
}

void LCON::ReconfigureLine(MsgReConfigureLine_t* body, MsgReConfigureLineCmplt_t* ret) {
    request(MsgReConfigureLine_t::MsgType, body, MsgReConfigureLineCmplt_t::MsgType, ret);
}

void LCON::ReconfigureLine(staticList<MsgReConfigureLine_t::Parms_t>& Parms,
                           MsgReConfigureLineCmplt_t* ret) {
    ReconfigureLine(Parms, 0xFFFFFFFF, ret);
}

void LCON::ReconfigureLine(staticList<MsgReConfigureLine_t::Parms_t>& Parms, unsigned int Count,
                           MsgReConfigureLineCmplt_t* ret) {
    MsgReConfigureLine_t body(Count, Parms);
    request(MsgReConfigureLine_t::MsgType, &body, MsgReConfigureLineCmplt_t::MsgType, ret);
}

}  // namespace tolk
