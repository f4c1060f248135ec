// Random blocks and control lines into the emulation core: nothing a client sends may crash it
// or make it read outside a block.
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <sstream>
#include <string>

#include "catalogue/generated/values.h"
#include "platform/farm/ActiveFarm.h"
#include "platform/farm/Addresses.h"
#include "platform/tkhost/tkhost.h"
#include "sim/Emulation.h"

namespace {

namespace wire = tolk::wire;

// Types the model sends, so that most inputs reach a real handler.
constexpr std::uint32_t kTypes[] = {
    wire::StdResource::MsgType::MsgComtest_t,
    wire::StdResource::MsgType::MsgSetParm_t,
    wire::StdResource::MsgType::MsgSetxParms_t,
    wire::StdResource::MsgType::MsgGetParm_t,
    wire::StdResource::MsgType::MsgGetxParms_t,
    wire::StdResource::MsgType::MsgDetectEvt_t,
    wire::StdResource::MsgType::MsgDetectxEvts_t,
    wire::StdResource::MsgType::MsgCancelEvt_t,
    wire::StdResource::MsgType::MsgCancelxEvts_t,
    wire::StdResource::MsgType::MsgCancelAllEvts_t,
    wire::StdResource::MsgType::MsgGetVParm_t,
    wire::ClusterMgr::MsgType::ClusterFind_t,
    wire::ClusterMgr::MsgType::ClusterCompByAttr_t,
    wire::ClusterMgr::MsgType::ClusterByComp_t,
    wire::ResourceMgr::MsgType::CompFind_t,
    wire::ResourceMgr::MsgType::CompInstAllocate_t,
    wire::ResourceMgr::MsgType::CompUse_t,
    wire::ResourceMgr::MsgType::CompUnuse_t,
    wire::Cluster::MsgType::ClusterSlotInfo_t,
    wire::Cluster::MsgType::ClusterSlotAssign_t,
    wire::Cluster::MsgType::ClusterActivate_t,
    wire::Cluster::MsgType::ClusterDeactivate_t,
    wire::Cluster::MsgType::ClusterSlotUnassign_t,
    wire::Cluster::MsgType::ClusterCompInfo_t,
    wire::Cluster::MsgType::ClusterUnlock_t,
    wire::TSC::MsgType::MsgMakeCall_t,
    wire::TSC::MsgType::MsgAnswerCall_t,
    wire::TSC::MsgType::MsgAcceptCall_t,
    wire::TSC::MsgType::MsgDropCall_t,
    wire::TSC::MsgType::MsgReleaseCall_t,
    wire::TSC::MsgType::MsgRejectCall_t,
    wire::TSC::MsgType::MsgGetCallState_t,
    wire::TSC::MsgType::MsgGetChanState_t,
    wire::TSC::MsgType::MsgSetChanState_t,
    wire::TSC::MsgType::MsgResetLineDevice_t,
    wire::TSC::MsgType::MsgDial_t,
    wire::TSC::MsgType::MsgSendISDN_t,
    wire::TSC::MsgType::MsgAttach_t,
    wire::TSC::MsgType::MsgDetach_t,
    wire::TSC::MsgType::MsgSetAlarmMask_t,
    wire::TSC::MsgType::MsgGetAlarmMask_t,
    wire::TSC::MsgType::MsgTxRxSignalingGet_t,
    wire::LCON::MsgType::MsgGetLineState_t,
    wire::LCON::MsgType::MsgSetLineState_t,
    wire::LCON::MsgType::MsgGetAlarms_t,
    wire::LCON::MsgType::MsgGetFaults_t,
    wire::LCON::MsgType::MsgGetDiagMode_t,
    wire::LCON::MsgType::MsgSetDiagMode_t,
    wire::LCON::MsgType::MsgSendAlarm_t,
    wire::LCON::MsgType::MsgStopAlarm_t,
    wire::CAS::MsgType::MsgMatchCondition_t,
    wire::CAS::MsgType::MsgDial_t,
    wire::TSC::MsgType::MsgHoldCall_t,
    wire::TSC::MsgType::MsgRetrieveCall_t,
    wire::TSC::MsgType::MsgBlindTransferCall_t,
    wire::TSC::MsgType::MsgInitTransfer_t,
    wire::TSC::MsgType::MsgCompleteTransfer_t,
    wire::TSC::MsgType::MsgCancelTransfer_t,
    wire::TSC::MsgType::MsgProceedCall_t,
};

sim::Emulation& emulation() {
    static std::ostringstream log;
    static sim::Emulation emu(farm::activeFarm().farm, log);
    return emu;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size < 4) {
        return 0;
    }
    sim::Emulation& emu = emulation();
    if (data[0] == 0xC0) {
        std::string line(reinterpret_cast<const char*>(data + 1), size - 1);
        if (line.rfind("delay", 0) != 0 && line.find("bpv") == std::string::npos &&
            line.find("ferr") == std::string::npos) {
            (void)emu.control(line);
        }
    } else {
        // Byte 0 picks the type, byte 1 the target kind, byte 2 a trunk/channel, rest the body.
        std::uint32_t type = kTypes[data[0] % (sizeof kTypes / sizeof kTypes[0])];
        unsigned int board = 1 + data[1] % 3;
        int n = 1 + data[2] % 4;
        farm::Address tgt;
        switch (data[1] >> 5) {
            case 0:
                tgt = farm::resourceMgrAddress(board);
                break;
            case 1:
                tgt = farm::clusterMgrAddress(board);
                break;
            case 2:
                tgt = farm::channelClusterAddress(board, 1, n);
                break;
            case 3:
                tgt = farm::rocClusterAddress(board, n);
                break;
            case 4:
                tgt = farm::lconAddress(board, 1 + (n & 1));
                break;
            case 5:
                tgt = farm::channelComponentAddress(board, 1, n, farm::kCAS);
                break;
            default:
                tgt = farm::channelComponentAddress(board, 1, n, farm::kTSC);
                break;
        }
        std::size_t bodySize = size - 3;
        TKMsg32Bit* b = nullptr;
        if (tkMsgAllocate(static_cast<unsigned int>(bodySize), &b) != 0 || !b) {
            return 0;
        }
        b->type = type;
        b->transTag = 0x123400u;
        b->srcBoard = 0xFF;
        b->srcInstance = 1;
        b->tgtInstance = tgt.instance;
        b->tgtBoard = tgt.board;
        b->tgtProcessor = tgt.processor;
        b->tgtComponent = tgt.component;
        b->tgtNode = tgt.node;
        std::memcpy(tkMsgBody(b), data + 3, bodySize);
        emu.receive(b);
    }
    while (emu.burstsPending()) {
        emu.pumpBursts(1024);
    }
    auto far = sim::Clock::now() + std::chrono::hours(24);
    while (TKMsg32Bit* out = emu.popDue(far)) {
        tkMsgFree(out);
    }
    return 0;
}
