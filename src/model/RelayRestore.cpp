#include "model/RelayRestore.h"

#include <condition_variable>
#include <exception>
#include <iostream>
#include <map>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "transport/TKSMsgQueue.h"
#include "transport/TKSWholeLine.h"

namespace vx7diag {

namespace {

class Restorer {
  public:
    int Add(RelayRestore::Task task) {
        // Outside `m`: the listener is called under the transport's own lock and takes `m`.
        std::call_once(started, [this] {
            // Detached, and the restorer never destroyed: the process may end (exit from a
            // signal handler) while a task waits for a board, and that must not hold it up.
            std::thread([this] { Run(); }).detach();
            TKSMsgQueue::addRelayListener([this](bool cutOff, const std::string&) {
                if (!cutOff) {
                    RunAll();
                }
            });
        });
        std::lock_guard<std::mutex> lk(m);
        int id = ++lastId;
        tasks.emplace(id, std::move(task));
        return id;
    }

    void Remove(int id) {
        {
            std::lock_guard<std::mutex> lk(m);
            tasks.erase(id);
        }
        // Waits for a run of it that has already begun.
        std::lock_guard<std::mutex> running(runLock);
    }

    void RunAll() {
        {
            std::lock_guard<std::mutex> lk(m);
            pending = true;
        }
        cv.notify_all();
    }

  private:
    void Run() {
        for (;;) {
            std::vector<int> ids;
            {
                std::unique_lock<std::mutex> lk(m);
                cv.wait(lk, [this] { return pending; });
                pending = false;
                for (const auto& entry : tasks) {
                    ids.push_back(entry.first);
                }
            }
            for (int id : ids) {
                std::lock_guard<std::mutex> running(runLock);
                RelayRestore::Task task;
                {
                    std::lock_guard<std::mutex> lk(m);
                    auto entry = tasks.find(id);
                    if (entry == tasks.end()) {
                        continue;
                    }
                    task = entry->second;
                }
                try {
                    task();
                } catch (const std::exception& e) {
                    TKSWholeLine()
                        << "restoring a view after the relay came back failed: " << e.what()
                        << std::endl;
                } catch (...) {
                    TKSWholeLine()
                        << "restoring a view after the relay came back failed" << std::endl;
                }
            }
        }
    }

    std::mutex m;
    std::condition_variable cv;
    std::mutex runLock;
    std::map<int, RelayRestore::Task> tasks;
    int lastId = 0;
    bool pending = false;
    std::once_flag started;
};

Restorer& TheRestorer() {
    static Restorer* restorer = new Restorer;
    return *restorer;
}

}  // namespace

int RelayRestore::Add(Task task) {
    return TheRestorer().Add(std::move(task));
}

void RelayRestore::Remove(int id) {
    TheRestorer().Remove(id);
}

void RelayRestore::RunAll() {
    TheRestorer().RunAll();
}

}  // namespace vx7diag
