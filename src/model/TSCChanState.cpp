#include "model/TSCChanState.h"

#include <cstdio>
#include <iostream>

#include "catalogue/generated/values.h"
#include "model/PublicationTexts.h"

namespace vx7diag {

namespace {

// A channel state event's type is the base plus the state; the board reports states 1 to 10,
// 13 and 14 (the types of 11 and 12 belong to other events).
constexpr unsigned int g_ChanStates[] = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 13, 14};

}  // namespace

TSCChanState::~TSCChanState() = default;

tolk::staticList<unsigned int> TSCChanState::EventTypeList() const {
    tolk::staticList<unsigned int> list;
    list.realloc(std::size(g_ChanStates));
    for (unsigned int i = 0; i < list.length(); ++i) {
        *list.element(i) = tolk::wire::TSC::EvtType::CHAN_STATE_BASE + g_ChanStates[i];
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
