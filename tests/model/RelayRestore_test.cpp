#include "model/RelayRestore.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

namespace {

using namespace std::chrono_literals;

bool WaitFor(const std::atomic<int>& value, int atLeast) {
    const auto deadline = std::chrono::steady_clock::now() + 5s;
    while (value.load() < atLeast) {
        if (std::chrono::steady_clock::now() > deadline) {
            return false;
        }
        std::this_thread::sleep_for(1ms);
    }
    return true;
}

// A view's task captures the view: once the view has removed it, it must neither be running
// (the view is about to be freed) nor run again.
TEST(RelayRestore, RemovedTaskHasFinishedAndNeverRunsAgain) {
    std::atomic<int> begun{0};
    std::atomic<int> ended{0};
    int id = vx7diag::RelayRestore::Add([&] {
        ++begun;
        std::this_thread::sleep_for(200ms);
        ++ended;
    });
    vx7diag::RelayRestore::RunAll();
    ASSERT_TRUE(WaitFor(begun, 1));
    vx7diag::RelayRestore::Remove(id);
    EXPECT_EQ(1, ended.load());

    std::atomic<int> other{0};
    int later = vx7diag::RelayRestore::Add([&] { ++other; });
    vx7diag::RelayRestore::RunAll();
    ASSERT_TRUE(WaitFor(other, 1));
    EXPECT_EQ(1, begun.load());
    vx7diag::RelayRestore::Remove(later);
}

TEST(RelayRestore, TasksRunInTheOrderTheyCameAndAFailingOneStopsNoOther) {
    std::vector<std::string> order;
    std::atomic<int> done{0};
    int first = vx7diag::RelayRestore::Add([&] { order.push_back("first"); });
    int failing = vx7diag::RelayRestore::Add([] { throw std::runtime_error("board gone"); });
    int last = vx7diag::RelayRestore::Add([&] {
        order.push_back("last");
        ++done;
    });
    vx7diag::RelayRestore::RunAll();
    ASSERT_TRUE(WaitFor(done, 1));
    EXPECT_EQ(std::vector<std::string>({"first", "last"}), order);
    for (int id : {first, failing, last}) {
        vx7diag::RelayRestore::Remove(id);
    }
}

}  // namespace
