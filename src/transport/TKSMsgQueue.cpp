#include "transport/TKSMsgQueue.h"

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <exception>
#include <iostream>
#include <vector>

#include "catalogue/generated/values.h"
#include "transport/TKSLocalMsgQueue.h"
#include "transport/TKSRemoteMsgQueue.h"
#include "transport/TKSWholeLine.h"

namespace {

constexpr unsigned int TYPE_ERROR = tolk::wire::StdResource::MsgType::MsgError_t;
constexpr unsigned int TYPE_RESOURCE_ERROR = tolk::wire::StdResource::MsgType::RESOURCE_ERROR;
constexpr unsigned int PICKUP_RECHECK_MS = 50;

const char* chooseHost(const char* remoteHost) {
    const char* host = remoteHost != nullptr ? remoteHost : std::getenv("REMOTE_TKHOST");
    const char* self = std::getenv("HOST");
    if (host != nullptr && self != nullptr && std::strncmp(host, self, std::strlen(self)) == 0) {
        return nullptr;
    }
    return host;
}

// The relay as the operator knows it; each queue of the process has its own connection to it,
// but the operator hears of the relay, not of every connection.
class RelayMonitor {
  public:
    void lost(const std::string& relay, const char* why) {
        std::lock_guard<std::mutex> lk(m);
        if (down++ != 0) {
            return;
        }
        since = std::chrono::steady_clock::now();
        const std::string line = "relay connection to " + relay + " lost at " + timeOfDay() + " (" +
                                 why + "); requests fail at once until it is back";
        TKSWholeLine(std::cout) << line << std::endl;
        TKSWholeLine() << line << std::endl;
        tell(true, relay);
    }
    // `restored` false: the queue went away while cut off, so it no longer waits for the relay.
    void back(const std::string& relay, bool restored) {
        std::lock_guard<std::mutex> lk(m);
        if (down == 0 || --down != 0) {
            return;
        }
        if (restored) {
            double seconds =
                std::chrono::duration<double>(std::chrono::steady_clock::now() - since).count();
            char took[32];
            std::snprintf(took, sizeof took, "%.1f", seconds);
            const std::string line = "relay connection to " + relay + " back at " + timeOfDay() +
                                     ", after " + took + " s";
            TKSWholeLine(std::cout) << line << std::endl;
            TKSWholeLine() << line << std::endl;
        }
        tell(false, relay);
    }
    void add(TKSMsgQueue::RelayListener listener) {
        std::lock_guard<std::mutex> lk(m);
        listeners.push_back(std::move(listener));
    }
    bool cutOff() {
        std::lock_guard<std::mutex> lk(m);
        return down != 0;
    }

  private:
    static std::string timeOfDay() {
        std::time_t now = std::time(nullptr);
        std::tm parts{};
        localtime_r(&now, &parts);
        char text[16];
        std::strftime(text, sizeof text, "%H:%M:%S", &parts);
        return text;
    }
    void tell(bool cut, const std::string& relay) {
        for (const TKSMsgQueue::RelayListener& listener : listeners) {
            try {
                listener(cut, relay);
            } catch (...) {
                TKSWholeLine() << "ERROR: TKSMsgQueue: a relay state listener failed" << std::endl;
            }
        }
    }

    std::mutex m;
    int down = 0;
    std::chrono::steady_clock::time_point since;
    std::vector<TKSMsgQueue::RelayListener> listeners;
};

// Never destroyed: a reader thread may report while the process exits.
RelayMonitor& relayMonitor() {
    static RelayMonitor* monitor = new RelayMonitor;
    return *monitor;
}

}  // namespace

void TKSMsgQueue::addRelayListener(RelayListener listener) {
    relayMonitor().add(std::move(listener));
}

bool TKSMsgQueue::relayCutOff() {
    return relayMonitor().cutOff();
}

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
    relayName = host != nullptr ? host : "";
    transport->connectionChanged = [this](bool up, const char* why) { connectionChanged(up, why); };
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
    if (cutOff) {
        relayMonitor().back(relayName, false);
    }
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
    const unsigned int type = block != nullptr ? block->type : 0;
    // Nothing can arrive while the connection is down: the request fails at once, as a request
    // without an answer would, rather than making its caller wait for a relay known to be gone.
    auto notSent = [&](const char* why) {
        TKSWholeLine() << "TKSMsgQueue: request of type 0x" << std::hex << type << std::dec
                       << " not sent: " << why << std::endl;
        tkMsgFree(block);
        return timeoutMs == 0 ? TKSMsgRef(0u) : TKSMsgRef();
    };
    const std::string down = "the relay connection to " + relayName + " is lost";
    TKCompDesc self;
    {
        std::lock_guard<std::mutex> lk(waitLock);
        if (failed || cutOff) {
            const bool lost = cutOff;
            waitTrans = 0;
            waiting = false;
            return notSent(lost ? down.c_str() : "the transport has failed");
        }
        waitRetType = retMsgType;
        waitTrans = msg.getTrans();
        waitTarget = msg.getTgtAddr();
        waitAnySource = anySource;
        waitLost = false;
        self = hostDesc;
    }
    msg.setSrcAddr(self);

    if (timeoutMs == 0) {
        if (transport->msgWrite(block) != TKS_OK) {
            if (!transport->connected()) {
                return notSent(down.c_str());
            }
            tkMsgFree(block);
        }
        return TKSMsgRef(0u);
    }

    replyGate.tryLock();
    {
        std::lock_guard<std::mutex> lk(waitLock);
        waiting = true;
    }
    if (transport->msgWrite(block) != TKS_OK) {
        if (!transport->connected()) {
            std::lock_guard<std::mutex> lk(waitLock);
            waiting = false;
            return notSent(down.c_str());
        }
        // The transport refused it: the block is still ours, and the wait ends by time-out.
        tkMsgFree(block);
    }

    bool opened = replyGate.tryLock(timeoutMs, 10);
    std::lock_guard<std::mutex> lk(waitLock);
    waiting = false;
    if (waitLost) {
        waitLost = false;
        TKSWholeLine() << "TKSMsgQueue: request of type 0x" << std::hex << type << std::dec
                       << " ended without its answer: " << down << std::endl;
    }
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
    return failed || cutOff;
}

TKCompDesc TKSMsgQueue::getHostDesc() const {
    std::lock_guard<std::mutex> lk(waitLock);
    return hostDesc;
}

void TKSMsgQueue::connectionChanged(bool up, const char* why) {
    {
        std::lock_guard<std::mutex> lk(waitLock);
        if (up) {
            hostDesc = transport->hostDesc;
        } else if (waiting) {
            // Its answer cannot come any more: let the request go now.
            waiting = false;
            waitLost = true;
            replyGate.unlock();
        }
        cutOff = !up;
    }
    if (up) {
        relayMonitor().back(relayName, true);
    } else {
        relayMonitor().lost(relayName, why);
    }
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
        TKSWholeLine() << "ERROR: TKSMsgQueue: message callback failed on message type 0x"
                       << std::hex << type << std::dec << ": " << e.what() << "; the queue goes on"
                       << std::endl;
    } catch (const TKSException&) {
        TKSWholeLine() << "ERROR: TKSMsgQueue: message callback failed on message type 0x"
                       << std::hex << type << std::dec
                       << " with a transport exception; the queue goes on" << std::endl;
    } catch (...) {
        TKSWholeLine() << "ERROR: TKSMsgQueue: message callback failed on message type 0x"
                       << std::hex << type << std::dec << " with an exception; the queue goes on"
                       << std::endl;
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
            {
                TKSWholeLine report;
                report << "ERROR: TKSMsgQueue: lost the relay connection to " << f.getHostName();
                if (std::strchr(f.getHostName(), ':') == nullptr) {
                    report << " port " << f.getPort();
                }
                report << "; this queue receives nothing more and its requests will time out"
                       << std::endl;
            }
            {
                std::lock_guard<std::mutex> lk(waitLock);
                failed = true;
            }
            waitForStop();
            break;
        } catch (...) {
            // No other failure is expected from a transport; if one comes the reader must still
            // be there for the shutdown, or the destructor would wait for it for ever.
            TKSWholeLine() << "ERROR: TKSMsgQueue: the transport failed while reading; this queue "
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
        if (status != TKS_OK || block == nullptr) {
            continue;
        }
        route(block);
    }
    std::lock_guard<std::mutex> lk(stopLock);
    readerDone = true;
    stopCond.notify_all();
    return nullptr;
}
