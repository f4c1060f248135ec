#pragma once

#include <cstddef>
#include <map>
#include <string>

#include "console/CommandLine.h"

namespace lineprobe {

class Command;
class View;

// Longest command line kept from the keyboard; typing past it is dropped. Roomy enough
// for a full word, three numbers and a full text field.
constexpr std::size_t MAX_LINE_LENGTH = 1024;

// The prompt of the command window: reads a line, finds the command by its first word
// and calls the Execute overload for the number of fields. Runs on the main thread.
class CmdProcessor {
  public:
    // Prints the first prompt and turns echo on. A null view (for tests of the table)
    // draws nothing.
    explicit CmdProcessor(View* view);
    virtual ~CmdProcessor() = default;

    // The main loop; returns when a command asks to stop or the keyboard is gone.
    virtual int ProcessCommands();
    // Exact, case-sensitive lookup; null when no command has that name.
    virtual Command* FindCommand(std::string word);

    // 0, -1 when the name is taken (the first command keeps it), -2 for null.
    int RegisterCommand(Command* command);

  private:
    std::map<std::string, Command*> commands_;
    View* view_;
    // Kept from one line to the next: a blank line looks the previous word up again.
    char word_[MAX_BUFFER_SIZE] = {};
};

}  // namespace lineprobe
