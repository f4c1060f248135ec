#pragma once

#include "framework/virtualObject.h"

namespace tolk {

class Msg;

// Base of every body. writeMsg/readMsg take the running offset and return it behind the last
// field handled; GetByteSize is exactly what writeMsg produces.
class MsgBody : public virtualObject {
  public:
    ~MsgBody() override = default;
    virtual unsigned int writeMsg(Msg* msg, unsigned int offset) = 0;
    virtual unsigned int readMsg(Msg* msg, unsigned int offset) = 0;
    virtual unsigned int GetByteSize() = 0;
};

}  // namespace tolk
