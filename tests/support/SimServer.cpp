#include "SimServer.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <cstring>

namespace lineprobe::testing {

SimServer::SimServer(const std::string& farmFile, const std::vector<std::string>& extraArgs)
    : farm_(farmFile), extraArgs_(extraArgs) {
    Launch("0");
}

SimServer::~SimServer() {
    Kill();
}

void SimServer::Launch(const std::string& port) {
    std::vector<std::string> args = {VX7SIM_BINARY, "--farm", farm_,      "--port",
                                     port,          "--bind", "127.0.0.1"};
    args.insert(args.end(), extraArgs_.begin(), extraArgs_.end());
    std::vector<char*> argv;
    for (std::string& a : args) {
        argv.push_back(a.data());
    }
    argv.push_back(nullptr);
    int in[2];
    int out[2];
    if (pipe2(in, O_CLOEXEC) != 0) {
        return;
    }
    if (pipe2(out, O_CLOEXEC) != 0) {
        close(in[0]);
        close(in[1]);
        return;
    }
    pid_ = fork();
    if (pid_ == 0) {
        dup2(in[0], STDIN_FILENO);
        dup2(out[1], STDOUT_FILENO);
        const int devNull = open("/dev/null", O_WRONLY);
        if (devNull >= 0) {
            dup2(devNull, STDERR_FILENO);
        }
        execv(VX7SIM_BINARY, argv.data());
        _exit(127);
    }
    close(in[0]);
    close(out[1]);
    toSim_ = in[1];
    fromSim_ = out[0];
    if (pid_ < 0) {
        return;
    }
    const std::string first = ReadLine(std::chrono::milliseconds(15000));
    const std::string prefix = "listening on ";
    if (first.rfind(prefix, 0) == 0) {
        port_ = std::atoi(first.c_str() + prefix.size());
    }
}

void SimServer::Kill() {
    if (pid_ > 0) {
        kill(pid_, SIGKILL);
        int status = 0;
        waitpid(pid_, &status, 0);
        pid_ = -1;
    }
    if (toSim_ >= 0) {
        close(toSim_);
        toSim_ = -1;
    }
    if (fromSim_ >= 0) {
        close(fromSim_);
        fromSim_ = -1;
    }
    pending_.clear();
}

bool SimServer::Restart() {
    const int port = port_;
    Kill();
    port_ = 0;
    Launch(std::to_string(port));
    return port_ == port;
}

std::string SimServer::Address() const {
    return "127.0.0.1:" + std::to_string(port_);
}

std::string SimServer::ReadLine(std::chrono::milliseconds timeout) {
    const auto deadline = std::chrono::steady_clock::now() + timeout;
    for (;;) {
        const auto newline = pending_.find('\n');
        if (newline != std::string::npos) {
            std::string line = pending_.substr(0, newline);
            pending_.erase(0, newline + 1);
            return line;
        }
        const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(
            deadline - std::chrono::steady_clock::now());
        if (left.count() <= 0 || fromSim_ < 0) {
            return "";
        }
        pollfd fd{fromSim_, POLLIN, 0};
        if (poll(&fd, 1, static_cast<int>(left.count())) <= 0) {
            continue;
        }
        char buffer[4096];
        const ssize_t got = read(fromSim_, buffer, sizeof buffer);
        if (got <= 0) {
            return "";
        }
        pending_.append(buffer, static_cast<std::size_t>(got));
    }
}

std::string SimServer::Control(const std::string& line, std::chrono::milliseconds timeout) {
    if (toSim_ < 0) {
        return "";
    }
    const std::string text = line + "\n";
    if (write(toSim_, text.data(), text.size()) != static_cast<ssize_t>(text.size())) {
        return "";
    }
    return ReadLine(timeout);
}

}  // namespace lineprobe::testing
