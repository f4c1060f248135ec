#pragma once

namespace vx7diag {

// The words that the trace texts of the publications give to board numbers. A value without a
// word of its own reads as the tables' own "Unknown" (or "unknown" for an alarm type, as the
// alarm table has it).
const char* CallInfoText(unsigned int infoId);
const char* ChanStateText(unsigned int chanState);
const char* CallStateText(unsigned int callState);
const char* TrunkStateText(unsigned int type);
const char* TrunkReasonText(unsigned int reason);
const char* AlarmTypeText(unsigned int type);
const char* AlarmStateText(unsigned int state);

}  // namespace vx7diag
