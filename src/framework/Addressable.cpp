#include "framework/Addressable.h"

#include <memory>

#include "framework/tolk.h"

namespace tolk {

Addressable::Timeout::Timeout(Addressable* a, unsigned int cmd, unsigned int retType,
                              unsigned int id, unsigned int timeoutMs)
    : MsgQueue::Timeout(a->getMsgQueue().Get(), retType, timeoutMs),
      addressable(a),
      cmdType(cmd),
      trans(id) {}

void Addressable::Timeout::toStream(std::ostream* os) const {
    StreamFlagsGuard g(*os);
    *os << "Addressable::Timeout ObjSource: " << *addressable << std::hex << std::showbase
        << " CmdMsgType: " << cmdType << " RetMsgType: " << msgType << std::dec
        << " Trans: " << trans << " Timeout: " << timeoutMs << "ms";
}

Addressable::UnexpectedMsg::UnexpectedMsg(Addressable* a, unsigned int cmd, Msg* reply)
    : MsgQueue::ErrorMsg(a->getMsgQueue().Get(), reply), addressable(a), cmdType(cmd) {}

Addressable::UnexpectedMsg::UnexpectedMsg(Addressable* a, unsigned int cmd,
                                          const MsgQueue::ErrorMsg& cause)
    : MsgQueue::ErrorMsg(cause), addressable(a), cmdType(cmd) {}

void Addressable::UnexpectedMsg::toStream(std::ostream* os) const {
    StreamFlagsGuard g(*os);
    *os << std::hex << std::showbase << "Addressable::UnexpectedMsg ObjSource: " << *addressable
        << " CmdMsgType " << cmdType << " RespMsg: ";
    if (msg != nullptr) {
        *os << *msg;
    }
}

Addressable::Addressable(const CompDesc_t& target) : TgtDesc(target), ObjId(getUniqueObjId()) {
    MsgQueueAttach(isa::RefPtr<MsgQueue>());
}

Addressable::Addressable(const CompDesc_t& target, isa::RefPtr<MsgQueue>& q)
    : TgtDesc(target), ObjId(getUniqueObjId()) {
    MsgQueueAttach(q);
}

Addressable::Addressable(const Addressable& other)
    : virtualObject(),
      ResponseTimeout(other.ResponseTimeout),
      ErrorWaitTime(other.ErrorWaitTime),
      TgtDesc(other.TgtDesc),
      queue(other.queue),
      ObjId(getUniqueObjId()) {}

Addressable::Addressable(const Addressable* other) : Addressable(*other) {}

Addressable::~Addressable() {
    delete evtCallback;
    evtCallback = nullptr;
}

void Addressable::toStream(std::ostream* os) const {
    *os << "{TgtDesc: " << TgtDesc << " HostDesc: ";
    if (queue.Get() != nullptr) {
        *os << queue->getHostDesc();
    }
}

void Addressable::MsgQueueAttach(const isa::RefPtr<MsgQueue>& q) {
    if (q.Get() == nullptr) {
        queue = isa::RefPtr<MsgQueue>(
            new MsgQueue(TgtDesc, MsgQueue::DefaultMaxRetMsgSize, MsgQueue::DefaultDepth));
    } else {
        queue = q;
    }
}

MsgBody* Addressable::MsgBodyLookup(unsigned int type) {
    throw UndefinedMsgBody(type);
}
MsgBody* Addressable::EvtBodyLookup(unsigned int group) {
    throw UndefinedEvtBody(group);
}
MsgBody* Addressable::superMsgBodyLookup(unsigned int type) {
    throw UndefinedMsgBody(type);
}
MsgBody* Addressable::superEvtBodyLookup(unsigned int group) {
    throw UndefinedEvtBody(group);
}

namespace {

Msg* buildCommand(unsigned int cmdType, MsgBody* cmdBody, unsigned int& trans, CompDesc_t& target) {
    Msg* msg = new Msg(cmdBody->GetByteSize());
    try {
        msg->write(cmdBody, 0);
    } catch (...) {
        delete msg;
        throw;
    }
    if (trans == 0) {
        trans = getUniqueTransId();
    }
    msg->setTrans(trans);
    msg->setTgtAddr(target);
    msg->setMsgType(cmdType);
    return msg;
}

// A reply that is not the awaited completion travels on inside UnexpectedMsg, with its body
// attached when the class knows it, so that it prints whole.
Addressable::UnexpectedMsg unexpected(Addressable* self, unsigned int cmdType,
                                      const MsgQueue::ErrorMsg& e) {
    MsgBody* def = nullptr;
    try {
        def = self->MsgBodyLookup(e.msg->getMsgType());
    } catch (...) {
        def = nullptr;
    }
    e.msg->setBodyDef(def);
    return Addressable::UnexpectedMsg(self, cmdType, e);
}

}  // namespace

void Addressable::request(unsigned int cmdType, MsgBody* cmdBody, unsigned int retType,
                          MsgBody* retBody, unsigned int trans, int anySource) {
    Msg* msg = buildCommand(cmdType, cmdBody, trans, TgtDesc);
    Msg* reply = nullptr;
    try {
        reply = queue->request(msg, ResponseTimeout, retType, anySource);
    } catch (const MsgQueue::ErrorMsg& e) {
        throw unexpected(this, cmdType, e);
    } catch (const MsgQueue::Timeout& e) {
        throw Timeout(this, cmdType, retType, trans, e.timeoutMs);
    }
    const std::unique_ptr<Msg> owned(reply);
    if (owned != nullptr && retBody != nullptr) {
        owned->read(retBody, 0);
    }
}

void Addressable::request(unsigned int cmdType, MsgBody* cmdBody, unsigned int trans,
                          int anySource) {
    Msg* msg = buildCommand(cmdType, cmdBody, trans, TgtDesc);
    try {
        Msg* reply = queue->request(msg, ErrorWaitTime, 0, anySource);
        delete reply;
    } catch (const MsgQueue::ErrorMsg& e) {
        throw unexpected(this, cmdType, e);
    }
}

void Addressable::UnregisteredSource(MsgQueue::UnregisteredHandler handler) {
    queue->unregisteredSource(handler);
}

EvtCallback* Addressable::dispatcher() {
    if (evtCallback == nullptr) {
        evtCallback = new EvtCallback(this);
    }
    return evtCallback;
}

#define TOLK_FORWARD_REGISTER(op, target)                                                    \
    void Addressable::async##op(unsigned int n, void* obj, MsgMethod m, unsigned int tag) {  \
        dispatcher()->target(n, obj, m, tag);                                                \
    }                                                                                        \
    void Addressable::async##op(unsigned int n, void* obj, BodyMethod m, unsigned int tag) { \
        dispatcher()->target(n, obj, m, tag);                                                \
    }                                                                                        \
    void Addressable::async##op(unsigned int n, MsgFn f, unsigned int tag) {                 \
        dispatcher()->target(n, f, tag);                                                     \
    }                                                                                        \
    void Addressable::async##op(unsigned int n, BodyFn f, unsigned int tag) {                \
        dispatcher()->target(n, f, tag);                                                     \
    }

TOLK_FORWARD_REGISTER(RegisterMsgType, registerMsgType)
TOLK_FORWARD_REGISTER(RegisterEvtGroup, registerEvtGroup)

#define TOLK_FORWARD_CANCEL(op, target)                                                      \
    void Addressable::async##op(unsigned int n, void* obj, MsgMethod m, unsigned int tag) {  \
        if (evtCallback != nullptr) {                                                        \
            evtCallback->target(n, obj, m, tag);                                             \
        }                                                                                    \
    }                                                                                        \
    void Addressable::async##op(unsigned int n, void* obj, BodyMethod m, unsigned int tag) { \
        if (evtCallback != nullptr) {                                                        \
            evtCallback->target(n, obj, m, tag);                                             \
        }                                                                                    \
    }                                                                                        \
    void Addressable::async##op(unsigned int n, MsgFn f, unsigned int tag) {                 \
        if (evtCallback != nullptr) {                                                        \
            evtCallback->target(n, f, tag);                                                  \
        }                                                                                    \
    }                                                                                        \
    void Addressable::async##op(unsigned int n, BodyFn f, unsigned int tag) {                \
        if (evtCallback != nullptr) {                                                        \
            evtCallback->target(n, f, tag);                                                  \
        }                                                                                    \
    }                                                                                        \
    void Addressable::async##op(unsigned int n) {                                            \
        if (evtCallback != nullptr) {                                                        \
            evtCallback->target(n);                                                          \
        }                                                                                    \
    }

TOLK_FORWARD_CANCEL(CancelMsgType, cancelMsgType)
TOLK_FORWARD_CANCEL(CancelEvtGroup, cancelEvtGroup)

void Addressable::asyncUnregisteredMsgType(void* obj, MsgMethod m, unsigned int tag) {
    dispatcher()->unregisteredMsgType(obj, m, tag);
}
void Addressable::asyncUnregisteredMsgType(MsgFn f, unsigned int tag) {
    dispatcher()->unregisteredMsgType(f, tag);
}
void Addressable::asyncUnregisteredEvtGroup(void* obj, MsgMethod m, unsigned int tag) {
    dispatcher()->unregisteredEvtGroup(obj, m, tag);
}
void Addressable::asyncUnregisteredEvtGroup(MsgFn f, unsigned int tag) {
    dispatcher()->unregisteredEvtGroup(f, tag);
}

void Addressable::asyncWaitMsg(unsigned int type, MsgBody* body, unsigned int timeoutMs) {
    EvtCallback::MsgWait w(dispatcher());
    w.enable(type);
    w.wait(body, timeoutMs);
}
Msg* Addressable::asyncWaitMsgMsg(unsigned int type, unsigned int timeoutMs) {
    EvtCallback::MsgWait w(dispatcher());
    w.enable(type);
    return w.waitMsg(timeoutMs);
}
void Addressable::asyncWaitEvtGroup(unsigned int group, MsgBody* body, unsigned int timeoutMs) {
    EvtCallback::EvtWait w(dispatcher());
    w.enable(group);
    w.wait(body, timeoutMs);
}
Msg* Addressable::asyncWaitEvtGroupMsg(unsigned int group, unsigned int timeoutMs) {
    EvtCallback::EvtWait w(dispatcher());
    w.enable(group);
    return w.waitMsg(timeoutMs);
}

EvtCallback::MsgWait* Addressable::getNewMsgWait() {
    return new EvtCallback::MsgWait(dispatcher());
}
EvtCallback::MsgWait* Addressable::getNewMsgWait(unsigned int type) {
    auto* w = new EvtCallback::MsgWait(dispatcher());
    w->enable(type);
    return w;
}
EvtCallback::EvtWait* Addressable::getNewEvtWait() {
    return new EvtCallback::EvtWait(dispatcher());
}
EvtCallback::EvtWait* Addressable::getNewEvtWait(unsigned int group) {
    auto* w = new EvtCallback::EvtWait(dispatcher());
    w->enable(group);
    return w;
}

}  // namespace tolk
