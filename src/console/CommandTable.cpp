#include "console/CommandTable.h"

#include <algorithm>
#include <string>

#include "console/CmdProcessor.h"
#include "console/Command.h"

namespace lineprobe {

void RegisterCommands(CmdProcessor& processor, const std::vector<Command*>& commands) {
    std::vector<Command*> pending;
    for (Command* command : commands) {
        if (command != nullptr) {
            pending.push_back(command);
        }
    }
    for (std::string_view word : COMMAND_REGISTRATION_ORDER) {
        for (auto it = pending.begin(); it != pending.end();) {
            if ((*it)->GetCommandName() == word) {
                processor.RegisterCommand(*it);
                it = pending.erase(it);
            } else {
                ++it;
            }
        }
    }
    for (Command* command : pending) {
        processor.RegisterCommand(command);
    }
}

}  // namespace lineprobe
