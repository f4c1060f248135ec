// The call state machine of a channel: calls made, offered, answered, held, transferred and
// ended, and the channel state that service and media decide.
#include <string>

#include "sim/ErrorCodes.h"
#include "sim/Model.h"

namespace sim {

namespace {

bool ended(const Call& c) {
    return c.state == call::Idle || c.state == call::Null;
}

bool ringing(const Call& c) {
    return c.state == call::Offered || c.state == call::Accepted;
}

}  // namespace

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
    e.type = kChanStateTypeBase + ch.chanState;
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

}  // namespace sim
