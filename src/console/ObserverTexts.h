#pragma once

#include <cstddef>
#include <string>

namespace vx7diag {

// What the phone and trunk rows show for the values a board reports, by value. Every text
// but the line-state ones is one character wider than its field and padded with blanks,
// so that printing it wipes a longer text printed before.
constexpr std::size_t CALL_STATE_STR_COUNT = 22;
constexpr std::size_t CHAN_STATE_STR_COUNT = 15;
constexpr std::size_t REASON_STR_COUNT = 52;
constexpr std::size_t LINE_STATE_STR_COUNT = 2;
constexpr std::size_t LINE_STATE_REASON_STR_COUNT = 6;

extern const std::string g_CallStateStr[CALL_STATE_STR_COUNT];
extern const std::string g_ChanStateStr[CHAN_STATE_STR_COUNT];
extern const std::string g_ReasonStr[REASON_STR_COUNT];
extern const std::string g_LineStateStr[LINE_STATE_STR_COUNT];
extern const std::string g_LineStateReasonStr[LINE_STATE_REASON_STR_COUNT];

// A board may report a value these tables do not know. Rather than read past a table,
// such a value shows as "?" and its number, padded to the width of the table's texts.
const char* ConsoleCallStateText(unsigned int state);
const char* ConsoleChanStateText(unsigned int state);
const char* ConsoleReasonText(unsigned int reason);
const char* ConsoleLineStateReasonText(unsigned int reason);

}  // namespace vx7diag
