// One transport and one reader thread: sends, and sorts what arrives into the awaited reply and
// everything else, which goes to the registered callback.
#pragma once

#include <condition_variable>
#include <functional>
#include <mutex>
#include <string>

#include "transport/TKSAbstractMsgQueue.h"
#include "transport/TKSCommon.h"
#include "transport/TKSMsgRef.h"

class TKSMsgQueue : public TKSRunnable {
  public:
    class CreationError : public TKSResource_CreationError {
      public:
        // hostName as the user gave it (null for the local transport); port 0 when none was
        // tried; reason in a few words, empty when the transport did not say.
        explicit CreationError(const char* hostName, int port = 0, const char* reason = nullptr);
        const char* getHostName() const { return hostName; }
        int getPort() const { return port; }
        const char* getReason() const { return reason; }

      private:
        char hostName[100];
        int port = 0;
        char reason[160];
    };

    // remoteHost null: "REMOTE_TKHOST" decides; a host whose name begins with "HOST" is this one.
    TKSMsgQueue(TKCompDesc addr, unsigned int maxRetMsgSize, unsigned int depth,
                const char* remoteHost);
    ~TKSMsgQueue() override;
    TKSMsgQueue(const TKSMsgQueue&) = delete;
    TKSMsgQueue& operator=(const TKSMsgQueue&) = delete;

    // Sends msg's block (taken over in every outcome) and waits up to timeoutMs for the reply:
    // same transaction id, an error answer (MsgError_t or a service's RESOURCE_ERROR) or
    // retMsgType, from msg's target unless anySource.
    // Returns a handle on the reply (the caller owns the block) or an empty handle on time-out.
    // timeoutMs 0 sends and returns a new empty message of size 0 at once.
    TKSMsgRef request(TKSMsgRef& msg, unsigned int timeoutMs, unsigned int retMsgType,
                      int anySource);

    // Registering one kind of callback clears the other, so a block has one owner.
    void registerAsyncCallback(TKSAsyncMsgReceiver* obj, TKSAsyncMethod method);
    void registerAsyncFunction(TKSAsyncFn fn);
    // The address the transport was given last: a restored relay connection gets a new one.
    TKCompDesc getHostDesc() const;

    // Blocks left for a direct reader while no callback is registered: waits up to timeoutMs,
    // returns an empty handle if none came.
    TKSMsgRef pickup(unsigned int timeoutMs);

    // Exceptions that left a callback and were reported, for tests and diagnostics.
    unsigned int callbackFailures() const;
    // True while nothing can be sent or received: the transport failed for good, or its relay
    // connection is lost and not yet restored. Requests made meanwhile fail at once.
    bool transportFailed() const;

    // Whatever a relay connection of any queue of the process does: cutOff true when the first
    // one is lost, false when the last lost one is back. Called on a reader thread, in order;
    // a listener must be quick and must not make requests. Listeners stay for the process.
    using RelayListener = std::function<void(bool cutOff, const std::string& relay)>;
    static void addRelayListener(RelayListener listener);
    // Whether some relay connection of the process is lost right now.
    static bool relayCutOff();

  private:
    void* readNroute(void* control, void* arg);
    void route(TKMsg32Bit* block);
    void deliverAsync(TKMsg32Bit* block);
    void waitForStop();
    void connectionChanged(bool up, const char* why);
    bool stopping();

    TKSThread readerThread;
    TKSAbstractMsgQueue* transport = nullptr;
    TKCompDesc hostDesc{};

    mutable std::mutex callbackLock;
    TKSAsyncFn asyncFn = nullptr;
    TKSAsyncMsgReceiver* asyncObj = nullptr;
    TKSAsyncMethod asyncMethod = nullptr;

    // The wait record, the reply slot and the pickup slot.
    mutable std::mutex waitLock;
    TKMsg32Bit* replySlot = nullptr;
    TKMsg32Bit* pickupSlot = nullptr;
    unsigned int waitTrans = 0;
    unsigned int waitRetType = 0;
    TKCompDesc waitTarget{};
    bool waiting = false;
    int waitAnySource = 0;
    unsigned int failures = 0;
    bool failed = false;
    bool cutOff = false;
    bool waitLost = false;
    std::string relayName;

    std::mutex stopLock;
    std::condition_variable stopCond;
    bool stop = false;
    bool readerDone = false;

    TKSMutex replyGate;
    TKSMutex pickupReady;
    TKSMutex pickupFree;
};
