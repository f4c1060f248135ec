#include "model/TSCCallInfo.h"

#include <cstdio>
#include <iostream>

#include "catalogue/generated/values.h"
#include "model/PublicationTexts.h"

namespace vx7diag {

namespace {

// Every call information event type, a range without gaps.
constexpr unsigned int kFirstEventType = tolk::wire::TSC::EvtType::CALL_INFO_FIRST;
constexpr unsigned int kEventTypes = tolk::wire::TSC::EvtType::CALL_INFO_LAST - kFirstEventType + 1;

}  // namespace

TSCCallInfo::~TSCCallInfo() = default;

tolk::staticList<unsigned int> TSCCallInfo::EventTypeList() const {
    tolk::staticList<unsigned int> list;
    list.realloc(kEventTypes);
    for (unsigned int i = 0; i < list.length(); ++i) {
        *list.element(i) = kFirstEventType + i;
    }
    return list;
}

char* TSCCallInfo::ToZLG() {
    std::cout << "received callinfo event" << std::endl;
    return EventPublication::ToZLG();
}

void TSCCallInfo::Format(char* text) {
    std::snprintf(
        text, PublicationTextLength, "Call Info timestamp=%d board=%d trunk=%d channel=%d state=%s",
        static_cast<int>(*event->pTimestamp), static_cast<int>(board), static_cast<int>(trunk),
        static_cast<int>(channel), CallInfoText(*event->pInfoId));
}

}  // namespace vx7diag
