#pragma once

#include "catalogue/OpText.h"
#include "catalogue/generated/lcon_bodies.h"
#include "catalogue/stdresource/Instance.h"

namespace tolk {

// Line control of one digital trunk: line state, loopback, alarms, faults and metrics.
class LCON : public Instance, public LCON_Bodies {
  public:
    // Both register a null handler for 0x1611, the completion of StartSetLineState.
    LCON(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue);
    explicit LCON(const Instance& other);
    LCON(const LCON& other);
    LCON& operator=(const LCON&) = delete;
    ~LCON() override;

    MsgBody* MsgBodyLookup(unsigned int type) override;
    MsgBody* EvtBodyLookup(unsigned int group) override;

    void ConfigureLine(MsgConfigureLine_t* body, MsgConfigureLineCmplt_t* ret);
    void ConfigureLine(MsgConfigureLineCmplt_t* ret);
    void GetAlarms(MsgGetAlarms_t* body, MsgGetAlarmsCmplt_t* ret);
    void GetAlarms(staticList<unsigned int>& Alarms, MsgGetAlarmsCmplt_t* ret);
    void GetAlarms(staticList<unsigned int>& Alarms, unsigned int Count, MsgGetAlarmsCmplt_t* ret);
    void GetDiagMode(MsgGetDiagMode_t* body, MsgGetDiagModeCmplt_t* ret);
    void GetDiagMode(MsgGetDiagModeCmplt_t* ret);
    void GetFaults(MsgGetFaults_t* body, MsgGetFaultsCmplt_t* ret);
    void GetFaults(staticList<unsigned int>& Faults, MsgGetFaultsCmplt_t* ret);
    void GetFaults(staticList<unsigned int>& Faults, unsigned int Count, MsgGetFaultsCmplt_t* ret);
    void GetLineState(MsgGetLineState_t* body, MsgGetLineStateCmplt_t* ret);
    void GetLineState(MsgGetLineStateCmplt_t* ret);
    void SendAlarm(MsgSendAlarm_t* body, MsgSendAlarmCmplt_t* ret);
    void SendAlarm(unsigned int AlarmId, MsgSendAlarmCmplt_t* ret);
    void SetDiagMode(MsgSetDiagMode_t* body, MsgSetDiagModeCmplt_t* ret);
    void SetDiagMode(unsigned char Mode, MsgSetDiagModeCmplt_t* ret);
    void SetLineState(MsgSetLineState_t* body, MsgSetLineStateCmplt_t* ret);
    void SetLineState(unsigned int State, MsgSetLineStateCmplt_t* ret);
    void SetLineState(unsigned int State, unsigned int Reason, MsgSetLineStateCmplt_t* ret);
    void SetLineState(unsigned int State, unsigned int Reason, unsigned int Priority,
                      MsgSetLineStateCmplt_t* ret);
    // The one-way twin of SetLineState: its completion is dropped by the null handler.
    void StartSetLineState(MsgSetLineState_t* body);
    void StartSetLineState(unsigned int State, unsigned int Reason = 0, unsigned int Priority = 0);
    void TSPSetLineState(MsgTSPSetLineState_t* body);
    void TSPSetLineState(unsigned int State, unsigned int Reason = 0);
    void StopAlarm(MsgStopAlarm_t* body);
    void StopAlarm(unsigned int AlarmId);
    void GetMetrics(MsgGetMetrics_t* body, MsgGetMetricsCmplt_t* ret);
    void GetMetrics(unsigned int MetricsId, MsgGetMetricsCmplt_t* ret);
    void GetMetrics(unsigned int MetricsId, unsigned char Mode, MsgGetMetricsCmplt_t* ret);
    // This component's own parameter bodies, with descriptor-coded values.
    void SetVParm(Std_MsgSetVParm_t* body, Std_MsgSetVParmCmplt_t* ret);
    void SetVParm(staticList<Std_MsgSetVParm_t::Parms_t>& Parms, Std_MsgSetVParmCmplt_t* ret);
    void SetVParm(staticList<Std_MsgSetVParm_t::Parms_t>& Parms, unsigned short Count,
                  Std_MsgSetVParmCmplt_t* ret);
    void GetVParm(Std_MsgGetVParm_t* body, Std_MsgGetVParmCmplt_t* ret);
    void GetVParm(staticList<Std_MsgGetVParm_t::Parms_t>& Parms, Std_MsgGetVParmCmplt_t* ret);
    void GetVParm(staticList<Std_MsgGetVParm_t::Parms_t>& Parms, unsigned short Count,
                  Std_MsgGetVParmCmplt_t* ret);
    // The protocol name goes out in 32 characters.
    void SetProtocol(MsgTSPSetProtocol_t* body, MsgTSPSetProtocolCmplt_t* ret);
    void SetProtocol(const staticList<char>& String, MsgTSPSetProtocolCmplt_t* ret);
    void ReconfigureLine(MsgReConfigureLine_t* body, MsgReConfigureLineCmplt_t* ret);
    void ReconfigureLine(staticList<MsgReConfigureLine_t::Parms_t>& Parms,
                         MsgReConfigureLineCmplt_t* ret);
    void ReconfigureLine(staticList<MsgReConfigureLine_t::Parms_t>& Parms, unsigned int Count,
                         MsgReConfigureLineCmplt_t* ret);

  private:
    void registerNullHandlers();
};

}  // namespace tolk
