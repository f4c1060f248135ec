// The control language of the emulation: one command a line, as a script or an operator types it
// to inject what a real network would do.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace sim {

enum class ControlKind {
    Call,     // call B T C FROM       an incoming call from FROM offered on channel B.T.C
    Hangup,   // hangup B T C          the far end of the call on B.T.C hangs up
    Alarm,    // alarm B T NAME on|off  a line alarm raised or cleared
    Bpv,      // bpv B T N             N bipolar-violation saturation events
    Ferr,     // ferr B T N            N frame-error saturation events
    Line,     // line B T in|out [R]   the line goes in or out of service, reason R (0..5)
    Refuse,   // refuse TYPE [CODE]    answer that message type with MsgError_t(CODE)
    Silence,  // silence TYPE          answer that message type not at all
    Normal,   // normal TYPE           answer that message type normally again
    Delay,    // delay MS              hold every answer and event MS milliseconds
    Drop,     // drop                  close every relay connection
    Stats,    // stats                 counters
    Help,     // help                  the list of commands
    Quit      // quit                  end the relay
};

struct ControlCommand {
    ControlKind kind = ControlKind::Help;
    unsigned int board = 0;
    unsigned int trunk = 0;
    unsigned int channel = 0;
    std::string from{};         // Call: the calling number
    std::uint32_t alarmId = 0;  // Alarm: the alarm number the name stands for
    bool on = false;            // Alarm: on; Line: in service
    std::uint32_t count = 0;    // Bpv, Ferr
    std::uint32_t reason = 0;   // Line
    std::uint32_t msgType = 0;  // Refuse, Silence, Normal
    std::uint32_t code = 0;     // Refuse
    std::uint32_t delayMs = 0;  // Delay
};

struct ControlParse {
    bool ok = false;
    ControlCommand cmd;
    std::string error;  // without the "error: " prefix
};

// Parses one line. Numbers are decimal but for TYPE and CODE, which are hex (an "0x" prefix is
// allowed). Blank lines and lines starting with '#' are not commands (ok false, error empty).
ControlParse parseControl(std::string_view line);

// Alarm names of the control language, and the alarm numbers they stand for.
bool alarmByName(std::string_view name, std::uint32_t& alarmId);

// Largest N accepted by bpv and ferr, and largest delay.
constexpr std::uint32_t kMaxBurst = 10'000'000;
constexpr std::uint32_t kMaxDelayMs = 600'000;

const char* controlHelp();

// A scenario: control commands with "sleep MS" between them, '#' comment lines and blank lines.
struct ScriptStep {
    unsigned int line = 0;      // in the file, from 1
    std::uint32_t sleepMs = 0;  // a sleep when command is empty
    std::string command;
};

struct ScriptParse {
    bool ok = false;
    std::vector<ScriptStep> steps;
    std::string error;  // "line N: why"
};

constexpr std::uint32_t kMaxSleepMs = 3'600'000;

// Checks every line before anything is played: one bad line refuses the whole script.
ScriptParse parseScript(std::string_view text);

}  // namespace sim
