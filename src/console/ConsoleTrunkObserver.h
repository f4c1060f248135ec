#pragma once

#include "model/Observer.h"
#include "transport/IsaSync.h"

namespace lineprobe {
class View;
}

namespace vx7diag {

class TrunkStatus;

// Alarm codes of a line's alarm events, and the line state code of a line in service.
constexpr unsigned int ALARM_RED = 5633;
constexpr unsigned int ALARM_YELLOW = 5634;
constexpr unsigned int ALARM_AIS = 5635;
constexpr unsigned int ALARM_LOS = 5636;
constexpr unsigned int ALARM_LOOPBACK = 5637;
constexpr unsigned int ALARM_RAI_CRC = 5638;
constexpr unsigned int ALARM_DCHAN = 5642;
constexpr unsigned int ALARM_BPV_SATURATION = 5654;
constexpr unsigned int ALARM_FERR_SATURATION = 5655;
constexpr unsigned int LINE_STATE_IN_SERVICE = 5647;

// Draws one row of the trunk views window: line state and reason, the alarm columns and
// the two error counts of one line. Update runs on the reader thread of the line's events;
// the first picture is drawn on the main thread by DisplayCurrentTrunkStatus.
class ConsoleTrunkObserver : public Observer {
  public:
    ConsoleTrunkObserver(int board, int line, int row, int col);

    void Update(Subject* subject, Aspect& aspect) override;
    // Draws the status read from the board when the view starts; 0 without a window,
    // else 1. The counts shown are this observer's own.
    virtual int DisplayCurrentTrunkStatus(TrunkStatus* status);

    void SetView(lineprobe::View* view);
    lineprobe::View* GetView();
    unsigned int GetBipolarViolations() const { return bipolarViolations; }
    unsigned int GetFrameErrors() const { return frameErrors; }

  private:
    void ShowFlag(bool set, int col);
    void ShowCount(unsigned int count, int col);
    void ShowLineState(unsigned int state, unsigned int reason);

    lineprobe::View* view = nullptr;
    char text[256] = {};
    isa::CriticalSection lock;
    [[maybe_unused]] int board;
    [[maybe_unused]] int line;
    [[maybe_unused]] int chan = 1;
    int startingCol;
    int row;
    unsigned int bipolarViolations = 0;
    unsigned int frameErrors = 0;
};

}  // namespace vx7diag
