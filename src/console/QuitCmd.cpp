#include "console/QuitCmd.h"

#include <csignal>

namespace lineprobe {

int QuitCmd::Execute() {
    raise(SIGUSR1);
    return 1;
}

int QuitCmd::Execute(int, int, int) {
    raise(SIGUSR1);
    return 1;
}

}  // namespace lineprobe
