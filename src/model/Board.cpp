#include "model/Board.h"

namespace tolk {

CompDesc_t Board::Address(unsigned int boardNumber) {
    return CompDesc_t(0, static_cast<unsigned char>(boardNumber), 0, 0, 0);
}

Board::Board(unsigned int boardNumber) : Addressable(Address(boardNumber)) {
    resourceMgr = new ResourceMgr(this);
    clusterMgr = new ClusterMgr(this);
}

Board::Board(unsigned int boardNumber, isa::RefPtr<MsgQueue>& queue)
    : Addressable(Address(boardNumber), queue) {
    resourceMgr = new ResourceMgr(this);
    clusterMgr = new ClusterMgr(this);
}

Board::~Board() {
    delete resourceMgr;
    delete clusterMgr;
}

void Board::MsgQueueAttach(const isa::RefPtr<MsgQueue>& q) {
    delete resourceMgr;
    resourceMgr = nullptr;
    delete clusterMgr;
    clusterMgr = nullptr;
    Addressable::MsgQueueAttach(q);
    resourceMgr = new ResourceMgr(this);
    clusterMgr = new ClusterMgr(this);
}

MsgBody* Board::MsgBodyLookup(unsigned int type) {
    try {
        return clusterMgr->MsgBodyLookup(type);
    } catch (const Addressable::UndefinedMsgBody&) {
        return resourceMgr->MsgBodyLookup(type);
    }
}

MsgBody* Board::EvtBodyLookup(unsigned int group) {
    try {
        return clusterMgr->EvtBodyLookup(group);
    } catch (const Addressable::UndefinedEvtBody&) {
        return resourceMgr->EvtBodyLookup(group);
    }
}

Component Board::findComp(unsigned char type, unsigned char instance) {
    staticList<CompAttr_t> attrs;
    return Component(resourceMgr->find(type, instance, 0, attrs));
}

Cluster Board::findClustByLCON(unsigned int lconNumber) {
    return clusterMgr->findByLCON(lconNumber);
}

Cluster Board::findClustByTSC(unsigned int trunk, unsigned int channel) {
    return clusterMgr->findByTSC(trunk, channel);
}

}  // namespace tolk
