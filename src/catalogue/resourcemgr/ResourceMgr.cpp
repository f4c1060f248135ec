#include "catalogue/resourcemgr/ResourceMgr.h"

#include "catalogue/cluster/Cluster.h"

namespace tolk {

namespace {

constexpr unsigned short kServiceInstance = 5;

// The address that means "no cluster": every field at its maximum.
CompDesc_t noCluster() {
    return CompDesc_t(0xFFFF, 0xFF, 0xFF, 0xFF, 0xFF);
}

void appendType(staticList<CompAttr_t>& attrs, unsigned int type) {
    unsigned int n = attrs.length();
    attrs.realloc(n + 1);
    *attrs.element(n) = CompAttr_t(0, static_cast<int>(type));
}

}  // namespace

ResourceMgr::ResourceMgr(const Addressable* owner) : Addressable(owner) {
    TgtDesc =
        CompDesc_t(kServiceInstance, owner->getTgtDesc().board, 1, 0, owner->getTgtDesc().node);
}

MsgBody* ResourceMgr::MsgBodyLookup(unsigned int type) {
    if (MsgBody* body = ResourceMgr_Bodies::msgLookup(type)) {
        return body;
    }
    return Addressable::MsgBodyLookup(type);
}

StdResource ResourceMgr::find(unsigned int type, unsigned char processor, unsigned short instance,
                              staticList<CompAttr_t> attrs) {
    if (type != 0) {
        appendType(attrs, type);
    }
    CompDesc_t CompStart(instance, TgtDesc.board, processor, 0xFF, TgtDesc.node);
    unsigned int count = 0xFFFFFFFF;
    CompFind_t body(CompStart, count, attrs);
    ComponentResult_t answer;
    request(CompFind_t::MsgType, &body, ComponentResult_t::MsgType, &answer);
    return StdResource(answer.desc, queue);
}

TmpInstance ResourceMgr::allocate(unsigned int type, unsigned char processor,
                                  unsigned short instance, Cluster* cluster,
                                  staticList<CompAttr_t> attrs) {
    if (type != 0) {
        appendType(attrs, type);
    }
    CompDesc_t CompStart(instance, TgtDesc.board, processor, 0xFF, TgtDesc.node);
    CompDesc_t ClustDesc = cluster != nullptr ? cluster->getTgtDesc() : noCluster();
    unsigned int count = 0xFFFFFFFF;
    CompInstAllocate_t body(CompStart, ClustDesc, count, attrs);
    ComponentResult_t answer;
    request(CompInstAllocate_t::MsgType, &body, ComponentResult_t::MsgType, &answer);
    TmpInstance result(answer.desc, queue);
    result.freeOnDestroy = 1;
    return result;
}

void ResourceMgr::free(StdResource* resource) {
    CompDesc_t desc = resource->getTgtDesc();
    CompInstFree_t body(desc);
    request(CompInstFree_t::MsgType, &body);
}

void ResourceMgr::use(StdResource* resource, unsigned int payload) {
    staticList<CompUse_t::List_t> list;
    list.realloc(1);
    list.element(0)->desc = resource->getTgtDesc();
    list.element(0)->Payload = payload;
    unsigned char Count = 0xFF;
    CompUse_t body(Count, list);
    request(CompUse_t::MsgType, &body, ResultComplete_t::MsgType, nullptr);
}

void ResourceMgr::unuse(StdResource* resource) {
    staticList<CompUnuse_t::List_t> list;
    list.realloc(1);
    list.element(0)->desc = resource->getTgtDesc();
    unsigned char Count = 0xFF;
    CompUnuse_t body(Count, list);
    request(CompUnuse_t::MsgType, &body, ResultComplete_t::MsgType, nullptr);
}

}  // namespace tolk
