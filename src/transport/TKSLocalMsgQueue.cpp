#include "transport/TKSLocalMsgQueue.h"

#include <sys/resource.h>

#include "transport/TKSCommon.h"

namespace {

// Out of descriptors: the library's queues use file descriptors, so allow a few more.
void raiseOpenFileLimit() {
    rlimit lim{};
    if (getrlimit(RLIMIT_NOFILE, &lim) == 0) {
        rlim_t want = lim.rlim_cur + 60;
        if (lim.rlim_max != RLIM_INFINITY && want > lim.rlim_max) {
            want = lim.rlim_max;
        }
        lim.rlim_cur = want;
        setrlimit(RLIMIT_NOFILE, &lim);
    }
}

}  // namespace

TKSLocalMsgQueue::TKSLocalMsgQueue(TKCompDesc, unsigned int, unsigned int) {
    queue = tkQueueOpen();
    if (queue == TK_ERR_NO_DESCRIPTORS) {
        raiseOpenFileLimit();
        queue = tkQueueOpen();
        if (queue == TK_ERR_NO_DESCRIPTORS) {
            throw TKSResource_CreationError();
        }
    }
    TKStatus st = tkQueueBind(queue, &hostDesc);
    if (st == TK_ERR_NO_DESCRIPTORS) {
        raiseOpenFileLimit();
        st = tkQueueBind(queue, &hostDesc);
    }
    if (st != TK_OK) {
        tkQueueClose(queue);
        throw TKSResource_CreationError();
    }
}

TKSLocalMsgQueue::~TKSLocalMsgQueue() {
    tkQueueUnbind(queue, hostDesc);
    tkQueueClose(queue);
}

int TKSLocalMsgQueue::msgRead(TKMsg32Bit** out) {
    return tkMsgRead(queue, 0, out);
}

int TKSLocalMsgQueue::msgWrite(TKMsg32Bit* msg) {
    return tkMsgWrite(queue, msg, 0);
}

void TKSLocalMsgQueue::sendLastMessage() {
    TKMsg32Bit* last = nullptr;
    tkMsgAllocate(0, &last);
    if (last == nullptr) {
        // Without memory for the wake-up, unbinding wakes the reader just as well.
        tkQueueUnbind(queue, hostDesc);
        return;
    }
    tkMsgFieldPut(last, TK_FIELD_SRC, &hostDesc);
    tkMsgFieldPut(last, TK_FIELD_TGT, &hostDesc);
    if (tkMsgWrite(queue, last, 0) != TK_OK) {
        tkMsgFree(last);
        tkQueueUnbind(queue, hostDesc);
    }
}
