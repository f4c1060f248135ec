#include "model/Trunk.h"

#include <iostream>
#include <string>

#include "catalogue/generated/values.h"
#include "catalogue/stdresource/StdResource.h"
#include "framework/Msg.h"
#include "framework/tolk.h"
#include "model/Board.h"
#include "model/BoardManager.h"
#include "model/Guarded.h"

namespace vx7diag {

namespace {

constexpr unsigned char kLconType = tolk::wire::LCON::Component::TYPE;
constexpr unsigned int kOutOfServiceReason = 4;
namespace Alarm = tolk::wire::LCON::Alarm;
constexpr unsigned int kAllAlarms = tolk::LCON::Evt_0x1600_t::EvtGroup_;

void Trunk_UnregisteredMsgHandler(tolk::Addressable*, tolk::Msg* msg) {
    delete msg;
}
void Trunk_UnregisteredEvtGroupHandler(tolk::Addressable*, tolk::Msg* msg) {
    delete msg;
}
void Trunk_UnregisteredSourceHandler(tolk::MsgQueue&, tolk::Msg* msg) {
    delete msg;
}

void RegisterTrunkHandlers(tolk::Addressable& object) {
    object.asyncUnregisteredMsgType(Trunk_UnregisteredMsgHandler, 0);
    object.asyncUnregisteredEvtGroup(Trunk_UnregisteredEvtGroupHandler, 0);
    object.UnregisteredSource(Trunk_UnregisteredSourceHandler);
}

// A state-changing request under the trunk's lock: a refusal or silence is written out.
template <class Work>
void Change(isa::CriticalSection& lock, Work&& work) {
    isa::AutoCriticalSection guard(lock);
    try {
        work();
    } catch (const tolk::Addressable::UnexpectedMsg& e) {
        std::cout << e << std::endl;
    } catch (const tolk::Addressable::Timeout& e) {
        std::cout << e << std::endl;
    }
}

template <class Work>
int Read(Work&& work) {
    try {
        work();
        return 0;
    } catch (const tolk::Addressable::UnexpectedMsg& e) {
        std::cout << e << std::endl;
    } catch (const tolk::Addressable::Timeout& e) {
        std::cout << e << std::endl;
    }
    return -1;
}

}  // namespace

Trunk::Trunk(unsigned int boardNumber, unsigned int trunk) {
    tolk::tolkInit();
    // An address holds the board in one byte: a larger number (or a negative one typed at the
    // prompt) would wrap onto a board that does exist and open a view of the wrong line. Past
    // the last board nothing can answer either, so it is refused before a request waits for it.
    if (boardNumber > BoardManager::LAST_LOGICAL_ID) {
        throw BoardFailure("Trunk::Trunk() board " + std::to_string(boardNumber) +
                           " is out of range");
    }
    tolk::Board board(boardNumber);
    RegisterTrunkHandlers(board);
    tolk::Cluster cluster = Captured([&] { return board.findClustByLCON(trunk); });
    RegisterTrunkHandlers(cluster);
    tolk::TmpInstance instance = Captured([&] { return cluster.find(kLconType); });
    lcon = std::make_unique<tolk::LCON>(instance);
    RegisterTrunkHandlers(*lcon);
}

// The LCON receives no events for the trunk (the view's publisher has its own), so nothing on
// a reader thread can reach it once the trunk goes.
Trunk::~Trunk() = default;

void Trunk::PutInService() {
    isa::AutoCriticalSection guard(lock);
    try {
        tolk::LCON::MsgSetLineStateCmplt_t done;
        lcon->SetLineState(IN_SERVICE, &done);
    } catch (const tolk::Addressable::UnexpectedMsg& e) {
        tolk::Msg* reply = e.getMsg();
        if (reply != nullptr && reply->getMsgType() == 0) {
            tolk::StdResource::MsgError_t error;
            error.readMsg(reply, 0);
            if (*error.pErrorCode == ERROR_ALREADY_IN_SERVICE) {
                std::cout << "Trunk already In Service" << std::endl;
            }
        } else {
            std::cout << e << std::endl;
        }
    } catch (const tolk::Addressable::Timeout& e) {
        std::cout << e << std::endl;
    }
}

void Trunk::PutOutOfService() {
    Change(lock, [&] {
        tolk::LCON::MsgSetLineStateCmplt_t done;
        lcon->SetLineState(OUT_OF_SERVICE, kOutOfServiceReason, 0, &done);
    });
}

void Trunk::EnableLoopBack(unsigned char mode) {
    Change(lock, [&] {
        tolk::LCON::MsgSetDiagModeCmplt_t done;
        lcon->SetDiagMode(mode, &done);
    });
}

void Trunk::DisableLoopBack() {
    Change(lock, [&] {
        tolk::LCON::MsgSetDiagModeCmplt_t done;
        unsigned char off = 0;
        lcon->SetDiagMode(off, &done);
    });
}

unsigned char Trunk::GetLoopBackMode() {
    tolk::LCON::MsgGetDiagModeCmplt_t answer;
    lcon->GetDiagMode(&answer);
    return *answer.pDiagnosticMode;
}

unsigned int Trunk::GetTrunkState() {
    tolk::LCON::MsgGetLineStateCmplt_t answer;
    lcon->GetLineState(&answer);
    return *answer.pLineState;
}

int Trunk::GetTrunkState(unsigned int& state, unsigned int& reason) {
    tolk::LCON::MsgGetLineStateCmplt_t answer;
    if (Read([&] { lcon->GetLineState(&answer); }) != 0) {
        return -1;
    }
    state = *answer.pLineState;
    reason = *answer.pReason;
    return 0;
}

std::map<unsigned int, char> Trunk::GetCurrentAlarms() {
    tolk::staticList<unsigned int> wanted;
    wanted.realloc(1);
    *wanted.element(0) = kAllAlarms;
    tolk::LCON::MsgGetAlarmsCmplt_t answer;
    lcon->GetAlarms(wanted, &answer);
    std::map<unsigned int, char> alarms;
    auto& info = *answer.pAlarmInfo;
    for (unsigned int i = 0; i < info.length(); ++i) {
        const auto* entry = info.element(i);
        if (entry->Type != 0) {
            alarms.insert({entry->Type, entry->State != 0 ? 1 : 0});
        }
    }
    return alarms;
}

int Trunk::StartTransmitAlarm(unsigned int alarmId) {
    return Read([&] {
        tolk::LCON::MsgSendAlarmCmplt_t done;
        lcon->SendAlarm(alarmId, &done);
    });
}

int Trunk::StopTransmitAlarm(unsigned int alarmId) {
    return Read([&] { lcon->StopAlarm(alarmId); });
}

void Trunk::Lock() {
    lock.Enter();
}

void Trunk::UnLock() {
    lock.Leave();
}

TrunkStatus::TrunkStatus(Trunk* t) : trunk(t) {
    unsigned int lineState = 0;
    unsigned int lineReason = 0;
    if (trunk->GetTrunkState(lineState, lineReason) == 0) {
        state = lineState;
        reason = lineReason;
    }
    std::map<unsigned int, char> alarms = trunk->GetCurrentAlarms();
    const std::pair<unsigned int, unsigned int TrunkStatus::*> fields[] = {
        {Alarm::LOS, &TrunkStatus::losCFA},
        {Alarm::RED, &TrunkStatus::redCFA},
        {Alarm::YELLOW, &TrunkStatus::yellowCFA},
        {Alarm::D_CHANNEL, &TrunkStatus::dChanCFA},
        {Alarm::BPV_SATURATION, &TrunkStatus::bpvsCnt},
        {Alarm::FERR_SATURATION, &TrunkStatus::ferrCnt},
        {Alarm::LOOPBACK, &TrunkStatus::loopBackCFA},
    };
    for (const auto& [alarmId, field] : fields) {
        auto found = alarms.find(alarmId);
        if (found != alarms.end()) {
            this->*field = static_cast<unsigned int>(found->second);
        }
    }
}

TrunkStatus* TrunkStatus::TryCreate(Trunk* trunk) {
    TrunkStatus* status = nullptr;
    RunGuarded(std::cout, "TrunkStatus - ", [&] { status = new TrunkStatus(trunk); });
    return status;
}

}  // namespace vx7diag
