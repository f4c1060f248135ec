#pragma once

namespace vx7diag {

class Aspect;
class Subject;

class Observer {
  public:
    virtual ~Observer();
    virtual void Update(Subject* subject, Aspect& aspect);
    // True for two different objects: observers have no order of their own, only identity.
    virtual bool operator<(const Observer& other) const;
};

}  // namespace vx7diag
