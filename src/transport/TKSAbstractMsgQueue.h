// The interface of a transport under TKSMsgQueue.
#pragma once

#include <functional>

#include "platform/tkhost/tkhost.h"

// Statuses of msgRead and msgWrite. The local transport hands on those of the host library,
// where 0 is success as well and any other value a failure.
enum TKSStatus : int {
    TKS_OK = 0,
    // Nothing moved: no block was read, or the block to write stays with the caller.
    TKS_NOT_MOVED = 2,
};

class TKSAbstractMsgQueue {
  public:
    // Blocks for the next message; TKS_OK when *out holds a new block that the caller now owns.
    virtual int msgRead(TKMsg32Bit** out) = 0;
    // TKS_OK: the block went to the transport. Any other status: it stays with the caller.
    virtual int msgWrite(TKMsg32Bit* msg) = 0;
    virtual ~TKSAbstractMsgQueue() = default;
    // At shutdown, while the reader still reads: anything the transport must exchange before
    // it goes (the relay's close handshake).
    virtual void closeExchange() {}
    // At shutdown, after the reader has been told to stop: makes a blocked msgRead return.
    virtual void sendLastMessage() {}

    // False while the transport knows that nothing it is given can arrive: a lost relay
    // connection that is being restored.
    virtual bool connected() const { return true; }

    // Set before the reader starts; called on the reader when the connection is lost (false,
    // with why) and when it is back (true, hostDesc already holding the new address).
    std::function<void(bool up, const char* why)> connectionChanged;

    TKCompDesc hostDesc{};
};
