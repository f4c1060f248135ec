// vx7sim's protocol trace: one line for each message the relay routes, named from the catalogue,
// so that the traffic can be read without a capture.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "platform/tkhost/tkhost.h"

namespace sim {

// "DIRECTION conn N SOURCE -> TARGET TYPE trans ID BODY": direction "in" from a connection,
// "out" to it; addresses as nN.bB.pP.cC.iI; an event's type is followed by its group's name;
// the body in the catalogue's text form, on the same line.
std::string traceLine(std::string_view direction, std::uint64_t conn, const TKMsg32Bit* block);

}  // namespace sim
