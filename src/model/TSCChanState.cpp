#include "model/TSCChanState.h"

#include <cstdio>
#include <iostream>

#include "model/PublicationTexts.h"

namespace vx7diag {

namespace {

// 0x1260 to 0x1269, then 0x126C and 0x126D: 0x126A and 0x126B are no channel states.
constexpr unsigned int g_ChanStateList[] = {
    0x1260, 0x1261, 0x1262, 0x1263, 0x1264, 0x1265, 0x1266, 0x1267, 0x1268, 0x1269, 0x126C, 0x126D,
};

}  // namespace

TSCChanState::~TSCChanState() = default;

tolk::staticList<unsigned int> TSCChanState::EventTypeList() const {
    tolk::staticList<unsigned int> list;
    list.realloc(std::size(g_ChanStateList));
    for (unsigned int i = 0; i < list.length(); ++i) {
        *list.element(i) = g_ChanStateList[i];
    }
    return list;
}

void TSCChanState::Format(char* text) {
    unsigned int state = *event->pChanState;
    std::cout << "ChanState = " << state << std::endl;
    std::snprintf(text, PublicationTextLength,
                  "Channel State timestamp=%d board=%d trunk=%d channel=%d state=%s",
                  static_cast<int>(*event->pTimestamp), static_cast<int>(board),
                  static_cast<int>(trunk), static_cast<int>(channel), ChanStateText(state));
}

}  // namespace vx7diag
