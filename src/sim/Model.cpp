#include "sim/Model.h"

#include <algorithm>

#include "sim/ErrorCodes.h"

namespace sim {

std::uint64_t addressKey(const Address& a) {
    return (std::uint64_t{a.node} << 40) | (std::uint64_t{a.board} << 32) |
           (std::uint64_t{a.processor} << 24) | (std::uint64_t{a.component} << 16) | a.instance;
}

namespace {

bool ended(const Call& c) {
    return c.state == call::Idle || c.state == call::Null;
}

bool ringing(const Call& c) {
    return c.state == call::Offered || c.state == call::Accepted;
}

}  // namespace

Model::Model(std::shared_ptr<const farm::Farm> farm) : farm_(std::move(farm)) {
    for (const farm::Board& b : farm_->boards) {
        for (const farm::Trunk& t : b.trunks) {
            auto line = std::make_unique<Line>();
            line->board = b.logicalId;
            line->trunk = t.number;
            line->type = t.type;
            line->signaling =
                t.analog() ? static_cast<int>(farm::Signaling::CAS) : static_cast<int>(t.signaling);
            line->lcon = farm::lconAddress(b.logicalId, t.number);
            for (int c = 1; c <= t.channels; ++c) {
                auto ch = std::make_unique<Channel>();
                ch->ref = farm::ChannelRef{b.logicalId, t.number, c};
                ch->line = line.get();
                ch->number = farm_->numberOf(ch->ref);
                ch->flexible = b.flexible();
                ch->tsc = farm::channelComponentAddress(b.logicalId, t.number, c, farm::kTSC);
                ch->ports.txSlot = static_cast<std::uint16_t>(t.number * 32 + c);
                ch->chanState = ch->flexible ? chan::MediaDetached : chan::Active;
                line->channels.push_back(ch.get());
                channels_[addressKey(ch->tsc)] = std::move(ch);
            }
            lines_[addressKey(line->lcon)] = std::move(line);
        }
        for (int v = 1; v <= b.voiceChannelCount(); ++v) {
            Ports p;
            p.txSlot = static_cast<std::uint16_t>(0x1000 + v);
            rocPorts_[addressKey(farm::rocClusterAddress(b.logicalId, v))] = p;
        }
    }
}

Channel* Model::channel(unsigned board, int trunk, int channel) {
    if (trunk < 1 || trunk > farm::kMaxTrunks || channel < 1 || channel > farm::kMaxChannels) {
        return nullptr;
    }
    auto it = channels_.find(
        addressKey(farm::channelComponentAddress(board, trunk, channel, farm::kTSC)));
    return it == channels_.end() ? nullptr : it->second.get();
}

Line* Model::line(unsigned board, int trunk) {
    if (trunk < 1 || trunk > farm::kMaxTrunks) {
        return nullptr;
    }
    auto it = lines_.find(addressKey(farm::lconAddress(board, trunk)));
    return it == lines_.end() ? nullptr : it->second.get();
}

Ports* Model::clusterPorts(const Address& cluster) {
    auto r = farm::resolve(*farm_, cluster);
    if (!r) {
        return nullptr;
    }
    if (r->kind == farm::ResourceKind::ChannelCluster) {
        Channel* ch = channel(r->board, r->trunk, r->channel);
        return ch ? &ch->ports : nullptr;
    }
    if (r->kind == farm::ResourceKind::RocCluster) {
        auto it = rocPorts_.find(addressKey(cluster));
        return it == rocPorts_.end() ? nullptr : &it->second;
    }
    return nullptr;
}

Call* Model::findCall(Channel& ch, std::uint32_t callId) {
    if (!ch.call || (callId != 0 && ch.call->id != callId)) {
        return nullptr;
    }
    return &*ch.call;
}

void Model::callEvent(Channel& ch, std::vector<Event>& ev) {
    Event e;
    e.kind = Event::Kind::CallState;
    e.source = ch.tsc;
    e.group = kGroupCallState;
    e.type = kGroupCallState + ch.call->state;
    e.a = ch.call->id;
    e.b = ch.call->state;
    e.c = ch.call->reason;
    ev.push_back(std::move(e));
}

void Model::consultEvent(Channel& ch, std::uint32_t state, std::uint32_t why,
                         std::vector<Event>& ev) {
    Event e;
    e.kind = Event::Kind::CallState;
    e.source = ch.tsc;
    e.group = kGroupCallState;
    e.type = kGroupCallState + state;
    e.a = ch.call->consultId;
    e.b = state;
    e.c = why;
    ev.push_back(std::move(e));
}

void Model::chanEvent(Channel& ch, std::vector<Event>& ev) {
    Event e;
    e.kind = Event::Kind::ChanState;
    e.source = ch.tsc;
    e.group = kGroupChanState;
    e.type = kGroupChanState - 1 + ch.chanState;
    e.a = ch.chanState;
    ev.push_back(std::move(e));
}

void Model::setCall(Channel& ch, std::uint32_t state, std::uint32_t why, std::vector<Event>& ev) {
    ch.call->state = state;
    ch.call->reason = why;
    callEvent(ch, ev);
    if (state == call::Null) {
        ch.call.reset();
    }
}

void Model::endCall(Channel& ch, std::uint32_t localState, std::uint32_t why, std::uint32_t peerWhy,
                    std::vector<Event>& ev) {
    Channel* peer = ch.call->peer;
    ch.call->peer = nullptr;
    if (ch.call->consultId != 0) {
        consultEvent(ch, call::Null, why, ev);
        ch.call->consultId = 0;
    }
    if (!ended(*ch.call) || localState == call::Null) {
        setCall(ch, localState, why, ev);
    }
    if (peer && peer->call && peer->call->peer == &ch) {
        peer->call->peer = nullptr;
        if (!ended(*peer->call)) {
            setCall(*peer, call::Disconnected, peerWhy, ev);
        }
    }
}

std::uint32_t Model::serviceState(const Channel& ch) const {
    if (ch.adminOut || ch.line->state != kInService) {
        return chan::OutOfService;
    }
    if (ch.flexible && !ch.mediaAttached) {
        return chan::MediaDetached;
    }
    return chan::Active;
}

void Model::refreshChanState(Channel& ch, std::vector<Event>& ev) {
    std::uint32_t s = serviceState(ch);
    if (s != ch.chanState) {
        ch.chanState = s;
        chanEvent(ch, ev);
    }
}

std::uint32_t Model::makeCall(Channel& ch, const std::string& dest, const std::string& orig,
                              std::uint32_t& callId, std::vector<Event>& ev) {
    if (ch.chanState != chan::Active) {
        return kErrOutOfService;
    }
    if (ch.call) {
        return kErrChannelBusy;
    }
    ch.call = Call{nextCallId_++, call::Dialing, reason::None, nullptr, dest};
    callId = ch.call->id;
    callEvent(ch, ev);
    setCall(ch, call::Proceeding, reason::None, ev);

    auto target = farm_->channelForNumber(dest);
    if (!target) {
        // Somebody outside the farm: the network rings and the party answers at once.
        setCall(ch, call::Alerting, reason::None, ev);
        setCall(ch, call::Connected, reason::None, ev);
        return 0;
    }
    Channel* far = channel(target->board, target->trunk, target->channel);
    if (far == &ch || (far && far->call)) {
        setCall(ch, call::Disconnected, reason::DestBusy, ev);
        return 0;
    }
    if (!far || far->chanState != chan::Active) {
        setCall(ch, call::Disconnected, reason::DestOutOfOrder, ev);
        return 0;
    }
    setCall(ch, call::Alerting, reason::None, ev);
    std::uint32_t farId = 0;
    incomingCall(*far, orig, farId, ev);
    far->call->peer = &ch;
    ch.call->peer = far;
    return 0;
}

std::uint32_t Model::incomingCall(Channel& ch, const std::string& from, std::uint32_t& callId,
                                  std::vector<Event>& ev) {
    if (ch.chanState != chan::Active) {
        return kErrOutOfService;
    }
    if (ch.call) {
        return kErrChannelBusy;
    }
    ch.call = Call{nextCallId_++, call::Offered, reason::IncomingCall, nullptr, from};
    callId = ch.call->id;
    Event info;
    info.kind = Event::Kind::CallInfo;
    info.source = ch.tsc;
    info.group = kGroupCallInfo;
    info.type = kEvtCallInfoCallerId;
    info.a = callId;
    info.b = kInfoIdCallerId;
    info.text = from;
    ev.push_back(std::move(info));
    callEvent(ch, ev);
    return 0;
}

std::uint32_t Model::answerCall(Channel& ch, std::uint32_t callId, std::vector<Event>& ev) {
    Call* c = findCall(ch, callId);
    if (!c) {
        return kErrNoSuchCall;
    }
    if (!ringing(*c)) {
        return kErrBadState;
    }
    setCall(ch, call::Connected, reason::None, ev);
    Channel* peer = c->peer;
    if (peer && peer->call && peer->call->state == call::Alerting) {
        setCall(*peer, call::Connected, reason::None, ev);
    }
    return 0;
}

std::uint32_t Model::acceptCall(Channel& ch, std::uint32_t callId, std::vector<Event>& ev) {
    Call* c = findCall(ch, callId);
    if (!c) {
        return kErrNoSuchCall;
    }
    if (c->state != call::Offered) {
        return kErrBadState;
    }
    setCall(ch, call::Accepted, reason::None, ev);
    return 0;
}

std::uint32_t Model::dropCall(Channel& ch, std::uint32_t callId, std::uint32_t why,
                              std::vector<Event>& ev) {
    Call* c = findCall(ch, callId);
    if (!c) {
        return kErrNoSuchCall;
    }
    if (ended(*c)) {
        return kErrBadState;
    }
    endCall(ch, call::Idle, why, why, ev);
    return 0;
}

std::uint32_t Model::releaseCall(Channel& ch, std::uint32_t callId, std::uint32_t why,
                                 std::vector<Event>& ev) {
    if (!findCall(ch, callId)) {
        return kErrNoSuchCall;
    }
    endCall(ch, call::Null, why, why, ev);
    return 0;
}

std::uint32_t Model::rejectCall(Channel& ch, std::uint32_t callId, std::uint32_t why,
                                std::vector<Event>& ev) {
    Call* c = findCall(ch, callId);
    if (!c) {
        return kErrNoSuchCall;
    }
    if (!ringing(*c)) {
        return kErrBadState;
    }
    endCall(ch, call::Null, why, why, ev);
    return 0;
}

std::uint32_t Model::holdCall(Channel& ch, std::uint32_t callId, std::vector<Event>& ev) {
    Call* c = findCall(ch, callId);
    if (!c) {
        return kErrNoSuchCall;
    }
    if (c->state != call::Connected) {
        return kErrBadState;
    }
    setCall(ch, call::Hold, reason::None, ev);
    return 0;
}

std::uint32_t Model::retrieveCall(Channel& ch, std::uint32_t callId, std::vector<Event>& ev) {
    Call* c = findCall(ch, callId);
    if (!c) {
        return kErrNoSuchCall;
    }
    if (c->state != call::Hold) {
        return kErrBadState;
    }
    setCall(ch, call::Connected, reason::None, ev);
    return 0;
}

std::uint32_t Model::blindTransfer(Channel& ch, std::uint32_t callId, std::vector<Event>& ev) {
    Call* c = findCall(ch, callId);
    if (!c) {
        return kErrNoSuchCall;
    }
    if (c->state != call::Connected && c->state != call::Hold) {
        return kErrBadState;
    }
    // The far end goes on with the transfer target; this channel is out of it.
    if (c->peer && c->peer->call) {
        c->peer->call->peer = nullptr;
    }
    c->peer = nullptr;
    setCall(ch, call::Null, reason::Transfer, ev);
    return 0;
}

std::uint32_t Model::initTransfer(Channel& ch, std::uint32_t callId, std::uint32_t& consultId,
                                  std::vector<Event>& ev) {
    Call* c = findCall(ch, callId);
    if (!c) {
        return kErrNoSuchCall;
    }
    if ((c->state != call::Connected && c->state != call::Hold) || c->consultId != 0) {
        return kErrBadState;
    }
    setCall(ch, call::HoldPendXfer, reason::None, ev);
    c->consultId = nextCallId_++;
    consultId = c->consultId;
    // The consulted party is played as one outside the farm: it rings and answers at once.
    for (std::uint32_t s : {call::Dialing, call::Proceeding, call::Alerting, call::Connected}) {
        consultEvent(ch, s, reason::None, ev);
    }
    return 0;
}

std::uint32_t Model::completeTransfer(Channel& ch, std::uint32_t callId, std::uint32_t consultId,
                                      std::vector<Event>& ev) {
    Call* c = findCall(ch, callId);
    if (!c || c->consultId == 0 || (consultId != 0 && consultId != c->consultId)) {
        return kErrNoSuchCall;
    }
    consultEvent(ch, call::Null, reason::Transfer, ev);
    c->consultId = 0;
    if (c->peer && c->peer->call) {
        c->peer->call->peer = nullptr;
    }
    c->peer = nullptr;
    setCall(ch, call::Null, reason::Transfer, ev);
    return 0;
}

std::uint32_t Model::cancelTransfer(Channel& ch, std::uint32_t callId, std::vector<Event>& ev) {
    // Either call of the transfer names it.
    bool consultation = ch.call && callId != 0 && callId == ch.call->consultId;
    Call* c = consultation ? &*ch.call : findCall(ch, callId);
    if (!c) {
        return kErrNoSuchCall;
    }
    if (c->consultId == 0) {
        return kErrBadState;
    }
    consultEvent(ch, call::Null, reason::Canceled, ev);
    c->consultId = 0;
    setCall(ch, call::Connected, reason::None, ev);
    return 0;
}

std::uint32_t Model::dial(Channel& ch, std::uint32_t callId) {
    Call* c = findCall(ch, callId);
    if (!c) {
        return kErrNoSuchCall;
    }
    return ended(*c) ? std::uint32_t{kErrBadState} : 0u;
}

std::uint32_t Model::callState(Channel& ch, std::uint32_t callId, std::uint32_t& id,
                               std::uint32_t& state, std::uint32_t& why) {
    if (callId == 0 && !ch.call) {
        id = 0;
        state = call::Null;
        why = reason::None;
        return 0;
    }
    Call* c = findCall(ch, callId);
    if (!c) {
        return kErrNoSuchCall;
    }
    id = c->id;
    state = c->state;
    why = c->reason;
    return 0;
}

std::uint32_t Model::setChanState(Channel& ch, std::uint32_t state, std::vector<Event>& ev) {
    if (state == kChanStateInService) {
        ch.adminOut = false;
    } else if (state == kChanStateOutOfService) {
        ch.adminOut = true;
        if (ch.call) {
            endCall(ch, call::Disconnected, reason::OutOfOrder, reason::DestOutOfOrder, ev);
        }
    } else {
        return kErrBadParameter;
    }
    refreshChanState(ch, ev);
    return 0;
}

std::uint32_t Model::reset(Channel& ch, std::vector<Event>& ev) {
    if (ch.call) {
        endCall(ch, call::Null, reason::Normal, reason::Normal, ev);
    }
    ch.adminOut = false;
    refreshChanState(ch, ev);
    return 0;
}

std::uint32_t Model::attachMedia(Channel& ch, std::vector<std::pair<std::uint32_t, Address>> media,
                                 std::vector<Event>& ev) {
    if (!ch.flexible) {
        return kErrNotSupported;
    }
    if (ch.mediaAttached) {
        return kErrBadState;
    }
    if (media.empty()) {
        return kErrBadParameter;
    }
    ch.media = std::move(media);
    ch.mediaAttached = true;
    refreshChanState(ch, ev);
    return 0;
}

std::uint32_t Model::detachMedia(Channel& ch, std::vector<Event>& ev) {
    if (!ch.mediaAttached) {
        return kErrBadState;
    }
    if (ch.call) {
        return kErrChannelBusy;
    }
    ch.media.clear();
    ch.mediaAttached = false;
    refreshChanState(ch, ev);
    return 0;
}

Event Model::lineEvent(const Line& line, Event::Kind kind, std::uint32_t type, std::uint32_t a,
                       std::uint32_t b) {
    Event e;
    e.kind = kind;
    e.source = line.lcon;
    e.group = type;
    e.type = type;
    e.a = a;
    e.b = b;
    return e;
}

std::uint32_t Model::setLineState(Line& line, std::uint32_t state, std::uint32_t why,
                                  std::vector<Event>& ev) {
    if (state != kInService && state != kOutOfService) {
        return kErrBadParameter;
    }
    if (why > 5) {
        return kErrBadParameter;
    }
    if (state == kInService && line.state == kInService) {
        return kErrAlreadyInService;
    }
    line.state = state;
    line.reason = why;
    ev.push_back(lineEvent(line, Event::Kind::LineState, kGroupLineState, state, why));
    for (Channel* ch : line.channels) {
        if (state == kOutOfService && ch->call) {
            endCall(*ch, call::Disconnected, reason::NetworkAlarm, reason::DestOutOfOrder, ev);
        }
        refreshChanState(*ch, ev);
    }
    return 0;
}

std::uint32_t Model::setDiagMode(Line& line, std::uint32_t mode, std::vector<Event>& ev) {
    if (mode > 2) {
        return kErrBadParameter;
    }
    bool was = line.diagMode != 0;
    line.diagMode = static_cast<std::uint8_t>(mode);
    if (was != (mode != 0)) {
        line.alarms[kAlarmLoopback] = mode != 0 ? 1 : 0;
        ev.push_back(
            lineEvent(line, Event::Kind::Alarm, kGroupAlarms, kAlarmLoopback, mode != 0 ? 1 : 0));
    }
    return 0;
}

std::uint32_t Model::sendAlarm(Line& line, std::uint32_t alarm, std::vector<Event>& ev) {
    if (alarm < 0x160B || alarm > 0x160E) {
        return kErrBadParameter;
    }
    if (line.transmitting.insert(alarm).second) {
        ev.push_back(lineEvent(line, Event::Kind::Alarm, kGroupAlarms, alarm, 1));
    }
    return 0;
}

std::uint32_t Model::stopAlarm(Line& line, std::uint32_t alarm, std::vector<Event>& ev) {
    if (line.transmitting.erase(alarm) == 0) {
        return kErrBadState;
    }
    ev.push_back(lineEvent(line, Event::Kind::Alarm, kGroupAlarms, alarm, 0));
    return 0;
}

std::uint8_t Model::alarmState(const Line& line, std::uint32_t alarm) const {
    if (line.transmitting.count(alarm)) {
        return 1;
    }
    auto it = line.alarms.find(alarm);
    return it == line.alarms.end() ? 0 : it->second;
}

const std::vector<std::uint32_t>& Model::reportedAlarms() {
    static const std::vector<std::uint32_t> kAll = {0x1601, 0x1602, 0x1603, 0x1604, 0x1605, 0x1606,
                                                    0x160A, 0x160B, 0x160C, 0x1616, 0x1617};
    return kAll;
}

std::uint32_t Model::farEndHangup(Channel& ch, std::vector<Event>& ev) {
    if (!ch.call || ended(*ch.call)) {
        return kErrNoSuchCall;
    }
    Channel* peer = ch.call->peer;
    if (peer && peer->call && peer->call->peer == &ch) {
        // The far end is a channel of the farm: it is the one that hangs up.
        endCall(*peer, call::Idle, reason::Normal, reason::Normal, ev);
    } else {
        ch.call->peer = nullptr;
        setCall(ch, call::Disconnected, reason::Normal, ev);
    }
    return 0;
}

std::uint32_t Model::setAlarm(Line& line, std::uint32_t alarm, bool on, std::vector<Event>& ev) {
    line.alarms[alarm] = on ? 1 : 0;
    ev.push_back(lineEvent(line, Event::Kind::Alarm, kGroupAlarms, alarm, on ? 1 : 0));
    return 0;
}

void Model::saturation(Line& line, std::uint32_t alarm, std::vector<Event>& ev) {
    (alarm == kAlarmBpvSaturation ? line.bpvCount : line.ferrCount)++;
    ev.push_back(lineEvent(line, Event::Kind::Alarm, kGroupAlarms, alarm, 1));
}

void Model::subscribe(const Address& component, Subscription s) {
    subs_[addressKey(component)].push_back(std::move(s));
}

void Model::cancel(const Address& component, const Address& owner, std::uint32_t trans,
                   const std::optional<std::uint32_t>& evtType) {
    auto it = subs_.find(addressKey(component));
    if (it == subs_.end()) {
        return;
    }
    auto& v = it->second;
    std::erase_if(v, [&](const Subscription& s) {
        return s.owner == owner && s.trans == trans && (!evtType || s.evtType == *evtType);
    });
    if (v.empty()) {
        subs_.erase(it);
    }
}

void Model::forget(const Address& host) {
    for (auto it = subs_.begin(); it != subs_.end();) {
        std::erase_if(it->second,
                      [&](const Subscription& s) { return s.owner == host || s.retAddr == host; });
        it = it->second.empty() ? subs_.erase(it) : std::next(it);
    }
}

void Model::subscribersOf(const Event& e, std::vector<const Subscription*>& out) const {
    out.clear();
    auto it = subs_.find(addressKey(e.source));
    if (it == subs_.end()) {
        return;
    }
    for (const Subscription& s : it->second) {
        if (s.evtType != e.type && s.evtType != e.group) {
            continue;
        }
        bool dup = std::any_of(out.begin(), out.end(), [&](const Subscription* o) {
            return o->retAddr == s.retAddr && o->trans == s.trans && o->group == s.group;
        });
        if (!dup) {
            out.push_back(&s);
        }
    }
}

std::size_t Model::subscriptionCount() const {
    std::size_t n = 0;
    for (const auto& [k, v] : subs_) {
        n += v.size();
    }
    return n;
}

}  // namespace sim
