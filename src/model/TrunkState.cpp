#include "model/TrunkState.h"

#include <cstdio>

#include "model/PublicationTexts.h"

namespace vx7diag {

TrunkState::~TrunkState() = default;

void TrunkState::Format(char* text) {
    std::snprintf(text, PublicationTextLength, "Trunk State board=%d trunk=%d state=%s reason=%s",
                  static_cast<int>(board), static_cast<int>(trunk), TrunkStateText(*event->pType),
                  TrunkReasonText(*event->pReason));
}

}  // namespace vx7diag
