#include "model/Phone.h"

#include <iostream>
#include <stdexcept>

#include "model/Board.h"
#include "model/BoardManager.h"
#include "model/Guarded.h"
#include "model/ROCCluster.h"
#include "transport/TKSCommon.h"

namespace vx7diag {

namespace {

// Messages for the channel that nobody asked for are dropped.
void Phone_UnregisteredMsgHandler(tolk::Addressable*, tolk::Msg* msg) {
    delete msg;
}
void Phone_UnregisteredEvtGroupHandler(tolk::Addressable*, tolk::Msg* msg) {
    delete msg;
}
void Phone_UnregisteredSourceHandler(tolk::MsgQueue&, tolk::Msg* msg) {
    delete msg;
}

void RegisterPhoneHandlers(tolk::Addressable& cluster) {
    cluster.asyncUnregisteredMsgType(Phone_UnregisteredMsgHandler, 0);
    cluster.asyncUnregisteredEvtGroup(Phone_UnregisteredEvtGroupHandler, 0);
    cluster.UnregisteredSource(Phone_UnregisteredSourceHandler);
}

// One request; true when the board took it. A refusal or silence is written to standard output.
template <class Work>
bool Request(Work&& work) {
    try {
        work();
        return true;
    } catch (const tolk::Addressable::UnexpectedMsg& e) {
        std::cout << e << std::endl;
    } catch (const tolk::Addressable::Timeout& e) {
        std::cout << e << std::endl;
    }
    return false;
}

// The same for the two operations that head a refusal with a banner of their own.
template <class Work>
bool RequestWithBanner(const char* banner, Work&& work) {
    try {
        work();
        return true;
    } catch (const tolk::Addressable::UnexpectedMsg& e) {
        std::cout << banner << std::endl << "===============" << std::endl << e << std::endl;
    } catch (const tolk::Addressable::Timeout& e) {
        std::cout << e << std::endl;
    }
    return false;
}

// One step of joining: an unexpected answer is reported and the next step still runs.
template <class Work>
void JoinStep(const char* failure, Work&& work) {
    try {
        work();
    } catch (const tolk::Addressable::UnexpectedMsg& e) {
        std::cout << failure << std::endl << e << std::endl;
    }
}

}  // namespace

Phone::Phone(BoardManager* manager, unsigned int t, unsigned int c)
    : trunk(t), channel(c), boardManager(manager), origAddr("5551212"), destAddr("5551234") {
    if (trunk >= 65) {
        throw std::out_of_range("Phone::Phone() trunk is out of range");
    }
    if (channel >= 32) {
        throw std::out_of_range("Phone::Phaone() channel is out of range");
    }
    board = manager != nullptr ? manager->GetBoard() : nullptr;
    if (board == nullptr) {
        throw std::runtime_error("Phone::Phone() board is not available");
    }
    tscCluster = std::make_unique<tolk::Cluster>(
        Captured([&] { return board->findClustByTSC(trunk, channel); }));
    tolk::TmpInstance instance = Captured([&] { return tscCluster->find(TSC_COMPONENT_TYPE); });
    tsc = std::make_unique<tolk::TSC>(instance);
    RegisterPhoneHandlers(*tscCluster);
}

// The TSC and its cluster receive no events, so once the phone goes no reader thread can reach
// them: they go with it.
Phone::~Phone() = default;

int Phone::Start() {
    if (boardManager->IsFlexibleRoutingEnabled(trunk, channel)) {
        return Attach();
    }
    return 0;
}

int Phone::Stop() {
    if (boardManager->IsFlexibleRoutingEnabled(trunk, channel)) {
        return Detach();
    }
    return 0;
}

int Phone::Attach() {
    rocCluster = boardManager->GetTelephonyVoiceChannel(trunk, channel);
    if (rocCluster == nullptr) {
        std::cout << "Phone::Attach - no voice resources for trunk " << trunk << " channel "
                  << channel << std::endl;
        return -1;
    }
    MediaList mediaList = rocCluster->GetMediaDescriptors();
    tolk::Cluster* roc = rocCluster->GetCluster();

    unsigned char tscWidth = 0, tscEncoding = 0, tscIdle = 0;
    tolk::staticList<unsigned short> tscSlots;
    unsigned char rocWidth = 0, rocEncoding = 0, rocIdle = 0;
    tolk::staticList<unsigned short> rocSlots;

    // Silence stops the joining: every further step would wait out its own time-out.
    try {
        JoinStep("Unexpected response msg - TSC_MsgAttach", [&] {
            tolk::TSC::MsgAttachCmplt_t done;
            tsc->Attach(mediaList, &done);
        });
        JoinStep("Unexpected response msg - TSC cluster - TSInfo ", [&] {
            tscCluster->TSInfo(TSINFO_PORT, &tscWidth, &tscEncoding, &tscIdle, &tscSlots);
        });
        RegisterPhoneHandlers(*roc);
        JoinStep("Unexpected response msg - ROC cluster - TSInfo ",
                 [&] { roc->TSInfo(TSINFO_PORT, &rocWidth, &rocEncoding, &rocIdle, &rocSlots); });
        JoinStep("Unexpected response msg -  ROC TSAssign ",
                 [&] { roc->TSAssign(TSASSIGN_PORT, tscSlots, tscEncoding, tscIdle); });
        JoinStep("Unexpected response msg - TSC - TSAssign ",
                 [&] { tscCluster->TSAssign(TSASSIGN_PORT, rocSlots, rocEncoding, rocIdle); });
        JoinStep("Unexpected response msg -ROC Activate ",
                 [&] { roc->Activate(TSASSIGN_PORT, nullptr, 0); });
        JoinStep("Unexpected response msg - TSC Activate ",
                 [&] { tscCluster->Activate(TSASSIGN_PORT, nullptr, 0); });
    } catch (const tolk::Exception& e) {
        std::cout << "Phone::Attach - " << e << std::endl;
        return -1;
    } catch (const TKSException&) {
        std::cout << "Phone::Attach - transport failure" << std::endl;
        return -1;
    }
    return 0;
}

int Phone::Detach() {
    if (rocCluster == nullptr) {
        rocCluster = boardManager->GetTelephonyVoiceChannel(trunk, channel);
    }
    if (rocCluster == nullptr) {
        return 0;
    }
    tolk::Cluster* roc = rocCluster->GetCluster();
    try {
        tsc->Detach(nullptr);
        roc->Deactivate(TSASSIGN_PORT);
        tscCluster->Deactivate(TSASSIGN_PORT);
        roc->TSUnassign(TSASSIGN_PORT);
        tscCluster->TSUnassign(TSASSIGN_PORT);
    } catch (const tolk::Addressable::UnexpectedMsg& e) {
        std::cout << e << std::endl;
    } catch (...) {
    }
    return 0;
}

unsigned int Phone::MakeCall(tolk::string orig, tolk::string dest) {
    tolk::TSC::MsgMakeCallCmplt_t answer;
    unsigned char progress = cpaMode;
    bool ok =
        RequestWithBanner("MAKECALL FAILED", [&] { tsc->MakeCall(dest, orig, progress, &answer); });
    return ok ? *answer.pCallId : 0;
}

unsigned int Phone::GetCallState(unsigned int callId) {
    tolk::TSC::MsgGetCallStateCmplt_t answer;
    return GetCallState(callId, &answer);
}

unsigned int Phone::GetCallState(unsigned int callId, tolk::TSC::MsgGetCallStateCmplt_t* out) {
    tolk::TSC::MsgGetCallStateCmplt_t own;
    tolk::TSC::MsgGetCallStateCmplt_t* answer = out != nullptr ? out : &own;
    bool ok = Request([&] { tsc->GetCallState(callId, answer); });
    return ok ? *answer->pCallState : 0;
}

unsigned int Phone::GetChanState() {
    tolk::TSC::MsgGetChanStateCmplt_t answer;
    bool ok = Request([&] { tsc->GetChanState(&answer); });
    return ok ? *answer.pChanState : 0;
}

int Phone::SetChanState(unsigned int state) {
    return Request([&] { tsc->SetChanState(state, nullptr); }) ? 0 : -1;
}

int Phone::AnswerCall(unsigned int callId) {
    return Request([&] { tsc->AnswerCall(callId); }) ? 1 : 0;
}

int Phone::AnswerCall(unsigned int callId, unsigned int numRings) {
    return Request([&] { tsc->AnswerCall(callId, numRings); }) ? 1 : 0;
}

int Phone::AcceptCall(unsigned int callId) {
    return Request([&] { tsc->AcceptCall(callId); }) ? 1 : 0;
}

int Phone::Reset(unsigned int state) {
    return Request([&] { tsc->ResetLineDevice(state, nullptr); }) ? 1 : 0;
}

int Phone::DropCall(unsigned int callId) {
    return Request([&] { tsc->DropCall(callId); }) ? 0 : 1;
}

int Phone::ReleaseCall(unsigned int callId) {
    return Request([&] { tsc->ReleaseCall(callId); }) ? 0 : 1;
}

int Phone::RejectCall(unsigned int callId, unsigned int reason) {
    return Request([&] { tsc->RejectCall(callId, reason); }) ? 0 : 1;
}

int Phone::DialDigits(tolk::string digits, unsigned int callId) {
    tolk::TSC::MsgDialCmplt_t answer;
    return Request([&] { tsc->Dial(digits, callId, &answer); }) ? 0 : 1;
}

int Phone::HoldCall(unsigned int callId) {
    return Request([&] { tsc->HoldCall(callId); }) ? 0 : 1;
}

int Phone::RetrieveCall(unsigned int callId) {
    return Request([&] { tsc->RetrieveCall(callId); }) ? 0 : 1;
}

int Phone::BlindTransfer(unsigned int callId, tolk::string dest, tolk::string orig,
                         int callProgress) {
    auto progress = static_cast<unsigned char>(callProgress);
    return Request([&] { tsc->BlindTransferCall(callId, dest, orig, progress); }) ? 0 : 1;
}

unsigned int Phone::InitTransfer(unsigned int callId, tolk::string dest, tolk::string orig,
                                 int callProgress) {
    auto progress = static_cast<unsigned char>(callProgress);
    tolk::TSC::MsgInitTransferCmplt_t answer;
    bool ok = RequestWithBanner("InitTransfer FAILED",
                                [&] { tsc->InitTransfer(callId, dest, orig, progress, &answer); });
    return ok ? *answer.pCallId : 0;
}

int Phone::CompleteTransfer(unsigned int callId, unsigned int conCallId) {
    return Request([&] { tsc->CompleteTransfer(conCallId, callId); }) ? 0 : 1;
}

int Phone::CancelTransfer(unsigned int callId) {
    return Request([&] { tsc->CancelTransfer(callId); }) ? 0 : 1;
}

int Phone::SendISDN(unsigned int callId, unsigned int messageType, std::vector<char> data) {
    tolk::staticList<unsigned char> bytes;
    bytes.realloc(static_cast<unsigned int>(data.size()));
    for (unsigned int i = 0; i < data.size(); ++i) {
        *bytes.element(i) = static_cast<unsigned char>(data[i]);
    }
    tolk::TSC::MsgSendISDNCmplt_t answer;
    return Request([&] { tsc->SendISDN(messageType, bytes, callId, &answer); }) ? 0 : 1;
}

int Phone::SetCallId(unsigned int) {
    return 0;
}

unsigned int Phone::GetCurCallId() {
    return 0;
}

int Phone::SetOrigAddr(const std::string& addr) {
    try {
        origAddr = addr;
    } catch (...) {
        return -1;
    }
    return 0;
}

int Phone::SetDestAddr(const std::string& addr) {
    try {
        destAddr = addr;
    } catch (...) {
        return -1;
    }
    return 0;
}

std::string Phone::GetOrigAddr() {
    return origAddr;
}

std::string Phone::GetDestAddr() {
    return destAddr;
}

int Phone::SetCPAMode(unsigned int mode) {
    cpaMode = static_cast<unsigned char>(mode & 0xFF);
    return 0;
}

unsigned int Phone::GetCPAMode() {
    return cpaMode;
}

}  // namespace vx7diag
