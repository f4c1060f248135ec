#pragma once

#include "framework/CompDesc_t.h"
#include "framework/virtualObject.h"

namespace tolk {

class Addressable;
class Msg;

// Gets every unsolicited message from one source address on one queue: the target of the
// Addressable it serves. It owns each message it receives.
class AsyncMsgReceiver : public virtualObject {
  public:
    explicit AsyncMsgReceiver(Addressable* a);
    ~AsyncMsgReceiver() override;
    AsyncMsgReceiver(const AsyncMsgReceiver&) = delete;
    AsyncMsgReceiver& operator=(const AsyncMsgReceiver&) = delete;

    virtual void receive(Msg* msg) = 0;

  protected:
    // For a subclass that must be whole before the reader may call it: it calls
    // registerReceiver() at the end of its own constructor.
    struct Deferred {};
    AsyncMsgReceiver(Addressable* a, Deferred);
    void registerReceiver();
    // Idempotent; once it returns, the queue no longer calls this receiver.
    void deregisterReceiver();

    Addressable* addressable;

  private:
    CompDesc_t source;
    bool registered = false;
};

}  // namespace tolk
