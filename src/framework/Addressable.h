#pragma once

#include "framework/CompDesc_t.h"
#include "framework/EvtCallback_Class.h"
#include "framework/MsgBody.h"
#include "framework/MsgQueue.h"
#include "framework/virtualObject.h"
#include "transport/IsaSync.h"

namespace tolk {

// Proxy for one component instance: its address, a shared queue, and blocking requests.
class Addressable : public virtualObject {
  public:
    static constexpr unsigned int DefaultResponseTimeout = 5000;
    static constexpr unsigned int DefaultErrorWaitTime = 1000;

    using MsgMethod = EvtCallback::MsgMethod;
    using BodyMethod = EvtCallback::BodyMethod;
    using MsgFn = EvtCallback::MsgFn;
    using BodyFn = EvtCallback::BodyFn;

    class Timeout : public MsgQueue::Timeout {
      public:
        Timeout(Addressable* a, unsigned int cmdType, unsigned int retType, unsigned int trans,
                unsigned int timeoutMs);
        void toStream(std::ostream* os) const override;

        Addressable* addressable;
        unsigned int cmdType;
        unsigned int trans;
    };

    class UnexpectedMsg : public MsgQueue::ErrorMsg {
      public:
        // Takes the reply over; the last copy of the exception frees it.
        UnexpectedMsg(Addressable* a, unsigned int cmdType, Msg* reply);
        // Shares the reply that the caught ErrorMsg holds.
        UnexpectedMsg(Addressable* a, unsigned int cmdType, const MsgQueue::ErrorMsg& cause);
        void toStream(std::ostream* os) const override;

        Addressable* addressable;
        unsigned int cmdType;
    };

    class UndefinedMsgBody : public Exception {
      public:
        explicit UndefinedMsgBody(unsigned int type)
            : Exception("tolk::Addressable::UndefinedMsgBody"), type(type) {}
        unsigned int type;
    };

    class UndefinedEvtBody : public Exception {
      public:
        explicit UndefinedEvtBody(unsigned int group)
            : Exception("tolk::Addressable::UndefinedEvtBody"), group(group) {}
        unsigned int group;
    };

    // Makes a private queue with the target's address.
    explicit Addressable(const CompDesc_t& target);
    // An empty queue pointer also makes a private queue.
    Addressable(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue);
    // Copies: same target, times and queue; a new ObjId; no dispatcher.
    Addressable(const Addressable& other);
    explicit Addressable(const Addressable* other);
    Addressable& operator=(const Addressable&) = delete;
    ~Addressable() override;

    void toStream(std::ostream* os) const override;
    virtual void MsgQueueAttach(const isa::RefPtr<MsgQueue>& queue);
    // A new, empty body for the number; the caller owns it.
    virtual MsgBody* MsgBodyLookup(unsigned int type);
    virtual MsgBody* EvtBodyLookup(unsigned int group);
    MsgBody* superMsgBodyLookup(unsigned int type);
    MsgBody* superEvtBodyLookup(unsigned int group);

    // With completion: waits up to ResponseTimeout for retType; fills retBody unless null.
    void request(unsigned int cmdType, MsgBody* cmdBody, unsigned int retType, MsgBody* retBody,
                 unsigned int trans = 0, int anySource = 0);
    // One-way: waits ErrorWaitTime for a refusal; silence is success.
    void request(unsigned int cmdType, MsgBody* cmdBody, unsigned int trans = 0, int anySource = 0);

    const CompDesc_t& getTgtDesc() const { return TgtDesc; }
    isa::RefPtr<MsgQueue> getMsgQueue() const { return queue; }
    unsigned int getId() const { return ObjId; }
    unsigned int getResponseTimeout() const { return ResponseTimeout; }
    unsigned int getErrorWaitTime() const { return ErrorWaitTime; }
    void UnregisteredSource(MsgQueue::UnregisteredHandler handler);

    void asyncRegisterMsgType(unsigned int type, void* obj, MsgMethod m, unsigned int tag = 0);
    void asyncRegisterMsgType(unsigned int type, void* obj, BodyMethod m, unsigned int tag = 0);
    void asyncRegisterMsgType(unsigned int type, MsgFn f, unsigned int tag = 0);
    void asyncRegisterMsgType(unsigned int type, BodyFn f, unsigned int tag = 0);
    void asyncRegisterEvtGroup(unsigned int group, void* obj, MsgMethod m, unsigned int tag = 0);
    void asyncRegisterEvtGroup(unsigned int group, void* obj, BodyMethod m, unsigned int tag = 0);
    void asyncRegisterEvtGroup(unsigned int group, MsgFn f, unsigned int tag = 0);
    void asyncRegisterEvtGroup(unsigned int group, BodyFn f, unsigned int tag = 0);
    // Without a dispatcher there is nothing registered, and these do nothing.
    void asyncCancelMsgType(unsigned int type, void* obj, MsgMethod m, unsigned int tag = 0);
    void asyncCancelMsgType(unsigned int type, void* obj, BodyMethod m, unsigned int tag = 0);
    void asyncCancelMsgType(unsigned int type, MsgFn f, unsigned int tag = 0);
    void asyncCancelMsgType(unsigned int type, BodyFn f, unsigned int tag = 0);
    void asyncCancelMsgType(unsigned int type);
    void asyncCancelEvtGroup(unsigned int group, void* obj, MsgMethod m, unsigned int tag = 0);
    void asyncCancelEvtGroup(unsigned int group, void* obj, BodyMethod m, unsigned int tag = 0);
    void asyncCancelEvtGroup(unsigned int group, MsgFn f, unsigned int tag = 0);
    void asyncCancelEvtGroup(unsigned int group, BodyFn f, unsigned int tag = 0);
    void asyncCancelEvtGroup(unsigned int group);
    void asyncUnregisteredMsgType(void* obj, MsgMethod m, unsigned int tag = 0);
    void asyncUnregisteredMsgType(MsgFn f, unsigned int tag = 0);
    void asyncUnregisteredEvtGroup(void* obj, MsgMethod m, unsigned int tag = 0);
    void asyncUnregisteredEvtGroup(MsgFn f, unsigned int tag = 0);

    void asyncWaitMsg(unsigned int type, MsgBody* body, unsigned int timeoutMs);
    Msg* asyncWaitMsgMsg(unsigned int type, unsigned int timeoutMs);
    void asyncWaitEvtGroup(unsigned int group, MsgBody* body, unsigned int timeoutMs);
    Msg* asyncWaitEvtGroupMsg(unsigned int group, unsigned int timeoutMs);
    // New wait objects, armed when given a number; the caller owns them.
    EvtCallback::MsgWait* getNewMsgWait();
    EvtCallback::MsgWait* getNewMsgWait(unsigned int type);
    EvtCallback::EvtWait* getNewEvtWait();
    EvtCallback::EvtWait* getNewEvtWait(unsigned int group);

  protected:
    EvtCallback* dispatcher();

    unsigned int ResponseTimeout = DefaultResponseTimeout;
    unsigned int ErrorWaitTime = DefaultErrorWaitTime;
    CompDesc_t TgtDesc;
    isa::RefPtr<MsgQueue> queue;
    EvtCallback* evtCallback = nullptr;
    unsigned int ObjId;
};

}  // namespace tolk
