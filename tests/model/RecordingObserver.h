#pragma once

#include <chrono>
#include <condition_variable>
#include <mutex>
#include <string>
#include <vector>

#include "model/Aspect.h"
#include "model/Observer.h"

// Keeps the text of every event it is told of, and lets a test wait for one.
class RecordingObserver : public vx7diag::Observer {
  public:
    void Update(vx7diag::Subject*, vx7diag::Aspect& aspect) override {
        const char* text = aspect.ToZLG();
        std::lock_guard<std::mutex> guard(mutex);
        texts.emplace_back(text != nullptr ? text : "");
        changed.notify_all();
    }

    // The first text, from the given index on, that starts with `prefix`; empty after `ms`.
    std::string WaitFor(const std::string& prefix, std::size_t from = 0, int ms = 3000) {
        std::unique_lock<std::mutex> lock(mutex);
        std::string found;
        changed.wait_for(lock, std::chrono::milliseconds(ms), [&] {
            for (std::size_t i = from; i < texts.size(); ++i) {
                if (texts[i].rfind(prefix, 0) == 0) {
                    found = texts[i];
                    return true;
                }
            }
            return false;
        });
        return found;
    }

    std::vector<std::string> Texts() {
        std::lock_guard<std::mutex> guard(mutex);
        return texts;
    }

  private:
    std::mutex mutex;
    std::condition_variable changed;
    std::vector<std::string> texts;
};
