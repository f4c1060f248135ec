// Random command lines into the prompt's scan. Any line leaves both buffers terminated inside
// their room and a field count the format allows; and where the C library's scan of the same
// format is defined (no NUL, no word past the buffer, no number past nine digits) both must
// agree on every field.
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <string_view>

#include "console/CommandLine.h"

namespace {

bool IsBlank(char c) {
    return c == ' ' || c == '\t' || c == '\n' || c == '\v' || c == '\f' || c == '\r';
}

bool WithinTheLibraryScan(std::string_view line) {
    std::size_t run = 0;
    std::size_t digits = 0;
    for (char c : line) {
        if (c == '\0') {
            return false;
        }
        run = IsBlank(c) ? 0 : run + 1;
        digits = (c >= '0' && c <= '9') ? digits + 1 : 0;
        if (run >= lineprobe::MAX_BUFFER_SIZE || digits > 9) {
            return false;
        }
    }
    return true;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string_view line(reinterpret_cast<const char*>(data), size);
    char word[lineprobe::MAX_BUFFER_SIZE] = "previous";
    char text[lineprobe::MAX_BUFFER_SIZE] = "";
    int board = -7, trunk = -7, chan = -7;
    const int fields = lineprobe::ScanCommandLine(line, word, board, trunk, chan, text);
    if (fields < -1 || fields == 0 || fields > 5 ||
        std::memchr(word, '\0', sizeof word) == nullptr ||
        std::memchr(text, '\0', sizeof text) == nullptr) {
        std::abort();
    }
    // A blank line leaves the previous word for the empty-line repeat.
    if (fields == -1 && std::strcmp(word, "previous") != 0) {
        std::abort();
    }
    if (!WithinTheLibraryScan(line)) {
        return 0;
    }
    const std::string terminated(line);
    char cWord[lineprobe::MAX_BUFFER_SIZE] = "previous";
    char cText[lineprobe::MAX_BUFFER_SIZE] = "";
    int cBoard = -7, cTrunk = -7, cChan = -7;
    const int cFields = std::sscanf(terminated.c_str(), "%255s %d %d %d %255s", cWord, &cBoard,
                                    &cTrunk, &cChan, cText);
    if (cFields != fields || std::strcmp(cWord, word) != 0 || cBoard != board || cTrunk != trunk ||
        cChan != chan || std::strcmp(cText, text) != 0) {
        std::abort();
    }
    return 0;
}
