#include "console/Pager.h"

#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>

extern char** environ;

namespace lineprobe {

namespace {

// The signals that end a program: the pager must die of them, whatever this process does
// with them.
sigset_t DefaultSignals() {
    sigset_t set;
    sigemptyset(&set);
    for (int sig : {SIGINT, SIGTERM, SIGUSR1, SIGHUP, SIGQUIT, SIGPIPE, SIGALRM}) {
        sigaddset(&set, sig);
    }
    return set;
}

}  // namespace

int RunPager(const char* program, const std::string& file) {
    posix_spawnattr_t attributes;
    posix_spawnattr_init(&attributes);
    // Nor may it inherit the signal mask of the thread that starts it.
    const sigset_t defaults = DefaultSignals();
    sigset_t none;
    sigemptyset(&none);
    posix_spawnattr_setsigdefault(&attributes, &defaults);
    posix_spawnattr_setsigmask(&attributes, &none);
    posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETSIGDEF | POSIX_SPAWN_SETSIGMASK);

    char* argv[] = {const_cast<char*>(program), const_cast<char*>(file.c_str()), nullptr};
    pid_t child = -1;
    const int error = posix_spawnp(&child, program, nullptr, &attributes, argv, environ);
    posix_spawnattr_destroy(&attributes);
    if (error != 0) {
        errno = error;
        return -1;
    }
    int status = 0;
    while (waitpid(child, &status, 0) < 0 && errno == EINTR) {
    }
    return status;
}

}  // namespace lineprobe
