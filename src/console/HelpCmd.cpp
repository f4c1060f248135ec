#include "console/HelpCmd.h"

#include <sys/wait.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <iostream>

#include "console/ConsoleDisplay.h"
#include "console/Pager.h"
#include "console/PhoneViewMgr.h"
#include "console/TrunkViewMgr.h"
#include "console/View.h"

namespace lineprobe {

namespace {

constexpr const char* PAGER = "less";

}  // namespace

std::string HelpCmd::HelpFilePath(const std::string& directory, const std::string& fileName) {
    return directory + "bin/" + fileName;
}

std::optional<std::string> HelpCmd::BuildPagerCommand(const std::string& directory,
                                                      const std::string& fileName) {
    std::string command = std::string(PAGER) + " " + HelpFilePath(directory, fileName);
    if (command.size() >= MAX_FILENAME_SIZE) {
        return std::nullopt;
    }
    return command;
}

int HelpCmd::Execute() {
    View* phoneWindow = phoneViewMgr_ != nullptr ? phoneViewMgr_->GetView() : nullptr;
    View* trunkWindow = trunkViewMgr_ != nullptr ? trunkViewMgr_->GetView() : nullptr;
    if (phoneWindow != nullptr) {
        phoneWindow->DisableRefresh();
    }
    if (trunkWindow != nullptr) {
        trunkWindow->DisableRefresh();
    }
    ConsoleDisplay* display = ConsoleDisplay::GetDisplay();
    display->Suspend();

    const char* directory = std::getenv(envVarName_);
    if (directory != nullptr) {
        orvaneDir_ = directory;
        const std::optional<std::string> command = BuildPagerCommand(orvaneDir_, helpFileName_);
        if (!command) {
            std::cerr << "help not shown: the pager command line for " << envVarName_ << "="
                      << orvaneDir_ << " would be longer than " << MAX_FILENAME_SIZE - 1
                      << " characters" << std::endl;
        } else {
            std::cout << *command << std::endl;
            // The pager's own messages (a missing file, say) are on the screen it
            // leaves; the log only records that it did not end cleanly.
            const int status = RunPager(PAGER, HelpFilePath(orvaneDir_, helpFileName_));
            if (status == -1) {
                std::cerr << "help: unable to run \"" << *command << "\": " << std::strerror(errno)
                          << std::endl;
            } else if (!WIFEXITED(status) || WEXITSTATUS(status) != 0) {
                std::cerr << "help: \"" << *command << "\" ended with status "
                          << (WIFEXITED(status) ? WEXITSTATUS(status) : -1) << std::endl;
            }
        }
    }

    // Refresh comes back before the repaint, which then shows what events drew on the
    // rows while the pager had the terminal.
    if (phoneWindow != nullptr) {
        phoneWindow->EnableRefresh();
    }
    if (trunkWindow != nullptr) {
        trunkWindow->EnableRefresh();
    }
    display->Resume();
    return 0;
}

int HelpCmd::Execute(int, int, int) {
    return 0;
}

}  // namespace lineprobe
