#pragma once

#include <functional>

namespace vx7diag {

// What must be done again when the relay connection comes back, so that every open view is
// right again without a command: its publisher subscribes again (the board knows nothing of
// subscriptions made from the lost connection's address) and the view reads its current state.
//
// The tasks run in the order they were added, on a thread of their own: the relay's return is
// heard on a reader thread, which must not wait for an answer on its own queue.
class RelayRestore {
  public:
    using Task = std::function<void()>;

    // Returns the task's id for Remove.
    static int Add(Task task);
    // Once this returns, the task is not running and never runs again. Not from a task.
    static void Remove(int id);
    // Runs every task once on the restore thread, as the relay's return does.
    static void RunAll();
};

}  // namespace vx7diag
