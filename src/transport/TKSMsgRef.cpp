#include "transport/TKSMsgRef.h"

// Header access on an empty handle is a programming error of the caller.
#define msgref (msgRef != nullptr)

#include <cstring>

TKSMsgRef::TKSMsgRef(unsigned int size) {
    tkMsgAllocate(size, &msgRef);
    if (msgRef == nullptr) {
        throw AllocationError(size);
    }
}

unsigned int TKSMsgRef::getSize() const {
    TKS_ASSERT(msgref);
    return msgRef->size;
}

unsigned int TKSMsgRef::getMsgType() const {
    TKS_ASSERT(msgref);
    return msgRef->type;
}

unsigned int TKSMsgRef::getTrans() const {
    TKS_ASSERT(msgref);
    return msgRef->transTag >> 8;
}

TKCompDesc TKSMsgRef::getSrcAddr() const {
    TKS_ASSERT(msgref);
    TKCompDesc d{};
    tkMsgFieldGet(msgRef, TK_FIELD_SRC, &d);
    return d;
}

TKCompDesc TKSMsgRef::getTgtAddr() const {
    TKS_ASSERT(msgref);
    TKCompDesc d{};
    tkMsgFieldGet(msgRef, TK_FIELD_TGT, &d);
    return d;
}

void TKSMsgRef::setMsgType(unsigned int type) {
    TKS_ASSERT(msgref);
    msgRef->type = type;
}

void TKSMsgRef::setTrans(unsigned int id) {
    TKS_ASSERT(msgref);
    msgRef->transTag = (id << 8) | (msgRef->transTag & 0xFFu);
}

void TKSMsgRef::setSrcAddr(TKCompDesc addr) {
    TKS_ASSERT(msgref);
    tkMsgFieldPut(msgRef, TK_FIELD_SRC, &addr);
}

void TKSMsgRef::setTgtAddr(TKCompDesc addr) {
    TKS_ASSERT(msgref);
    tkMsgFieldPut(msgRef, TK_FIELD_TGT, &addr);
}

TKStatus TKSMsgRef::fieldGet(TKMsgField field, void* value) {
    TKS_ASSERT(msgref);
    return tkMsgFieldGet(msgRef, field, value);
}

TKStatus TKSMsgRef::fieldPut(TKMsgField field, void* value) {
    TKS_ASSERT(msgref);
    return tkMsgFieldPut(msgRef, field, value);
}

TKSMsgRef TKSMsgRef::clone() const {
    TKS_ASSERT(msgref);
    TKSMsgRef copy(msgRef->size);
    std::memcpy(copy.msgRef, msgRef, std::size_t(msgRef->size) + TK_MSG_COPY_EXTRA);
    return copy;
}

void TKSMsgRef::free() {
    TKS_ASSERT(msgref);
    tkMsgFree(msgRef);
    msgRef = nullptr;
}

void TKSMsgRef::realloc(unsigned int size) {
    if (msgRef == nullptr) {
        tkMsgAllocate(size, &msgRef);
        if (msgRef == nullptr) {
            throw AllocationError(size);
        }
        return;
    }
    if (tkMsgReallocate(size, &msgRef) != TK_OK) {
        throw AllocationError(size);
    }
}

bool operator==(const TKCompDesc& a, const TKCompDesc& b) {
    return a.instance == b.instance && a.board == b.board && a.processor == b.processor &&
           a.component == b.component && a.node == b.node;
}
