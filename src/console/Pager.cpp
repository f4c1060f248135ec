#include "console/Pager.h"

#include <pthread.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <csignal>
#include <thread>

extern char** environ;

namespace lineprobe {

namespace {

// What g_pager holds besides the pid of a running pager.
constexpr pid_t IDLE = 0;
constexpr pid_t CLAIMED = -1;   // the shutdown has taken over; no pager may start
constexpr pid_t STARTING = -2;  // between the start of the spawn and the pid being known

std::atomic<pid_t> g_pager{IDLE};
static_assert(std::atomic<pid_t>::is_always_lock_free, "read in signal handlers");

// The signals that end the tool.
sigset_t EndingSignals() {
    sigset_t set;
    sigemptyset(&set);
    for (int sig : {SIGINT, SIGTERM, SIGUSR1, SIGHUP}) {
        sigaddset(&set, sig);
    }
    return set;
}

[[noreturn]] void Park() {
    for (;;) {
        pause();
    }
}

pid_t Spawn(const char* program, const std::string& file, int& error) {
    posix_spawnattr_t attributes;
    posix_spawnattr_init(&attributes);
    // The pager must die of the signals that end a program, whatever this process does
    // with them, and must not inherit a mask of the thread that starts it.
    sigset_t defaults = EndingSignals();
    for (int sig : {SIGQUIT, SIGPIPE, SIGALRM}) {
        sigaddset(&defaults, sig);
    }
    sigset_t none;
    sigemptyset(&none);
    posix_spawnattr_setsigdefault(&attributes, &defaults);
    posix_spawnattr_setsigmask(&attributes, &none);
    posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETSIGDEF | POSIX_SPAWN_SETSIGMASK);

    char* argv[] = {const_cast<char*>(program), const_cast<char*>(file.c_str()), nullptr};
    pid_t child = -1;
    error = posix_spawnp(&child, program, nullptr, &attributes, argv, environ);
    posix_spawnattr_destroy(&attributes);
    return error == 0 ? child : -1;
}

}  // namespace

int RunPager(const char* program, const std::string& file) {
    // Until the pid is recorded, a shutdown could not end the pager: the ending signals
    // wait on this thread, and one taken by another thread waits in EndPager.
    const sigset_t ending = EndingSignals();
    sigset_t previous;
    pthread_sigmask(SIG_BLOCK, &ending, &previous);
    pid_t idle = IDLE;
    if (!g_pager.compare_exchange_strong(idle, STARTING)) {
        Park();
    }
    int error = 0;
    const pid_t child = Spawn(program, file, error);
    g_pager.store(child > 0 ? child : IDLE);
    pthread_sigmask(SIG_SETMASK, &previous, nullptr);
    if (child <= 0) {
        errno = error;
        return -1;
    }

    // Waits without reaping: until it is reaped the pid stays the pager's, so a shutdown
    // that ends the pager meanwhile cannot hit another process.
    siginfo_t info{};
    while (waitid(P_PID, static_cast<id_t>(child), &info, WEXITED | WNOWAIT) != 0 &&
           errno == EINTR) {
    }
    pid_t mine = child;
    if (!g_pager.compare_exchange_strong(mine, IDLE)) {
        Park();
    }
    int status = 0;
    while (waitpid(child, &status, 0) < 0 && errno == EINTR) {
    }
    return status;
}

bool EndPager(std::chrono::milliseconds bound) {
    const auto deadline = std::chrono::steady_clock::now() + bound;
    pid_t seen = g_pager.load();
    for (;;) {
        if (seen == STARTING) {
            // Another thread is starting it: the spawn returns in a moment.
            if (std::chrono::steady_clock::now() >= deadline) {
                return false;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
            seen = g_pager.load();
            continue;
        }
        if (g_pager.compare_exchange_weak(seen, CLAIMED)) {
            break;
        }
    }
    if (seen <= 0) {
        return false;
    }

    kill(seen, SIGTERM);
    int status = 0;
    for (;;) {
        const pid_t reaped = waitpid(seen, &status, WNOHANG);
        if (reaped == seen || (reaped < 0 && errno != EINTR)) {
            return true;
        }
        if (std::chrono::steady_clock::now() >= deadline) {
            break;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    kill(seen, SIGKILL);
    while (waitpid(seen, &status, 0) < 0 && errno == EINTR) {
    }
    return true;
}

}  // namespace lineprobe
