#include "catalogue/cluster/Cluster.h"

#include "catalogue/cluster/ClusterMgr.h"
#include "catalogue/generated/clustermgr_bodies.h"
#include "catalogue/resourcemgr/ResourceMgr.h"

namespace tolk {

namespace {

// Stands for "no talker" in ClusterActivate_t.
CompDesc_t allOnes() {
    return CompDesc_t(0xFFFF, 0xFF, 0xFF, 0xFF, 0xFF);
}

}  // namespace

Cluster::Cluster(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q) : Addressable(target, q) {
    makeManagers();
}

Cluster::Cluster(const Addressable& other) : Addressable(other) {
    makeManagers();
}

Cluster::Cluster(const Cluster& other) : Addressable(other), Cluster_Bodies() {
    makeManagers();
}

void Cluster::makeManagers() {
    clusterMgr = new ClusterMgr(this);
    try {
        resourceMgr = new ResourceMgr(this);
    } catch (...) {
        delete clusterMgr;
        clusterMgr = nullptr;
        throw;
    }
}

Cluster::~Cluster() {
    if (destroyOnDelete != 0) {
        try {
            CompDesc_t own = TgtDesc;
            clusterMgr->ClusterDestroy(own);
        } catch (...) {
        }
    }
    delete clusterMgr;
    delete resourceMgr;
}

// A cluster is also answered with the cluster service's records (0x800007, 0x80002C).
MsgBody* Cluster::MsgBodyLookup(unsigned int type) {
    if (MsgBody* body = Cluster_Bodies::msgLookup(type)) {
        return body;
    }
    // Only the two answers a cluster shares with the service; the service's commands are not
    // a cluster's to receive.
    if (type == ClusterMgr_Bodies::ComponentResult_t::MsgType ||
        type == ClusterMgr_Bodies::ClusterResult_t::MsgType) {
        return ClusterMgr_Bodies::msgLookup(type);
    }
    return Addressable::MsgBodyLookup(type);
}

TmpInstance Cluster::find(unsigned char type) {
    return find(type, staticList<CompAttr_t>());
}

TmpInstance Cluster::find(unsigned char type, staticList<CompAttr_t> attrs) {
    if (type != 0) {
        unsigned int n = attrs.length();
        attrs.realloc(n + 1);
        *attrs.element(n) = CompAttr_t(0, type);
    }
    CompDesc_t own = TgtDesc;
    unsigned char CompType = type;
    ClusterMgr::ComponentResult_t answer;
    clusterMgr->ClusterFindInst(own, CompType, attrs, &answer);
    return TmpInstance(answer.desc, queue);
}

TmpInstance Cluster::findAutoAllocate(unsigned char type) {
    return findAutoAllocate(type, staticList<CompAttr_t>());
}

// Any failure of the search counts as absence of the instance.
TmpInstance Cluster::findAutoAllocate(unsigned char type, staticList<CompAttr_t> attrs) {
    try {
        return find(type, attrs);
    } catch (...) {
    }
    return allocateInst(type, attrs);
}

TmpInstance Cluster::allocateInst(unsigned char type, staticList<CompAttr_t> attrs) {
    return resourceMgr->allocate(type, 1, 0xFFFF, this, attrs);
}

void Cluster::Activate(ClusterActivate_t* body) {
    request(ClusterActivate_t::MsgType, body, ResultComplete_t::MsgType, nullptr);
}

void Cluster::Activate(unsigned int portId, Addressable* talker, unsigned char options) {
    CompDesc_t ClustDesc = TgtDesc;
    CompDesc_t talkerDesc = talker != nullptr ? talker->getTgtDesc() : allOnes();
    ClusterActivate_t body(ClustDesc, portId, options, talkerDesc);
    request(ClusterActivate_t::MsgType, &body, ResultComplete_t::MsgType, nullptr);
}

void Cluster::Deactivate(ClusterDeactivate_t* body) {
    request(ClusterDeactivate_t::MsgType, body, ResultComplete_t::MsgType, nullptr);
}

void Cluster::Deactivate(unsigned int portId) {
    CompDesc_t ClustDesc = TgtDesc;
    ClusterDeactivate_t body(ClustDesc, portId);
    request(ClusterDeactivate_t::MsgType, &body, ResultComplete_t::MsgType, nullptr);
}

void Cluster::TSAssign(ClusterSlotAssign_t* body) {
    request(ClusterSlotAssign_t::MsgType, body, ResultComplete_t::MsgType, nullptr);
}

void Cluster::TSAssign(unsigned int portId, staticList<unsigned short>& slotIds,
                       unsigned char encoding, unsigned char idlePattern) {
    CompDesc_t ClustDesc = TgtDesc;
    unsigned char width = static_cast<unsigned char>(slotIds.length());
    staticList<unsigned short> slots(slotIds);
    ClusterSlotAssign_t body(ClustDesc, portId, width, encoding, idlePattern, slots);
    request(ClusterSlotAssign_t::MsgType, &body, ResultComplete_t::MsgType, nullptr);
}

void Cluster::TSUnassign(ClusterSlotUnassign_t* body) {
    request(ClusterSlotUnassign_t::MsgType, body, ResultComplete_t::MsgType, nullptr);
}

void Cluster::TSUnassign(unsigned int portId) {
    CompDesc_t ClustDesc = TgtDesc;
    ClusterSlotUnassign_t body(ClustDesc, portId);
    request(ClusterSlotUnassign_t::MsgType, &body, ResultComplete_t::MsgType, nullptr);
}

void Cluster::TSInfo(ClusterSlotInfo_t* body, ClusterSlotInfoResult_t* ret) {
    request(ClusterSlotInfo_t::MsgType, body, ClusterSlotInfoResult_t::MsgType, ret);
}

void Cluster::TSInfo(unsigned int portId, unsigned char* width, unsigned char* encoding,
                     unsigned char* idlePattern, staticList<unsigned short>* slotIds) {
    CompDesc_t ClustDesc = TgtDesc;
    ClusterSlotInfo_t body(ClustDesc, portId);
    ClusterSlotInfoResult_t answer;
    request(ClusterSlotInfo_t::MsgType, &body, ClusterSlotInfoResult_t::MsgType, &answer);
    if (width != nullptr) {
        *width = answer.width;
    }
    if (encoding != nullptr) {
        *encoding = answer.encoding;
    }
    if (idlePattern != nullptr) {
        *idlePattern = answer.idlePattern;
    }
    if (slotIds != nullptr) {
        *slotIds = answer.slotIds;
    }
}

void Cluster::Connect(ClusterConnect_t* body) {
    request(ClusterConnect_t::MsgType, body);
}

void Cluster::Connect(unsigned int portId1, unsigned int portId2, Addressable* a, Addressable* b) {
    CompDesc_t InstDesc1 = a != nullptr ? a->getTgtDesc() : TgtDesc;
    CompDesc_t InstDesc2 = b != nullptr ? b->getTgtDesc() : TgtDesc;
    ClusterConnect_t body(InstDesc1, portId1, InstDesc2, portId2);
    request(ClusterConnect_t::MsgType, &body);
}

void Cluster::Disconnect(ClusterDisconnect_t* body) {
    request(ClusterDisconnect_t::MsgType, body);
}

void Cluster::Disconnect(unsigned int portId1, unsigned int portId2, Addressable* a,
                         Addressable* b) {
    CompDesc_t InstDesc1 = a != nullptr ? a->getTgtDesc() : TgtDesc;
    CompDesc_t InstDesc2 = b != nullptr ? b->getTgtDesc() : TgtDesc;
    ClusterDisconnect_t body(InstDesc1, portId1, InstDesc2, portId2);
    request(ClusterDisconnect_t::MsgType, &body);
}

void Cluster::ClusterCompInfo(ClusterCompInfo_t* body, ClusterCompInfoResult_t* ret) {
    request(ClusterCompInfo_t::MsgType, body, ClusterCompInfoResult_t::MsgType, ret, 0, 1);
}

void Cluster::ClusterCompInfo(staticList<CompDesc_t>* out, CompDesc_t ClustDesc) {
    ClusterCompInfo_t body(ClustDesc);
    ClusterCompInfoResult_t answer;
    request(ClusterCompInfo_t::MsgType, &body, ClusterCompInfoResult_t::MsgType, &answer, 0, 1);
    if (out != nullptr) {
        *out = answer.instances;
    }
}

void Cluster::AttrAdd(ClusterAttrAdd_t* body, ResultComplete_t* ret) {
    request(ClusterAttrAdd_t::MsgType, body, ResultComplete_t::MsgType, ret);
}

void Cluster::AttrAdd(staticList<CompAttr_t>& Attrs, ResultComplete_t* ret) {
    AttrAdd(Attrs, 0xFF, ret);
}

void Cluster::AttrAdd(staticList<CompAttr_t>& Attrs, unsigned char Count, ResultComplete_t* ret) {
    ClusterAttrAdd_t body(Count, Attrs);
    request(ClusterAttrAdd_t::MsgType, &body, ResultComplete_t::MsgType, ret);
}

void Cluster::AttrRemove(ClusterAttrRemove_t* body, ResultComplete_t* ret) {
    request(ClusterAttrRemove_t::MsgType, body, ResultComplete_t::MsgType, ret);
}

void Cluster::AttrRemove(staticList<CompAttr_t>& Attrs, ResultComplete_t* ret) {
    AttrRemove(Attrs, 0xFF, ret);
}

void Cluster::AttrRemove(staticList<CompAttr_t>& Attrs, unsigned char Count,
                         ResultComplete_t* ret) {
    ClusterAttrRemove_t body(Count, Attrs);
    request(ClusterAttrRemove_t::MsgType, &body, ResultComplete_t::MsgType, ret);
}

void Cluster::Lock(ClusterLock_t* body, ResultComplete_t* ret) {
    request(ClusterLock_t::MsgType, body, ResultComplete_t::MsgType, ret);
}

void Cluster::Lock(ResultComplete_t* ret) {
    ClusterLock_t body;
    request(ClusterLock_t::MsgType, &body, ResultComplete_t::MsgType, ret);
}

void Cluster::Unlock(ClusterUnlock_t* body, ClusterUnlockCmplt_t* ret) {
    request(ClusterUnlock_t::MsgType, body, ClusterUnlockCmplt_t::MsgType, ret);
}

void Cluster::Unlock(ClusterUnlockCmplt_t* ret) {
    ClusterUnlock_t body;
    request(ClusterUnlock_t::MsgType, &body, ClusterUnlockCmplt_t::MsgType, ret);
}

}  // namespace tolk
