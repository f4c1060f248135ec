#include "sim/Control.h"

#include <charconv>
#include <vector>

#include "catalogue/generated/values.h"
#include "sim/ErrorCodes.h"

namespace sim {
namespace {

std::vector<std::string_view> splitWords(std::string_view line) {
    std::vector<std::string_view> words;
    size_t i = 0;
    while (i < line.size()) {
        while (i < line.size() && (line[i] == ' ' || line[i] == '\t' || line[i] == '\r')) {
            ++i;
        }
        size_t start = i;
        while (i < line.size() && line[i] != ' ' && line[i] != '\t' && line[i] != '\r') {
            ++i;
        }
        if (i > start) {
            words.push_back(line.substr(start, i - start));
        }
    }
    return words;
}

bool parseNumber(std::string_view text, int base, std::uint32_t& out) {
    if (base == 16 && text.size() > 2 && text[0] == '0' && (text[1] == 'x' || text[1] == 'X')) {
        text.remove_prefix(2);
    }
    if (text.empty()) {
        return false;
    }
    std::uint32_t value = 0;
    auto [end, ec] = std::from_chars(text.data(), text.data() + text.size(), value, base);
    if (ec != std::errc() || end != text.data() + text.size()) {
        return false;
    }
    out = value;
    return true;
}

struct Parser {
    std::vector<std::string_view> words;
    ControlParse result;

    bool fail(std::string message) {
        result.ok = false;
        result.error = std::move(message);
        return false;
    }

    bool arity(size_t least, size_t most) {
        size_t n = words.size() - 1;
        if (n < least || n > most) {
            std::string want = least == most
                                   ? std::to_string(least)
                                   : std::to_string(least) + " to " + std::to_string(most);
            return fail(std::string(words[0]) + " takes " + want + " argument" +
                        (most == 1 ? "" : "s") + ", got " + std::to_string(n));
        }
        return true;
    }

    bool number(size_t index, const char* what, std::uint32_t& out, std::uint32_t max) {
        if (!parseNumber(words[index], 10, out) || out > max) {
            return fail(std::string(what) + " must be a number from 0 to " + std::to_string(max) +
                        ", not \"" + std::string(words[index]) + "\"");
        }
        return true;
    }

    bool hex(size_t index, const char* what, std::uint32_t& out) {
        if (!parseNumber(words[index], 16, out)) {
            return fail(std::string(what) + " must be a hex number, not \"" +
                        std::string(words[index]) + "\"");
        }
        return true;
    }

    bool boardTrunk() {
        std::uint32_t b = 0, t = 0;
        if (!number(1, "board", b, 32) || !number(2, "trunk", t, 64)) {
            return false;
        }
        result.cmd.board = b;
        result.cmd.trunk = t;
        return true;
    }

    bool boardTrunkChannel() {
        std::uint32_t c = 0;
        if (!boardTrunk() || !number(3, "channel", c, 31)) {
            return false;
        }
        result.cmd.channel = c;
        return true;
    }

    bool run() {
        ControlCommand& cmd = result.cmd;
        std::string_view verb = words[0];
        if (verb == "call") {
            cmd.kind = ControlKind::Call;
            if (!arity(4, 4) || !boardTrunkChannel()) {
                return false;
            }
            cmd.from = std::string(words[4]);
            if (cmd.from.size() > 127) {
                return fail("FROM is longer than 127 characters");
            }
        } else if (verb == "hangup") {
            cmd.kind = ControlKind::Hangup;
            if (!arity(3, 3) || !boardTrunkChannel()) {
                return false;
            }
        } else if (verb == "alarm") {
            cmd.kind = ControlKind::Alarm;
            if (!arity(4, 4) || !boardTrunk()) {
                return false;
            }
            if (!alarmByName(words[3], cmd.alarmId)) {
                return fail("unknown alarm \"" + std::string(words[3]) +
                            "\" (red, yellow, ais, los, loopback, raicrc, dchan)");
            }
            if (words[4] == "on") {
                cmd.on = true;
            } else if (words[4] == "off") {
                cmd.on = false;
            } else {
                return fail("alarm state must be on or off, not \"" + std::string(words[4]) + "\"");
            }
        } else if (verb == "bpv" || verb == "ferr") {
            cmd.kind = verb == "bpv" ? ControlKind::Bpv : ControlKind::Ferr;
            if (!arity(3, 3) || !boardTrunk() || !number(3, "N", cmd.count, kMaxBurst)) {
                return false;
            }
        } else if (verb == "line") {
            cmd.kind = ControlKind::Line;
            if (!arity(3, 4) || !boardTrunk()) {
                return false;
            }
            if (words[3] == "in") {
                cmd.on = true;
            } else if (words[3] == "out") {
                cmd.on = false;
            } else {
                return fail("line state must be in or out, not \"" + std::string(words[3]) + "\"");
            }
            if (words.size() == 5 && !number(4, "REASON", cmd.reason, 5)) {
                return false;
            }
        } else if (verb == "refuse") {
            cmd.kind = ControlKind::Refuse;
            cmd.code = kErrRefused;
            if (!arity(1, 2) || !hex(1, "TYPE", cmd.msgType)) {
                return false;
            }
            if (words.size() == 3 && !hex(2, "CODE", cmd.code)) {
                return false;
            }
        } else if (verb == "silence" || verb == "normal") {
            cmd.kind = verb == "silence" ? ControlKind::Silence : ControlKind::Normal;
            if (!arity(1, 1) || !hex(1, "TYPE", cmd.msgType)) {
                return false;
            }
        } else if (verb == "delay") {
            cmd.kind = ControlKind::Delay;
            if (!arity(1, 1) || !number(1, "MS", cmd.delayMs, kMaxDelayMs)) {
                return false;
            }
        } else if (verb == "drop" || verb == "stats" || verb == "help" || verb == "quit") {
            cmd.kind = verb == "drop"    ? ControlKind::Drop
                       : verb == "stats" ? ControlKind::Stats
                       : verb == "help"  ? ControlKind::Help
                                         : ControlKind::Quit;
            if (!arity(0, 0)) {
                return false;
            }
        } else {
            return fail("unknown command \"" + std::string(verb) + "\" (try help)");
        }
        result.ok = true;
        return true;
    }
};

}  // namespace

bool alarmByName(std::string_view name, std::uint32_t& alarmId) {
    namespace Alarm = tolk::wire::LCON::Alarm;
    static constexpr struct {
        std::string_view name;
        std::uint32_t id;
    } kAlarms[] = {
        {"red", Alarm::RED},         {"yellow", Alarm::YELLOW},     {"ais", Alarm::AIS},
        {"los", Alarm::LOS},         {"loopback", Alarm::LOOPBACK}, {"raicrc", Alarm::RAI_CRC},
        {"dchan", Alarm::D_CHANNEL},
    };
    for (const auto& a : kAlarms) {
        if (a.name == name) {
            alarmId = a.id;
            return true;
        }
    }
    return false;
}

ControlParse parseControl(std::string_view line) {
    Parser p;
    p.words = splitWords(line);
    if (p.words.empty() || p.words[0].front() == '#') {
        return p.result;
    }
    p.run();
    return p.result;
}

const char* controlHelp() {
    return "ok commands: call B T C FROM | hangup B T C | alarm B T red|yellow|ais|los|loopback|"
           "raicrc|dchan on|off | bpv B T N | ferr B T N | line B T in|out [REASON 0-5] | "
           "refuse TYPE [CODE] | silence TYPE | normal TYPE | delay MS | drop | stats | quit "
           "(TYPE and CODE in hex)";
}

ScriptParse parseScript(std::string_view text) {
    ScriptParse out;
    unsigned int number = 0;
    while (!text.empty()) {
        std::size_t nl = text.find('\n');
        std::string_view line = text.substr(0, nl);
        text.remove_prefix(nl == std::string_view::npos ? text.size() : nl + 1);
        ++number;
        std::vector<std::string_view> words = splitWords(line);
        if (words.empty() || words[0].front() == '#') {
            continue;
        }
        ScriptStep step;
        step.line = number;
        if (words[0] == "sleep") {
            if (words.size() != 2 || !parseNumber(words[1], 10, step.sleepMs) ||
                step.sleepMs > kMaxSleepMs) {
                out.error = "line " + std::to_string(number) +
                            ": sleep takes a number of milliseconds from 0 to " +
                            std::to_string(kMaxSleepMs);
                out.steps.clear();
                return out;
            }
        } else {
            ControlParse p = parseControl(line);
            if (!p.ok) {
                out.error = "line " + std::to_string(number) + ": " + p.error;
                out.steps.clear();
                return out;
            }
            step.command = std::string(line);
        }
        out.steps.push_back(std::move(step));
    }
    out.ok = true;
    return out;
}

}  // namespace sim
