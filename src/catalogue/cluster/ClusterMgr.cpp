#include "catalogue/cluster/ClusterMgr.h"

#include "catalogue/generated/values.h"

namespace tolk {

namespace {

constexpr unsigned short kServiceInstance = 8;

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
    append(attrs, 0, 18);
    append(attrs, wire::TSC::Attr::TRUNK, trunk);
    append(attrs, wire::TSC::Attr::CHANNEL, channel);
    return find(attrs);
}

Cluster ClusterMgr::findByLCON(unsigned int line) {
    return findByLCON(line, staticList<CompAttr_t>());
}

Cluster ClusterMgr::findByLCON(unsigned int line, staticList<CompAttr_t> attrs) {
    append(attrs, 0, 22);
    append(attrs, wire::LCON::Attr::LINE, line);
    return find(attrs);
}

void ClusterMgr::ClusterFindInst(ClusterCompByAttr_t* body, ComponentResult_t* ret) {
    request(ClusterCompByAttr_t::MsgType, body, ComponentResult_t::MsgType, ret, 0, 1);
}

void ClusterMgr::ClusterFindInst(CompDesc_t& ClustDesc, unsigned char& CompType,
                                 staticList<CompAttr_t>& Attrs, ComponentResult_t* ret) {
    ClusterFindInst(ClustDesc, CompType, Attrs, 0xFF, ret);
}

void ClusterMgr::ClusterFindInst(CompDesc_t& ClustDesc, unsigned char& CompType,
                                 staticList<CompAttr_t>& Attrs, unsigned char Count,
                                 ComponentResult_t* ret) {
    ClusterCompByAttr_t body(ClustDesc, CompType, Count, Attrs);
    request(ClusterCompByAttr_t::MsgType, &body, ComponentResult_t::MsgType, ret, 0, 1);
}

void ClusterMgr::ClusterCreate(ClusterCreate_t* body, ClusterResult_t* ret) {
    request(ClusterCreate_t::MsgType, body, ClusterResult_t::MsgType, ret);
}

void ClusterMgr::ClusterCreate(ClusterResult_t* ret) {
    ClusterCreate_t body;
    request(ClusterCreate_t::MsgType, &body, ClusterResult_t::MsgType, ret);
}

void ClusterMgr::ClusterDestroy(ClusterDestroy_t* body) {
    request(ClusterDestroy_t::MsgType, body);
}

void ClusterMgr::ClusterDestroy(CompDesc_t& ClustDesc) {
    ClusterDestroy_t body(ClustDesc);
    request(ClusterDestroy_t::MsgType, &body);
}

void ClusterMgr::ClusterFree(ClusterFree_t* body) {
    request(ClusterFree_t::MsgType, body);
}

void ClusterMgr::ClusterFree(CompDesc_t& ClustDesc) {
    ClusterFree_t body(ClustDesc);
    request(ClusterFree_t::MsgType, &body);
}

void ClusterMgr::ClusterFindByComp(ClusterByComp_t* body, ClusterResult_t* ret) {
    request(ClusterByComp_t::MsgType, body, ClusterResult_t::MsgType, ret);
}

void ClusterMgr::ClusterFindByComp(CompDesc_t& desc, ClusterResult_t* ret) {
    ClusterByComp_t body(desc);
    request(ClusterByComp_t::MsgType, &body, ClusterResult_t::MsgType, ret);
}

}  // namespace tolk
