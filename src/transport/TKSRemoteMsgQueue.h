// Transport over one TCP connection to a relay host.
#pragma once

#include <atomic>
#include <condition_variable>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "transport/TKSAbstractMsgQueue.h"
#include "transport/TKSCommon.h"
#include "transport/TKSFrame.h"

class sock;

class TKSRemoteService_ComFailure : public TKSException {
  public:
    TKSRemoteService_ComFailure(const char* hostName, int port);
    const char* getHostName() const { return hostName; }
    int getPort() const { return port; }

  private:
    char hostName[100];
    int port;
};

// The relay could not be reached, or did not open the queue as it should: why, in a few words,
// and the port that was tried.
class TKSRemoteOpenError : public TKSResource_CreationError {
  public:
    TKSRemoteOpenError(const char* reason, int port);
    const char* getReason() const { return reason; }
    int getPort() const { return port; }

  private:
    char reason[160];
    int port;
};

class TKSRemoteMsgQueue : public TKSAbstractMsgQueue {
  public:
    // hostName: a name or dotted address, optionally ":port" (decimal, or hex with an x).
    TKSRemoteMsgQueue(TKCompDesc addr, unsigned int maxRetMsgSize, unsigned int depth,
                      const char* hostName);
    ~TKSRemoteMsgQueue() override;

    int msgRead(TKMsg32Bit** out) override;
    int msgWrite(TKMsg32Bit* msg) override;
    // Sends the close and waits up to 5 s for its acknowledgement, which the reader collects.
    void closeExchange() override;
    // Makes every read fail from now on, so that a blocked reader returns.
    void sendLastMessage() override;

    bool connected() const override { return up.load(); }

    const char* getHostName() const { return hostName; }
    int getPort() const { return port; }

    // Pause before the first attempt to reconnect, and the longest pause between attempts.
    static constexpr unsigned int RECONNECT_FIRST_MS = 100;
    static constexpr unsigned int RECONNECT_MAX_MS = 2000;

  private:
    // Connects and opens the queue, the whole exchange within the open's time limit. Null, with
    // the reason, when the relay cannot be reached or does not answer the open as it should.
    std::unique_ptr<sock> openConnection(TKCompDesc& assigned, std::string& reason);
    // On the reader: the connection is gone. Tries again with a growing pause until a new
    // connection is open or the queue is closing; returns msgRead's "nothing read".
    int reconnect(const char* why);
    bool sendClose();
    // Once the close has been sent, the connection ending is the relay's answer, not a fault:
    // let the close wait go and park the reader until shutdown wakes it.
    int closedByRelay();

    TKSOpenRequest openRequest;
    char* hostName = nullptr;
    int retries = 10;
    int port = 6554;
    TKSMutex closeSignal;
    // Replaced only by the reader, under writeLock and sockLock; `opening` is a connection
    // being made, which shutdown must be able to interrupt as well.
    sock* socket = nullptr;
    sock* opening = nullptr;
    std::mutex sockLock;
    std::atomic<bool> up{true};
    std::mutex writeLock;
    std::atomic<bool> closeSent{false};
    std::atomic<bool> closing{false};
    std::atomic<bool> readerGone{false};
    std::mutex closingLock;
    std::condition_variable closingCond;
    std::vector<unsigned char> outFrame;
};
