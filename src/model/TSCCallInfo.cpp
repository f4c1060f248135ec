#include "model/TSCCallInfo.h"

#include <cstdio>
#include <iostream>

#include "model/PublicationTexts.h"

namespace vx7diag {

namespace {

// 0x1200 to 0x121A: every call information event type.
constexpr unsigned int g_CallInfoEventList[] = {
    0x1200, 0x1201, 0x1202, 0x1203, 0x1204, 0x1205, 0x1206, 0x1207, 0x1208,
    0x1209, 0x120A, 0x120B, 0x120C, 0x120D, 0x120E, 0x120F, 0x1210, 0x1211,
    0x1212, 0x1213, 0x1214, 0x1215, 0x1216, 0x1217, 0x1218, 0x1219, 0x121A,
};

}  // namespace

TSCCallInfo::~TSCCallInfo() = default;

tolk::staticList<unsigned int> TSCCallInfo::EventTypeList() const {
    tolk::staticList<unsigned int> list;
    list.realloc(std::size(g_CallInfoEventList));
    for (unsigned int i = 0; i < list.length(); ++i) {
        *list.element(i) = g_CallInfoEventList[i];
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
