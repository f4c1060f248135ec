#pragma once

#include "framework/MsgBody.h"
#include "framework/staticList.h"

namespace tolk {

// A body that is nothing but bytes: all that is left of the message from its offset on.
class MsgDefault_t : public MsgBody {
  public:
    MsgDefault_t() : data(&own) {}
    // Works on the caller's list, which must outlive the body.
    explicit MsgDefault_t(staticList<unsigned char>& bytes) : data(&bytes) {}
    MsgDefault_t(const MsgDefault_t& other) : data(&own) { own = *other.data; }
    MsgDefault_t& operator=(const MsgDefault_t& other) {
        *data = *other.data;
        return *this;
    }

    void toStream(std::ostream* os) const override;
    unsigned int writeMsg(Msg* msg, unsigned int offset) override;
    unsigned int readMsg(Msg* msg, unsigned int offset) override;
    unsigned int GetByteSize() override { return data->length(); }

    staticList<unsigned char>& bytes() { return *data; }

  private:
    staticList<unsigned char>* data;
    staticList<unsigned char> own;
};

}  // namespace tolk
