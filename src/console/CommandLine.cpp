#include "console/CommandLine.h"

#include <charconv>
#include <cstring>

namespace lineprobe {

namespace {

bool IsBlank(char c) {
    return c == ' ' || c == '\t' || c == '\n' || c == '\v' || c == '\f' || c == '\r';
}

void SkipBlanks(std::string_view& rest) {
    while (!rest.empty() && IsBlank(rest.front())) {
        rest.remove_prefix(1);
    }
}

// Takes the next run of non-blank characters; false at the end of the line.
bool TakeToken(std::string_view& rest, char (&out)[MAX_BUFFER_SIZE]) {
    SkipBlanks(rest);
    if (rest.empty()) {
        return false;
    }
    std::size_t length = 0;
    while (length < rest.size() && !IsBlank(rest[length])) {
        ++length;
    }
    const std::size_t kept = length < MAX_BUFFER_SIZE - 1 ? length : MAX_BUFFER_SIZE - 1;
    std::memcpy(out, rest.data(), kept);
    out[kept] = '\0';
    rest.remove_prefix(length);
    return true;
}

// An optional sign and at least one digit; what follows the digits stays for the next
// field, as it would for the scan format.
bool TakeNumber(std::string_view& rest, int& out) {
    SkipBlanks(rest);
    std::string_view digits = rest;
    if (!digits.empty() && digits.front() == '+') {
        digits.remove_prefix(1);
        if (!digits.empty() && digits.front() == '-') {
            return false;
        }
    }
    int value = 0;
    const auto [end, error] = std::from_chars(digits.data(), digits.data() + digits.size(), value);
    if (error != std::errc{}) {
        return false;
    }
    out = value;
    rest.remove_prefix(static_cast<std::size_t>(end - rest.data()));
    return true;
}

}  // namespace

int ScanCommandLine(std::string_view line, char (&word)[MAX_BUFFER_SIZE], int& board, int& trunk,
                    int& chan, char (&text)[MAX_BUFFER_SIZE]) {
    std::string_view rest = line;
    if (!TakeToken(rest, word)) {
        return -1;
    }
    int fields = 1;
    for (int* number : {&board, &trunk, &chan}) {
        if (!TakeNumber(rest, *number)) {
            return fields;
        }
        ++fields;
    }
    if (!TakeToken(rest, text)) {
        return fields;
    }
    return fields + 1;
}

}  // namespace lineprobe
