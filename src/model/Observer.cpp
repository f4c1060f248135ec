#include "model/Observer.h"

namespace vx7diag {

Observer::~Observer() = default;

void Observer::Update(Subject*, Aspect&) {}

bool Observer::operator<(const Observer& other) const {
    return this != &other;
}

}  // namespace vx7diag
