#pragma once

#include <cstddef>
#include <string_view>

namespace lineprobe {

// Room for a word or text field of a command line, terminator included.
constexpr std::size_t MAX_BUFFER_SIZE = 256;

// Splits a command line as the format "%s %d %d %d %s" would: a word, up to three
// decimal numbers (board, line, channel) and a text. Returns the number of fields
// converted, or -1 when the line holds nothing but blanks. The scan ends at the first
// field that is not a number, so "phone x" is one field. Fields that were not reached
// are left untouched: after a blank line `word` still holds the previous word.
//
// A word or text longer than MAX_BUFFER_SIZE - 1 characters is cut to that length and
// the rest of it dropped. A number outside the range of int is not a number.
int ScanCommandLine(std::string_view line, char (&word)[MAX_BUFFER_SIZE], int& board, int& trunk,
                    int& chan, char (&text)[MAX_BUFFER_SIZE]);

}  // namespace lineprobe
