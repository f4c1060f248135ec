#pragma once

#include <array>
#include <string_view>
#include <vector>

namespace lineprobe {

class CmdProcessor;
class Command;

// Every command word, in the order start-up creates the command objects.
inline constexpr std::array<std::string_view, 23> COMMAND_CREATION_ORDER = {
    "quit",       "help",      "phone",      "trunk",    "delphone", "makecall",
    "answer",     "accept",    "drop",       "release",  "chan_oos", "chan_ins",
    "trunk_ins",  "trunk_oos", "origaddr",   "destaddr", "deltrunk", "reset",
    "disablelbk", "linelbk",   "payloadlbk", "startrai", "stoprai"};

// The order of registration: that of creation, but for delphone ahead of trunk. Lookup
// does not depend on it; the trace of start-up does.
inline constexpr std::array<std::string_view, 23> COMMAND_REGISTRATION_ORDER = {
    "quit",       "help",      "phone",      "delphone", "trunk",    "makecall",
    "answer",     "accept",    "drop",       "release",  "chan_oos", "chan_ins",
    "trunk_ins",  "trunk_oos", "origaddr",   "destaddr", "deltrunk", "reset",
    "disablelbk", "linelbk",   "payloadlbk", "startrai", "stoprai"};

// Registers the given commands in the order of COMMAND_REGISTRATION_ORDER; a command
// whose word is not in that table comes last, in the order given. The results of
// RegisterCommand are not looked at.
void RegisterCommands(CmdProcessor& processor, const std::vector<Command*>& commands);

}  // namespace lineprobe
