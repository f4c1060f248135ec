#include "model/VX7EventPublication.h"

namespace vx7diag {

VX7EventPublication::~VX7EventPublication() = default;

tolk::staticList<unsigned int> VX7EventPublication::EventTypeList() const {
    return {};
}

void VX7EventPublication::Lock() {
    lock.Enter();
}

int VX7EventPublication::QueryHandlerType() {
    return 1;
}

}  // namespace vx7diag
