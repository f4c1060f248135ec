// The board manager, phones, trunks and event publishers against the built-in board emulation
// of a farm.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "LogCapture.h"
#include "RecordingObserver.h"
#include "SimFixture.h"
#include "model/Board.h"
#include "model/BoardManager.h"
#include "model/Guarded.h"
#include "model/Phone.h"
#include "model/TSCCallState.h"
#include "model/TSCChanState.h"
#include "model/Trunk.h"
#include "model/TrunkState.h"
#include "model/VX7EventPublisher.h"
#include "platform/farm/Addresses.h"

namespace {

using testing::AllOf;
using testing::ContainsRegex;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;
using testing::ThrowsMessage;
using testsupport::LogCapture;
using namespace vx7diag;

std::vector<unsigned int> MediaTypes(BoardManager& manager, unsigned int trunk,
                                     unsigned int channel) {
    MediaList media = manager.GetMediaResources(trunk, channel);
    std::vector<unsigned int> types;
    for (unsigned int i = 0; i < media.length(); ++i) {
        types.push_back(media.element(i)->ComponentType);
    }
    return types;
}

bool SameAddress(const tolk::CompDesc_t& got, const farm::Address& want) {
    return got.instance == want.instance && got.board == want.board &&
           got.component == want.component;
}

// The phones share one manager of the fixed board 1 and one of the flexible board 2.
class DefaultFarm : public SimFixture {
  protected:
    static void SetUpTestSuite() {
        UseFarm("");
        fixedBoard = std::make_unique<BoardManager>(1);
        flexibleBoard = std::make_unique<BoardManager>(2);
    }
    static void TearDownTestSuite() {
        fixedBoard.reset();
        flexibleBoard.reset();
    }
    static inline std::unique_ptr<BoardManager> fixedBoard;
    static inline std::unique_ptr<BoardManager> flexibleBoard;
};

// ---- the board manager ----

TEST_F(DefaultFarm, BoardsAreWalkedTrunkByTrunk) {
    LogCapture out;
    BoardManager& digital = *fixedBoard;
    EXPECT_EQ(digital.GetBoardName(), "VX7/T1-2");
    EXPECT_EQ(digital.GetSerialNumber(), "VX7-0001");
    EXPECT_EQ(digital.GetBoardType(), BoardManager::DIGITAL_BOARD);
    BoardManager analog(3);
    EXPECT_EQ(analog.GetBoardType(), BoardManager::ANALOG_BOARD);
    // The analog walk ends on the board's refusal, which is no failure to log.
    EXPECT_THAT(out.Text(), Not(HasSubstr("UnexpectedMsg")));

    const struct {
        BoardManager* manager;
        unsigned int trunk;
        int channels, trunkType, signaling;
    } rows[] = {{&digital, 1, 24, 1, 4},  {&digital, 2, 24, 1, 4},   {&digital, 0, 0, -1, -1},
                {&digital, 3, 0, -1, -1}, {&digital, 65, 0, -1, -1}, {&analog, 1, 4, 4, 4},
                {&analog, 2, 4, 4, 4},    {&analog, 3, 0, -1, -1}};
    for (const auto& r : rows) {
        SCOPED_TRACE(std::to_string(r.manager->GetBoardType()) + " trunk " +
                     std::to_string(r.trunk));
        EXPECT_EQ(r.manager->GetNumberOfTrunks(), 2);
        EXPECT_EQ(r.manager->GetNumChannelsOnTrunk(r.trunk), r.channels);
        EXPECT_EQ(r.manager->GetTrunkType(r.trunk), r.trunkType);
        EXPECT_EQ(r.manager->GetSignalingType(r.trunk), r.signaling);
    }
    // Fixed routing: no voice resources to look up on any line.
    EXPECT_FALSE(digital.IsFlexibleRoutingEnabled(1, 1));
    EXPECT_EQ(digital.GetVoiceChannelCount(), 0);
    EXPECT_EQ(digital.GetTelephonyVoiceChannel(1, 1), nullptr);
    EXPECT_TRUE(MediaTypes(digital, 1, 24).empty());
}

// The walk's end is told from a failure by the answer: only a refusal means "no such line".
TEST_F(DefaultFarm, OnlyARefusedSearchFindsNothing) {
    tolk::Board board(3);
    EXPECT_TRUE(FoundOrRefused([&] { return board.findClustByLCON(2); }).has_value());
    EXPECT_FALSE(FoundOrRefused([&] { return board.findClustByLCON(3); }).has_value());

    // A search nobody answered is a failure, not a refusal.
    Silence(0x800053);
    EXPECT_THAT([&] { FoundOrRefused([&] { return board.findClustByLCON(3); }); },
                ThrowsMessage<BoardFailure>(HasSubstr("Timeout")));
}

// Voice channels are numbered in channel order; media lists follow the attribute table's
// order (SIGDET, SIGBUF_DTMF, SIGBUF_MF, TONEGEN, CALLANALYSIS, CALLERID: no R2 MF here).
TEST_F(DefaultFarm, FlexibleRoutingMapsVoiceChannelsInOrder) {
    BoardManager& manager = *flexibleBoard;
    EXPECT_TRUE(manager.IsFlexibleRoutingEnabled(1, 1));
    EXPECT_EQ(manager.GetTelephonyMediaRoutingMode(7, 7), 1);
    EXPECT_EQ(manager.GetNumberOfTrunks(), 1);
    EXPECT_EQ(manager.GetNumChannelsOnTrunk(1), 23);
    EXPECT_EQ(manager.GetSignalingType(1), 5);
    EXPECT_EQ(manager.GetVoiceChannelCount(), 23);
    for (unsigned int channel = 1; channel <= 23; ++channel) {
        EXPECT_EQ(manager.GetVoiceChannelNumber(1, channel), channel);
        ROCCluster* roc = manager.GetTelephonyVoiceChannel(1, channel);
        ASSERT_NE(roc, nullptr) << channel;
        EXPECT_TRUE(SameAddress(roc->GetCluster()->getTgtDesc(),
                                farm::rocClusterAddress(2, static_cast<int>(channel))))
            << channel;
    }
    for (auto [trunk, channel] : std::vector<std::pair<unsigned int, unsigned int>>{
             {1, 0}, {1, 24}, {1, 32}, {2, 1}, {0, 1}, {0xFFFFFFFF, 0xFFFFFFFF}}) {
        EXPECT_EQ(manager.GetTelephonyVoiceChannel(trunk, channel), nullptr)
            << trunk << "." << channel;
        EXPECT_TRUE(MediaTypes(manager, trunk, channel).empty());
    }
    EXPECT_EQ(MediaTypes(manager, 1, 5), (std::vector<unsigned int>{7, 8, 8, 5, 10, 41}));
    EXPECT_EQ(manager.GetTelephonyVoiceChannel(1, 5)->GetMediaCount(), 6);
    EXPECT_TRUE(SameAddress(manager.GetMediaResources(1, 5).element(0)->InstDesc,
                            farm::mediaAddress(2, 5, farm::Media::SigDet)));
}

TEST_F(DefaultFarm, BoardTheMapDoesNotListGivesAnEmptyManager) {
    BoardManager manager(9);
    EXPECT_EQ(manager.GetBoard(), nullptr);
    EXPECT_FALSE(manager.HasBoardName());
    EXPECT_EQ(manager.GetBoardName(), "");
    EXPECT_EQ(manager.GetNumberOfTrunks(), 0);
    EXPECT_EQ(manager.GetBoardType(), 0);
    EXPECT_FALSE(manager.IsFlexibleRoutingEnabled());
    EXPECT_TRUE(MediaTypes(manager, 1, 1).empty());
}

TEST_F(DefaultFarm, RefusedParameterQueriesMeanAnUnknownBoardWithFixedRouting) {
    Refuse(0x12);
    LogCapture out;
    BoardManager manager(2);
    EXPECT_FALSE(manager.IsFlexibleRoutingEnabled());
    EXPECT_EQ(manager.GetVoiceChannelCount(), 0);
    EXPECT_EQ(manager.GetTelephonyVoiceChannel(1, 1), nullptr);
}

class FlexibleFarm : public SimFixture {
  protected:
    static void SetUpTestSuite() { UseFarm("flexible.toml"); }
    static void TearDownTestSuite() { UseFarm(""); }
};

// The second trunk continues the voice channels; the media list follows the attribute order,
// not the farm's (SIGDETADDR, TONEGENADDR, CALLERIDADDR); the fixed board beside it has no
// voice resources.
TEST_F(FlexibleFarm, VoiceChannelsAcrossTrunks) {
    BoardManager manager(7);
    ASSERT_TRUE(manager.IsFlexibleRoutingEnabled());
    EXPECT_EQ(manager.GetVoiceChannelCount(), 5);
    EXPECT_EQ(manager.GetVoiceChannelNumber(1, 3), 3u);
    EXPECT_EQ(manager.GetVoiceChannelNumber(2, 1), 4u);
    EXPECT_EQ(manager.GetVoiceChannelNumber(2, 2), 5u);
    EXPECT_EQ(manager.GetVoiceChannelNumber(2, 3), 0u);
    EXPECT_NE(manager.GetTelephonyVoiceChannel(2, 2), nullptr);
    EXPECT_NE(manager.GetTelephonyVoiceChannel(2, 1), manager.GetTelephonyVoiceChannel(1, 1));
    EXPECT_EQ(MediaTypes(manager, 2, 2), (std::vector<unsigned int>{7, 5, 41}));

    BoardManager fixed(8);
    EXPECT_FALSE(fixed.IsFlexibleRoutingEnabled());
    EXPECT_EQ(fixed.GetVoiceChannelCount(), 0);
}

// ---- phones ----

TEST_F(DefaultFarm, PhoneRangeChecksComeFirstTrunkBeforeChannel) {
    BoardManager* fixed = fixedBoard.get();
    const auto trunk = ThrowsMessage<std::out_of_range>("Phone::Phone() trunk is out of range");
    EXPECT_THAT([&] { Phone(fixed, 65, 1); }, trunk);
    EXPECT_THAT([&] { Phone(fixed, 1, 32); },
                ThrowsMessage<std::out_of_range>("Phone::Phaone() channel is out of range"));
    EXPECT_THAT([&] { Phone(fixed, 65, 32); }, trunk);
    EXPECT_THAT([] { Phone(nullptr, 65, 1); }, trunk);
    // The limits themselves pass the check (a BoardFailure is no std::out_of_range); the board
    // then has no such channel.
    EXPECT_THROW(Phone(fixed, 64, 31), BoardFailure);
    EXPECT_THROW(Phone(flexibleBoard.get(), 1, 24), BoardFailure);
    BoardManager absent(9);
    EXPECT_THROW(Phone(&absent, 1, 1), std::runtime_error);
}

TEST_F(DefaultFarm, PhoneDefaultsAndSettings) {
    Phone phone(fixedBoard.get(), 1, 2);
    EXPECT_EQ(phone.GetOrigAddr(), "5551212");
    EXPECT_EQ(phone.GetDestAddr(), "5551234");
    EXPECT_EQ(phone.SetOrigAddr(""), 0);
    EXPECT_EQ(phone.GetOrigAddr(), "");
    EXPECT_EQ(phone.SetCPAMode(0x101), 0);
    EXPECT_EQ(phone.GetCPAMode(), 1u);
    EXPECT_EQ(phone.SetCallId(77), 0);
    EXPECT_EQ(phone.GetCurCallId(), 0u);
}

// With fixed routing there is nothing to join: a refused TSC attach would print its failure
// line if anything were sent. With flexible routing the voice resources are joined and parted.
TEST_F(DefaultFarm, PhoneStartAndStopJoinOnlyFlexibleRouting) {
    Phone fixed(fixedBoard.get(), 1, 3);
    Phone flexible(flexibleBoard.get(), 1, 2);
    {
        Refuse(0x1234);
        Refuse(0x1236);
        LogCapture out;
        EXPECT_EQ(fixed.Start(), 0);
        EXPECT_EQ(fixed.Stop(), 0);
        EXPECT_EQ(out.Text(), "");
    }
    Control("normal 1234");
    Control("normal 1236");
    LogCapture out;
    EXPECT_EQ(flexible.Start(), 0);
    EXPECT_NE(flexible.GetRocCluster(), nullptr);
    EXPECT_EQ(flexible.Stop(), 0);
    EXPECT_EQ(out.Text(), "");
}

TEST_F(DefaultFarm, SilentBoardGivesThePhoneItsFailureValueAndThePhoneStaysUsable) {
    Phone phone(fixedBoard.get(), 1, 7);
    Silence(0x1214);
    Silence(0x120D);
    {
        LogCapture out;
        EXPECT_EQ(phone.MakeCall("5551218", "5551219"), 0u);
        EXPECT_THAT(out.Text(), StartsWith("Addressable::Timeout ObjSource: "));
        EXPECT_THAT(out.Text(), Not(HasSubstr("MAKECALL FAILED")));
    }
    Control("normal 120D");
    EXPECT_EQ(phone.GetCallState(0), 0u);
    EXPECT_NE(phone.GetChanState(), 0u);
}

// Each operation whose request the board refuses gives its own failure value and prints the
// refusal; a refused call puts its banner before the exception.
TEST_F(DefaultFarm, RefusedPhoneOperationsGiveTheirFailureValues) {
    const struct {
        unsigned int type;
        std::function<int(Phone&)> op;
        int failure;
        const char* said = "Addressable::UnexpectedMsg";
    } rows[] = {
        {0x1214, [](Phone& p) { return int(p.MakeCall("5551217", "5551218")); }, 0,
         "MAKECALL FAILED\n===============\nAddressable::UnexpectedMsg"},
        {0x120D, [](Phone& p) { return int(p.GetCallState(3)); }, 0},
        {0x120F, [](Phone& p) { return int(p.GetChanState()); }, 0},
        {0x121F, [](Phone& p) { return p.SetChanState(4); }, -1},
        {0x1201, [](Phone& p) { return p.AnswerCall(3); }, 0},
        {0x1201, [](Phone& p) { return p.AnswerCall(3, 2); }, 0},
        {0x1200, [](Phone& p) { return p.AcceptCall(3); }, 0},
        {0x1246, [](Phone& p) { return p.Reset(0x100); }, 0},
        {0x120A, [](Phone& p) { return p.DropCall(3); }, 1},
        {0x121C, [](Phone& p) { return p.ReleaseCall(3); }, 1},
        {0x121D, [](Phone& p) { return p.RejectCall(3, 2); }, 1},
        {0x1224, [](Phone& p) { return p.DialDigits("123", 3); }, 1},
        {0x1211, [](Phone& p) { return p.HoldCall(3); }, 1},
        {0x121E, [](Phone& p) { return p.RetrieveCall(3); }, 1},
        {0x1202, [](Phone& p) { return p.BlindTransfer(3, "5551300", "5551212", 0); }, 1},
        {0x1212, [](Phone& p) { return int(p.InitTransfer(3, "5551300", "5551212", 0)); }, 0},
        {0x1207, [](Phone& p) { return p.CompleteTransfer(3, 4); }, 1},
        {0x1203, [](Phone& p) { return p.CancelTransfer(3); }, 1},
        {0x1222,
         [](Phone& p) {
             return p.SendISDN(3, 5, std::vector<char>{1, 2, 3});
         },
         1},
    };
    Phone phone(fixedBoard.get(), 2, 1);
    for (const auto& r : rows) {
        SCOPED_TRACE(testing::Message() << "type 0x" << std::hex << r.type);
        Refuse(r.type);
        LogCapture out;
        EXPECT_EQ(r.op(phone), r.failure);
        EXPECT_THAT(out.Text(), HasSubstr(r.said));
    }
}

TEST_F(DefaultFarm, AcceptedPhoneOperationsGiveTheirSuccessValues) {
    Phone caller(fixedBoard.get(), 2, 2);
    Phone callee(fixedBoard.get(), 2, 3);
    // The board's own numbers for taking a channel out of service and back.
    EXPECT_EQ(callee.SetChanState(257), 0);
    EXPECT_EQ(callee.SetChanState(256), 0);
    EXPECT_EQ(callee.Reset(0x100), 1);
    // Channel 3 of trunk 2 answers 5551302.
    unsigned int callId = caller.MakeCall("5551301", "5551302");
    ASSERT_NE(callId, 0u);
    tolk::TSC::MsgGetCallStateCmplt_t state;
    EXPECT_NE(caller.GetCallState(callId, &state), 0u);
    EXPECT_EQ(*state.pCallId, callId);
    EXPECT_NE(caller.GetChanState(), 0u);
    tolk::TSC::MsgGetCallStateCmplt_t offered;
    callee.GetCallState(0, &offered);
    unsigned int incoming = *offered.pCallId;
    EXPECT_EQ(callee.AcceptCall(incoming), 1);
    EXPECT_EQ(callee.AnswerCall(incoming), 1);
    EXPECT_EQ(caller.DropCall(callId), 0);
    EXPECT_EQ(caller.ReleaseCall(callId), 0);
}

// A refused attach of the TSC does not stop the cluster steps: each reports its refusal, in
// order, and the cluster is never asked for its slots.
TEST_F(DefaultFarm, RefusedTscAttachDoesNotStopTheClusterSteps) {
    Phone phone(flexibleBoard.get(), 1, 3);
    Refuse(0x1234);
    Refuse(0x800030);
    LogCapture out;
    EXPECT_EQ(phone.Attach(), 0);
    EXPECT_THAT(out.Text(), AllOf(ContainsRegex("Unexpected response msg - TSC_MsgAttach\n.*"
                                                "Unexpected response msg -  ROC TSAssign \n.*"
                                                "Unexpected response msg - TSC - TSAssign \n"),
                                  Not(HasSubstr("TSInfo"))));
}

TEST_F(DefaultFarm, RefusedTscDetachEndsTheParting) {
    Phone phone(flexibleBoard.get(), 1, 4);
    ASSERT_EQ(phone.Start(), 0);
    Refuse(0x1236);
    // Had the parting gone on, the refused deactivation would have been the first failure.
    Refuse(0x800023, 0x55);
    LogCapture out;
    EXPECT_EQ(phone.Detach(), 0);
    EXPECT_THAT(out.Text(), HasSubstr("CmdMsgType 0x1236"));
    EXPECT_THAT(out.Text(), Not(HasSubstr("0x800023")));
}

TEST_F(DefaultFarm, SilentJoiningStopsThePhoneAndReports) {
    Phone phone(flexibleBoard.get(), 1, 5);
    Silence(0x800032);
    LogCapture out;
    EXPECT_EQ(phone.Start(), -1);
    EXPECT_THAT(out.Text(), HasSubstr("Phone::Attach - Addressable::Timeout"));
}

// ---- trunks ----

// 257 and the unsigned form of -255 both end in the byte 1: they must not reach board 1's line.
TEST_F(DefaultFarm, OnlyLinesOfTheFarmAreTrunks) {
    EXPECT_NO_THROW(Trunk(1, 1));
    for (unsigned int board : {1u, 33u, 257u, static_cast<unsigned int>(-255)}) {
        EXPECT_THROW(Trunk(board, board == 1 ? 3 : 1), BoardFailure) << board;
    }
}

TEST_F(DefaultFarm, TrunkServiceChangesTheLineState) {
    Trunk trunk(1, 1);
    unsigned int state = 0, reason = 0;
    trunk.PutOutOfService();
    ASSERT_EQ(trunk.GetTrunkState(state, reason), 0);
    EXPECT_EQ(state, Trunk::OUT_OF_SERVICE);
    EXPECT_EQ(reason, 4u);
    trunk.PutInService();
    EXPECT_EQ(trunk.GetTrunkState(), Trunk::IN_SERVICE);
    // Putting it in service again is reported, not thrown.
    LogCapture out;
    EXPECT_NO_THROW(trunk.PutInService());
    EXPECT_EQ(out.Text(), "Trunk already In Service\n");
}

TEST_F(DefaultFarm, OtherRefusalsOfTrunkServicePrintTheException) {
    Trunk trunk(1, 2);
    Refuse(0x1610, 0x42);
    {
        LogCapture out;
        trunk.PutInService();
        EXPECT_EQ(out.Text(), "");
    }
    LogCapture out;
    trunk.PutOutOfService();
    EXPECT_THAT(out.Text(), StartsWith("Addressable::UnexpectedMsg"));
}

TEST_F(DefaultFarm, TrunkLoopBackModesAndARefusedAlarm) {
    Trunk trunk(1, 1);
    for (unsigned char mode : {1, 2}) {
        trunk.EnableLoopBack(mode);
        EXPECT_EQ(trunk.GetLoopBackMode(), mode);
    }
    trunk.DisableLoopBack();
    EXPECT_EQ(trunk.GetLoopBackMode(), 0);
    constexpr unsigned int kTransmitRAI = 0x160B;
    EXPECT_EQ(trunk.StartTransmitAlarm(kTransmitRAI), 0);
    EXPECT_EQ(trunk.StopTransmitAlarm(kTransmitRAI), 0);
    Refuse(0x160C);
    {
        LogCapture out;
        EXPECT_EQ(trunk.StartTransmitAlarm(kTransmitRAI), -1);
        EXPECT_THAT(out.Text(), HasSubstr("Addressable::UnexpectedMsg"));
    }
    unsigned int state = 0, reason = 0;
    EXPECT_EQ(trunk.GetTrunkState(state, reason), 0);
}

TEST_F(DefaultFarm, TrunkStatusShowsTheActiveAlarms) {
    Trunk trunk(1, 1);
    trunk.PutInService();
    std::unique_ptr<TrunkStatus> status(TrunkStatus::TryCreate(&trunk));
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->GetState(), Trunk::IN_SERVICE);
    EXPECT_EQ(status->GetRedCFA() + status->GetYellowCFA() + status->GetDChanCFA() +
                  status->GetBPVSCnt() + status->GetFERRCnt() + status->GetLOSCFA() +
                  status->GetLoopBackCFA(),
              0u);

    Control("alarm 1 1 red on");
    Control("alarm 1 1 los on");
    std::map<unsigned int, char> alarms = trunk.GetCurrentAlarms();
    EXPECT_EQ(alarms.count(0), 0u);
    EXPECT_EQ(alarms[0x1601], 1);
    status.reset(TrunkStatus::TryCreate(&trunk));
    Control("alarm 1 1 red off");
    Control("alarm 1 1 los off");
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->GetRedCFA(), 1u);
    EXPECT_EQ(status->GetLOSCFA(), 1u);
    EXPECT_EQ(status->GetYellowCFA(), 0u);
    EXPECT_EQ(status->GetLoopBackCFA(), 0u);
}

// An unreadable line state still gives a status with the alarms; unreadable alarms give none,
// and no exception either when asked through TryCreate.
TEST_F(DefaultFarm, TrunkStatusOfAnUnreadableBoard) {
    Trunk trunk(1, 1);
    Control("alarm 1 1 yellow on");
    Refuse(0x1608);
    std::unique_ptr<TrunkStatus> status(TrunkStatus::TryCreate(&trunk));
    Control("alarm 1 1 yellow off");
    ASSERT_NE(status, nullptr);
    EXPECT_EQ(status->GetState(), Trunk::OUT_OF_SERVICE);
    EXPECT_EQ(status->GetReason(), 0u);
    EXPECT_EQ(status->GetYellowCFA(), 1u);

    Control("normal 1608");
    Refuse(0x1602);
    EXPECT_THROW(TrunkStatus{&trunk}, tolk::Addressable::UnexpectedMsg);
    LogCapture out;
    EXPECT_EQ(TrunkStatus::TryCreate(&trunk), nullptr);
    EXPECT_THAT(out.Text(), StartsWith("TrunkStatus - Addressable::UnexpectedMsg"));
}

// ---- event publishers ----

constexpr unsigned int kClusterFind = 0x800053;
constexpr unsigned int kDetectxEvts = 0x18;
constexpr unsigned int kCancelxEvts = 0x1C;

class Publisher : public DefaultFarm {
  protected:
    // The aspects are process-wide objects, as the console's factory makes them.
    static inline TSCCallState callState;
    static inline TSCChanState chanState;
    static inline TrunkState trunkState;

    isa::RefPtr<Observer> first{new RecordingObserver};
    isa::RefPtr<Observer> second{new RecordingObserver};
};

// The components and clusters the publisher holds, named in one line.
std::string Held(const VX7EventPublisher& p) {
    return std::string(p.GetTsc() != nullptr ? "tsc " : "") +
           (p.GetLcon() != nullptr ? "lcon " : "") + (p.GetCas() != nullptr ? "cas " : "") +
           (p.GetChp() != nullptr ? "chp " : "") +
           (p.GetTscCluster() != nullptr ? "tscCluster " : "") +
           (p.GetLconCluster() != nullptr ? "lconCluster " : "");
}

TEST_F(Publisher, FirstObserverSubscribesSecondSendsNothing) {
    VX7EventPublisher publisher(1, 1, 2);
    EXPECT_EQ(publisher.Detach(first, callState), 0);
    ASSERT_TRUE(publisher.Attach(first, &callState));
    EXPECT_EQ(Held(publisher), "tsc tscCluster lconCluster ");
    EXPECT_EQ(publisher.GetCount(VX7EventPublisher::TSC_COMPONENT), 1u);

    // Had the second observer asked the board again, the refusal would have failed it.
    Refuse(kDetectxEvts);
    EXPECT_TRUE(publisher.Attach(second, &callState));
    EXPECT_EQ(publisher.GetCount(VX7EventPublisher::TSC_COMPONENT), 1u);
    EXPECT_FALSE(publisher.Attach(second, &callState));
    EXPECT_EQ(publisher.Detach(second, callState), 1);
    EXPECT_EQ(publisher.Detach(first, callState), 0);
}

// A refused subscription and a refused cluster search are failed attaches, not exceptions,
// and leave nothing behind.
TEST_F(Publisher, RefusedSubscriptionLeavesNothingBehind) {
    VX7EventPublisher publisher(1, 1, 3);
    Refuse(kDetectxEvts);
    EXPECT_FALSE(publisher.Attach(first, &callState));
    EXPECT_EQ(publisher.ObserverCount(callState), 0);
    EXPECT_EQ(Held(publisher), "");
    EXPECT_EQ(publisher.GetCount(VX7EventPublisher::TSC_COMPONENT), 0u);
    EXPECT_EQ(publisher.Detach(first, callState), 0);

    VX7EventPublisher searching(1, 1, 4);
    Refuse(kClusterFind);
    LogCapture out;
    EXPECT_FALSE(searching.Attach(first, &callState));
    EXPECT_THAT(out.Text(), HasSubstr("VX7EventPublisher::Attach - "));
    EXPECT_EQ(searching.ObserverCount(callState), 0);
    EXPECT_EQ(Held(searching), "");
}

TEST_F(Publisher, ChannelAspectsShareOneTscUntilTheLastGoes) {
    VX7EventPublisher publisher(1, 1, 5);
    ASSERT_TRUE(publisher.Attach(first, &callState));
    tolk::TSC* shared = publisher.GetTsc();
    ASSERT_TRUE(publisher.Attach(first, &chanState));
    EXPECT_EQ(publisher.GetTsc(), shared);
    EXPECT_EQ(publisher.GetCount(VX7EventPublisher::TSC_COMPONENT), 2u);
    EXPECT_EQ(VX7EventPublisher::GetMyPublisher(shared), &publisher);

    EXPECT_EQ(publisher.Detach(first, chanState), 0);
    EXPECT_EQ(publisher.GetTsc(), shared);
    EXPECT_EQ(publisher.GetCount(VX7EventPublisher::TSC_COMPONENT), 1u);
    EXPECT_EQ(Held(publisher), "tsc tscCluster lconCluster ");

    EXPECT_EQ(publisher.Detach(first, callState), 0);
    EXPECT_EQ(Held(publisher), "");
    EXPECT_EQ(VX7EventPublisher::GetMyPublisher(shared), nullptr);

    // And everything is made again for the next observer.
    ASSERT_TRUE(publisher.Attach(second, &trunkState));
    EXPECT_EQ(Held(publisher), "lcon tscCluster lconCluster ");
    EXPECT_EQ(publisher.GetCount(VX7EventPublisher::LCON_COMPONENT), 1u);
}

TEST_F(Publisher, SilentCancellationIsPrintedAndTheCountStays) {
    VX7EventPublisher publisher(1, 1, 7);
    ASSERT_TRUE(publisher.Attach(first, &callState));
    Silence(kCancelxEvts);
    LogCapture out;
    EXPECT_EQ(publisher.Detach(first, callState), 0);
    EXPECT_THAT(out.Text(), StartsWith("UnSubscribe: TSC Component Timeout Exception.  Ignoring\n"
                                       "Addressable::Timeout ObjSource: "));
    EXPECT_EQ(publisher.GetCount(VX7EventPublisher::TSC_COMPONENT), 1u);
    EXPECT_NE(publisher.GetTsc(), nullptr);
    // The destructor still lets go of the component the board never released.
}

TEST_F(Publisher, CallStateEventsCarryTheChannel) {
    Phone caller(fixedBoard.get(), 1, 8);
    VX7EventPublisher publisher(1, 1, 8);
    ASSERT_TRUE(publisher.Attach(first, &callState));
    ASSERT_TRUE(publisher.Attach(second, &chanState));
    caller.SetDestAddr("5551222");
    unsigned int callId = caller.MakeCall("5551219", "5551222");
    ASSERT_NE(callId, 0u);
    EXPECT_THAT(static_cast<RecordingObserver*>(first.Get())->WaitFor("Call State timestamp="),
                HasSubstr(" board=1 trunk=1 channel=8 state="));
    caller.DropCall(callId);
    caller.ReleaseCall(callId);
}

}  // namespace
