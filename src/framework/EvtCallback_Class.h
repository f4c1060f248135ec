#pragma once

#include <atomic>
#include <mutex>

#include "framework/AsyncMsgReceiver.h"
#include "framework/Msg.h"
#include "framework/MsgBody.h"
#include "framework/Mutex.h"
#include "framework/keyedList.h"
#include "framework/linkedList.h"

namespace tolk {

class Addressable;

// The asynchronous side of an Addressable: every message from its target that isn't an awaited
// reply is handed to the functions registered for its type or, for events (type 0x20), for its
// event group. Everything runs on the queue's reader thread, one dispatch at a time.
class EvtCallback : public AsyncMsgReceiver {
  public:
    // Member callbacks are typed on this class: derive from it and pass
    // static_cast<EvtCallback::Callback*>(obj) with static_cast<MsgMethod>(&C::fn).
    class Callback {};
    using MsgMethod = void (Callback::*)(Addressable*, Msg*);
    using BodyMethod = void (Callback::*)(Addressable*, unsigned int, MsgBody*);
    using MsgFn = void (*)(Addressable*, Msg*);
    using BodyFn = void (*)(Addressable*, unsigned int, MsgBody*);

    class callbackInfo : public virtualObject {
      public:
        callbackInfo() = default;
        callbackInfo(void* obj, MsgMethod m, unsigned int tag);
        callbackInfo(void* obj, BodyMethod m, unsigned int tag);
        callbackInfo(MsgFn f, unsigned int tag);
        callbackInfo(BodyFn f, unsigned int tag);
        callbackInfo(const callbackInfo&) = default;
        callbackInfo& operator=(const callbackInfo&) = default;
        bool operator==(const callbackInfo& o) const;
        bool isNull() const {
            return target == nullptr && method == nullptr && bodyMethod == nullptr;
        }

        void* target = nullptr;  // the object, or the plain function
        MsgMethod method = nullptr;
        BodyMethod bodyMethod = nullptr;
        int wantsMsg = 1;
        void* argument = nullptr;  // Msg* or MsgBody* of a dispatch in progress
        unsigned int number = 0;
        unsigned int tag = 0;
    };

    using CallbackList = linkedList<callbackInfo>;
    using CallbackMap = keyedList<unsigned int, CallbackList>;

    // One-shot wait for a message type (MsgWait) or an event group (EvtWait).
    class OneShotWait : public Callback {
      public:
        class Timeout : public virtualObject {
          public:
            Timeout(unsigned int number, unsigned int timeoutMs)
                : number(number), timeoutMs(timeoutMs) {}
            unsigned int number;
            unsigned int timeoutMs;
        };

        virtual ~OneShotWait();
        OneShotWait(const OneShotWait&) = delete;
        OneShotWait& operator=(const OneShotWait&) = delete;

        void enable(unsigned int number);
        void disable();
        // The registered callback: keeps the message and fires the signal. It runs inside a
        // dispatch, which holds the dispatcher's lock, so it drops its entry without that lock.
        void trigger(Addressable* a, Msg* m);
        // Raises Timeout if nothing came; reads the message into body if given.
        void wait(MsgBody* body, unsigned int timeoutMs);
        // The caller owns the message returned.
        Msg* waitMsg(unsigned int timeoutMs);

      protected:
        OneShotWait(EvtCallback* cb, bool byGroup) : dispatcher(cb), byGroup(byGroup) {}
        Msg* take(unsigned int timeoutMs);

        std::atomic<Msg*> msg{nullptr};
        Mutex signal;
        unsigned int number = 0;
        EvtCallback* dispatcher;

      private:
        bool byGroup;
        std::atomic<bool> armed{false};
    };

    class MsgWait : public OneShotWait {
      public:
        explicit MsgWait(EvtCallback* cb) : OneShotWait(cb, false) {}
        MsgWait(EvtCallback* cb, unsigned int type, unsigned int timeoutMs);
    };

    class EvtWait : public OneShotWait {
      public:
        explicit EvtWait(EvtCallback* cb) : OneShotWait(cb, true) {}
        EvtWait(EvtCallback* cb, unsigned int group, unsigned int timeoutMs);
    };

    explicit EvtCallback(Addressable* a);
    ~EvtCallback() override;

    void registerMsgType(unsigned int type, void* obj, MsgMethod m, unsigned int tag);
    void registerMsgType(unsigned int type, void* obj, BodyMethod m, unsigned int tag);
    void registerMsgType(unsigned int type, MsgFn f, unsigned int tag);
    void registerMsgType(unsigned int type, BodyFn f, unsigned int tag);
    void registerEvtGroup(unsigned int group, void* obj, MsgMethod m, unsigned int tag);
    void registerEvtGroup(unsigned int group, void* obj, BodyMethod m, unsigned int tag);
    void registerEvtGroup(unsigned int group, MsgFn f, unsigned int tag);
    void registerEvtGroup(unsigned int group, BodyFn f, unsigned int tag);

    // A number that was never registered raises its list's OutOfBoundsError.
    void cancelMsgType(unsigned int type, void* obj, MsgMethod m, unsigned int tag);
    void cancelMsgType(unsigned int type, void* obj, BodyMethod m, unsigned int tag);
    void cancelMsgType(unsigned int type, MsgFn f, unsigned int tag);
    void cancelMsgType(unsigned int type, BodyFn f, unsigned int tag);
    void cancelMsgType(unsigned int type);
    void cancelEvtGroup(unsigned int group, void* obj, MsgMethod m, unsigned int tag);
    void cancelEvtGroup(unsigned int group, void* obj, BodyMethod m, unsigned int tag);
    void cancelEvtGroup(unsigned int group, MsgFn f, unsigned int tag);
    void cancelEvtGroup(unsigned int group, BodyFn f, unsigned int tag);
    void cancelEvtGroup(unsigned int group);

    void unregisteredMsgType(void* obj, MsgMethod m, unsigned int tag);
    void unregisteredMsgType(MsgFn f, unsigned int tag);
    void unregisteredEvtGroup(void* obj, MsgMethod m, unsigned int tag);
    void unregisteredEvtGroup(MsgFn f, unsigned int tag);

    // Takes the message over.
    void receive(Msg* msg) override;
    // Calls one callback and deletes info. What the callback raises is reported and re-raised.
    void start(void* control, callbackInfo* info);

  private:
    void add(CallbackMap& map, unsigned int number, const callbackInfo& info);
    void remove(CallbackMap& map, unsigned int number, const callbackInfo& info);
    void removeHeld(CallbackMap& map, unsigned int number, const callbackInfo& info);
    void removeAll(CallbackMap& map, unsigned int number);
    MsgBody* makeBody(unsigned int type, unsigned int group);
    void dispatch(Msg* msg, unsigned int type, unsigned int group, CallbackList& entries);

    CallbackMap msgTypes;
    CallbackMap evtGroups;
    Mutex lock;
    std::mutex unregisteredLock;
    callbackInfo unregisteredMsg;
    callbackInfo unregisteredEvt;
};

void EvtCallback_unregisteredMsgHandler(Addressable* a, Msg* m);
void EvtCallback_unregisteredEvtHandler(Addressable* a, Msg* m);

}  // namespace tolk
