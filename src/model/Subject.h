#pragma once

#include <functional>
#include <map>
#include <set>

#include "model/Aspect.h"
#include "model/Observer.h"
#include "transport/IsaSync.h"

namespace vx7diag {

// Observers are told apart by identity. Observer::operator< ("different objects") is no strict
// weak order, so the set orders the objects' addresses instead; equivalence is still identity.
struct ObserverOrder {
    bool operator()(const isa::RefPtr<Observer>& a, const isa::RefPtr<Observer>& b) const {
        return std::less<const Observer*>()(a.Get(), b.Get());
    }
};

using ObserverSet = std::set<isa::RefPtr<Observer>, ObserverOrder>;

// Something that can be watched: for each aspect, the observers of that aspect. No lock of its
// own; its users serialise Attach, Detach and Notify.
class Subject {
  public:
    Subject() = default;
    Subject(const Subject&) = delete;
    Subject& operator=(const Subject&) = delete;
    virtual ~Subject();

    // True if the observer was added, false if it watched this aspect already.
    virtual bool Attach(isa::RefPtr<Observer> observer, Aspect* aspect);
    // Observers of the aspect that remain, or -1 if the aspect had none.
    virtual int Detach(const isa::RefPtr<Observer>& observer, const Aspect& aspect);
    virtual void Notify(Aspect& aspect);

  protected:
    std::map<Aspect*, ObserverSet> observers;
};

}  // namespace vx7diag
