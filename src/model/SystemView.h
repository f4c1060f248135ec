#pragma once

#include <map>
#include <string>

namespace vx7diag {

class BoardManager;

// What the device map says the host has: the system's name and a board manager for each
// VX7 board, by logical number. Collected once by the constructor; a board that comes up
// later is not seen. The managers are never freed.
class SystemView {
  public:
    SystemView();
    ~SystemView();
    SystemView(const SystemView&) = delete;
    SystemView& operator=(const SystemView&) = delete;

    std::map<unsigned int, BoardManager*> GetActiveBoardList();
    // Empty when the board service is down or the host's name cannot be read.
    std::string GetSystemName();
    bool IsOrvaneServiceStarted();

  private:
    unsigned int hostAU = 0;
    std::string* systemName = nullptr;
    std::map<unsigned int, BoardManager*> boards;
    bool serviceStarted = false;
};

}  // namespace vx7diag
