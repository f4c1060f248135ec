#include "framework/EvtCallback_Class.h"

#include <iostream>
#include <vector>

#include "framework/Addressable.h"
#include "framework/Marshal.h"
#include "framework/MsgDefault_t.h"
#include "framework/MsgEvtDetected_t.h"
#include "transport/TKSWholeLine.h"

namespace tolk {

namespace {

constexpr unsigned int EvtDetectedType = MsgEvtDetected_t::Type;

void* fnWord(EvtCallback::MsgFn f) {
    return reinterpret_cast<void*>(f);
}
void* fnWord(EvtCallback::BodyFn f) {
    return reinterpret_cast<void*>(f);
}

// The group is the first word of every event body.
unsigned int readGroup(Msg* msg) {
    unsigned int group = 0;
    getFirst(msg, 0, wire::pack(wire::U32), &group);
    return group;
}

}  // namespace

using Info = EvtCallback::callbackInfo;

Info::callbackInfo(void* obj, MsgMethod m, unsigned int t)
    : target(obj), method(m), wantsMsg(1), tag(t) {}
Info::callbackInfo(void* obj, BodyMethod m, unsigned int t)
    : target(obj), bodyMethod(m), wantsMsg(0), tag(t) {}
Info::callbackInfo(MsgFn f, unsigned int t) : target(fnWord(f)), wantsMsg(1), tag(t) {}
Info::callbackInfo(BodyFn f, unsigned int t) : target(fnWord(f)), wantsMsg(0), tag(t) {}

bool Info::operator==(const callbackInfo& o) const {
    return target == o.target && method == o.method && bodyMethod == o.bodyMethod &&
           wantsMsg == o.wantsMsg && argument == o.argument && number == o.number && tag == o.tag;
}

EvtCallback::EvtCallback(Addressable* a)
    : AsyncMsgReceiver(a, Deferred{}),
      unregisteredMsg(EvtCallback_unregisteredMsgHandler, 0),
      unregisteredEvt(EvtCallback_unregisteredEvtHandler, 0) {
    registerReceiver();
}

// Off the queue first, while the lists and the lock still exist: a dispatch in progress ends
// before deregistration returns.
EvtCallback::~EvtCallback() {
    deregisterReceiver();
}

void EvtCallback::add(CallbackMap& map, unsigned int number, const callbackInfo& info) {
    MutexGuard g(lock);
    CallbackList* l = nullptr;
    try {
        l = map.element(number);
    } catch (const CallbackMap::OutOfBoundsError&) {
        map.set(number, CallbackList());
        l = map.element(number);
    }
    l->append(info);
}

void EvtCallback::removeHeld(CallbackMap& map, unsigned int number, const callbackInfo& info) {
    CallbackList* l = map.element(number);
    for (unsigned int i = l->length(); i-- > 0;) {
        if (*l->element(i) == info) {
            l->remove(i);
        }
    }
    if (l->length() == 0) {
        map.unset(number);
    }
}

void EvtCallback::remove(CallbackMap& map, unsigned int number, const callbackInfo& info) {
    MutexGuard g(lock);
    removeHeld(map, number, info);
}

void EvtCallback::removeAll(CallbackMap& map, unsigned int number) {
    MutexGuard g(lock);
    map.unset(number);
}

#define TOLK_FOUR_FORMS(name, body)                                                     \
    void EvtCallback::name(unsigned int n, void* obj, MsgMethod m, unsigned int tag) {  \
        body(n, callbackInfo(obj, m, tag));                                             \
    }                                                                                   \
    void EvtCallback::name(unsigned int n, void* obj, BodyMethod m, unsigned int tag) { \
        body(n, callbackInfo(obj, m, tag));                                             \
    }                                                                                   \
    void EvtCallback::name(unsigned int n, MsgFn f, unsigned int tag) {                 \
        body(n, callbackInfo(f, tag));                                                  \
    }                                                                                   \
    void EvtCallback::name(unsigned int n, BodyFn f, unsigned int tag) {                \
        body(n, callbackInfo(f, tag));                                                  \
    }

#define TOLK_ADD_MSG(n, info) add(msgTypes, n, info)
#define TOLK_ADD_EVT(n, info) add(evtGroups, n, info)
#define TOLK_REMOVE_MSG(n, info) remove(msgTypes, n, info)
#define TOLK_REMOVE_EVT(n, info) remove(evtGroups, n, info)

TOLK_FOUR_FORMS(registerMsgType, TOLK_ADD_MSG)
TOLK_FOUR_FORMS(registerEvtGroup, TOLK_ADD_EVT)
TOLK_FOUR_FORMS(cancelMsgType, TOLK_REMOVE_MSG)
TOLK_FOUR_FORMS(cancelEvtGroup, TOLK_REMOVE_EVT)

void EvtCallback::cancelMsgType(unsigned int type) {
    removeAll(msgTypes, type);
}
void EvtCallback::cancelEvtGroup(unsigned int group) {
    removeAll(evtGroups, group);
}

void EvtCallback::unregisteredMsgType(void* obj, MsgMethod m, unsigned int tag) {
    std::lock_guard<std::mutex> g(unregisteredLock);
    unregisteredMsg = callbackInfo(obj, m, tag);
}
void EvtCallback::unregisteredMsgType(MsgFn f, unsigned int tag) {
    std::lock_guard<std::mutex> g(unregisteredLock);
    unregisteredMsg = callbackInfo(f, tag);
}
void EvtCallback::unregisteredEvtGroup(void* obj, MsgMethod m, unsigned int tag) {
    std::lock_guard<std::mutex> g(unregisteredLock);
    unregisteredEvt = callbackInfo(obj, m, tag);
}
void EvtCallback::unregisteredEvtGroup(MsgFn f, unsigned int tag) {
    std::lock_guard<std::mutex> g(unregisteredLock);
    unregisteredEvt = callbackInfo(f, tag);
}

MsgBody* EvtCallback::makeBody(unsigned int type, unsigned int group) {
    if (type == EvtDetectedType) {
        try {
            return addressable->EvtBodyLookup(group);
        } catch (const Addressable::UndefinedEvtBody&) {
            return new MsgEvtDetected_t();
        }
    }
    try {
        return addressable->MsgBodyLookup(type);
    } catch (const Addressable::UndefinedMsgBody&) {
        return new MsgDefault_t();
    }
}

void EvtCallback::start(void*, callbackInfo* info) {
    try {
        if (info->wantsMsg != 0) {
            Msg* m = static_cast<Msg*>(info->argument);
            if (info->method != nullptr) {
                Callback* obj = static_cast<Callback*>(info->target);
                MsgMethod fn = info->method;
                (obj->*fn)(addressable, m);
            } else {
                reinterpret_cast<MsgFn>(info->target)(addressable, m);
            }
        } else {
            MsgBody* b = static_cast<MsgBody*>(info->argument);
            if (info->bodyMethod != nullptr) {
                Callback* obj = static_cast<Callback*>(info->target);
                BodyMethod fn = info->bodyMethod;
                (obj->*fn)(addressable, info->number, b);
            } else {
                reinterpret_cast<BodyFn>(info->target)(addressable, info->number, b);
            }
        }
    } catch (const Exception& e) {
        TKSWholeLine() << "EvtCallback_Class"
                       << "(" << 138 << ") "
                       << "TOLK Exception caught from callback handler thread" << std::endl
                       << e << std::endl;
        delete info;
        throw;
    } catch (...) {
        TKSWholeLine() << "EvtCallback_Class"
                       << "(" << 147 << ") "
                       << "general Exception caught from callback handler thread" << std::endl;
        delete info;
        throw;
    }
    delete info;
}

// Calls every entry in order. A callback that raises has been reported by start(); the others
// still get their message, so one faulty handler cannot starve the rest.
void EvtCallback::dispatch(Msg* msg, unsigned int type, unsigned int group, CallbackList& entries) {
    unsigned int count = entries.length();
    bool handedOver = false;
    try {
        for (unsigned int i = 0; i < count; ++i) {
            const callbackInfo& entry = *entries.element(i);
            if (entry.isNull()) {
                continue;
            }
            auto* info = new callbackInfo(entry);
            if (info->wantsMsg != 0) {
                if (count == 1) {
                    info->argument = msg;
                    handedOver = true;
                } else {
                    info->argument = new Msg(*msg);
                }
            } else {
                MsgBody* body = nullptr;
                try {
                    body = makeBody(type, group);
                    body->readMsg(msg, 0);
                } catch (...) {
                    delete body;
                    delete info;
                    throw;
                }
                info->argument = body;
                info->number = type;
            }
            try {
                start(nullptr, info);
            } catch (...) {
            }
        }
    } catch (const Exception& e) {
        TKSWholeLine() << "EvtCallback_Class"
                       << "(" << 321 << ") "
                       << "tolk internal error" << std::endl
                       << e << std::endl;
    } catch (...) {
        TKSWholeLine() << "EvtCallback_Class"
                       << "(" << 330 << ") "
                       << "tolk internal error" << std::endl;
    }
    if (!handedOver) {
        delete msg;
    }
}

void EvtCallback::receive(Msg* msg) {
    MutexGuard g(lock);
    unsigned int type = msg->getMsgType();
    unsigned int group = 0;
    // A snapshot, so that a callback that drops its own entry (a one-shot wait) cannot pull the
    // list from under the walk.
    CallbackList entries;
    bool found = true;
    try {
        if (type == EvtDetectedType) {
            group = readGroup(msg);
            entries = *evtGroups.element(group);
        } else {
            entries = *msgTypes.element(type);
        }
    } catch (const CallbackMap::OutOfBoundsError&) {
        found = false;
    }
    if (found) {
        dispatch(msg, type, group, entries);
        return;
    }
    callbackInfo* info;
    {
        std::lock_guard<std::mutex> ug(unregisteredLock);
        info = new callbackInfo(type == EvtDetectedType ? unregisteredEvt : unregisteredMsg);
    }
    if (info->isNull()) {
        delete info;
        delete msg;
        return;
    }
    info->number = type;
    info->argument = msg;
    try {
        start(nullptr, info);
    } catch (...) {
    }
}

// --- one-shot waits ---

EvtCallback::OneShotWait::~OneShotWait() {
    try {
        disable();
    } catch (...) {
    }
    delete msg.exchange(nullptr);
}

void EvtCallback::OneShotWait::enable(unsigned int n) {
    disable();
    signal.lock();
    delete msg.exchange(nullptr);
    number = n;
    auto m = static_cast<MsgMethod>(&OneShotWait::trigger);
    armed = true;
    if (byGroup) {
        dispatcher->registerEvtGroup(n, static_cast<Callback*>(this), m, 0);
    } else {
        dispatcher->registerMsgType(n, static_cast<Callback*>(this), m, 0);
    }
}

void EvtCallback::OneShotWait::disable() {
    if (armed.exchange(false)) {
        callbackInfo info(static_cast<Callback*>(this),
                          static_cast<MsgMethod>(&OneShotWait::trigger), 0);
        try {
            dispatcher->remove(byGroup ? dispatcher->evtGroups : dispatcher->msgTypes, number,
                               info);
        } catch (const CallbackMap::OutOfBoundsError&) {
        }
    }
    signal.unlock();
}

void EvtCallback::OneShotWait::trigger(Addressable*, Msg* m) {
    delete msg.exchange(m);
    if (armed.exchange(false)) {
        callbackInfo info(static_cast<Callback*>(this),
                          static_cast<MsgMethod>(&OneShotWait::trigger), 0);
        try {
            dispatcher->removeHeld(byGroup ? dispatcher->evtGroups : dispatcher->msgTypes, number,
                                   info);
        } catch (const CallbackMap::OutOfBoundsError&) {
        }
    }
    signal.unlock();
}

Msg* EvtCallback::OneShotWait::take(unsigned int timeoutMs) {
    bool got = true;
    if (timeoutMs != 0) {
        got = signal.tryLock(timeoutMs, 10);
    } else {
        signal.lock();
    }
    Msg* m = msg.exchange(nullptr);
    if (m == nullptr) {
        if (got) {
            signal.unlock();
        }
        throw Timeout(number, timeoutMs);
    }
    return m;
}

void EvtCallback::OneShotWait::wait(MsgBody* body, unsigned int timeoutMs) {
    Msg* m = take(timeoutMs);
    try {
        if (body != nullptr) {
            body->readMsg(m, 0);
        }
    } catch (...) {
        delete m;
        signal.unlock();
        throw;
    }
    delete m;
    signal.unlock();
}

Msg* EvtCallback::OneShotWait::waitMsg(unsigned int timeoutMs) {
    Msg* m = take(timeoutMs);
    signal.unlock();
    return m;
}

EvtCallback::MsgWait::MsgWait(EvtCallback* cb, unsigned int type, unsigned int timeoutMs)
    : OneShotWait(cb, false) {
    enable(type);
    wait(nullptr, timeoutMs);
}

EvtCallback::EvtWait::EvtWait(EvtCallback* cb, unsigned int group, unsigned int timeoutMs)
    : OneShotWait(cb, true) {
    enable(group);
    wait(nullptr, timeoutMs);
}

// --- handlers for what nobody registered ---

void EvtCallback_unregisteredMsgHandler(Addressable* a, Msg* m) {
    unsigned int type = m->getMsgType();
    try {
        m->setBodyDef(a->MsgBodyLookup(type));
    } catch (...) {
    }
    TKSWholeLine() << "\n"
                   << "********************************************" << std::endl
                   << "Unregistered MsgType " << type << std::endl
                   << "For " << *a << std::endl
                   << *m << std::endl
                   << "You may specify your own handler for unregisted messages using" << std::endl
                   << "Addressable::asyncUnregisteredMsgType" << std::endl
                   << "********************************************" << std::endl
                   << std::endl;
    delete m;
}

void EvtCallback_unregisteredEvtHandler(Addressable* a, Msg* m) {
    unsigned int group = readGroup(m);
    try {
        m->setBodyDef(a->EvtBodyLookup(group));
    } catch (...) {
    }
    TKSWholeLine() << "********************************************" << std::endl
                   << "Unregistered EventGroup " << group << std::endl
                   << "For " << *a << std::endl
                   << *m << std::endl
                   << "You may specify your own handler for unregisted events using" << std::endl
                   << "Addressable::asyncUnregisteredEvtGroup" << std::endl
                   << "********************************************" << std::endl
                   << std::endl;
    delete m;
}

}  // namespace tolk
