#pragma once

#include "catalogue/generated/values.h"
#include "framework/MsgBody.h"
#include "framework/staticList.h"

namespace tolk {

// Carrier of every event: the group word, then the event's bytes to the end of the
// body. The dispatcher reads the group from it and falls back on it for an unknown group.
class MsgEvtDetected_t : public MsgBody {
  public:
    static constexpr unsigned int Type = wire::StdResource::MsgType::MsgEvtDetected_t;

    MsgEvtDetected_t() = default;
    MsgEvtDetected_t(const MsgEvtDetected_t& other) = default;

    void toStream(std::ostream* os) const override;
    unsigned int writeMsg(Msg* msg, unsigned int offset) override;
    unsigned int readMsg(Msg* msg, unsigned int offset) override;
    unsigned int GetByteSize() override { return 4 + Data.length(); }

    unsigned int EvtGroup = 0;
    staticList<unsigned char> Data;
};

}  // namespace tolk
