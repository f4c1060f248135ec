#include "model/TSCCallState.h"

#include <cstdio>

#include "model/PublicationTexts.h"

namespace vx7diag {

namespace {

// 0x1230 to 0x1241: every call state event type.
constexpr unsigned int g_CallStateEventList[] = {
    0x1230, 0x1231, 0x1232, 0x1233, 0x1234, 0x1235, 0x1236, 0x1237, 0x1238,
    0x1239, 0x123A, 0x123B, 0x123C, 0x123D, 0x123E, 0x123F, 0x1240, 0x1241,
};

}  // namespace

TSCCallState::~TSCCallState() = default;

tolk::staticList<unsigned int> TSCCallState::EventTypeList() const {
    tolk::staticList<unsigned int> list;
    list.realloc(std::size(g_CallStateEventList));
    for (unsigned int i = 0; i < list.length(); ++i) {
        *list.element(i) = g_CallStateEventList[i];
    }
    return list;
}

void TSCCallState::Format(char* text) {
    std::snprintf(text, PublicationTextLength,
                  "Call State timestamp=%d board=%d trunk=%d channel=%d state=%s",
                  static_cast<int>(*event->pTimestamp), static_cast<int>(board),
                  static_cast<int>(trunk), static_cast<int>(channel),
                  CallStateText(*event->pCallState));
}

}  // namespace vx7diag
