#pragma once

#include "framework/MsgBody.h"

namespace tolk {

class CompAttr_t : public MsgBody {
  public:
    CompAttr_t() = default;
    CompAttr_t(const CompAttr_t& other) = default;
    CompAttr_t& operator=(const CompAttr_t& other) = default;
    CompAttr_t(unsigned int key, int value) : key(key), value(value) {}

    void toStream(std::ostream* os) const override;
    unsigned int writeMsg(Msg* msg, unsigned int offset) override;
    unsigned int readMsg(Msg* msg, unsigned int offset) override;
    unsigned int GetByteSize() override { return 8; }

    unsigned int key = 0;
    int value = 0;
};

}  // namespace tolk
