#pragma once

#include <map>
#include <memory>

#include "catalogue/generated/values.h"
#include "catalogue/lcon/LCON.h"
#include "model/Subject.h"
#include "transport/IsaSync.h"

namespace vx7diag {

// One line of a board, through its LCON: service, loopback, transmitted alarms, and the line's
// state and alarms.
class Trunk : public Subject {
  public:
    static constexpr unsigned int IN_SERVICE = tolk::wire::LCON::LineState::IN_SERVICE;
    static constexpr unsigned int OUT_OF_SERVICE = tolk::wire::LCON::LineState::OUT_OF_SERVICE;
    static constexpr unsigned int ERROR_ALREADY_IN_SERVICE =
        tolk::wire::LCON::Error::ALREADY_IN_SERVICE;

    // Throws BoardFailure (a std::runtime_error with the reason) when the board lacks the line or
    // refuses or ignores the searches for its cluster and LCON.
    Trunk(unsigned int board, unsigned int trunk);
    ~Trunk() override;

    void PutInService();
    void PutOutOfService();
    void EnableLoopBack(unsigned char mode);
    void DisableLoopBack();
    // These three pass a refusal or a time-out on to the caller.
    unsigned char GetLoopBackMode();
    unsigned int GetTrunkState();
    std::map<unsigned int, char> GetCurrentAlarms();
    // 0, or -1 when the board refused or fell silent.
    int GetTrunkState(unsigned int& state, unsigned int& reason);
    int StartTransmitAlarm(unsigned int alarmId);
    int StopTransmitAlarm(unsigned int alarmId);
    void Lock();
    void UnLock();

    tolk::LCON* GetLCON() const { return lcon.get(); }

  private:
    std::unique_ptr<tolk::LCON> lcon;
    isa::CriticalSection lock;
};

// What a trunk view shows when it starts: the line state and reason and the alarm flags, read
// from the board once.
class TrunkStatus {
  public:
    // Throws what GetCurrentAlarms throws: no snapshot comes to exist then.
    explicit TrunkStatus(Trunk* trunk);
    // The same, but a board that refuses or is silent gives null, with the reason written to
    // standard output, instead of an exception.
    static TrunkStatus* TryCreate(Trunk* trunk);

    unsigned int GetState() const { return state; }
    unsigned int GetReason() const { return reason; }
    unsigned int GetRedCFA() const { return redCFA; }
    unsigned int GetYellowCFA() const { return yellowCFA; }
    unsigned int GetDChanCFA() const { return dChanCFA; }
    unsigned int GetBPVSCnt() const { return bpvsCnt; }
    unsigned int GetFERRCnt() const { return ferrCnt; }
    unsigned int GetLOSCFA() const { return losCFA; }
    unsigned int GetLoopBackCFA() const { return loopBackCFA; }

  private:
    Trunk* trunk;
    unsigned int state = Trunk::OUT_OF_SERVICE;
    unsigned int reason = 0;
    unsigned int redCFA = 0;
    unsigned int yellowCFA = 0;
    unsigned int dChanCFA = 0;
    [[maybe_unused]] unsigned int unused = 0;
    unsigned int bpvsCnt = 0;
    unsigned int ferrCnt = 0;
    unsigned int losCFA = 0;
    unsigned int loopBackCFA = 0;
};

}  // namespace vx7diag
