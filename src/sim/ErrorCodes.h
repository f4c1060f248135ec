// The ErrorCode values the emulated boards put in MsgError_t. A real board's codes are its own;
// these are the emulation's, one per kind of refusal, so that tests and logs can tell them apart.
#pragma once

#include <cstdint>

#include "catalogue/generated/values.h"

namespace sim {

enum ErrorCode : std::uint32_t {
    kErrNoSuchComponent = 0x0101,  // a search found nothing, or the target address names nothing
    kErrNoSuchCluster = 0x0102,
    kErrBadParameter = 0x0103,  // unknown or read-only parameter, value out of range
    kErrBadState = 0x0104,      // the operation does not fit the present state
    kErrNoSuchCall = 0x0105,
    kErrChannelBusy = 0x0106,   // the channel already has a call
    kErrOutOfService = 0x0107,  // the channel or its line is out of service
    kErrNotSupported = 0x0108,  // a message this emulation knows but does not play
    kErrMalformed = 0x0109,     // the body is shorter than its fields
    kErrRefused = 0x01FF,       // default of the control command "refuse"
    // The line control's own code for a line that is already in service.
    kErrAlreadyInService = tolk::wire::LCON::Error::ALREADY_IN_SERVICE,
};

}  // namespace sim
