#pragma once

#include "framework/staticList.h"

namespace tolk::cat {

// The default of a character field: one NUL, which writing grows to the field's fixed length.
inline staticList<char> emptyText() {
    staticList<char> text;
    text.realloc(1);
    *text.element(0) = '\0';
    return text;
}

}  // namespace tolk::cat
