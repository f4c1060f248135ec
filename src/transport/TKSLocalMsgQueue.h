// Transport straight onto the host message library's local queues.
#pragma once

#include "transport/TKSAbstractMsgQueue.h"

class TKSLocalMsgQueue : public TKSAbstractMsgQueue {
  public:
    // The address is assigned at bind; the three arguments are not used.
    TKSLocalMsgQueue(TKCompDesc addr, unsigned int maxRetMsgSize, unsigned int depth);
    ~TKSLocalMsgQueue() override;

    int msgRead(TKMsg32Bit** out) override;
    int msgWrite(TKMsg32Bit* msg) override;
    // An empty message from this queue to itself.
    void sendLastMessage() override;

  private:
    TKQueueHandle queue;
};
