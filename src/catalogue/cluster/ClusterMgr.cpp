#include "catalogue/cluster/ClusterMgr.h"

#include "catalogue/generated/values.h"

namespace tolk {

namespace {

constexpr unsigned short kServiceInstance = wire::ClusterMgr::Service::INSTANCE;

void append(staticList<CompAttr_t>& attrs, unsigned int key, unsigned int value) {
    unsigned int n = attrs.length();
    attrs.realloc(n + 1);
    *attrs.element(n) = CompAttr_t(key, static_cast<int>(value));
}

}  // namespace

ClusterMgr::ClusterMgr(const Addressable* owner) : Addressable(owner) {
    TgtDesc =
        CompDesc_t(kServiceInstance, owner->getTgtDesc().board, 1, 0, owner->getTgtDesc().node);
}

MsgBody* ClusterMgr::MsgBodyLookup(unsigned int type) {
    if (MsgBody* body = ClusterMgr_Bodies::msgLookup(type)) {
        return body;
    }
    return Addressable::MsgBodyLookup(type);
}

Cluster ClusterMgr::find(staticList<CompAttr_t> attrs) {
    CompDesc_t CompStart(0xFFFF, TgtDesc.board, 1, 0xFF, TgtDesc.node);
    unsigned char count = 0xFF;
    ClusterFind_t body(CompStart, count, attrs);
    ClusterResult_t answer;
    request(ClusterFind_t::MsgType, &body, ClusterResult_t::MsgType, &answer, 0, 1);
    Addressable found(answer.desc, queue);
    return Cluster(found);
}

Cluster ClusterMgr::findByTSC(unsigned int trunk, unsigned int channel) {
    return findByTSC(trunk, channel, staticList<CompAttr_t>());
}

Cluster ClusterMgr::findByTSC(unsigned int trunk, unsigned int channel,
                              staticList<CompAttr_t> attrs) {
    append(attrs, 0, wire::TSC::Component::TYPE);
    append(attrs, wire::TSC::Attr::TRUNK, trunk);
    append(attrs, wire::TSC::Attr::CHANNEL, channel);
    return find(attrs);
}

Cluster ClusterMgr::findByLCON(unsigned int line) {
    return findByLCON(line, staticList<CompAttr_t>());
}

Cluster ClusterMgr::findByLCON(unsigned int line, staticList<CompAttr_t> attrs) {
    append(attrs, 0, wire::LCON::Component::TYPE);
    append(attrs, wire::LCON::Attr::LINE, line);
    return find(attrs);
}

}  // namespace tolk
