#pragma once

#include "framework/staticList.h"
#include "model/Aspect.h"
#include "transport/IsaSync.h"

namespace tolk {
class Addressable;
class Msg;
class MsgBody;
}  // namespace tolk

namespace vx7diag {

// What the dispatcher calls with a decoded event body, and with a raw message.
using EvtHandler = void (*)(tolk::Addressable*, unsigned int, tolk::MsgBody*);
using MsgHandlerFn = void (*)(tolk::Addressable*, tolk::Msg*);

// An aspect fed by board events. The one object of a kind names the kind of event and, while one
// event is being delivered (between Lock and Unlock), carries that event.
class VX7EventPublication : public Aspect {
  public:
    VX7EventPublication() = default;
    ~VX7EventPublication() override;

    // The kind of component the events come from, a VX7EventPublisher constant.
    virtual int Component() = 0;
    virtual unsigned int Group() const = 0;
    virtual tolk::staticList<unsigned int> EventTypeList() const;
    virtual EvtHandler Handler() const = 0;
    virtual MsgHandlerFn MsgHandler() const = 0;
    virtual void Lock();
    virtual tolk::MsgBody* GetEvent() const = 0;
    // Drops the event and its text, then gives the lock back.
    virtual void Unlock() = 0;
    // 1: register Handler(), 2: register MsgHandler().
    virtual int QueryHandlerType();

  protected:
    isa::CriticalSection lock;
};

}  // namespace vx7diag
