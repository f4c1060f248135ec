#include "model/Subject.h"

namespace vx7diag {

Subject::~Subject() = default;

bool Subject::Attach(isa::RefPtr<Observer> observer, Aspect* aspect) {
    return observers[aspect].insert(observer).second;
}

int Subject::Detach(const isa::RefPtr<Observer>& observer, const Aspect& aspect) {
    auto entry = observers.find(const_cast<Aspect*>(&aspect));
    if (entry == observers.end()) {
        return -1;
    }
    entry->second.erase(observer);
    int left = static_cast<int>(entry->second.size());
    if (left == 0) {
        observers.erase(entry);
    }
    return left;
}

void Subject::Notify(Aspect& aspect) {
    auto entry = observers.find(&aspect);
    if (entry == observers.end()) {
        return;
    }
    for (const isa::RefPtr<Observer>& observer : entry->second) {
        observer->Update(this, aspect);
    }
}

}  // namespace vx7diag
