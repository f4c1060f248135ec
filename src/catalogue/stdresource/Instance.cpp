#include "catalogue/stdresource/Instance.h"

namespace tolk {

Instance::Instance(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q) : StdResource(target, q) {
    use(0);
    inUse = 1;
    eventsDetected = 1;
}

Instance::Instance(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q, int withMgr)
    : StdResource(target, q, withMgr) {
    if (withMgr != 0) {
        use(0);
    }
    inUse = 1;
    eventsDetected = 1;
}

Instance::Instance(const StdResource& other) : StdResource(other) {
    use(0);
    inUse = 1;
    eventsDetected = 1;
}

Instance::Instance(const Instance& other) : StdResource(other) {}

Instance::Instance(const TmpInstance& other, int) : StdResource(other) {}

Instance::~Instance() {
    endDispatch();
}

MsgBody* Instance::MsgBodyLookup(unsigned int type) {
    return StdResource::MsgBodyLookup(type);
}

MsgBody* Instance::EvtBodyLookup(unsigned int group) {
    return StdResource::EvtBodyLookup(group);
}

MsgBody* Instance::superMsgBodyLookup(unsigned int type) {
    return StdResource::MsgBodyLookup(type);
}

MsgBody* Instance::superEvtBodyLookup(unsigned int group) {
    return StdResource::EvtBodyLookup(group);
}

TmpInstance::TmpInstance(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q)
    : Instance(target, q, 0) {}

TmpInstance::TmpInstance(const TmpInstance& other) : Instance(other, 0) {}

TmpInstance::~TmpInstance() {
    endDispatch();
    freeOnDestroy = 0;
    inUse = 0;
    eventsDetected = 0;
}

}  // namespace tolk
