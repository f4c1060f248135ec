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

// A cluster is also answered with two of the cluster service's records.
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

void Cluster::Activate(unsigned int portId, Addressable* talker, unsigned char options) {
    CompDesc_t ClustDesc = TgtDesc;
    CompDesc_t talkerDesc = talker != nullptr ? talker->getTgtDesc() : allOnes();
    ClusterActivate_t body(ClustDesc, portId, options, talkerDesc);
    Activate(&body);
}

void Cluster::TSAssign(unsigned int portId, staticList<unsigned short>& slotIds,
                       unsigned char encoding, unsigned char idlePattern) {
    CompDesc_t ClustDesc = TgtDesc;
    unsigned char width = static_cast<unsigned char>(slotIds.length());
    staticList<unsigned short> slots(slotIds);
    ClusterSlotAssign_t body(ClustDesc, portId, width, encoding, idlePattern, slots);
    TSAssign(&body);
}

void Cluster::TSInfo(unsigned int portId, unsigned char* width, unsigned char* encoding,
                     unsigned char* idlePattern, staticList<unsigned short>* slotIds) {
    CompDesc_t ClustDesc = TgtDesc;
    ClusterSlotInfo_t body(ClustDesc, portId);
    ClusterSlotInfoResult_t answer;
    TSInfo(&body, &answer);
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

void Cluster::Connect(unsigned int portId1, unsigned int portId2, Addressable* a, Addressable* b) {
    CompDesc_t InstDesc1 = a != nullptr ? a->getTgtDesc() : TgtDesc;
    CompDesc_t InstDesc2 = b != nullptr ? b->getTgtDesc() : TgtDesc;
    ClusterConnect_t body(InstDesc1, portId1, InstDesc2, portId2);
    Connect(&body);
}

void Cluster::Disconnect(unsigned int portId1, unsigned int portId2, Addressable* a,
                         Addressable* b) {
    CompDesc_t InstDesc1 = a != nullptr ? a->getTgtDesc() : TgtDesc;
    CompDesc_t InstDesc2 = b != nullptr ? b->getTgtDesc() : TgtDesc;
    ClusterDisconnect_t body(InstDesc1, portId1, InstDesc2, portId2);
    Disconnect(&body);
}

void Cluster::ClusterCompInfo(staticList<CompDesc_t>* out, CompDesc_t ClustDesc) {
    ClusterCompInfo_t body(ClustDesc);
    ClusterCompInfoResult_t answer;
    ClusterCompInfo(&body, &answer);
    if (out != nullptr) {
        *out = answer.instances;
    }
}

}  // namespace tolk
