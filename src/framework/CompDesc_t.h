#pragma once

#include <ostream>

#include "framework/MsgBody.h"
#include "platform/tkhost/tkhost.h"

namespace tolk {

// Address of a component instance. Equal fields mean the same address.
class CompDesc_t : public MsgBody {
  public:
    CompDesc_t() = default;
    CompDesc_t(const TKCompDesc& d);  // NOLINT: converting on purpose
    CompDesc_t(unsigned short instance, unsigned char board, unsigned char processor,
               unsigned char component, unsigned char node);
    CompDesc_t(const CompDesc_t& other) = default;
    CompDesc_t& operator=(const CompDesc_t& other);

    bool operator==(const CompDesc_t& other) const;
    bool operator!=(const CompDesc_t& other) const { return !(*this == other); }

    TKCompDesc getTKCompDesc() const;

    void toStream(std::ostream* os) const override;
    unsigned int writeMsg(Msg* msg, unsigned int offset) override;
    unsigned int readMsg(Msg* msg, unsigned int offset) override;
    unsigned int GetByteSize() override { return 6; }

    unsigned short instance = 0;
    unsigned char board = 0;
    unsigned char processor = 0;
    unsigned char component = 0;
    unsigned char node = 0;
};

}  // namespace tolk

// node:board:processor:component:instance in hexadecimal with base prefix.
std::ostream& operator<<(std::ostream& os, const TKCompDesc& d);
