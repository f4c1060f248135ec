// The switch behind the local queues, and the plug where the board emulation attaches.
#pragma once

#include <cstdint>

#include "platform/tkhost/tkhost.h"

// Receives ownership of every written block whose target is not a bound host queue. Called on
// the writer's thread: it must hand the block to its own thread and return quickly, and must not
// call tkMsgWrite for a board target itself (tkSwitchDeliver is fine).
using TKBoardEndpoint = void (*)(void* ctx, TKMsg32Bit* msg);

// Only one endpoint at a time; attaching replaces the previous one.
void tkSwitchAttachBoards(TKBoardEndpoint fn, void* ctx);
// Returns once no call into the endpoint is in progress any more.
void tkSwitchDetachBoards();

// The board side sends a block into the switch: it goes to the queue bound at its target, or is
// freed and counted undeliverable. Always takes the block over; returns TK_OK if delivered.
TKStatus tkSwitchDeliver(TKMsg32Bit* msg);

// True for addresses of the host-queue space (board 0xFF), bound or not.
bool tkSwitchIsHostAddress(TKCompDesc desc);
// True if a queue is bound at exactly this address now.
bool tkSwitchIsBound(TKCompDesc desc);

// Blocks freed because nobody was at their target, since start or the last reset.
std::uint64_t tkSwitchUndeliverableCount();
void tkSwitchResetUndeliverableCount();

// Test hook: at most `n` queues may be open at once (0 = no limit), so that running out of
// descriptors can be provoked.
void tkSwitchSetQueueLimit(unsigned int n);

constexpr std::uint8_t TK_HOST_BOARD = 0xFF;
