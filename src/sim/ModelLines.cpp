// Line control: line state, diagnostic mode, alarms received and transmitted, saturation counts.
#include "catalogue/generated/values.h"
#include "sim/ErrorCodes.h"
#include "sim/Model.h"

namespace sim {

namespace Alarm = tolk::wire::LCON::Alarm;

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
    if (alarm < Alarm::TRANSMIT_RAI || alarm > Alarm::TRANSMIT_AIS_TS16) {
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
    static const std::vector<std::uint32_t> kAll = {Alarm::RED,
                                                    Alarm::YELLOW,
                                                    Alarm::AIS,
                                                    Alarm::LOS,
                                                    Alarm::LOOPBACK,
                                                    Alarm::RAI_CRC,
                                                    Alarm::D_CHANNEL,
                                                    Alarm::TRANSMIT_RAI,
                                                    Alarm::TRANSMIT_AIS,
                                                    Alarm::BPV_SATURATION,
                                                    Alarm::FERR_SATURATION};
    return kAll;
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

}  // namespace sim
