#pragma once

#include <atomic>
#include <memory>
#include <mutex>

#include "framework/CompDesc_t.h"
#include "framework/Exception.h"
#include "framework/Msg.h"
#include "framework/Mutex.h"
#include "framework/sharedKeyedList.h"
#include "framework/virtualObject.h"
#include "transport/TKSCommon.h"

class TKSMsgQueue;
class TKSMsgRef;

namespace tolk {

class AsyncMsgReceiver;

// One address of this process and one reader thread. Replies go back to the waiting request;
// everything else is routed by its source address to the registered receiver.
class MsgQueue : public virtualObject {
  public:
    static constexpr unsigned int DefaultDepth = 5;
    static constexpr unsigned int DefaultMaxRetMsgSize = 512;

    using UnregisteredHandler = void (*)(MsgQueue&, Msg*);

    // The reply that came instead of the awaited one. The exception owns it: every copy of the
    // exception shares it, and the last copy to go frees it.
    class ErrorMsg : public Exception {
      public:
        ErrorMsg(MsgQueue* queue, Msg* reply);
        void toStream(std::ostream* os) const override;
        Msg* getMsg() const { return msg; }

        Msg* msg;
        MsgQueue* queue;

      private:
        std::shared_ptr<Msg> owner;
    };

    class Timeout : public Exception {
      public:
        Timeout(MsgQueue* queue, unsigned int msgType, unsigned int timeoutMs);
        void toStream(std::ostream* os) const override;

        MsgQueue* queue;
        unsigned int msgType;
        unsigned int timeoutMs;
    };

    MsgQueue(CompDesc_t addr, unsigned int maxRetMsgSize, unsigned int depth);
    ~MsgQueue() override;
    MsgQueue(const MsgQueue&) = delete;
    MsgQueue& operator=(const MsgQueue&) = delete;

    // Sends msg and waits for the reply of retMsgType. Takes msg over in every outcome.
    // No reply: Timeout if retMsgType isn't 0, else null. A reply of type 0 or of another type
    // than retMsgType: ErrorMsg holding it.
    Msg* request(Msg* msg, unsigned int timeoutMs, unsigned int retMsgType, int anySource);

    // How many requests of the whole process have ended so far, answered, timed out or
    // failed. A waiting request ends within its time-out, so a count that stands still
    // tells a caller stuck elsewhere from one held up by slow boards. Async-signal-safe.
    static unsigned long endedRequests();

    void RegisterAsyncMsgReceiver(CompDesc_t source, AsyncMsgReceiver* receiver);
    void DeregisterAsyncMsgReceiver(CompDesc_t source);
    void unregisteredSource(UnregisteredHandler handler);

    CompDesc_t getHostDesc() const;
    void toStream(std::ostream* os) const override;

    // The reader thread's callback for every block that isn't an awaited reply.
    int MsgRouter(TKSMsgRef& ref);

  private:
    // The transport calls back through a member of a TKSAsyncMsgReceiver; this single-base
    // adapter keeps that call on an object of exactly that shape.
    class Router : public TKSAsyncMsgReceiver {
      public:
        explicit Router(MsgQueue* q) : owner(q) {}
        int route(TKSMsgRef& ref) { return owner->MsgRouter(ref); }

      private:
        MsgQueue* owner;
    };

    Router router{this};
    TKSMsgQueue* queue;
    sharedKeyedList<CompDesc_t, AsyncMsgReceiver*> receivers;
    std::atomic<UnregisteredHandler> unregisteredHandler;
    Mutex requestLock;
    // Held by the reader from the lookup of a receiver to the end of its receive, and by
    // deregistration, so that a receiver is never called after it has deregistered. Recursive:
    // a callback on the reader may deregister.
    std::recursive_mutex dispatchLock;
};

// Banner to the error stream for a message nobody registered for; frees the message.
void MsgQueue_unregisteredSourceHandler(MsgQueue& q, Msg* m);

}  // namespace tolk
