#pragma once

#include "catalogue/generated/stdresource_bodies.h"
#include "framework/Addressable.h"

namespace tolk {

class ResourceMgr;

// The operations that every resource on a board answers to, and the rule of who claims,
// releases and frees the instance behind the proxy.
class StdResource : public Addressable, public StdResource_Bodies {
  public:
    // use, unuse or free on a proxy that was made without a resource manager.
    class NoResourceMgr : public Exception {
      public:
        NoResourceMgr() : Exception("tolk::StdResource::NoResourceMgr") {}
    };

    explicit StdResource(const CompDesc_t& target);
    StdResource(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue);
    // withMgr 0: no resource manager, so the proxy can neither claim nor free.
    StdResource(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue, int withMgr);
    explicit StdResource(const Addressable& other);
    // A copy claims nothing: its flags start at 0 and it has a manager of its own.
    StdResource(const StdResource& other);
    StdResource& operator=(const StdResource&) = delete;
    // Cancels all events if it detected any, unclaims if in use, frees if allocated; every
    // failure of these is dropped, since the board may already be gone.
    ~StdResource() override;

    MsgBody* MsgBodyLookup(unsigned int type) override;
    MsgBody* EvtBodyLookup(unsigned int group) override;

    virtual void free();
    virtual void use(unsigned int payload);
    virtual void unuse();
    virtual void msgQueueAttach(isa::RefPtr<MsgQueue>& queue);

    // The operation families, from the schema. The event operations: RetAddr and transaction
    // id are the target's, or with a null target the queue's host address and this object's id.
    // A ready body goes out with this object's id.
#include "catalogue/generated/stdresource_ops.h"

    // The group defaults to the type.
    virtual void DetectEvt(unsigned int EvtType, unsigned int EvtGroup, Addressable* target);
    // Element i asks for types[i] in EvtGroup, or in group types[i] when EvtGroup is 0.
    virtual void DetectxEvts(staticList<unsigned int>& types, unsigned int EvtGroup,
                             Addressable* target);

    ResourceMgr* getResourceMgr() const {
        return resourceMgr;
    }
    unsigned int getUsePayload() const {
        return usePayload;
    }
    int getFreeOnDestroy() const {
        return freeOnDestroy;
    }
    int getInUse() const {
        return inUse;
    }
    int getEventsDetected() const {
        return eventsDetected;
    }

  protected:
    friend class ResourceMgr;

    // Ends the delivery of unsolicited messages to this object. Every destructor of the family
    // calls it first, so that the reader thread never calls into an object whose most derived
    // part is already gone.
    void endDispatch() {
        delete evtCallback;
        evtCallback = nullptr;
    }

    // The id and return address that the event operations give for `target`.
    unsigned int eventId(const Addressable* target) const;
    CompDesc_t eventRetAddr(const Addressable* target) const;

    ResourceMgr* resourceMgr = nullptr;
    unsigned int usePayload = 0;
    int freeOnDestroy = 0;
    int inUse = 0;
    int eventsDetected = 0;
};

}  // namespace tolk
