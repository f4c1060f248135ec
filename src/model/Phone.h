#pragma once

#include <memory>
#include <string>
#include <vector>

#include "catalogue/cluster/Cluster.h"
#include "catalogue/generated/values.h"
#include "catalogue/tsc/TSC.h"
#include "framework/String.h"

namespace tolk {
class Board;
}

namespace vx7diag {

class BoardManager;
class ROCCluster;

// One channel of one trunk, driven as a telephone through its TSC. Every call operation is one
// blocking request; a refusal or a time-out is turned into the operation's failure value, with
// the reason written to standard output. A phone keeps no call state.
class Phone {
  public:
    static constexpr unsigned int TSINFO_PORT = tolk::wire::Cluster::Port::TS_INFO;
    static constexpr unsigned int TSASSIGN_PORT = tolk::wire::Cluster::Port::TS_ASSIGN;
    static constexpr unsigned char TSC_COMPONENT_TYPE = tolk::wire::TSC::Component::TYPE;

    // Throws std::out_of_range for trunk 65 and above or channel 32 and above, and
    // std::runtime_error for a manager without a board or a board that has no such channel or
    // refuses or ignores the searches for it (a BoardFailure with the reason).
    Phone(BoardManager* manager, unsigned int trunk, unsigned int channel);
    Phone(const Phone&) = delete;
    Phone& operator=(const Phone&) = delete;
    virtual ~Phone();

    // Join the channel to its voice resources on a flexible-routing board, and part it again.
    // 0 when done (or nothing to do); -1 when the board fell silent or the channel has no voice
    // resources, which is written to standard output.
    int Start();
    int Stop();
    int Attach();
    int Detach();

    unsigned int MakeCall(tolk::string origAddr, tolk::string destAddr);
    unsigned int GetCallState(unsigned int callId);
    unsigned int GetCallState(unsigned int callId, tolk::TSC::MsgGetCallStateCmplt_t* out);
    unsigned int GetChanState();
    int SetChanState(unsigned int state);
    int AnswerCall(unsigned int callId);
    int AnswerCall(unsigned int callId, unsigned int numRings);
    int AcceptCall(unsigned int callId);
    int Reset(unsigned int state);
    int DropCall(unsigned int callId);
    int ReleaseCall(unsigned int callId);
    int RejectCall(unsigned int callId, unsigned int reason);
    int DialDigits(tolk::string digits, unsigned int callId);
    int HoldCall(unsigned int callId);
    int RetrieveCall(unsigned int callId);
    int BlindTransfer(unsigned int callId, tolk::string destAddr, tolk::string origAddr,
                      int callProgress);
    unsigned int InitTransfer(unsigned int callId, tolk::string destAddr, tolk::string origAddr,
                              int callProgress);
    int CompleteTransfer(unsigned int callId, unsigned int conCallId);
    int CancelTransfer(unsigned int callId);
    int SendISDN(unsigned int callId, unsigned int messageType, std::vector<char> data);

    // The call id lives in the phone's observer, not here.
    int SetCallId(unsigned int callId);
    unsigned int GetCurCallId();

    int SetOrigAddr(const std::string& addr);
    int SetDestAddr(const std::string& addr);
    std::string GetOrigAddr();
    std::string GetDestAddr();
    int SetCPAMode(unsigned int mode);
    unsigned int GetCPAMode();

    unsigned int GetTrunk() const { return trunk; }
    unsigned int GetChannel() const { return channel; }
    tolk::TSC* GetTSC() const { return tsc.get(); }
    tolk::Cluster* GetTscCluster() const { return tscCluster.get(); }
    ROCCluster* GetRocCluster() const { return rocCluster; }

  private:
    unsigned int trunk;
    unsigned int channel;
    unsigned char cpaMode = 0;
    BoardManager* boardManager;
    tolk::Board* board = nullptr;
    std::unique_ptr<tolk::Cluster> tscCluster;
    std::unique_ptr<tolk::TSC> tsc;
    ROCCluster* rocCluster = nullptr;
    std::string origAddr;
    std::string destAddr;
};

}  // namespace vx7diag
