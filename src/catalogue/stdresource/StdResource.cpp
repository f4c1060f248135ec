#include "catalogue/stdresource/StdResource.h"

#include "catalogue/resourcemgr/ResourceMgr.h"

namespace tolk {

StdResource::StdResource(const CompDesc_t& target) : Addressable(target) {
    resourceMgr = new ResourceMgr(this);
}

StdResource::StdResource(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q)
    : Addressable(target, q) {
    resourceMgr = new ResourceMgr(this);
}

StdResource::StdResource(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q, int withMgr)
    : Addressable(target, q) {
    if (withMgr != 0) {
        resourceMgr = new ResourceMgr(this);
    }
}

StdResource::StdResource(const Addressable& other) : Addressable(other) {
    resourceMgr = new ResourceMgr(this);
}

StdResource::StdResource(const StdResource& other) : Addressable(other), StdResource_Bodies() {
    resourceMgr = new ResourceMgr(this);
}

StdResource::~StdResource() {
    endDispatch();
    if (eventsDetected != 0) {
        try {
            CancelAllEvts(static_cast<Addressable*>(nullptr));
        } catch (...) {
        }
    }
    if (inUse != 0) {
        try {
            unuse();
        } catch (...) {
        }
    }
    if (freeOnDestroy != 0) {
        try {
            free();
        } catch (...) {
        }
    }
    delete resourceMgr;
}

MsgBody* StdResource::MsgBodyLookup(unsigned int type) {
    if (MsgBody* body = StdResource_Bodies::msgLookup(type)) {
        return body;
    }
    return superMsgBodyLookup(type);
}

MsgBody* StdResource::EvtBodyLookup(unsigned int group) {
    return superEvtBodyLookup(group);
}

void StdResource::free() {
    if (resourceMgr == nullptr) {
        throw NoResourceMgr();
    }
    resourceMgr->free(this);
}

void StdResource::use(unsigned int payload) {
    if (resourceMgr == nullptr) {
        throw NoResourceMgr();
    }
    resourceMgr->use(this, payload);
}

void StdResource::unuse() {
    if (resourceMgr == nullptr) {
        throw NoResourceMgr();
    }
    resourceMgr->unuse(this);
}

void StdResource::msgQueueAttach(isa::RefPtr<MsgQueue>& q) {
    if (inUse != 0) {
        unuse();
    }
    bool hadMgr = resourceMgr != nullptr;
    delete resourceMgr;
    resourceMgr = nullptr;
    Addressable::MsgQueueAttach(q);
    if (hadMgr) {
        resourceMgr = new ResourceMgr(this);
    }
    if (inUse != 0) {
        use(usePayload);
    }
}

unsigned int StdResource::eventId(const Addressable* target) const {
    return target != nullptr ? target->getId() : getId();
}

CompDesc_t StdResource::eventRetAddr(const Addressable* target) const {
    return target != nullptr ? target->getTgtDesc() : queue->getHostDesc();
}

void StdResource::DetectEvt(unsigned int EvtType, unsigned int EvtGroup, Addressable* target) {
    CompDesc_t RetAddr = eventRetAddr(target);
    unsigned int group = EvtGroup != 0 ? EvtGroup : EvtType;
    MsgDetectEvt_t body(RetAddr, EvtType, group);
    request(MsgDetectEvt_t::MsgType, &body, MsgDetectEvtCmplt_t::MsgType, nullptr, eventId(target));
}

void StdResource::DetectxEvts(staticList<unsigned int>& types, unsigned int EvtGroup,
                              Addressable* target) {
    staticList<MsgDetectxEvts_t::List_t> pairs;
    pairs.realloc(types.length());
    for (unsigned int i = 0; i < types.length(); ++i) {
        unsigned int type = *types.element(i);
        pairs.element(i)->EvtType = type;
        pairs.element(i)->EvtGroup = EvtGroup != 0 ? EvtGroup : type;
    }
    DetectxEvts(pairs, target);
}

}  // namespace tolk
