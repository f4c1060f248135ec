// Subscriptions as the components take them, and the events that reach each subscriber.
#include <cstring>
#include <memory>
#include <optional>
#include <string>

#include "catalogue/generated/lcon_bodies.h"
#include "catalogue/generated/stdresource_bodies.h"
#include "catalogue/generated/tsc_bodies.h"
#include "sim/EmulationInternal.h"

namespace sim {

using Std = tolk::StdResource_Bodies;
using Tsc = tolk::TSC_Bodies;
using Lcon = tolk::LCON_Bodies;

namespace {

constexpr std::uint32_t kEvtDetected = Std::MsgEvtDetected_t::MsgType;

void setText(tolk::staticList<char>& l, const std::string& s) {
    l.realloc(static_cast<unsigned int>(s.size()) + 1);
    std::memcpy(l.data(), s.c_str(), s.size() + 1);
}

}  // namespace

void Emulation::handleSubscription(Request& rq) {
    switch (rq.type) {
        case Std::MsgDetectEvt_t::MsgType: {
            // A TSC's 0x16 may carry a set behind these fields; the subscription is the same.
            Std::MsgDetectEvt_t f;
            (void)f.readMsg(&rq.msg, 0);
            Subscription s;
            s.evtType = f.EvtType;
            s.group = f.EvtGroup == 0 ? f.EvtType : f.EvtGroup;
            s.retAddr = fromCD(f.RetAddr);
            s.trans = rq.trans;
            s.owner = rq.src;
            model_.subscribe(rq.tgt, s);
            reply(rq, Std::MsgDetectEvtCmplt_t::MsgType, nullptr);
            return;
        }
        case Std::MsgDetectxEvts_t::MsgType: {
            Std::MsgDetectxEvts_t f;
            (void)f.readMsg(&rq.msg, 0);
            unsigned int n = std::min(f.Count, f.List.length());
            for (unsigned int i = 0; i < n; ++i) {
                Subscription s;
                s.evtType = f.List[i]->EvtType;
                s.group = f.List[i]->EvtGroup == 0 ? s.evtType : f.List[i]->EvtGroup;
                s.retAddr = fromCD(f.RetAddr);
                s.trans = rq.trans;
                s.owner = rq.src;
                model_.subscribe(rq.tgt, s);
            }
            reply(rq, Std::MsgDetectxEvtsCmplt_t::MsgType, nullptr);
            return;
        }
        case Std::MsgCancelEvt_t::MsgType: {
            Std::MsgCancelEvt_t f;
            (void)f.readMsg(&rq.msg, 0);
            model_.cancel(rq.tgt, rq.src, rq.trans, f.Type);
            reply(rq, Std::MsgCancelEvtCmplt_t::MsgType, nullptr);
            return;
        }
        case Std::MsgCancelxEvts_t::MsgType: {
            Std::MsgCancelxEvts_t f;
            (void)f.readMsg(&rq.msg, 0);
            unsigned int n = std::min(f.Count, f.EvtTypeList.length());
            for (unsigned int i = 0; i < n; ++i) {
                model_.cancel(rq.tgt, rq.src, rq.trans, *f.EvtTypeList[i]);
            }
            reply(rq, Std::MsgCancelxEvtsCmplt_t::MsgType, nullptr);
            return;
        }
        case Std::MsgCancelAllEvts_t::MsgType:
            model_.cancel(rq.tgt, rq.src, rq.trans, std::nullopt);
            // The completion has no body of its own in the catalogue: the command + 1.
            reply(rq, Std::MsgCancelAllEvts_t::MsgType + 1, nullptr);
            return;
    }
}

void Emulation::publish(const std::vector<Event>& events) {
    for (const Event& e : events) {
        model_.subscribersOf(e, deliveries_);
        if (deliveries_.empty()) {
            continue;
        }
        std::uint32_t ts = model_.nextTimestamp();
        for (const Subscription* s : deliveries_) {
            std::unique_ptr<tolk::MsgBody> body;
            switch (e.kind) {
                case Event::Kind::CallState: {
                    auto b = std::make_unique<Tsc::EvtCallState_t>();
                    b->EvtGroup = s->group;
                    b->Type = e.type;
                    b->Timestamp = ts;
                    b->CallId = e.a;
                    b->CallState = e.b;
                    b->Reason = e.c;
                    body = std::move(b);
                    break;
                }
                case Event::Kind::ChanState: {
                    auto b = std::make_unique<Tsc::EvtChanState_t>();
                    b->EvtGroup = s->group;
                    b->Type = e.type;
                    b->Timestamp = ts;
                    b->ChanState = e.a;
                    body = std::move(b);
                    break;
                }
                case Event::Kind::CallInfo: {
                    auto b = std::make_unique<Tsc::EvtCallInfo_Type_CalledId_t>();
                    b->EvtGroup = s->group;
                    b->Type = e.type;
                    b->Timestamp = ts;
                    b->CallId = e.a;
                    b->InfoId = e.b;
                    setText(b->Value, e.text);
                    body = std::move(b);
                    break;
                }
                case Event::Kind::Alarm: {
                    auto b = std::make_unique<Lcon::Evt_0x1600_t>();
                    b->Label = s->group;
                    b->Type = e.a;
                    b->State = static_cast<unsigned char>(e.b);
                    body = std::move(b);
                    break;
                }
                case Event::Kind::LineState: {
                    auto b = std::make_unique<Lcon::Evt_0x1611_t>();
                    b->Label = s->group;
                    b->Type = e.a;
                    b->Reason = e.b;
                    body = std::move(b);
                    break;
                }
            }
            post(kEvtDetected, s->trans, e.source, s->retAddr, body.get());
            stats_.events++;
        }
    }
}

}  // namespace sim
