// The control channel: what the network does to the farm, overrides of the answers, and the
// saturation bursts played a slice at a time.
#include <cstdio>
#include <string>

#include "sim/Emulation.h"
#include "sim/ErrorCodes.h"

namespace sim {

ControlOutcome Emulation::control(const std::string& line, Clock::time_point now) {
    ControlParse p = parseControl(line);
    if (!p.ok) {
        ControlOutcome o;
        if (!p.error.empty()) {
            o.reply = "error: " + p.error;
        }
        return o;
    }
    return control(p.cmd, now);
}

ControlOutcome Emulation::control(const ControlCommand& cmd, Clock::time_point now) {
    now_ = now;
    ControlOutcome o;
    scratch_.clear();
    auto lineOf = [&](Line*& l) {
        l = model_.line(cmd.board, static_cast<int>(cmd.trunk));
        if (!l) {
            o.reply = "error: no line " + std::to_string(cmd.board) + "." +
                      std::to_string(cmd.trunk) + " in this farm";
        }
        return l != nullptr;
    };
    auto channelOf = [&](Channel*& c) {
        c = model_.channel(cmd.board, static_cast<int>(cmd.trunk), static_cast<int>(cmd.channel));
        if (!c) {
            o.reply = "error: no channel " + std::to_string(cmd.board) + "." +
                      std::to_string(cmd.trunk) + "." + std::to_string(cmd.channel) +
                      " in this farm";
        }
        return c != nullptr;
    };
    auto codeText = [](std::uint32_t code) -> std::string {
        switch (code) {
            case kErrChannelBusy:
                return "error: the channel already has a call";
            case kErrOutOfService:
                return "error: the channel is out of service";
            case kErrNoSuchCall:
                return "error: the channel has no call";
            default:
                return "error: refused";
        }
    };
    Line* l = nullptr;
    Channel* c = nullptr;
    switch (cmd.kind) {
        case ControlKind::Call: {
            if (!channelOf(c)) {
                break;
            }
            std::uint32_t id = 0;
            std::uint32_t code = model_.incomingCall(*c, cmd.from, id, scratch_);
            char buf[32];
            std::snprintf(buf, sizeof buf, "0x%x", id);
            o.reply = code == 0 ? std::string("ok call ") + buf : codeText(code);
            break;
        }
        case ControlKind::Hangup: {
            if (!channelOf(c)) {
                break;
            }
            std::uint32_t code = model_.farEndHangup(*c, scratch_);
            o.reply = code == 0 ? "ok" : codeText(code);
            break;
        }
        case ControlKind::Alarm:
            if (lineOf(l)) {
                model_.setAlarm(*l, cmd.alarmId, cmd.on, scratch_);
                o.reply = "ok";
            }
            break;
        case ControlKind::Bpv:
        case ControlKind::Ferr:
            if (lineOf(l)) {
                if (cmd.count > 0) {
                    bursts_.push_back(Burst{
                        cmd.board, static_cast<int>(cmd.trunk),
                        cmd.kind == ControlKind::Bpv ? kAlarmBpvSaturation : kAlarmFerrSaturation,
                        cmd.count});
                }
                o.reply = "ok " + std::to_string(cmd.count);
            }
            break;
        case ControlKind::Line:
            if (lineOf(l)) {
                std::uint32_t state = cmd.on ? kInService : kOutOfService;
                if (l->state == state) {
                    o.reply = std::string("error: the line is already ") +
                              (cmd.on ? "in service" : "out of service");
                } else {
                    model_.setLineState(*l, state, cmd.reason, scratch_);
                    o.reply = "ok";
                }
            }
            break;
        case ControlKind::Refuse:
            overrides_[cmd.msgType] = {Override::Refuse, cmd.code};
            o.reply = "ok";
            break;
        case ControlKind::Silence:
            overrides_[cmd.msgType] = {Override::Silence, 0};
            o.reply = "ok";
            break;
        case ControlKind::Normal:
            overrides_.erase(cmd.msgType);
            o.reply = "ok";
            break;
        case ControlKind::Delay:
            delayMs_ = cmd.delayMs;
            o.reply = "ok";
            break;
        case ControlKind::Drop:
            o.drop = true;
            o.reply = "ok";
            break;
        case ControlKind::Stats:
            o.reply = "ok stats requests=" + std::to_string(stats_.requests) +
                      " answers=" + std::to_string(stats_.answers) +
                      " events=" + std::to_string(stats_.events) +
                      " refused=" + std::to_string(stats_.refused) +
                      " silenced=" + std::to_string(stats_.silenced) +
                      " unanswered=" + std::to_string(stats_.unanswered) +
                      " undeliverable=" + std::to_string(stats_.undeliverable) +
                      " subscriptions=" + std::to_string(model_.subscriptionCount());
            break;
        case ControlKind::Help:
            o.reply = controlHelp();
            break;
        case ControlKind::Quit:
            o.quit = true;
            o.reply = "ok bye";
            break;
    }
    publish(scratch_);
    return o;
}

bool Emulation::pumpBursts(std::size_t maxEvents, Clock::time_point now) {
    now_ = now;
    std::size_t done = 0;
    while (!bursts_.empty() && done < maxEvents) {
        Burst& b = bursts_.front();
        Line* l = model_.line(b.board, b.trunk);
        scratch_.clear();
        while (l && b.left > 0 && done < maxEvents) {
            model_.saturation(*l, b.alarm, scratch_);
            --b.left;
            ++done;
        }
        publish(scratch_);
        if (!l || b.left == 0) {
            bursts_.pop_front();
        }
    }
    return !bursts_.empty();
}

}  // namespace sim
