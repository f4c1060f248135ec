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

    virtual void GetParm(MsgGetParm_t* body, MsgGetParmCmplt_t* ret);
    virtual void GetParm(unsigned int Num, MsgGetParmCmplt_t* ret);

    virtual void ArmRTC(MsgArmRTC_t* body);
    virtual void ArmRTC(unsigned int EvtGroup, unsigned int Action);
    virtual void ArmxRTCs(MsgArmxRTCs_t* body);
    virtual void ArmxRTCs(staticList<MsgArmxRTCs_t::EventGroupList_t>& EventGroupList);
    virtual void DisArmRTC(MsgDisarmRTC_t* body);
    virtual void DisArmRTC(unsigned int EvtGroup);
    virtual void DisarmxRTCs(MsgDisarmxRTCs_t* body);
    virtual void DisarmxRTCs(staticList<unsigned int>& EventGroupList);
    virtual void DisarmAllRTCs(MsgDisarmAllRTCs_t* body);
    virtual void DisarmAllRTCs();

    // The event operations: RetAddr and transaction id are the target's, or with a null target
    // the queue's host address and this object's id. A ready body goes out with this object's id.
    virtual void DetectEvt(MsgDetectEvt_t* body);
    virtual void DetectEvt(unsigned int EvtType, unsigned int EvtGroup, Addressable* target);
    virtual void DetectxEvts(MsgDetectxEvts_t* body);
    virtual void DetectxEvts(staticList<MsgDetectxEvts_t::List_t>& List, Addressable* target);
    // Element i asks for types[i] in EvtGroup, or in group types[i] when EvtGroup is 0.
    virtual void DetectxEvts(staticList<unsigned int>& types, unsigned int EvtGroup,
                             Addressable* target);
    virtual void CancelEvt(MsgCancelEvt_t* body);
    virtual void CancelEvt(unsigned int Type, Addressable* target);
    virtual void CancelxEvts(MsgCancelxEvts_t* body);
    virtual void CancelxEvts(staticList<unsigned int>& EvtTypeList, Addressable* target);
    virtual void CancelAllEvts(Addressable* target);

    void Error(MsgError_t* body);
    void Error(unsigned int ErrorMsg, unsigned int ErrorCode, cat::ValueWord Data = 0);
    void ComTest(MsgComtest_t* body, MsgComtestCmplt_t* ret);
    void ComTest(MsgComtestCmplt_t* ret);
    void SetParm(MsgSetParm_t* body, MsgSetParmCmplt_t* ret);
    void SetParm(unsigned int Parm, unsigned int Val, MsgSetParmCmplt_t* ret);
    void SetxParms(MsgSetxParms_t* body, MsgSetxParmsCmplt_t* ret);
    void SetxParms(staticList<MsgSetxParms_t::Parms_t>& Parms, MsgSetxParmsCmplt_t* ret);
    void SetxParms(staticList<MsgSetxParms_t::Parms_t>& Parms, unsigned int Count,
                   MsgSetxParmsCmplt_t* ret);
    void GetxParms(MsgGetxParms_t* body, MsgGetxParmsCmplt_t* ret);
    void GetxParms(staticList<MsgGetxParms_t::Parms_t>& Parms, MsgGetxParmsCmplt_t* ret);
    void GetxParms(staticList<MsgGetxParms_t::Parms_t>& Parms, unsigned int Count,
                   MsgGetxParmsCmplt_t* ret);
    void SetVParm(MsgSetVParm_t* body, MsgSetVParmCmplt_t* ret);
    void SetVParm(staticList<MsgSetVParm_t::Parms_t>& Parms, MsgSetVParmCmplt_t* ret);
    void SetVParm(staticList<MsgSetVParm_t::Parms_t>& Parms, unsigned short Count,
                  MsgSetVParmCmplt_t* ret);
    void GetVParm(MsgGetVParm_t* body, MsgGetVParmCmplt_t* ret);
    void GetVParm(staticList<MsgGetVParm_t::Parms_t>& Parms, MsgGetVParmCmplt_t* ret);
    void GetVParm(staticList<MsgGetVParm_t::Parms_t>& Parms, unsigned short Count,
                  MsgGetVParmCmplt_t* ret);
    void Init(MsgInit_t* body, MsgInitCmplt_t* ret);
    void Init(MsgInitCmplt_t* ret);
    void Ack(MsgAck_t* body);
    void Ack();
    // One-way: nothing waits for the completion 0x07.
    void Exit(MsgExit_t* body);
    void Exit();
    void SetParmDef(MsgSetParmDef_t* body, MsgSetParmDefCmplt_t* ret);
    void SetParmDef(unsigned int Parm, MsgSetParmDefCmplt_t* ret);
    void SetxParmsDef(MsgSetxParmsDef_t* body, MsgSetxParmsDefCmplt_t* ret);
    void SetxParmsDef(staticList<MsgSetxParmsDef_t::Parms_t>& Parms, MsgSetxParmsDefCmplt_t* ret);
    void SetxParmsDef(staticList<MsgSetxParmsDef_t::Parms_t>& Parms, unsigned int Count,
                      MsgSetxParmsDefCmplt_t* ret);
    void SetAllParmsDef(MsgSetAllParmsDef_t* body, MsgSetAllParmsDefCmplt_t* ret);
    void SetAllParmsDef(MsgSetAllParmsDefCmplt_t* ret);

    ResourceMgr* getResourceMgr() const { return resourceMgr; }
    unsigned int getUsePayload() const { return usePayload; }
    int getFreeOnDestroy() const { return freeOnDestroy; }
    int getInUse() const { return inUse; }
    int getEventsDetected() const { return eventsDetected; }

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
