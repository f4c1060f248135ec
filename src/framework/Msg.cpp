#include "framework/Msg.h"

#include "framework/Exception.h"
#include "framework/MsgDefault_t.h"
#include "transport/TKSMsgRef.h"

namespace tolk {

Msg::Msg(unsigned int size) : ref(new TKSMsgRef(size)) {}

Msg::Msg(Msg& other) : ref(new TKSMsgRef(other.ref->clone())) {}

Msg::Msg(TKSMsgRef* r) : ref(new TKSMsgRef(*r)) {}

Msg::~Msg() {
    if (ref->getMsgRef() != nullptr) {
        ref->free();
    }
    delete ref;
    delete bodyDef;
}

unsigned int Msg::getMsgType() const {
    return ref->getMsgType();
}
CompDesc_t Msg::getSrcAddr() const {
    return CompDesc_t(ref->getSrcAddr());
}
CompDesc_t Msg::getTgtAddr() const {
    return CompDesc_t(ref->getTgtAddr());
}
unsigned int Msg::getSize() const {
    return ref->getSize();
}
unsigned int Msg::getTrans() const {
    return ref->getTrans();
}
void Msg::setMsgType(unsigned int type) {
    ref->setMsgType(type);
}
void Msg::setSrcAddr(CompDesc_t& addr) {
    ref->setSrcAddr(addr.getTKCompDesc());
}
void Msg::setTgtAddr(CompDesc_t& addr) {
    ref->setTgtAddr(addr.getTKCompDesc());
}
void Msg::setTrans(unsigned int id) {
    ref->setTrans(id);
}
void Msg::realloc(unsigned int size) {
    ref->realloc(size);
}

TKStatus Msg::fieldGet(unsigned int field, void* value) {
    return ref->fieldGet(static_cast<TKMsgField>(field), value);
}
TKStatus Msg::fieldPut(unsigned int field, void* value) {
    return ref->fieldPut(static_cast<TKMsgField>(field), value);
}

TKMsg32Bit* Msg::getMsgRef() const {
    return ref->getMsgRef();
}

void Msg::setBodyDef(MsgBody* body) {
    if (body != bodyDef) {
        delete bodyDef;
    }
    bodyDef = body;
}

void Msg::toStream(std::ostream* os) const {
    StreamFlagsGuard g(*os);
    Msg* self = const_cast<Msg*>(this);
    *os << std::hex << std::showbase << "{MsgType: " << getMsgType() << " Source: " << getSrcAddr()
        << " Target: " << getTgtAddr() << std::dec << " Size: " << getSize()
        << " Trans: " << getTrans() << std::hex << std::showbase;
    if (bodyDef == nullptr) {
        bodyDef = new MsgDefault_t();
    }
    try {
        bodyDef->readMsg(self, 0);
        *os << " Body: " << *bodyDef << "}";
    } catch (const Exception&) {
        // A body the definition cannot hold (an impossible count) still prints, as its bytes.
        MsgDefault_t raw;
        raw.readMsg(self, 0);
        *os << " Body: " << raw << "}";
    }
}

}  // namespace tolk
