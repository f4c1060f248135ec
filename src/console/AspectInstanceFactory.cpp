#include "console/AspectInstanceFactory.h"

#include "model/AllAlarms.h"
#include "model/TSCCallInfo.h"
#include "model/TSCCallState.h"
#include "model/TSCChanState.h"
#include "model/TrunkState.h"

namespace lineprobe {

vx7diag::AllAlarms* AspectInstanceFactory::_allalarms_instance = nullptr;
vx7diag::TrunkState* AspectInstanceFactory::_trunkstate_instance = nullptr;
vx7diag::TSCCallInfo* AspectInstanceFactory::_tsccallinfo_instance = nullptr;
vx7diag::TSCCallState* AspectInstanceFactory::_tsccallstate_instance = nullptr;
vx7diag::TSCChanState* AspectInstanceFactory::_tscchanstate_instance = nullptr;

namespace {

template <class T>
T* Instance(T*& slot) {
    if (slot == nullptr) {
        slot = new T();
    }
    return slot;
}

}  // namespace

vx7diag::AllAlarms* AspectInstanceFactory::GetAllAlarmsAspectInstance() {
    return Instance(_allalarms_instance);
}

vx7diag::TrunkState* AspectInstanceFactory::GetTrunkStateAspectInstance() {
    return Instance(_trunkstate_instance);
}

vx7diag::TSCCallInfo* AspectInstanceFactory::GetCallInfoAspectInstance() {
    return Instance(_tsccallinfo_instance);
}

vx7diag::TSCCallState* AspectInstanceFactory::GetCallStateAspectInstance() {
    return Instance(_tsccallstate_instance);
}

vx7diag::TSCChanState* AspectInstanceFactory::GetChanStateAspectInstance() {
    return Instance(_tscchanstate_instance);
}

}  // namespace lineprobe
