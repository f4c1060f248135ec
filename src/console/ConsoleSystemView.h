#pragma once

#include <map>

#include "model/SystemView.h"

namespace lineprobe {

class View;

// The system window: the system's name as its title, then one entry per board with its
// number, name and lines (line number, channel count, signalling). Drawn once.
class ConsoleSystemView : public vx7diag::SystemView {
  public:
    // Column past which a board's lines go on on the next row, indented to WRAP_COL.
    static constexpr int WRAP_AFTER_COL = 89;
    static constexpr int WRAP_COL = 9;
    static constexpr int TITLE_COL = 45;

    ConsoleSystemView();

    virtual void Display();

    void SetView(View* view);
    // -1 without a window.
    int SetVisible();

    // "CAS", "CCS", or "CLEAR" for any other signalling value.
    static const char* SignalingText(int signaling);

  private:
    View* view = nullptr;
    std::map<unsigned int, vx7diag::BoardManager*> boards;
    char text[256] = {};
};

}  // namespace lineprobe
