// A handle on one message block: copying copies the pointer; only free() or a transport frees.
#pragma once

#include "platform/tkhost/tkhost.h"
#include "transport/TKSCommon.h"

class TKSMsgRef {
  public:
    class AllocationError : public TKSException {
      public:
        explicit AllocationError(unsigned int size) : size(size) {}
        unsigned int getSize() const { return size; }

      private:
        unsigned int size;
    };

    TKSMsgRef() = default;
    explicit TKSMsgRef(unsigned int size);
    explicit TKSMsgRef(TKMsg32Bit* msg) : msgRef(msg) {}
    TKSMsgRef(const TKSMsgRef& other) = default;
    TKSMsgRef& operator=(const TKSMsgRef& other) = default;
    virtual ~TKSMsgRef() = default;

    TKMsg32Bit* getMsgRef() const { return msgRef; }

    unsigned int getSize() const;
    unsigned int getMsgType() const;
    unsigned int getTrans() const;
    TKCompDesc getSrcAddr() const;
    TKCompDesc getTgtAddr() const;
    void setMsgType(unsigned int type);
    // Keeps the tag byte; only the low 24 bits of id are stored.
    void setTrans(unsigned int id);
    void setSrcAddr(TKCompDesc addr);
    void setTgtAddr(TKCompDesc addr);

    TKStatus fieldGet(TKMsgField field, void* value);
    TKStatus fieldPut(TKMsgField field, void* value);

    TKSMsgRef clone() const;
    void free();
    void realloc(unsigned int size);

  private:
    TKMsg32Bit* msgRef = nullptr;
};

bool operator==(const TKCompDesc& a, const TKCompDesc& b);
inline bool operator!=(const TKCompDesc& a, const TKCompDesc& b) {
    return !(a == b);
}
