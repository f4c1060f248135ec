#include "model/SystemView.h"

#include <cstdint>
#include <cstring>
#include <iostream>

#include "model/BoardManager.h"
#include "platform/unitmap/unitmap.h"

namespace vx7diag {

SystemView::SystemView() {
    UM_AUID host = 0;
    if (um_getHostAU(&host) != 0) {
        return;
    }
    hostAU = host;
    serviceStarted = true;

    char name[256] = {};
    um_attribute nameAttribute{};
    um_initAttributeStruct(&nameAttribute, "NAME", name, sizeof name, 0, 0);
    if (um_getAttributes(hostAU, 1, &nameAttribute) == 0) {
        name[sizeof name - 1] = '\0';
        systemName = new std::string(name);
    }

    for (unsigned int logicalId = 0; logicalId <= BoardManager::LAST_LOGICAL_ID; ++logicalId) {
        char platform[4] = {'V', 'X', '7', '\0'};
        std::uint32_t id = logicalId;
        um_attribute search[2]{};
        um_initAttributeStruct(&search[0], "CTPLATFORM", platform, sizeof platform, 0, 0);
        um_initAttributeStruct(&search[1], "LOGICAL ID", &id, sizeof id, 0, 0);
        std::uint32_t found = 1;
        UM_AUID board = 0;
        if (um_findAUs(hostAU, 2, search, &found, &board) != 0) {
            std::cout << "number of board AUIDS found = " << found << std::endl;
            continue;
        }
        if (found == 1) {
            boards[logicalId] = new BoardManager(logicalId);
        }
    }
}

SystemView::~SystemView() {
    delete systemName;
}

std::map<unsigned int, BoardManager*> SystemView::GetActiveBoardList() {
    return boards;
}

std::string SystemView::GetSystemName() {
    return systemName != nullptr ? *systemName : std::string();
}

bool SystemView::IsOrvaneServiceStarted() {
    return serviceStarted;
}

}  // namespace vx7diag
