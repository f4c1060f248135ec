#include "transport/TKSMsgQueue.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <iostream>

#include "transport/TKSLocalMsgQueue.h"
#include "transport/TKSRemoteMsgQueue.h"

namespace {

constexpr unsigned int TYPE_ERROR = 0;
constexpr unsigned int TYPE_RESOURCE_ERROR = 0x800001;
constexpr unsigned int PICKUP_RECHECK_MS = 50;

const char* chooseHost(const char* remoteHost) {
    const char* host = remoteHost != nullptr ? remoteHost : std::getenv("REMOTE_TKHOST");
    const char* self = std::getenv("HOST");
    if (host != nullptr && self != nullptr && std::strncmp(host, self, std::strlen(self)) == 0) {
        return nullptr;
    }
    return host;
}

}  // namespace

TKSMsgQueue::CreationError::CreationError(const char* name, int port, const char* why)
    : port(port) {
    std::snprintf(reason, sizeof reason, "%s", why != nullptr ? why : "");
    hostName[0] = '\0';
    if (name != nullptr) {
        std::strncpy(hostName, name, sizeof hostName - 1);
        hostName[sizeof hostName - 1] = '\0';
    }
}

TKSMsgQueue::TKSMsgQueue(TKCompDesc addr, unsigned int maxRetMsgSize, unsigned int depth,
                         const char* remoteHost)
    : readerThread(static_cast<TKSRunnable*>(this),
                   static_cast<TKSThread::MemberBody>(&TKSMsgQueue::readNroute), 0) {
    const char* host = chooseHost(remoteHost);
    try {
        if (host == nullptr) {
            transport = new TKSLocalMsgQueue(addr, maxRetMsgSize, depth);
        } else {
            transport = new TKSRemoteMsgQueue(addr, maxRetMsgSize, depth, host);
        }
    } catch (const TKSRemoteOpenError& e) {
        throw CreationError(host, e.getPort(), e.getReason());
    } catch (TKSResource_CreationError&) {
        throw CreationError(host, 0,
                            host == nullptr ? "the host message library refused a queue" : nullptr);
    }
    hostDesc = transport->hostDesc;
    replyGate.lock();
    pickupReady.lock();
    try {
        readerThread.start(nullptr);
    } catch (TKSResource_CreationError&) {
        delete transport;
        transport = nullptr;
        throw CreationError(host);
    }
}

TKSMsgQueue::~TKSMsgQueue() {
    readerThread.cancel();
    transport->closeExchange();
    {
        std::lock_guard<std::mutex> lk(stopLock);
        stop = true;
        stopCond.notify_all();
    }
    transport->sendLastMessage();
    // A reader parked on a full pickup slot must see the stop too.
    pickupFree.unlock();
    {
        std::unique_lock<std::mutex> lk(stopLock);
        stopCond.wait(lk, [this] { return readerDone; });
    }
    readerThread.join();
    delete transport;
    std::lock_guard<std::mutex> lk(waitLock);
    tkMsgFree(replySlot);
    tkMsgFree(pickupSlot);
}

bool TKSMsgQueue::stopping() {
    std::lock_guard<std::mutex> lk(stopLock);
    return stop;
}

TKSMsgRef TKSMsgQueue::request(TKSMsgRef& msg, unsigned int timeoutMs, unsigned int retMsgType,
                               int anySource) {
    TKMsg32Bit* block = msg.getMsgRef();
    {
        std::lock_guard<std::mutex> lk(waitLock);
        waitRetType = retMsgType;
        waitTrans = msg.getTrans();
        waitTarget = msg.getTgtAddr();
        waitAnySource = anySource;
    }
    msg.setSrcAddr(hostDesc);

    if (timeoutMs == 0) {
        if (transport->msgWrite(block) != 0) {
            tkMsgFree(block);
        }
        return TKSMsgRef(0u);
    }

    replyGate.tryLock();
    {
        std::lock_guard<std::mutex> lk(waitLock);
        waiting = true;
    }
    if (transport->msgWrite(block) != 0) {
        // The transport refused it: the block is still ours, and the wait ends by time-out.
        tkMsgFree(block);
    }

    bool opened = replyGate.tryLock(timeoutMs, 10);
    std::lock_guard<std::mutex> lk(waitLock);
    waiting = false;
    // A reply stored at the very moment of the time-out is taken, not left behind.
    TKMsg32Bit* reply = replySlot;
    replySlot = nullptr;
    (void)opened;
    return TKSMsgRef(reply);
}

void TKSMsgQueue::registerAsyncCallback(TKSAsyncMsgReceiver* obj, TKSAsyncMethod method) {
    std::lock_guard<std::mutex> lk(callbackLock);
    asyncFn = nullptr;
    asyncObj = obj;
    asyncMethod = method;
}

void TKSMsgQueue::registerAsyncFunction(TKSAsyncFn fn) {
    std::lock_guard<std::mutex> lk(callbackLock);
    asyncObj = nullptr;
    asyncMethod = nullptr;
    asyncFn = fn;
}

TKSMsgRef TKSMsgQueue::pickup(unsigned int timeoutMs) {
    if (!pickupReady.tryLock(timeoutMs, 1)) {
        return TKSMsgRef();
    }
    TKMsg32Bit* block;
    {
        std::lock_guard<std::mutex> lk(waitLock);
        block = pickupSlot;
        pickupSlot = nullptr;
    }
    pickupFree.unlock();
    return TKSMsgRef(block);
}

unsigned int TKSMsgQueue::callbackFailures() const {
    std::lock_guard<std::mutex> lk(waitLock);
    return failures;
}

bool TKSMsgQueue::transportFailed() const {
    std::lock_guard<std::mutex> lk(waitLock);
    return failed;
}

void TKSMsgQueue::deliverAsync(TKMsg32Bit* block) {
    TKSAsyncFn fn;
    TKSAsyncMsgReceiver* obj;
    TKSAsyncMethod method;
    for (;;) {
        {
            std::lock_guard<std::mutex> lk(callbackLock);
            fn = asyncFn;
            obj = asyncObj;
            method = asyncMethod;
        }
        if (fn != nullptr || (obj != nullptr && method != nullptr)) {
            break;
        }
        // Nobody to take it yet: leave it for a direct reader, one block at a time. The wait for
        // a free slot looks for a callback now and then, so that one registered meanwhile gets
        // the block and a full slot never leaves the queue deaf.
        if (pickupFree.tryLock(PICKUP_RECHECK_MS, 10)) {
            if (stopping()) {
                pickupFree.unlock();
                tkMsgFree(block);
                return;
            }
            {
                std::lock_guard<std::mutex> lk(waitLock);
                pickupSlot = block;
            }
            pickupReady.unlock();
            return;
        }
        if (stopping()) {
            tkMsgFree(block);
            return;
        }
    }
    unsigned int type = block->type;
    TKSMsgRef ref(block);
    try {
        if (fn != nullptr) {
            fn(ref);
        } else {
            (obj->*method)(ref);
        }
        return;
    } catch (const std::exception& e) {
        std::cerr << "ERROR: TKSMsgQueue: message callback failed on message type 0x" << std::hex
                  << type << std::dec << ": " << e.what() << "; the queue goes on" << std::endl;
    } catch (const TKSException&) {
        std::cerr << "ERROR: TKSMsgQueue: message callback failed on message type 0x" << std::hex
                  << type << std::dec << " with a transport exception; the queue goes on"
                  << std::endl;
    } catch (...) {
        std::cerr << "ERROR: TKSMsgQueue: message callback failed on message type 0x" << std::hex
                  << type << std::dec << " with an exception; the queue goes on" << std::endl;
    }
    std::lock_guard<std::mutex> lk(waitLock);
    ++failures;
}

void TKSMsgQueue::route(TKMsg32Bit* block) {
    {
        std::lock_guard<std::mutex> lk(waitLock);
        if (waiting) {
            unsigned int type = block->type;
            TKCompDesc src{};
            tkMsgFieldGet(block, TK_FIELD_SRC, &src);
            bool isReply =
                (block->transTag >> 8) == (waitTrans & 0xFFFFFFu) &&
                (type == TYPE_ERROR || type == TYPE_RESOURCE_ERROR || type == waitRetType) &&
                (waitAnySource != 0 || src == waitTarget);
            if (isReply) {
                replySlot = block;
                waiting = false;
                replyGate.unlock();
                return;
            }
        }
    }
    deliverAsync(block);
}

// Once the transport has failed for good there is nothing to read: wait for the end.
void TKSMsgQueue::waitForStop() {
    std::unique_lock<std::mutex> lk(stopLock);
    stopCond.wait(lk, [this] { return stop; });
}

void* TKSMsgQueue::readNroute(void*, void*) {
    for (;;) {
        TKMsg32Bit* block = nullptr;
        int status;
        try {
            status = transport->msgRead(&block);
        } catch (const TKSRemoteService_ComFailure& f) {
            // The name is the relay as the user gave it, with its port when one was given.
            std::cerr << "ERROR: TKSMsgQueue: lost the relay connection to " << f.getHostName();
            if (std::strchr(f.getHostName(), ':') == nullptr) {
                std::cerr << " port " << f.getPort();
            }
            std::cerr << "; this queue receives nothing more and its requests will time out"
                      << std::endl;
            {
                std::lock_guard<std::mutex> lk(waitLock);
                failed = true;
            }
            waitForStop();
            break;
        } catch (...) {
            // No other failure is expected from a transport; if one comes the reader must still
            // be there for the shutdown, or the destructor would wait for it for ever.
            std::cerr << "ERROR: TKSMsgQueue: the transport failed while reading; this queue "
                         "receives nothing more and its requests will time out"
                      << std::endl;
            {
                std::lock_guard<std::mutex> lk(waitLock);
                failed = true;
            }
            waitForStop();
            break;
        }
        if (stopping()) {
            tkMsgFree(block);
            break;
        }
        if (status != 0 || block == nullptr) {
            continue;
        }
        route(block);
    }
    std::lock_guard<std::mutex> lk(stopLock);
    readerDone = true;
    stopCond.notify_all();
    return nullptr;
}
