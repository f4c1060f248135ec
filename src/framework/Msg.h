#pragma once

#include "framework/CompDesc_t.h"
#include "framework/MsgBody.h"
#include "framework/virtualObject.h"
#include "platform/tkhost/tkhost.h"

class TKSMsgRef;

namespace tolk {

// One message: owns its block through a TKSMsgRef, and optionally a body definition that only
// serves printing.
class Msg : public virtualObject {
  public:
    explicit Msg(unsigned int size);
    // Deep copy: a new block with the other's bytes (size + 48); no body definition.
    Msg(Msg& other);
    // Adopts the block that ref holds: from now on this Msg frees it.
    explicit Msg(TKSMsgRef* ref);
    ~Msg() override;
    Msg& operator=(const Msg&) = delete;

    // Parses the body into the body definition (a MsgDefault_t if there is none) and prints it.
    void toStream(std::ostream* os) const override;

    unsigned int getMsgType() const;
    CompDesc_t getSrcAddr() const;
    CompDesc_t getTgtAddr() const;
    unsigned int getSize() const;
    unsigned int getTrans() const;
    void setMsgType(unsigned int type);
    void setSrcAddr(CompDesc_t& addr);
    void setTgtAddr(CompDesc_t& addr);
    void setTrans(unsigned int id);

    void realloc(unsigned int size);
    TKStatus fieldGet(unsigned int field, void* value);
    TKStatus fieldPut(unsigned int field, void* value);

    // The reference that holds the block: assign an empty TKSMsgRef to it to take the block
    // out of this Msg (the Msg then frees nothing).
    TKSMsgRef* getTKMsgRef() { return ref; }
    TKMsg32Bit* getMsgRef() const;

    unsigned int read(MsgBody* body, unsigned int offset) { return body->readMsg(this, offset); }
    unsigned int write(MsgBody* body, unsigned int offset) { return body->writeMsg(this, offset); }

    // Deletes the present definition and takes the new one (may be null).
    void setBodyDef(MsgBody* body);
    MsgBody* getBodyDef() const { return bodyDef; }

  private:
    TKSMsgRef* ref;
    mutable MsgBody* bodyDef = nullptr;
};

}  // namespace tolk
