#pragma once

#include <cstddef>
#include <optional>
#include <string>

#include "console/Command.h"

namespace lineprobe {

class PhoneViewMgr;
class TrunkViewMgr;

// Room for the pager command line, terminator included.
constexpr std::size_t MAX_FILENAME_SIZE = 256;

// `help`: shows the help file in the pager `less`, found under the install directory
// named by CORVO_ORVANE_DIR (with its trailing slash) in "bin/". The pager is run without
// a shell, so the directory may hold any character. The display is
// suspended while the pager has the terminal, so rows that change meanwhile are drawn
// only when the screen comes back.
// The phone and trunk views windows also have their refresh turned off meanwhile.
class HelpCmd : public Command {
  public:
    HelpCmd(std::string name, std::string helpFileName, PhoneViewMgr* phoneViewMgr = nullptr,
            TrunkViewMgr* trunkViewMgr = nullptr)
        : Command(std::move(name)),
          phoneViewMgr_(phoneViewMgr),
          trunkViewMgr_(trunkViewMgr),
          helpFileName_(std::move(helpFileName)) {}

    using Command::Execute;
    int Execute() override;
    int Execute(int board, int line, int chan) override;

    // directory + "bin/" + file: the pager's one argument.
    static std::string HelpFilePath(const std::string& directory, const std::string& fileName);
    // "less " + the help file's path, as the trace shows it, or nothing when that would
    // not fit in MAX_FILENAME_SIZE with its terminator.
    static std::optional<std::string> BuildPagerCommand(const std::string& directory,
                                                        const std::string& fileName);

  private:
    PhoneViewMgr* phoneViewMgr_;
    TrunkViewMgr* trunkViewMgr_;
    std::string helpFileName_;
    std::string orvaneDir_;
    const char* envVarName_ = "CORVO_ORVANE_DIR";
};

}  // namespace lineprobe
