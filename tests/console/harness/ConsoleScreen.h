#pragma once

// Screen positions of the console layout as the operator sees them, for terminal tests.
namespace lineprobe::testing {

// The command window starts at screen row 36, column 1; its row 1 holds the prompt and
// its row 2, column 1 the result of the last command.
inline constexpr int PROMPT_ROW = 37;
inline constexpr int PROMPT_COL = 2;
inline constexpr int RESULT_ROW = 38;
inline constexpr int RESULT_COL = 2;
inline constexpr const char* PROMPT = "-> ";
// The prompt row with nothing typed, as a trimmed row reads.
inline constexpr const char* EMPTY_PROMPT_ROW = "  ->";

// Separator lines across the full width, on the standard screen.
inline constexpr int SEPARATOR_ROWS[] = {11, 23, 35};

}  // namespace lineprobe::testing

#include <string>

namespace lineprobe::testing {

// A separator line: the first 100 columns all hold one and the same line character
// (how a line-drawing character reads back depends on the terminal type).
inline bool IsSeparatorRow(const std::string& row) {
    if (row.size() < 100 || row[0] == ' ') {
        return false;
    }
    for (std::size_t col = 0; col < 100; ++col) {
        if (row[col] != row[0]) {
            return false;
        }
    }
    return true;
}

}  // namespace lineprobe::testing
