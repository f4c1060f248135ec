#pragma once

#include "catalogue/generated/cas_bodies.h"
#include "catalogue/stdresource/Instance.h"

namespace tolk {

// Signalling of one channel: enable, disable, generate and match signals, dial digits.
class CAS : public Instance, public CAS_Bodies {
  public:
    // Both register a null handler for the completion of StartDial.
    CAS(const CompDesc_t& target, isa::RefPtr<MsgQueue>& queue);
    explicit CAS(const Instance& other);
    CAS(const CAS& other);
    CAS& operator=(const CAS&) = delete;
    ~CAS() override;

    MsgBody* MsgBodyLookup(unsigned int type) override;
    MsgBody* EvtBodyLookup(unsigned int group) override;

    // The operation families, from the schema. SignalList holds the address of a
    // staticList<unsigned char>, or of a staticList<char> for Format 2 and 3.
#include "catalogue/generated/cas_ops.h"

  private:
    void registerNullHandlers();
};

}  // namespace tolk
