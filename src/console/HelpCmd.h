#pragma once

#include <cstddef>
#include <optional>
#include <string>

#include "console/Command.h"

namespace lineprobe {

// Room for the pager command line, terminator included.
constexpr std::size_t MAX_FILENAME_SIZE = 256;

// `help`: shows the help file in the pager `less`, found under the install directory
// named by CORVO_ORVANE_DIR (with its trailing slash) in "bin/". The display is
// suspended while the pager has the terminal, so rows that change meanwhile are drawn
// only when the screen comes back.
//
// The phone and trunk view managers join this command with the views; their windows'
// refresh is turned off around the pager as well.
class HelpCmd : public Command {
  public:
    HelpCmd(std::string name, std::string helpFileName)
        : Command(std::move(name)), helpFileName_(std::move(helpFileName)) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line, int chan) override;

    // "less " + directory + "bin/" + file, or nothing when that would not fit in
    // MAX_FILENAME_SIZE with its terminator.
    static std::optional<std::string> BuildPagerCommand(const std::string& directory,
                                                        const std::string& fileName);

  private:
    std::string helpFileName_;
    std::string orvaneDir_;
    const char* envVarName_ = "CORVO_ORVANE_DIR";
};

}  // namespace lineprobe
