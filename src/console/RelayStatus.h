#pragma once

namespace lineprobe {

// Where the operator sees that the relay connection is cut off: the right end of the
// separator above the command window, which holds no text of its own.
constexpr const char* RELAY_CUT_OFF_TEXT = " relay cut off: reconnecting ";
constexpr int RELAY_STATUS_ROW = 35;
constexpr int RELAY_STATUS_END_COL = 98;

// Draws the notice, or the separator line again in its place.
void ShowRelayState(bool cutOff);

// Makes every relay connection's loss and return show on the screen.
void WatchRelayState();

}  // namespace lineprobe
