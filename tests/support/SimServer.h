#pragma once

#include <sys/types.h>

#include <chrono>
#include <cstdio>
#include <string>
#include <vector>

namespace lineprobe::testing {

// A vx7sim relay of its own on a free port of the loopback interface, driven by its
// control channel: each control line gets one answer line. Stopped with the object.
class SimServer {
  public:
    // The farm file is played by the relay; lineprobe must be given the same one in
    // VX7_FARM, since its device map reads the farm itself.
    // extraArgs are added to vx7sim's command line (--script FILE, --trace).
    explicit SimServer(const std::string& farmFile, const std::vector<std::string>& extraArgs = {});
    ~SimServer();

    SimServer(const SimServer&) = delete;
    SimServer& operator=(const SimServer&) = delete;

    bool Running() const { return port_ > 0; }
    int Port() const { return port_; }
    // "127.0.0.1:PORT", for REMOTE_TKHOST.
    std::string Address() const;

    // Ends the relay at once, as a crash would: every connection breaks, and nothing listens
    // on its port until Restart.
    void Kill();
    // A new relay on the port of the last one; true when it listens there.
    bool Restart();

    // Sends one control line and returns its answer, or "" when none came in time.
    std::string Control(const std::string& line,
                        std::chrono::milliseconds timeout = std::chrono::milliseconds(15000));

  private:
    void Launch(const std::string& port);
    std::string ReadLine(std::chrono::milliseconds timeout);

    std::string farm_;
    std::vector<std::string> extraArgs_;
    pid_t pid_ = -1;
    int toSim_ = -1;
    int fromSim_ = -1;
    int port_ = 0;
    std::string pending_;
};

}  // namespace lineprobe::testing
