// The relay's control channel: lines from its input, from the script and from other threads,
// each run in the server's loop so that the emulation sees them in order with the traffic.
#include <unistd.h>

#include <ostream>
#include <string_view>

#include "sim/RelayServer.h"

namespace sim {

namespace {

constexpr std::size_t kMaxControlLine = 64 * 1024;

}  // namespace

void RelayServer::readControl(int fd, std::ostream* out) {
    char buf[4096];
    for (;;) {
        ssize_t n = ::read(fd, buf, sizeof buf);
        if (n <= 0) {
            break;
        }
        std::string_view chunk(buf, static_cast<std::size_t>(n));
        while (!chunk.empty()) {
            std::size_t nl = chunk.find('\n');
            if (discardingControl_) {
                // The rest of a refused line is not a command of its own.
                if (nl == std::string_view::npos) {
                    break;
                }
                discardingControl_ = false;
                chunk.remove_prefix(nl + 1);
                continue;
            }
            controlPending_.append(chunk.substr(0, nl));
            if (controlPending_.size() > kMaxControlLine) {
                controlPending_.clear();
                discardingControl_ = nl == std::string_view::npos;
                if (out) {
                    *out << "error: control line too long" << std::endl;
                }
            } else if (nl != std::string_view::npos) {
                std::string reply = runControl(controlPending_);
                controlPending_.clear();
                if (!reply.empty() && out) {
                    *out << reply << std::endl;
                }
            }
            if (nl == std::string_view::npos) {
                break;
            }
            chunk.remove_prefix(nl + 1);
        }
    }
}

std::string RelayServer::runControl(const std::string& line) {
    ControlOutcome o = emu_.control(line);
    if (o.drop) {
        std::size_t n = liveConnections();
        dropAll();
        reap();
        o.reply = "ok dropped " + std::to_string(n);
    }
    if (o.quit) {
        running_ = false;
    }
    if (o.reply.rfind("ok stats", 0) == 0) {
        o.reply += " connections=" + std::to_string(liveConnections()) +
                   " queued=" + std::to_string(queued_);
    }
    drainEmulation();
    return o.reply;
}

std::string RelayServer::control(const std::string& line) {
    std::future<std::string> f;
    {
        std::lock_guard<std::mutex> g(crossLock_);
        cross_.push_back(CrossCall{line, {}});
        f = cross_.back().result.get_future();
    }
    std::uint64_t one = 1;
    [[maybe_unused]] ssize_t w = ::write(wakeFd_, &one, sizeof one);
    return f.get();
}

void RelayServer::playScript(Clock::time_point now) {
    while (running_ && scriptNext_ < script_.size() && scriptDue_ <= now) {
        const ScriptStep& step = script_[scriptNext_++];
        if (step.command.empty()) {
            scriptDue_ = now + std::chrono::milliseconds(step.sleepMs);
            continue;
        }
        log_ << "vx7sim: script line " << step.line << ": " << step.command << ": "
             << runControl(step.command) << std::endl;
    }
}

void RelayServer::runCrossThread() {
    std::deque<CrossCall> calls;
    {
        std::lock_guard<std::mutex> g(crossLock_);
        calls.swap(cross_);
    }
    for (CrossCall& call : calls) {
        call.result.set_value(runControl(call.line));
    }
}

}  // namespace sim
