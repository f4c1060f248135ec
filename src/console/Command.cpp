#include "console/Command.h"

namespace lineprobe {

std::string Command::GetCommandName() {
    return name_;
}

int Command::Execute() {
    return 0;
}

int Command::Execute(int, int) {
    return 0;
}

int Command::Execute(int, int, int) {
    return 0;
}

int Command::Execute(int, int, int, char*) {
    return 0;
}

int Command::Execute(std::string) {
    return 0;
}

void Command::SetView(View* view) {
    if (view != nullptr) {
        view_ = view;
    }
}

}  // namespace lineprobe
