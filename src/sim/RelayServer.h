// vx7sim's server: the emulation served over the relay's frame protocol on TCP. One thread runs
// the whole loop (sockets, control lines, the emulation), so the emulation needs no lock and
// everything happens in the order it arrived.
#pragma once

#include <atomic>
#include <chrono>
#include <cstdint>
#include <deque>
#include <future>
#include <iosfwd>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "platform/farm/Farm.h"
#include "platform/tkhost/tkhost.h"
#include "sim/Control.h"
#include "sim/Emulation.h"
#include "sim/RelayConnection.h"

namespace sim {

struct RelayOptions {
    int port = 6554;  // 0 picks a free port
    std::string bindAddress = "0.0.0.0";
    std::size_t maxConnections = 4096;
    // A connection that has not opened within this time is closed. Those not yet open never
    // hold the last reservedForOpen slots: past that, the oldest of them makes way for a newcomer.
    std::chrono::milliseconds openTimeout{5000};
    std::size_t reservedForOpen = 64;
    // A client that lets this much pile up unread is cut off.
    std::size_t maxPendingOutput = 64u << 20;
    // What all clients together may leave unread; past it the worst reader is cut off first.
    std::size_t maxQueuedOutput = 256u << 20;
    // Each message routed, one line on the log (see Trace.h).
    bool trace = false;
};

class RelayServer {
  public:
    RelayServer(std::shared_ptr<const farm::Farm> farm, RelayOptions options, std::ostream& log);
    ~RelayServer();
    RelayServer(const RelayServer&) = delete;
    RelayServer& operator=(const RelayServer&) = delete;

    // Opens the listening socket; port() is valid afterwards.
    bool listen(std::string& error);
    int port() const { return port_; }

    // Serves until "quit" or stop(). Control lines are read from controlFd (-1 for none) and
    // answered on controlOut, one line each; end of input there is not a quit.
    void run(int controlFd, std::ostream* controlOut);

    // A scenario played from the start of run(), each command's answer on the log; then the
    // relay goes on serving. Set before run().
    void setScript(std::vector<ScriptStep> steps) { script_ = std::move(steps); }

    // From any thread: runs one control line in the loop and returns its answer.
    std::string control(const std::string& line);
    // From any thread: ends run().
    void stop();

    std::size_t connectionCount() const { return connectionCount_.load(); }

  private:
    using Conn = RelayConnection;

    void acceptAll();
    void readFrom(Conn& c);
    bool processFrames(Conn& c);
    bool handleFrame(Conn& c, std::uint32_t type, const unsigned char* body, std::uint32_t size,
                     const unsigned char* ex, std::uint32_t exSize);
    void route(TKMsg32Bit* block);
    void sendFrame(Conn& c, std::uint32_t type, const unsigned char* body, std::uint32_t size,
                   const unsigned char* ex, std::uint32_t exSize);
    void sendBlock(Conn& c, const TKMsg32Bit* block);
    // Closes a client that lets too much pile up, then holds all of them to their cap.
    void checkPending(Conn& c);
    void flush(Conn& c);
    void flushAll();
    void close(Conn& c, const char* why);
    void expireUnopened(Clock::time_point now);
    void makeRoomForNewcomer();
    void enforceQueuedCap();
    std::size_t liveConnections() const { return conns_.size() - doomed_.size(); }
    void reap();
    void dropAll();
    void drainEmulation();
    void pumpBursts();
    void readControl(int fd, std::ostream* out);
    void runCrossThread();
    void playScript(Clock::time_point now);
    std::string runControl(const std::string& line);
    bool outputRoom() const;
    int timeoutMs() const;
    std::uint16_t nextInstance();

    RelayOptions options_;
    std::ostream& log_;
    Emulation emu_;
    int listenFd_ = -1;
    int epollFd_ = -1;
    int wakeFd_ = -1;
    // Held open so that, out of descriptors, a waiting connection can still be taken and closed
    // instead of keeping the listening socket ready for ever.
    int spareFd_ = -1;
    int port_ = 0;
    bool running_ = false;
    std::map<int, std::unique_ptr<Conn>> conns_;  // by descriptor
    std::map<std::uint16_t, Conn*> byInstance_;   // by assigned address
    std::map<std::uint64_t, Conn*> unopened_;     // by serial, so the oldest first
    std::size_t queued_ = 0;                      // unsent bytes of every live connection
    std::vector<int> doomed_;
    std::uint16_t lastInstance_ = 0;
    std::uint64_t serial_ = 0;
    std::string controlPending_;
    std::vector<ScriptStep> script_;
    std::size_t scriptNext_ = 0;
    Clock::time_point scriptDue_;
    bool discardingControl_ = false;  // until the newline of a line refused as too long
    std::atomic<std::size_t> connectionCount_{0};

    std::mutex crossLock_;
    struct CrossCall {
        std::string line;
        std::promise<std::string> result;
    };
    std::deque<CrossCall> cross_;
    std::atomic<bool> stopRequested_{false};
};

}  // namespace sim
