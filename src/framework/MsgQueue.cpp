#include "framework/MsgQueue.h"

#include <iostream>
#include <mutex>

#include "framework/AsyncMsgReceiver.h"
#include "transport/TKSMsgQueue.h"
#include "transport/TKSMsgRef.h"
#include "transport/TKSWholeLine.h"

namespace tolk {

using ReceiverList = sharedKeyedList<CompDesc_t, AsyncMsgReceiver*>;

MsgQueue::ErrorMsg::ErrorMsg(MsgQueue* q, Msg* reply)
    : Exception("MsgQueue::ErrorMsg"), msg(reply), queue(q), owner(reply) {}

void MsgQueue::ErrorMsg::toStream(std::ostream* os) const {
    *os << "MsgQueue::ErrorMsg "
        << "MsgBody: ";
    if (msg != nullptr) {
        *os << *msg;
    }
}

MsgQueue::Timeout::Timeout(MsgQueue* q, unsigned int type, unsigned int ms)
    : Exception("MsgQueue::Timeout"), queue(q), msgType(type), timeoutMs(ms) {}

void MsgQueue::Timeout::toStream(std::ostream* os) const {
    StreamFlagsGuard g(*os);
    *os << "MsgQueue::Timeout" << std::hex << std::showbase << " MsgType: " << msgType << std::dec
        << " Timeout: " << timeoutMs << "ms)";
}

MsgQueue::MsgQueue(CompDesc_t addr, unsigned int maxRetMsgSize, unsigned int depth)
    : queue(new TKSMsgQueue(addr.getTKCompDesc(), maxRetMsgSize, depth, nullptr)),
      unregisteredHandler(MsgQueue_unregisteredSourceHandler) {
    queue->registerAsyncCallback(&router, static_cast<TKSAsyncMethod>(&Router::route));
}

MsgQueue::~MsgQueue() {
    delete queue;
}

namespace {

std::atomic<unsigned long> g_endedRequests{0};
static_assert(std::atomic<unsigned long>::is_always_lock_free, "read in signal handlers");

}  // namespace

unsigned long MsgQueue::endedRequests() {
    return g_endedRequests.load();
}

Msg* MsgQueue::request(Msg* msg, unsigned int timeoutMs, unsigned int retMsgType, int anySource) {
    TKSMsgRef ref(*msg->getTKMsgRef());
    // The block belongs to the transport once it has been handed on, whatever the outcome.
    auto handedOn = [msg] {
        ++g_endedRequests;
        *msg->getTKMsgRef() = TKSMsgRef();
        delete msg;
    };
    TKSMsgRef reply;
    try {
        // Only a request that waits holds the queue: the transport has one wait record.
        std::unique_lock<Mutex> waiting(requestLock, std::defer_lock);
        if (timeoutMs != 0) {
            waiting.lock();
        }
        reply = queue->request(ref, timeoutMs, retMsgType, anySource);
    } catch (...) {
        handedOn();
        throw;
    }
    handedOn();

    if (reply.getMsgRef() == nullptr) {
        if (retMsgType != 0) {
            throw Timeout(this, retMsgType, timeoutMs);
        }
        return nullptr;
    }
    Msg* answer = new Msg(&reply);
    // Only the awaited completion is an answer. A refusal (type 0) is never one, and a request
    // that awaits none has nothing but refusals to hear.
    if (retMsgType == 0 || answer->getMsgType() != retMsgType) {
        throw ErrorMsg(this, answer);
    }
    return answer;
}

void MsgQueue::RegisterAsyncMsgReceiver(CompDesc_t source, AsyncMsgReceiver* receiver) {
    if (!receivers.setIfAbsent(source, receiver)) {
        throw Exception(
            "Only One AsyncMsgReceiver can be registered for each source address on a particular "
            "MsgQueue");
    }
}

void MsgQueue::DeregisterAsyncMsgReceiver(CompDesc_t source) {
    std::lock_guard<std::recursive_mutex> g(dispatchLock);
    receivers.unset(source);
}

void MsgQueue::unregisteredSource(UnregisteredHandler handler) {
    unregisteredHandler = handler;
}

CompDesc_t MsgQueue::getHostDesc() const {
    return CompDesc_t(queue->getHostDesc());
}

void MsgQueue::toStream(std::ostream* os) const {
    *os << "{HostDesc: " << getHostDesc() << "}";
}

int MsgQueue::MsgRouter(TKSMsgRef& ref) {
    Msg* msg = new Msg(&ref);
    CompDesc_t source = msg->getSrcAddr();
    std::lock_guard<std::recursive_mutex> g(dispatchLock);
    AsyncMsgReceiver* receiver = nullptr;
    try {
        receiver = receivers.get(source);
    } catch (const ReceiverList::OutOfBoundsError&) {
    }
    // Whatever a receiver lets escape is reported here, so that the reader keeps serving the
    // queue; the receiver owned the message and has freed it or leaks only what it held.
    try {
        if (receiver == nullptr) {
            unregisteredHandler.load()(*this, msg);
        } else {
            receiver->receive(msg);
        }
    } catch (const Exception& e) {
        TKSWholeLine() << "MsgQueue::MsgRouter: exception from the receiver for source " << source
                       << ", message dropped" << std::endl
                       << e << std::endl;
    } catch (...) {
        TKSWholeLine() << "MsgQueue::MsgRouter: unknown exception from the receiver for source "
                       << source << ", message dropped" << std::endl;
    }
    return 1;
}

void MsgQueue_unregisteredSourceHandler(MsgQueue& q, Msg* m) {
    TKSWholeLine()
        << std::endl
        << "********************************************" << std::endl
        << "Unregistered Source sent to MsgQueue " << q << std::endl
        << "MsgType " << m->getMsgType() << std::endl
        << *m << std::endl
        << "You may specify your own handler for messages from unregistered sources using"
        << std::endl
        << "MsgQueue::unregisteredSource" << std::endl
        << "********************************************" << std::endl
        << std::endl;
    delete m;
}

}  // namespace tolk
