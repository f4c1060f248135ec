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

    // The first text that starts with `prefix`; empty after three seconds.
    std::string WaitFor(const std::string& prefix) {
        std::unique_lock<std::mutex> lock(mutex);
        std::string found;
        changed.wait_for(lock, std::chrono::seconds(3), [&] {
            for (const std::string& text : texts) {
                if (text.rfind(prefix, 0) == 0) {
                    found = text;
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
