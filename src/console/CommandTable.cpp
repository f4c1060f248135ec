#include "console/CommandTable.h"

#include <algorithm>
#include <limits>
#include <utility>

#include "console/AcceptCallCmd.h"
#include "console/AnswerCallCmd.h"
#include "console/ChanStateInServiceCmd.h"
#include "console/ChanStateOutOfServiceCmd.h"
#include "console/CmdProcessor.h"
#include "console/DeletePhoneCmd.h"
#include "console/DeleteTrunkCmd.h"
#include "console/DestAddrCmd.h"
#include "console/DisableLoopBackCmd.h"
#include "console/DropCallCmd.h"
#include "console/EnableLineLoopBackCmd.h"
#include "console/EnablePayloadLoopBackCmd.h"
#include "console/HelpCmd.h"
#include "console/MakeCallCmd.h"
#include "console/NewPhoneCmd.h"
#include "console/NewTrunkCmd.h"
#include "console/OrigAddrCmd.h"
#include "console/QuitCmd.h"
#include "console/ReleaseCallCmd.h"
#include "console/ResetChanCmd.h"
#include "console/StartTxRAICmd.h"
#include "console/StopTxRAICmd.h"
#include "console/TrunkStateInServiceCmd.h"
#include "console/TrunkStateOutOfServiceCmd.h"

namespace lineprobe {

namespace {

template <class C>
std::unique_ptr<Command> Phone(std::string word, const CommandContext& context) {
    return std::make_unique<C>(std::move(word), context.phones);
}

template <class C>
std::unique_ptr<Command> Trunk(std::string word, const CommandContext& context) {
    return std::make_unique<C>(std::move(word), context.trunks);
}

std::unique_ptr<Command> Quit(std::string word, const CommandContext&) {
    return std::make_unique<QuitCmd>(std::move(word));
}

std::unique_ptr<Command> Help(std::string word, const CommandContext& context) {
    return std::make_unique<HelpCmd>(std::move(word), "lineprobe_help.txt", context.phones,
                                     context.trunks);
}

}  // namespace

// delphone is registered ahead of trunk, though made after it.
const std::array<CommandEntry, 23> COMMAND_TABLE = {{
    {"quit", 0, Quit},
    {"help", 1, Help},
    {"phone", 2, Phone<NewPhoneCmd>},
    {"trunk", 4, Trunk<NewTrunkCmd>},
    {"delphone", 3, Phone<DeletePhoneCmd>},
    {"makecall", 5, Phone<MakeCallCmd>},
    {"answer", 6, Phone<AnswerCallCmd>},
    {"accept", 7, Phone<AcceptCallCmd>},
    {"drop", 8, Phone<DropCallCmd>},
    {"release", 9, Phone<ReleaseCallCmd>},
    {"chan_oos", 10, Phone<ChanStateOutOfServiceCmd>},
    {"chan_ins", 11, Phone<ChanStateInServiceCmd>},
    {"trunk_ins", 12, Trunk<TrunkStateInServiceCmd>},
    {"trunk_oos", 13, Trunk<TrunkStateOutOfServiceCmd>},
    {"origaddr", 14, Phone<OrigAddrCmd>},
    {"destaddr", 15, Phone<DestAddrCmd>},
    {"deltrunk", 16, Trunk<DeleteTrunkCmd>},
    {"reset", 17, Phone<ResetChanCmd>},
    {"disablelbk", 18, Trunk<DisableLoopBackCmd>},
    {"linelbk", 19, Trunk<EnableLineLoopBackCmd>},
    {"payloadlbk", 20, Trunk<EnablePayloadLoopBackCmd>},
    {"startrai", 21, Trunk<StartTxRAICmd>},
    {"stoprai", 22, Trunk<StopTxRAICmd>},
}};

std::vector<std::unique_ptr<Command>> CreateCommands(const CommandContext& context) {
    std::vector<std::unique_ptr<Command>> commands;
    commands.reserve(COMMAND_TABLE.size());
    for (const CommandEntry& entry : COMMAND_TABLE) {
        commands.push_back(entry.make(std::string(entry.word), context));
    }
    return commands;
}

void RegisterCommands(CmdProcessor& processor, const std::vector<Command*>& commands) {
    constexpr std::size_t UNKNOWN = std::numeric_limits<std::size_t>::max();
    std::vector<std::pair<std::size_t, Command*>> ranked;
    for (Command* command : commands) {
        if (command == nullptr) {
            continue;
        }
        const std::string word = command->GetCommandName();
        const auto entry = std::find_if(COMMAND_TABLE.begin(), COMMAND_TABLE.end(),
                                        [&](const CommandEntry& e) { return e.word == word; });
        ranked.emplace_back(entry != COMMAND_TABLE.end() ? entry->registration : UNKNOWN, command);
    }
    std::stable_sort(ranked.begin(), ranked.end(),
                     [](const auto& a, const auto& b) { return a.first < b.first; });
    for (const auto& entry : ranked) {
        processor.RegisterCommand(entry.second);
    }
}

}  // namespace lineprobe
