// The emulation's answers through the framework's own Addressable over the local transport, as
// the program sees them; and its core alone, without a serving thread: what it logs, what it
// refuses and that the same requests always give the same bytes.
#include "sim/Emulation.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstring>
#include <functional>
#include <memory>
#include <sstream>
#include <vector>

#include "BoardEvents.h"
#include "RawClient.h"
#include "catalogue/generated/cluster_bodies.h"
#include "catalogue/generated/clustermgr_bodies.h"
#include "catalogue/generated/lcon_bodies.h"
#include "catalogue/generated/resourcemgr_bodies.h"
#include "catalogue/generated/stdresource_bodies.h"
#include "catalogue/generated/tsc_bodies.h"
#include "framework/Addressable.h"
#include "framework/Msg.h"
#include "platform/farm/ActiveFarm.h"
#include "platform/farm/Addresses.h"
#include "platform/farm/FarmParser.h"
#include "platform/tkhost/tkhost.h"
#include "sim/Builtin.h"
#include "sim/ErrorCodes.h"

namespace sim {
namespace {

// Bodies without fields, for the requests that carry none.
tolk::LCON_Bodies::MsgGetLineState_t getLine;
tolk::LCON_Bodies::MsgGetDiagMode_t getDiag;
tolk::TSC_Bodies::MsgGetChanState_t getChan;

using testsupport::BoardEvents;
using testsupport::cd;
using testsupport::setText;
using tolk::Addressable;
using tolk::CompDesc_t;
using Std = tolk::StdResource_Bodies;
using Rm = tolk::ResourceMgr_Bodies;
using Cm = tolk::ClusterMgr_Bodies;
using Cl = tolk::Cluster_Bodies;
using Tsc = tolk::TSC_Bodies;
using Lcon = tolk::LCON_Bodies;

// A proxy whose waits can be shortened, to see silence without waiting five seconds.
class Proxy : public Addressable {
  public:
    using Addressable::Addressable;
    void setResponseTimeout(unsigned int ms) { ResponseTimeout = ms; }
};

class EmulationTest : public testing::Test {
  protected:
    static void SetUpTestSuite() {
        unsetenv("REMOTE_TKHOST");
        unsetenv("VX7_FARM");
        farm::resetActiveFarm();
        std::string error;
        ASSERT_TRUE(startBuiltinEmulation(&error)) << error;
    }
    static void TearDownTestSuite() { stopBuiltinEmulation(); }
    void SetUp() override { BoardEvents::get().clear(); }

    // The refusal a request got, or 0xFFFFFFFF if none came.
    static std::uint32_t refusal(Addressable& a, std::uint32_t type, tolk::MsgBody* body,
                                 std::uint32_t retType) {
        try {
            a.request(type, body, retType, nullptr);
        } catch (Addressable::UnexpectedMsg& e) {
            Std::MsgError_t err;
            (void)err.readMsg(e.getMsg(), 0);
            EXPECT_EQ(err.ErrorMsg, type);
            return err.ErrorCode;
        }
        return 0xFFFFFFFF;
    }
};

TEST_F(EmulationTest, ClusterSearchFindsTheChannelClusterAndItsTsc) {
    Addressable cm(cd(farm::clusterMgrAddress(1)));
    Cm::ClusterFind_t find;
    find.CompStart = CompDesc_t(0xFFFF, 1, 1, 255, 0);
    find.attr.realloc(3);
    *find.attr[0] = tolk::CompAttr_t(0, 18);
    *find.attr[1] = tolk::CompAttr_t(0x1200, 2);
    *find.attr[2] = tolk::CompAttr_t(0x1201, 5);
    Cm::ClusterResult_t cluster;
    cm.request(0x800053, &find, 0x80002C, &cluster, 0, 1);
    EXPECT_EQ(cluster.desc, cd(farm::channelClusterAddress(1, 2, 5)));

    Cm::ClusterCompByAttr_t inCluster;
    inCluster.ClustDesc = cluster.desc;
    inCluster.CompType = 18;
    inCluster.Attrs.realloc(1);
    *inCluster.Attrs[0] = tolk::CompAttr_t(0, 18);
    Cm::ComponentResult_t tsc;
    cm.request(0x80001E, &inCluster, 0x800007, &tsc, 0, 1);
    EXPECT_EQ(tsc.desc, cd(farm::channelComponentAddress(1, 2, 5, farm::kTSC)));
}

TEST_F(EmulationTest, ResourceManagerFindsAnyChpOfTheBoard) {
    Addressable rm(cd(farm::resourceMgrAddress(1)));
    Rm::CompFind_t find;
    find.CompStart = CompDesc_t(0, 1, 255, 255, 0);
    find.attr.realloc(1);
    *find.attr[0] = tolk::CompAttr_t(0, 19);
    Rm::ComponentResult_t res;
    rm.request(0x80003D, &find, 0x800007, &res);
    EXPECT_EQ(res.desc.component, 19);
    EXPECT_EQ(res.desc.board, 1);
}

TEST_F(EmulationTest, GetParmAnswersWhatTheFarmSays) {
    struct Case {
        farm::Address target;
        std::uint32_t parm, value;
    };
    for (const Case& c :
         {Case{farm::lconAddress(1, 1), 0x1601, 1}, Case{farm::lconAddress(1, 2), 0x1602, 4},
          Case{farm::lconAddress(2, 1), 0x1602, 5}, Case{farm::lconAddress(3, 2), 0x1601, 4},
          Case{farm::channelComponentAddress(1, 1, 1, farm::kCHP), 0x1313, 0},
          Case{farm::channelComponentAddress(2, 1, 7, farm::kCHP), 0x1313, 1}}) {
        Addressable a(cd(c.target));
        Std::MsgGetParm_t q;
        q.Num = c.parm;
        Std::MsgGetParmCmplt_t r;
        a.request(0x12, &q, 0x13, &r);
        EXPECT_EQ(r.Num, c.parm);
        EXPECT_EQ(r.Val, c.value) << "parm 0x" << std::hex << c.parm << " of board " << std::dec
                                  << int(c.target.board);
    }
}

TEST_F(EmulationTest, UnknownParameterIsRefusedNamingIt) {
    Addressable a(cd(farm::lconAddress(1, 1)));
    Std::MsgGetParm_t q;
    q.Num = 0x4242;
    try {
        a.request(0x12, &q, 0x13, nullptr);
        FAIL() << "no refusal";
    } catch (Addressable::UnexpectedMsg& e) {
        Std::MsgError_t err;
        (void)err.readMsg(e.getMsg(), 0);
        EXPECT_EQ(err.ErrorMsg, 0x12u);
        EXPECT_EQ(err.ErrorCode, kErrBadParameter);
        auto* data = reinterpret_cast<Std::MsgError_t::Data_ErrorMsg_0x12_t*>(err.Data);
        ASSERT_NE(data, nullptr);
        EXPECT_EQ(data->Num, 0x4242u);
    }
}

TEST_F(EmulationTest, SubscribedCallStateEventsFollowAMakeCall) {
    Addressable tsc(cd(farm::channelComponentAddress(1, 1, 3, farm::kTSC)));
    tsc.asyncRegisterEvtGroup(0x1230, &BoardEvents::take);
    Std::MsgDetectxEvts_t sub;
    sub.RetAddr = tsc.getMsgQueue()->getHostDesc();
    sub.List.realloc(18);
    for (unsigned int i = 0; i < 18; ++i) {
        sub.List[i]->EvtType = 0x1230 + i;
        sub.List[i]->EvtGroup = 0x1230;
    }
    tsc.request(0x18, &sub, 0x19, nullptr, tsc.getId());

    Tsc::MsgMakeCall_t mk;
    setText(mk.DestAddr, "8005551000");
    setText(mk.OrigAddr, "5551214");
    mk.CallProgress = 0;
    Tsc::MsgMakeCallCmplt_t done;
    tsc.request(0x1214, &mk, 0x1215, &done);
    EXPECT_NE(done.CallId, 0u);

    auto got = BoardEvents::get().waitFor(4);
    ASSERT_EQ(got.size(), 4u);
    const std::uint32_t states[] = {5, 15, 17, 2};
    for (int i = 0; i < 4; ++i) {
        ASSERT_EQ(got[i].size(), 6u);
        EXPECT_EQ(got[i][0], 0x1230u);
        EXPECT_EQ(got[i][1], 0x1230u + states[i]);
        EXPECT_EQ(got[i][3], done.CallId);
        EXPECT_EQ(got[i][4], states[i]);
    }

    Tsc::MsgDropCall_t drop;
    drop.CallId = done.CallId;
    drop.Reason = 14;
    tsc.request(0x120A, &drop);  // one-way: silence is success
    Tsc::MsgReleaseCall_t rel;
    rel.CallId = done.CallId;
    rel.Reason = 14;
    tsc.request(0x121C, &rel);
    got = BoardEvents::get().waitFor(6);
    ASSERT_EQ(got.size(), 6u);
    EXPECT_EQ(got[4][4], 9u);  // Idle
    EXPECT_EQ(got[5][4], 0u);  // Null

    Std::MsgCancelxEvts_t cancel;
    cancel.EvtTypeList.realloc(18);
    for (unsigned int i = 0; i < 18; ++i) {
        *cancel.EvtTypeList[i] = 0x1230 + i;
    }
    tsc.request(0x1C, &cancel, 0x1D, nullptr, tsc.getId());
    EXPECT_NE(builtinControl("stats").find("subscriptions=0"), std::string::npos);
}

TEST_F(EmulationTest, SaturationBurstSendsEveryEventToTheLinesSubscriber) {
    Addressable lcon(cd(farm::lconAddress(3, 1)));
    subscribe(lcon, 0x1600);

    EXPECT_EQ(builtinControl("ferr 3 1 300"), "ok 300");
    auto got = BoardEvents::get().waitFor(300);
    ASSERT_EQ(got.size(), 300u);
    for (const auto& w : got) {
        ASSERT_EQ(w.size(), 3u);
        EXPECT_EQ(w[0], 0x1600u);  // label
        EXPECT_EQ(w[1], 0x1617u);  // frame error saturation
        EXPECT_EQ(w[2] >> 24, 1u);
    }
    Std::MsgCancelEvt_t off;
    off.Type = 0x1600;
    lcon.request(0x1A, &off, 0x1B, nullptr, lcon.getId());
}

TEST_F(EmulationTest, LineAlreadyInServiceIsRefusedWith1600) {
    Addressable lcon(cd(farm::lconAddress(1, 2)));
    Lcon::MsgSetLineState_t in;
    in.State = 0x160F;
    in.Reason = 0;
    in.Priority = 0;
    EXPECT_EQ(refusal(lcon, 0x1610, &in, 0x1611), 0x1600u);

    Lcon::MsgSetLineState_t out;
    out.State = 0x1610;
    out.Reason = 4;
    out.Priority = 0;
    lcon.request(0x1610, &out, 0x1611, nullptr);
    Lcon::MsgGetLineStateCmplt_t st;
    lcon.request(0x1608, &getLine, 0x1609, &st);
    EXPECT_EQ(st.LineState, 0x1610u);
    EXPECT_EQ(st.Reason, 4u);
    lcon.request(0x1610, &in, 0x1611, nullptr);
    lcon.request(0x1608, &getLine, 0x1609, &st);
    EXPECT_EQ(st.LineState, 0x160Fu);
}

TEST_F(EmulationTest, DiagnosticModeShowsInTheAlarms) {
    Addressable lcon(cd(farm::lconAddress(1, 1)));
    Lcon::MsgSetDiagMode_t mode;
    mode.Mode = 2;
    lcon.request(0x160E, &mode, 0x160F, nullptr);
    Lcon::MsgGetDiagModeCmplt_t dm;
    lcon.request(0x1604, &getDiag, 0x1605, &dm);
    EXPECT_EQ(dm.DiagnosticMode, 2);

    Lcon::MsgGetAlarms_t q;
    q.Alarms.realloc(1);
    *q.Alarms[0] = 0x1600;
    Lcon::MsgGetAlarmsCmplt_t a;
    lcon.request(0x1602, &q, 0x1603, &a);
    bool loopback = false;
    for (unsigned int i = 0; i < a.AlarmInfo.length(); ++i) {
        if (a.AlarmInfo[i]->Type == 0x1605) {
            loopback = a.AlarmInfo[i]->State == 1;
        }
    }
    EXPECT_TRUE(loopback);
    mode.Mode = 0;
    lcon.request(0x160E, &mode, 0x160F, nullptr);
}

TEST_F(EmulationTest, FlexibleRoutingJoinsTheSlotsOfTheTwoClusters) {
    Addressable tscCluster(cd(farm::channelClusterAddress(2, 1, 4)));
    Addressable rocCluster(cd(farm::rocClusterAddress(2, 4)));
    Cl::ClusterSlotInfo_t info;
    info.portId = 0x4201;
    Cl::ClusterSlotInfoResult_t tscSide, rocSide;
    tscCluster.request(0x800032, &info, 0x800033, &tscSide);
    rocCluster.request(0x800032, &info, 0x800033, &rocSide);
    ASSERT_EQ(tscSide.width, 1);
    ASSERT_EQ(rocSide.width, 1);
    EXPECT_NE(*tscSide.slotIds[0], *rocSide.slotIds[0]);

    Cl::ClusterSlotAssign_t assign;
    assign.portId = 0x8201;
    assign.slotIds = tscSide.slotIds;
    assign.encoding = tscSide.encoding;
    assign.idlePattern = tscSide.idlePattern;
    rocCluster.request(0x800030, &assign, 0x800000, nullptr);
    Cl::ClusterActivate_t act;
    act.portId = 0x8201;
    act.talkerDesc = CompDesc_t(0xFFFF, 0xFF, 0xFF, 0xFF, 0xFF);
    rocCluster.request(0x80001B, &act, 0x800000, nullptr);
    EXPECT_EQ(refusal(rocCluster, 0x80001B, &act, 0x800000), kErrBadState);

    Cl::ClusterSlotUnassign_t un;
    un.portId = 0x8201;
    EXPECT_EQ(refusal(rocCluster, 0x800036, &un, 0x800000), kErrBadState);  // still active
    Cl::ClusterDeactivate_t de;
    de.portId = 0x8201;
    rocCluster.request(0x800023, &de, 0x800000, nullptr);
    rocCluster.request(0x800036, &un, 0x800000, nullptr);
}

TEST_F(EmulationTest, AttachingMediaPutsAFlexibleChannelInServiceAndDetachTakesItOut) {
    Addressable tsc(cd(farm::channelComponentAddress(2, 1, 11, farm::kTSC)));
    Tsc::MsgGetChanStateCmplt_t st;
    tsc.request(0x120F, &getChan, 0x1210, &st);
    EXPECT_EQ(st.ChanState, 13u);  // OutOfServiceMediaDetached
    Tsc::MsgMakeCall_t mk;
    setText(mk.DestAddr, "8005551000");
    EXPECT_EQ(refusal(tsc, 0x1214, &mk, 0x1215), kErrOutOfService);

    Tsc::MsgAttach_t attach;
    attach.MediaInfo.realloc(2);
    attach.MediaInfo[0]->ComponentType = 7;
    attach.MediaInfo[0]->InstDesc = cd(farm::mediaAddress(2, 11, farm::Media::SigDet));
    attach.MediaInfo[1]->ComponentType = 5;
    attach.MediaInfo[1]->InstDesc = cd(farm::mediaAddress(2, 11, farm::Media::ToneGen));
    attach.Count = 2;
    tsc.request(0x1234, &attach, 0x1235, nullptr);
    tsc.request(0x120F, &getChan, 0x1210, &st);
    EXPECT_EQ(st.ChanState, 1u);
    EXPECT_EQ(refusal(tsc, 0x1234, &attach, 0x1235), kErrBadState);  // already attached

    Tsc::MsgDetach_t detach;
    tsc.request(0x1236, &detach, 0x1237, nullptr);
    tsc.request(0x120F, &getChan, 0x1210, &st);
    EXPECT_EQ(st.ChanState, 13u);
    // Media of a voice channel the board lacks is no media at all.
    attach.MediaInfo[1]->InstDesc = cd(farm::mediaAddress(2, 40, farm::Media::ToneGen));
    EXPECT_EQ(refusal(tsc, 0x1234, &attach, 0x1235), kErrNoSuchComponent);
}

TEST_F(EmulationTest, RefuseSilenceAndNormalOverrideOneMessageType) {
    Proxy tsc(cd(farm::channelComponentAddress(1, 2, 1, farm::kTSC)));
    Tsc::MsgGetChanStateCmplt_t st;
    tsc.request(0x120F, &getChan, 0x1210, &st);
    EXPECT_EQ(st.ChanState, 1u);

    EXPECT_EQ(builtinControl("refuse 120f 77"), "ok");
    EXPECT_EQ(refusal(tsc, 0x120F, &getChan, 0x1210), 0x77u);

    EXPECT_EQ(builtinControl("silence 120f"), "ok");
    tsc.setResponseTimeout(200);
    EXPECT_THROW(tsc.request(0x120F, &getChan, 0x1210, &st), Addressable::Timeout);

    EXPECT_EQ(builtinControl("normal 120f"), "ok");
    tsc.request(0x120F, &getChan, 0x1210, &st);
    EXPECT_EQ(st.ChanState, 1u);
}

TEST_F(EmulationTest, DelayHoldsAnswersBack) {
    Proxy tsc(cd(farm::channelComponentAddress(1, 2, 2, farm::kTSC)));
    EXPECT_EQ(builtinControl("delay 300"), "ok");
    Tsc::MsgGetChanStateCmplt_t st;
    tsc.setResponseTimeout(100);
    EXPECT_THROW(tsc.request(0x120F, &getChan, 0x1210, &st), Addressable::Timeout);
    tsc.setResponseTimeout(2000);
    auto t0 = std::chrono::steady_clock::now();
    tsc.request(0x120F, &getChan, 0x1210, &st);
    EXPECT_GE(std::chrono::steady_clock::now() - t0, std::chrono::milliseconds(250));
    EXPECT_EQ(builtinControl("delay 0"), "ok");
}

TEST_F(EmulationTest, ControlCallRingsAChannelAndAnswerConnectsIt) {
    Addressable tsc(cd(farm::channelComponentAddress(1, 1, 10, farm::kTSC)));
    EXPECT_EQ(builtinControl("call 1 1 30 555"), "error: no channel 1.1.30 in this farm");
    std::string r = builtinControl("call 1 1 10 5550100");
    ASSERT_EQ(r.rfind("ok call 0x", 0), 0u) << r;
    Tsc::MsgGetCallStateCmplt_t cs;
    Tsc::MsgGetCallState_t q;
    q.CallId = 0;
    tsc.request(0x120D, &q, 0x120E, &cs);
    EXPECT_EQ(cs.CallState, 11u);
    EXPECT_EQ(cs.Reason, 11u);
    EXPECT_EQ(builtinControl("call 1 1 10 5550100"), "error: the channel already has a call");

    Tsc::MsgAnswerCall_t ans;
    ans.CallId = cs.CallId;
    tsc.request(0x1201, &ans);
    tsc.request(0x120D, &q, 0x120E, &cs);
    EXPECT_EQ(cs.CallState, 2u);
    EXPECT_EQ(builtinControl("hangup 1 1 10"), "ok");
    tsc.request(0x120D, &q, 0x120E, &cs);
    EXPECT_EQ(cs.CallState, 6u);
    Tsc::MsgReleaseCall_t rel;
    rel.CallId = cs.CallId;
    rel.Reason = 14;
    tsc.request(0x121C, &rel);
}

// What each further request of the program gets from a board in its first state: the answer
// of the given type (refusal 0), or MsgError_t with the given code. Bodies start all zeros.
struct Exchange {
    const char* name;
    farm::Address target;
    std::uint32_t type;
    std::function<std::unique_ptr<tolk::MsgBody>()> body;
    std::uint32_t answerType;
    std::uint32_t refusal;
};

void PrintTo(const Exchange& x, std::ostream* os) {
    *os << x.name;
}

template <typename B>
Exchange ask(
    const char* name, farm::Address target, std::uint32_t answerType, std::uint32_t refusal,
    std::function<void(B&)> fill = [](B&) {}) {
    return Exchange{name,
                    target,
                    B::MsgType,
                    [fill] {
                        auto b = std::make_unique<B>();
                        fill(*b);
                        return std::unique_ptr<tolk::MsgBody>(std::move(b));
                    },
                    answerType,
                    refusal};
}

class EmulationExchange : public EmulationTest, public testing::WithParamInterface<Exchange> {};

TEST_P(EmulationExchange, IsAnsweredAsABoardWould) {
    const Exchange& x = GetParam();
    Addressable a(cd(x.target));
    std::unique_ptr<tolk::MsgBody> body = x.body();
    if (x.refusal != 0) {
        EXPECT_EQ(refusal(a, x.type, body.get(), x.answerType), x.refusal);
    } else {
        EXPECT_NO_THROW(a.request(x.type, body.get(), x.answerType, nullptr));
    }
}

farm::Address tscOf(unsigned board, int trunk, int channel) {
    return farm::channelComponentAddress(board, trunk, channel, farm::kTSC);
}

void claim(Rm::CompUse_t& b, const farm::Address& what) {
    b.List.realloc(1);
    b.List[0]->desc = cd(what);
    b.Count = 1;
}

INSTANTIATE_TEST_SUITE_P(
    DefaultFarm, EmulationExchange,
    testing::Values(
        ask<Tsc::MsgHoldCall_t>("HoldWithoutCall", tscOf(1, 1, 20), 0, kErrNoSuchCall),
        ask<Tsc::MsgRetrieveCall_t>("RetrieveWithoutCall", tscOf(1, 1, 20), 0, kErrNoSuchCall),
        ask<Tsc::MsgAcceptCall_t>("AcceptWithoutCall", tscOf(1, 1, 20), 0, kErrNoSuchCall),
        ask<Tsc::MsgRejectCall_t>("RejectWithoutCall", tscOf(1, 1, 20), 0, kErrNoSuchCall),
        ask<Tsc::MsgBlindTransferCall_t>("BlindTransferWithoutCall", tscOf(1, 1, 20), 0,
                                         kErrNoSuchCall),
        ask<Tsc::MsgInitTransfer_t>("InitTransferWithoutCall", tscOf(1, 1, 20), 0x1213,
                                    kErrNoSuchCall),
        ask<Tsc::MsgCompleteTransfer_t>("CompleteTransferWithoutCall", tscOf(1, 1, 20), 0,
                                        kErrNoSuchCall),
        ask<Tsc::MsgCancelTransfer_t>("CancelTransferWithoutCall", tscOf(1, 1, 20), 0,
                                      kErrNoSuchCall),
        ask<Tsc::MsgDial_t>("DialWithoutCall", tscOf(1, 1, 20), 0x1225, kErrNoSuchCall,
                            [](auto& b) { setText(b.DigitString, "12"); }),
        ask<Tsc::MsgSendISDN_t>("IsdnOnACasLine", tscOf(1, 1, 20), 0x1223, kErrNotSupported),
        ask<Tsc::MsgSendISDN_t>("IsdnWithoutCallOnACcsLine", tscOf(2, 1, 20), 0x1223,
                                kErrNoSuchCall),
        ask<Tsc::MsgSetChanState_t>("ChannelStateOfNoMeaning", tscOf(1, 1, 20), 0x1220,
                                    kErrBadParameter, [](auto& b) { b.State = 99; }),
        ask<Tsc::MsgSetChanState_t>("ChannelBackInService", tscOf(1, 1, 20), 0x1220, 0,
                                    [](auto& b) { b.State = 256; }),
        ask<Tsc::MsgResetLineDevice_t>("ResetLineDevice", tscOf(1, 1, 21), 0x1247, 0),
        ask<Tsc::MsgAttach_t>("AttachOnAFixedBoard", tscOf(1, 1, 20), 0x1235, kErrNotSupported),
        ask<Tsc::MsgDetach_t>("DetachWhatIsNotAttached", tscOf(2, 1, 20), 0x1237, kErrBadState),
        ask<Lcon::MsgStopAlarm_t>("StopAnAlarmNotSent", farm::lconAddress(1, 1), 0, kErrBadState,
                                  [](auto& b) { b.AlarmId = 0x160C; }),
        ask<Rm::CompUse_t>("ClaimAComponentThatIsThere", farm::resourceMgrAddress(1), 0x800000, 0,
                           [](auto& b) { claim(b, tscOf(1, 1, 1)); }),
        ask<Rm::CompUse_t>("ClaimAComponentThatIsNot", farm::resourceMgrAddress(1), 0x800000,
                           kErrNoSuchComponent, [](auto& b) { claim(b, tscOf(1, 1, 30)); }),
        ask<Cm::ClusterByComp_t>("ClusterOfATsc", farm::clusterMgrAddress(1), 0x80002C, 0,
                                 [](auto& b) { b.desc = cd(tscOf(1, 2, 3)); }),
        // The analog board has two lines, and a channel's cluster holds no line control.
        ask<Cm::ClusterFind_t>("NoClusterOfALineTheBoardLacks", farm::clusterMgrAddress(3),
                               0x80002C, kErrNoSuchCluster,
                               [](auto& b) {
                                   b.CompStart = CompDesc_t(0xFFFF, 3, 1, 255, 0);
                                   b.attr.realloc(2);
                                   *b.attr[0] = tolk::CompAttr_t(0, 22);
                                   *b.attr[1] = tolk::CompAttr_t(0x1600, 3);
                               }),
        ask<Cm::ClusterCompByAttr_t>("NoLineControlInAChannelsCluster", farm::clusterMgrAddress(2),
                                     0x800007, kErrNoSuchComponent,
                                     [](auto& b) {
                                         b.ClustDesc = cd(farm::channelClusterAddress(2, 1, 1));
                                         b.CompType = 22;
                                     })),
    [](const testing::TestParamInfo<Exchange>& i) { return std::string(i.param.name); });

// ---- the core alone ----

// Every block the emulation sends, header and body, as bytes.
std::vector<std::vector<unsigned char>> drain(Emulation& emu) {
    std::vector<std::vector<unsigned char>> out;
    while (emu.burstsPending()) {
        emu.pumpBursts(64);
    }
    while (TKMsg32Bit* b = emu.popDue(Clock::now() + std::chrono::hours(1))) {
        const unsigned char* p = reinterpret_cast<const unsigned char*>(b);
        out.emplace_back(p, p + sizeof(TKMsg32Bit) + b->size);
        tkMsgFree(b);
    }
    return out;
}

std::vector<unsigned char> bytesOf(tolk::MsgBody& body) {
    tolk::Msg m(body.GetByteSize());
    (void)body.writeMsg(&m, 0);
    const unsigned char* p = tkMsgBody(m.getMsgRef());
    return std::vector<unsigned char>(p, p + m.getSize());
}

std::shared_ptr<const farm::Farm> defaultFarm() {
    std::string error;
    auto f = farm::parseFarm(farm::builtinFarmText(), "default", error);
    EXPECT_TRUE(f) << error;
    return std::make_shared<const farm::Farm>(*f);
}

TEST(EmulationCore, WhatItCannotAnswerIsLoggedByTypeAndTarget) {
    std::ostringstream log;
    Emulation emu(defaultFarm(), log);
    // No such board: nobody is there to answer, so nothing comes back.
    emu.receive(
        RawClient::block(0x1214, farm::channelComponentAddress(9, 1, 1, farm::kTSC), 1, {}));
    EXPECT_TRUE(drain(emu).empty());
    // A message this channel's TSC does not play (ParkCall) and one a CHP does not take.
    emu.receive(
        RawClient::block(0x1216, farm::channelComponentAddress(1, 1, 2, farm::kTSC), 2, {}));
    emu.receive(
        RawClient::block(0x1415, farm::channelComponentAddress(1, 1, 2, farm::kCHP), 3, {}));
    auto out = drain(emu);
    ASSERT_EQ(out.size(), 2u);
    for (const auto& b : out) {
        const auto* h = reinterpret_cast<const TKMsg32Bit*>(b.data());
        EXPECT_EQ(h->type, 0u);  // MsgError_t
        EXPECT_EQ(h->srcInstance, 34);
        EXPECT_EQ(h->srcBoard, 1);
    }
    EXPECT_EQ(emu.stats().unanswered, 3u);
    for (const char* logged : {"0x1214 to {Node 0 Board 9 Processor 1 Component 18 Instance 33}",
                               "0x1216 to {Node 0 Board 1 Processor 1 Component 18 Instance 34}",
                               "0x1415 to {Node 0 Board 1 Processor 1 Component 19 Instance 34}"}) {
        EXPECT_NE(log.str().find(logged), std::string::npos) << log.str();
    }
}

TEST(EmulationCore, TheBoardItselfAnswersNothingAndMediaTakeOnlyStandardOperations) {
    std::ostringstream log;
    Emulation emu(defaultFarm(), log);
    emu.receive(RawClient::block(0x02, farm::boardAddress(1), 1, {}));
    EXPECT_TRUE(drain(emu).empty());
    EXPECT_NE(log.str().find("the board itself takes no messages"), std::string::npos) << log.str();

    const farm::Address media = farm::mediaAddress(2, 11, farm::Media::SigDet);
    emu.receive(RawClient::block(0x02, media, 2, {}));
    emu.receive(RawClient::block(0x1415, media, 3, {}));
    auto out = drain(emu);
    ASSERT_EQ(out.size(), 2u);
    EXPECT_EQ(reinterpret_cast<const TKMsg32Bit*>(out[0].data())->type, 0x03u);
    EXPECT_EQ(reinterpret_cast<const TKMsg32Bit*>(out[1].data())->type, 0u);  // MsgError_t
    EXPECT_NE(log.str().find("not a message of this component"), std::string::npos) << log.str();
    EXPECT_EQ(emu.stats().unanswered, 2u);
}

TEST(EmulationCore, SameRequestsAndControlLinesGiveTheSameBytes) {
    auto run = [] {
        std::ostringstream log;
        Emulation emu(defaultFarm(), log);
        auto tsc = farm::channelComponentAddress(1, 1, 1, farm::kTSC);
        // Subscribe the whole call state group and two lines' alarms, then call a farm number,
        // and let the network ring, hang up and raise alarms.
        for (const auto& [target, group] :
             {std::pair{tsc, 0x1230u}, std::pair{farm::lconAddress(1, 1), 0x1600u},
              std::pair{farm::lconAddress(1, 2), 0x1600u}}) {
            Std::MsgDetectEvt_t sub;
            sub.RetAddr = CompDesc_t(1, 0xFF, 0, 0, 0);
            sub.EvtType = group;
            sub.EvtGroup = group;
            emu.receive(RawClient::block(0x16, target, 7, bytesOf(sub)));
        }
        std::vector<unsigned char> call(128 + 128 + 1, 0);
        std::memcpy(call.data(), "5551234", 7);
        std::memcpy(call.data() + 128, "5551212", 7);
        emu.receive(RawClient::block(0x1214, tsc, 8, call));
        emu.control("alarm 1 1 red on");
        emu.control("bpv 1 2 5");
        emu.control("call 1 2 3 777");
        emu.control("hangup 1 1 23");
        return drain(emu);
    };
    auto first = run();
    auto second = run();
    // Acks, the completion, the call's four states, red and five BPV saturations.
    EXPECT_GE(first.size(), 14u);
    EXPECT_EQ(first, second);
}

}  // namespace
}  // namespace sim
