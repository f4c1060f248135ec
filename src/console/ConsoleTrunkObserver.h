#pragma once

#include "catalogue/generated/values.h"
#include "model/Observer.h"
#include "transport/IsaSync.h"

namespace lineprobe {
class View;
}

namespace vx7diag {

class TrunkStatus;

// Alarm codes of a line's alarm events, and the line state code of a line in service.
constexpr unsigned int ALARM_RED = tolk::wire::LCON::Alarm::RED;
constexpr unsigned int ALARM_YELLOW = tolk::wire::LCON::Alarm::YELLOW;
constexpr unsigned int ALARM_AIS = tolk::wire::LCON::Alarm::AIS;
constexpr unsigned int ALARM_LOS = tolk::wire::LCON::Alarm::LOS;
constexpr unsigned int ALARM_LOOPBACK = tolk::wire::LCON::Alarm::LOOPBACK;
constexpr unsigned int ALARM_RAI_CRC = tolk::wire::LCON::Alarm::RAI_CRC;
constexpr unsigned int ALARM_DCHAN = tolk::wire::LCON::Alarm::D_CHANNEL;
constexpr unsigned int ALARM_BPV_SATURATION = tolk::wire::LCON::Alarm::BPV_SATURATION;
constexpr unsigned int ALARM_FERR_SATURATION = tolk::wire::LCON::Alarm::FERR_SATURATION;
constexpr unsigned int LINE_STATE_IN_SERVICE = tolk::wire::LCON::LineState::IN_SERVICE;

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
