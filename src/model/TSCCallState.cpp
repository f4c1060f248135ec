#include "model/TSCCallState.h"

#include <cstdio>

#include "catalogue/generated/values.h"
#include "model/PublicationTexts.h"

namespace vx7diag {

namespace {

// Every call state event type, a range without gaps.
constexpr unsigned int kFirstEventType = tolk::wire::TSC::EvtType::CALL_STATE_FIRST;
constexpr unsigned int kEventTypes =
    tolk::wire::TSC::EvtType::CALL_STATE_LAST - kFirstEventType + 1;

}  // namespace

TSCCallState::~TSCCallState() = default;

tolk::staticList<unsigned int> TSCCallState::EventTypeList() const {
    tolk::staticList<unsigned int> list;
    list.realloc(kEventTypes);
    for (unsigned int i = 0; i < list.length(); ++i) {
        *list.element(i) = kFirstEventType + i;
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
