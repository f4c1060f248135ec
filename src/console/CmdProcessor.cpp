#include "console/CmdProcessor.h"

#include <iostream>

#include "console/Command.h"
#include "console/ConsoleDisplay.h"
#include "console/View.h"

namespace lineprobe {

namespace {

constexpr int PROMPT_ROW = 1;
constexpr int RESULT_ROW = 2;
constexpr int MESSAGE_COL = 1;
constexpr const char* PROMPT = "-> ";

}  // namespace

CmdProcessor::CmdProcessor(View* view) : view_(view) {
    if (view_ == nullptr) {
        return;
    }
    view_->PrintString(PROMPT, PROMPT_ROW, MESSAGE_COL);
    view_->Refresh();
    view_->GetDisplay()->SetEcho(true);
}

int CmdProcessor::RegisterCommand(Command* command) {
    if (command == nullptr) {
        return -2;
    }
    std::cout << "Calling CmdProcessor::RegisterCommand" << std::endl;
    const std::string name = command->GetCommandName();
    std::cout << "command name: " << name << std::endl;
    command->SetView(view_);
    return commands_.emplace(name, command).second ? 0 : -1;
}

Command* CmdProcessor::FindCommand(std::string word) {
    std::cout << "Calling CmdProcessor::FindCommand: cmdStr= " << word << std::endl;
    const auto found = commands_.find(word);
    return found == commands_.end() ? nullptr : found->second;
}

int CmdProcessor::ProcessCommands() {
    if (view_ == nullptr) {
        return 0;
    }
    std::string line;
    for (;;) {
        int stop = 0;
        view_->ClearToEOL(PROMPT_ROW, MESSAGE_COL);
        view_->PrintString(PROMPT, PROMPT_ROW, MESSAGE_COL);

        if (view_->ReadLine(line, MAX_LINE_LENGTH) == ConsoleWindow::LineStatus::InputClosed) {
            std::cerr << "keyboard input closed: leaving the command loop" << std::endl;
            return 0;
        }
        int board = 0;
        int trunk = 0;
        int chan = 0;
        char text[MAX_BUFFER_SIZE] = {};
        const int validArgs = ScanCommandLine(line, word_, board, trunk, chan, text);
        std::cout << "validArgs: " << validArgs << std::endl;
        const std::string word(word_);

        // The line read has left the cursor at the start of the result row, and row 5
        // lies outside this 5-row window, so this wipes the previous command's message.
        view_->ClearAll(5);

        Command* command = FindCommand(word);
        if (command == nullptr) {
            view_->PrintString("Unrecgnized Command", RESULT_ROW, MESSAGE_COL);
            continue;
        }
        switch (validArgs) {
            case 1:
                stop = command->Execute();
                break;
            case 3:
                stop = command->Execute(board, trunk);
                break;
            case 4:
                stop = command->Execute(board, trunk, chan);
                break;
            case 5:
                stop = command->Execute(board, trunk, chan, text);
                break;
            default:
                break;
        }
        if (stop != 0) {
            return 0;
        }
    }
}

}  // namespace lineprobe
