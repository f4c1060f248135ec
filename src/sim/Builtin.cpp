#include "sim/Builtin.h"

#include <condition_variable>
#include <deque>
#include <future>
#include <iostream>
#include <mutex>
#include <thread>

#include "platform/farm/ActiveFarm.h"
#include "platform/tkhost/tkhost_switch.h"
#include "sim/Emulation.h"

namespace sim {
namespace {

constexpr std::size_t kBurstSlice = 256;

class Engine {
  public:
    explicit Engine(std::shared_ptr<const farm::Farm> farm) : emu_(std::move(farm), std::cerr) {
        thread_ = std::thread([this] { loop(); });
    }

    ~Engine() {
        {
            std::lock_guard<std::mutex> g(lock_);
            stop_ = true;
        }
        cv_.notify_all();
        thread_.join();
        for (TKMsg32Bit* b : inbox_) {
            tkMsgFree(b);
        }
        for (auto& c : calls_) {
            c.second.set_value("error: the emulation stopped");
        }
    }

    static void endpoint(void* ctx, TKMsg32Bit* block) {
        auto* self = static_cast<Engine*>(ctx);
        {
            std::lock_guard<std::mutex> g(self->lock_);
            self->inbox_.push_back(block);
        }
        self->cv_.notify_one();
    }

    std::string control(const std::string& line) {
        std::future<std::string> f;
        {
            std::lock_guard<std::mutex> g(lock_);
            if (stop_) {
                return "error: the emulation stopped";
            }
            calls_.emplace_back(line, std::promise<std::string>());
            f = calls_.back().second.get_future();
        }
        cv_.notify_one();
        return f.get();
    }

  private:
    void loop() {
        std::unique_lock<std::mutex> g(lock_);
        for (;;) {
            auto due = emu_.nextDue();
            auto ready = [&] {
                return stop_ || !inbox_.empty() || !calls_.empty() || emu_.burstsPending();
            };
            if (due) {
                cv_.wait_until(g, *due, ready);
            } else {
                cv_.wait(g, ready);
            }
            if (stop_) {
                return;
            }
            std::deque<TKMsg32Bit*> in;
            in.swap(inbox_);
            std::deque<std::pair<std::string, std::promise<std::string>>> calls;
            calls.swap(calls_);
            g.unlock();
            auto now = Clock::now();
            for (auto& c : calls) {
                c.second.set_value(emu_.control(c.first, now).reply);
            }
            for (TKMsg32Bit* b : in) {
                emu_.receive(b, now);
            }
            if (emu_.burstsPending()) {
                emu_.pumpBursts(kBurstSlice, now);
            }
            deliver(Clock::now());
            g.lock();
        }
    }

    void deliver(Clock::time_point now) {
        while (TKMsg32Bit* out = emu_.popDue(now)) {
            if (tkSwitchDeliver(out) != TK_OK) {
                emu_.stats().undeliverable++;
            }
        }
    }

    Emulation emu_;
    std::mutex lock_;
    std::condition_variable cv_;
    std::deque<TKMsg32Bit*> inbox_;
    std::deque<std::pair<std::string, std::promise<std::string>>> calls_;
    bool stop_ = false;
    std::thread thread_;
};

std::mutex g_lock;
std::unique_ptr<Engine> g_engine;

}  // namespace

bool startBuiltinEmulation(std::shared_ptr<const farm::Farm> farm) {
    std::lock_guard<std::mutex> g(g_lock);
    if (g_engine) {
        return true;
    }
    if (!farm) {
        return false;
    }
    g_engine = std::make_unique<Engine>(std::move(farm));
    tkSwitchAttachBoards(&Engine::endpoint, g_engine.get());
    return true;
}

bool startBuiltinEmulation(std::string* error) {
    farm::FarmLoad load = farm::activeFarm();
    if (!load.farm) {
        if (error) {
            *error = load.error;
        }
        return false;
    }
    return startBuiltinEmulation(load.farm);
}

void stopBuiltinEmulation() {
    std::unique_ptr<Engine> e;
    {
        std::lock_guard<std::mutex> g(g_lock);
        if (!g_engine) {
            return;
        }
        tkSwitchDetachBoards();
        e = std::move(g_engine);
    }
}

bool builtinEmulationRunning() {
    std::lock_guard<std::mutex> g(g_lock);
    return g_engine != nullptr;
}

std::string builtinControl(const std::string& line) {
    // Held throughout, so that the engine cannot be stopped under the caller.
    std::lock_guard<std::mutex> g(g_lock);
    if (!g_engine) {
        return "error: the emulation is not running";
    }
    return g_engine->control(line);
}

}  // namespace sim
