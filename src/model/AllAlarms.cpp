#include "model/AllAlarms.h"

#include <cstdio>

#include "model/PublicationTexts.h"

namespace vx7diag {

AllAlarms::~AllAlarms() = default;

void AllAlarms::Format(char* text) {
    std::snprintf(text, PublicationTextLength, "Alarm Event:  board=%d trunk=%d type=%s state=%s",
                  static_cast<int>(board), static_cast<int>(trunk), AlarmTypeText(*event->pType),
                  AlarmStateText(*event->pState));
}

}  // namespace vx7diag
