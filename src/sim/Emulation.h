// The board emulation core. It knows nothing of how blocks travel: it takes a block addressed to
// a board of the farm and queues the answer and the events that a board would send, each ready
// to be delivered by its target address. One thread at a time may use an Emulation; both
// servings (the in-process switch and the relay) keep it on one thread of their own.
#pragma once

#include <chrono>
#include <cstdint>
#include <deque>
#include <iosfwd>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "framework/CompAttr_t.h"
#include "framework/MsgBody.h"
#include "framework/staticList.h"
#include "platform/farm/Addresses.h"
#include "platform/farm/Farm.h"
#include "platform/tkhost/tkhost.h"
#include "sim/Control.h"
#include "sim/Model.h"

namespace sim {

using Clock = std::chrono::steady_clock;

struct Stats {
    std::uint64_t requests = 0;       // blocks received for the boards
    std::uint64_t answers = 0;        // completions and refusals sent
    std::uint64_t events = 0;         // event messages sent
    std::uint64_t refused = 0;        // answered with MsgError_t because of "refuse"
    std::uint64_t silenced = 0;       // not answered because of "silence"
    std::uint64_t unanswered = 0;     // blocks the emulation could not answer (logged)
    std::uint64_t undeliverable = 0;  // blocks the serving could not hand to anyone
};

struct ControlOutcome {
    std::string reply;  // one line, "ok ..." or "error: ..."
    bool quit = false;
    bool drop = false;
};

class Emulation {
  public:
    // `log` gets one line for every message the emulation cannot answer.
    Emulation(std::shared_ptr<const farm::Farm> farm, std::ostream& log);
    ~Emulation();
    Emulation(const Emulation&) = delete;
    Emulation& operator=(const Emulation&) = delete;

    // Takes the block over, whatever it holds.
    void receive(TKMsg32Bit* block, Clock::time_point now = Clock::now());

    ControlOutcome control(const ControlCommand& cmd, Clock::time_point now = Clock::now());
    // Parses and runs one control line; blank and comment lines give an empty reply.
    ControlOutcome control(const std::string& line, Clock::time_point now = Clock::now());

    // The next block whose time has come, or null; the caller owns it.
    TKMsg32Bit* popDue(Clock::time_point now);
    // When the oldest waiting block falls due, if any waits.
    std::optional<Clock::time_point> nextDue() const;
    std::size_t queued() const { return outbox_.size(); }

    // Saturation bursts ("bpv", "ferr") are played a slice at a time, so that a slow reader
    // holds up the burst instead of filling memory. Returns true while some remain.
    bool pumpBursts(std::size_t maxEvents, Clock::time_point now = Clock::now());
    bool burstsPending() const { return !bursts_.empty(); }

    // A host went away: its subscriptions go with it.
    void forget(const TKCompDesc& host);

    Stats& stats() { return stats_; }
    const Stats& stats() const { return stats_; }
    Model& model() { return model_; }
    std::uint32_t delayMs() const { return delayMs_; }

  private:
    struct Request;
    enum class Override { Refuse, Silence };

    // What a search can find: a component of the farm and what describes it.
    struct Component {
        Address addr;
        Address cluster;
        std::uint8_t type = 0;
        int trunk = 0;
        int channel = 0;
    };

    // Every unit of a component type takes the request and what its target resolved to.
    using Handler = void (Emulation::*)(Request&, const farm::Resource&);

    void indexComponents(const farm::Farm& farm);
    void handle(Request& rq);
    void handleBoard(Request& rq, const farm::Resource& r);
    void handleResourceMgr(Request& rq, const farm::Resource& r);
    void handleClusterMgr(Request& rq, const farm::Resource& r);
    void handleCluster(Request& rq, const farm::Resource& r);
    void handleStd(Request& rq, const farm::Resource& r);
    void handleSubscription(Request& rq);
    bool parmValue(const farm::Resource& r, std::uint32_t num, std::uint32_t& val) const;
    // The first component of the board in `start` that fits the search, or null.
    const Component* findComponent(const Address& start, const Address* cluster, std::uint8_t type,
                                   tolk::staticList<tolk::CompAttr_t>& attrs,
                                   unsigned int count) const;
    void handleTsc(Request& rq, const farm::Resource& r);
    void handleLcon(Request& rq, const farm::Resource& r);
    void handleCas(Request& rq, const farm::Resource& r);

    // Queues one block from `src` to `tgt`, with `body` written behind the header if any.
    void post(std::uint32_t type, std::uint32_t trans, const Address& src, const Address& tgt,
              tolk::MsgBody* body);
    void reply(Request& rq, std::uint32_t type, tolk::MsgBody* body);
    void refuse(Request& rq, std::uint32_t code);
    // Answers an operation: the completion `okType` (none if 0) when `code` is 0, else a refusal.
    void answer(Request& rq, std::uint32_t code, std::uint32_t okType);
    void unanswerable(Request& rq, const char* why);
    void publish(const std::vector<Event>& events);
    void enqueue(TKMsg32Bit* block);

    Model model_;
    std::map<unsigned int, std::vector<Component>> components_;  // by board
    std::map<std::uint64_t, std::uint32_t> alarmMasks_;
    std::ostream& log_;
    std::map<std::uint32_t, std::pair<Override, std::uint32_t>> overrides_;
    std::map<std::uint64_t, std::map<std::uint32_t, std::uint32_t>> parms_;  // set by SetParm
    std::uint32_t delayMs_ = 0;
    Clock::time_point now_{};
    struct Queued {
        Clock::time_point due;
        TKMsg32Bit* block;
    };
    std::deque<Queued> outbox_;
    struct Burst {
        unsigned int board;
        int trunk;
        std::uint32_t alarm;
        std::uint32_t left;
    };
    std::deque<Burst> bursts_;
    std::vector<Event> scratch_;
    std::vector<const Subscription*> deliveries_;
    Stats stats_;
};

}  // namespace sim
