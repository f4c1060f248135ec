#pragma once

#include <atomic>
#include <iostream>

#include "model/VX7EventPublication.h"
#include "model/VX7EventPublisher.h"
#include "transport/TKSWholeLine.h"

namespace vx7diag {

// Size of the trace text buffer of every publication.
constexpr unsigned int PublicationTextLength = 256;

// The shape shared by the five publications: the event in hand with the board, trunk and channel
// of its publisher, the static Callback that the dispatcher calls, and the text built once per
// event. Derived provides ComponentKind, GroupNumber and Format(char* text).
template <class Derived, class Event>
class EventPublication : public VX7EventPublication {
  public:
    using EventType = Event;

    ~EventPublication() override {
        if (g_this.load() == this) {
            g_this.store(nullptr);
        }
        delete event;
    }

    int Component() override {
        g_this.store(static_cast<Derived*>(this));
        return Derived::ComponentKind;
    }
    unsigned int Group() const override { return Derived::GroupNumber; }
    EvtHandler Handler() const override { return &Callback; }
    MsgHandlerFn MsgHandler() const override { return nullptr; }
    Event* GetEvent() const override { return event; }

    void Unlock() override {
        delete event;
        event = nullptr;
        delete[] zlgText;
        zlgText = nullptr;
        lock.Leave();
    }

    // Takes the event over; board, trunk and channel come from the publisher that received it.
    void SetEvent(VX7EventPublisher* publisher, Event* e) {
        publisher->GetChannel(board, trunk, channel);
        delete event;
        event = e;
    }

    char* ToZLG() override {
        if (zlgText != nullptr || event == nullptr) {
            return zlgText;
        }
        zlgText = new char[PublicationTextLength];
        zlgText[0] = '\0';
        static_cast<Derived*>(this)->Format(zlgText);
        return zlgText;
    }

    unsigned int GetBoard() const { return board; }
    unsigned int GetTrunk() const { return trunk; }
    unsigned int GetChannel() const { return channel; }

    // Runs on the reader thread of the component's queue. It owns the body it is given and must
    // not let an exception out: that would take the reader down with it.
    static void Callback(tolk::Addressable* component, unsigned int, tolk::MsgBody* body) {
        Event* e = dynamic_cast<Event*>(body);
        Derived* self = g_this.load();
        VX7EventPublisher* publisher = VX7EventPublisher::GetMyPublisher(component);
        if (e == nullptr || self == nullptr || publisher == nullptr) {
            delete body;
            return;
        }
        self->Lock();
        self->SetEvent(publisher, e);
        try {
            publisher->Notify(*self);
        } catch (...) {
            TKSWholeLine() << "event observer failed; event dropped" << std::endl;
        }
        self->Unlock();
    }

    // The object that Callback delivers to; set by Component().
    static inline std::atomic<Derived*> g_this{nullptr};

  protected:
    Event* event = nullptr;
    unsigned int board = 0;
    unsigned int trunk = 0;
    unsigned int channel = 0;
};

}  // namespace vx7diag
