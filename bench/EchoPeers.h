#pragma once

#include "platform/tkhost/tkhost.h"
#include "transport/TKSSock.h"

namespace lp_bench {

// The cheapest possible far end of a request: the block goes back as it came, source and target
// swapped, typed as the completion. What the round-trip figures measure is then the path, not
// the answering.
void turnAround(TKMsg32Bit* block, unsigned int completionType);

// Answers every block read from a bound local queue until the queue is closed or unbound.
void serveEchoQueue(TKQueueHandle queue, unsigned int completionType);

// A relay that speaks just enough of the frame protocol for one client: it takes the open,
// assigns board 0xFE instance 1, turns every message around and acknowledges the close.
void serveEchoRelay(sock& listener, unsigned int completionType);

}  // namespace lp_bench
