#include "catalogue/chp/CHP.h"

namespace tolk {

CHP::CHP(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q) : StdResource(target, q) {}

CHP::CHP(const StdResource& other) : StdResource(other) {}

CHP::CHP(const CHP& other) : StdResource(other), CHP_Bodies() {}

CHP::~CHP() {
    endDispatch();
}

// Past StdResource on purpose: not even the standard numbers are known here.
MsgBody* CHP::MsgBodyLookup(unsigned int type) {
    return StdResource::superMsgBodyLookup(type);
}

MsgBody* CHP::EvtBodyLookup(unsigned int group) {
    if (MsgBody* body = CHP_Bodies::evtLookup(group)) {
        return body;
    }
    return superEvtBodyLookup(group);
}

}  // namespace tolk
