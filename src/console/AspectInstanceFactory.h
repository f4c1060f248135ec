#pragma once

namespace vx7diag {
class AllAlarms;
class TrunkState;
class TSCCallInfo;
class TSCCallState;
class TSCChanState;
}  // namespace vx7diag

namespace lineprobe {

// One aspect object of each kind for the whole process: observers subscribe by these
// objects, and every view shares them. Made on first use, never destroyed. Used from the
// main thread only.
class AspectInstanceFactory {
  public:
    static vx7diag::AllAlarms* GetAllAlarmsAspectInstance();
    static vx7diag::TrunkState* GetTrunkStateAspectInstance();
    static vx7diag::TSCCallInfo* GetCallInfoAspectInstance();
    static vx7diag::TSCCallState* GetCallStateAspectInstance();
    static vx7diag::TSCChanState* GetChanStateAspectInstance();

  private:
    static vx7diag::AllAlarms* _allalarms_instance;
    static vx7diag::TrunkState* _trunkstate_instance;
    static vx7diag::TSCCallInfo* _tsccallinfo_instance;
    static vx7diag::TSCCallState* _tsccallstate_instance;
    static vx7diag::TSCChanState* _tscchanstate_instance;
};

}  // namespace lineprobe
