#pragma once

#include <array>
#include <cstddef>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace lineprobe {

class CmdProcessor;
class Command;
class PhoneViewMgr;
class TrunkViewMgr;

// What a command may be given when it is made: the managers of the views it acts on.
struct CommandContext {
    PhoneViewMgr* phones = nullptr;
    TrunkViewMgr* trunks = nullptr;
};

struct CommandEntry {
    std::string_view word;
    // Where the command comes in the order of registration (from 0). Lookup does not depend
    // on it; the trace of start-up does.
    std::size_t registration;
    std::unique_ptr<Command> (*make)(std::string word, const CommandContext& context);
};

// Every command of the prompt, in the order start-up creates them.
extern const std::array<CommandEntry, 23> COMMAND_TABLE;

// One command of each entry of COMMAND_TABLE, in its order, each under its own word.
std::vector<std::unique_ptr<Command>> CreateCommands(const CommandContext& context);

// Registers the given commands in their order of registration in COMMAND_TABLE; a command
// whose word is not in that table comes last, in the order given. The results of
// RegisterCommand are not looked at.
void RegisterCommands(CmdProcessor& processor, const std::vector<Command*>& commands);

}  // namespace lineprobe
