// What the units of the emulation share and nothing else needs: the request in hand and the
// conversions between the farm's addresses and the catalogue's.
#pragma once

#include <cstdint>

#include "framework/CompDesc_t.h"
#include "framework/Msg.h"
#include "sim/Emulation.h"

namespace sim {

struct Emulation::Request {
    tolk::Msg msg;
    std::uint32_t type = 0;
    std::uint32_t trans = 0;
    Address src;
    Address tgt;
    bool answered = false;

    explicit Request(TKSMsgRef* ref) : msg(ref) {}
};

inline Address fromCD(const tolk::CompDesc_t& d) {
    return Address{d.instance, d.board, d.processor, d.component, d.node};
}

inline tolk::CompDesc_t toCD(const Address& a) {
    return tolk::CompDesc_t(a.instance, a.board, a.processor, a.component, a.node);
}

// 0xFFFF in a search's start instance, or in a cluster descriptor, means any.
inline constexpr std::uint16_t kAnyInstance = 0xFFFF;

}  // namespace sim
