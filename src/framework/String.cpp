#include "framework/String.h"

#include <cstring>

namespace tolk {

string::string(const char* s) {
    std::size_t n = std::strlen(s) + 1;
    realloc(static_cast<unsigned int>(n));
    std::memcpy(buffer, s, n);
}

void string::toStream(std::ostream* os) const {
    *os << "{";
    // Print up to the terminator only; a list resized by hand may hold no zero at all.
    for (unsigned int i = 0; i < len && buffer[i] != '\0'; ++i) {
        *os << buffer[i];
    }
    *os << "}";
}

}  // namespace tolk
