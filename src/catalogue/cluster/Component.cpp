#include "catalogue/cluster/Component.h"

namespace tolk {

Component::Component(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q) : StdResource(target, q) {}

Component::Component(const StdResource& other) : StdResource(other) {}

Component::Component(const Component& other) : StdResource(other) {}

Component::~Component() {
    endDispatch();
}

MsgBody* Component::MsgBodyLookup(unsigned int type) {
    return StdResource::MsgBodyLookup(type);
}

MsgBody* Component::EvtBodyLookup(unsigned int group) {
    return StdResource::EvtBodyLookup(group);
}

}  // namespace tolk
