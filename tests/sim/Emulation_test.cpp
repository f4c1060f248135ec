// The emulation and vx7sim's server, each on its own thread. The emulation's answers through
// the framework's own Addressable over the local transport, as the program sees them; its core
// alone: what it logs, what it refuses and that the same requests always give the same bytes.
// The server over TCP: the framework's remote transport on one side, and a raw client for
// what a well-behaved client never sends. What the model's operations get from the emulation
// is tested with the model.
#include "sim/Emulation.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <cstring>
#include <functional>
#include <memory>
#include <mutex>
#include <set>
#include <sstream>
#include <streambuf>
#include <string>
#include <thread>
#include <vector>

#include "BoardEvents.h"
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
#include "sim/RelayConnection.h"
#include "sim/RelayServer.h"
#include "transport/TKSFrame.h"

namespace sim {
namespace {

using testsupport::BoardEvents;
using testsupport::cd;
using testsupport::Event;
using testsupport::setText;
using tolk::Addressable;
using tolk::CompDesc_t;
using Std = tolk::StdResource_Bodies;
using Rm = tolk::ResourceMgr_Bodies;
using Cm = tolk::ClusterMgr_Bodies;
using Cl = tolk::Cluster_Bodies;
using Tsc = tolk::TSC_Bodies;
using Lcon = tolk::LCON_Bodies;

// Bodies without fields, for the requests that carry none.
Tsc::MsgGetChanState_t getChan;
Lcon::MsgGetLineState_t getLine;

// A plain TCP client for raw frames.
class RawClient {
  public:
    // A receive buffer of rcvbuf bytes (0: the system's) keeps what the kernel holds for a
    // client that does not read small against what the server queues.
    explicit RawClient(int port, int rcvbuf = 0) {
        fd = ::socket(AF_INET, SOCK_STREAM, 0);
        if (rcvbuf > 0) {
            setsockopt(fd, SOL_SOCKET, SO_RCVBUF, &rcvbuf, sizeof rcvbuf);
        }
        sockaddr_in sa{};
        sa.sin_family = AF_INET;
        sa.sin_port = htons(static_cast<std::uint16_t>(port));
        sa.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        connected = ::connect(fd, reinterpret_cast<sockaddr*>(&sa), sizeof sa) == 0;
        timeval tv{5, 0};
        setsockopt(fd, SOL_SOCKET, SO_RCVTIMEO, &tv, sizeof tv);
    }
    ~RawClient() {
        if (fd >= 0) {
            ::close(fd);
        }
    }
    void send(const std::vector<unsigned char>& bytes) {
        ASSERT_EQ(::send(fd, bytes.data(), bytes.size(), MSG_NOSIGNAL),
                  static_cast<ssize_t>(bytes.size()));
    }
    std::vector<unsigned char> open() {
        unsigned char body[TKS_OPEN_BODY_BYTES];
        TKSOpenRequest req;
        req.maxRetMsgSize = 512;
        req.depth = 5;
        tksEncodeOpen(req, body);
        msg_t m;
        m.type = TKS_FRAME_OPEN;
        m.size = sizeof body;
        m.body = body;
        return tksEncodeFrame(m);
    }
    // A block from the host to `to` carrying `body`, as a client would send it (the relay
    // stamps its own source on it); the caller frees it.
    static TKMsg32Bit* block(std::uint32_t type, const farm::Address& to, std::uint32_t trans,
                             const std::vector<unsigned char>& body = {}) {
        TKMsg32Bit* b = nullptr;
        EXPECT_EQ(tkMsgAllocate(static_cast<unsigned int>(body.size()), &b), 0);
        b->type = type;
        b->transTag = trans << 8;
        b->srcBoard = 0xFF;
        b->srcInstance = 1;
        b->tgtInstance = to.instance;
        b->tgtBoard = to.board;
        b->tgtProcessor = to.processor;
        b->tgtComponent = to.component;
        b->tgtNode = to.node;
        if (!body.empty()) {
            std::memcpy(tkMsgBody(b), body.data(), body.size());
        }
        return b;
    }
    // A message frame of a request without a body.
    static std::vector<unsigned char> request(const farm::Address& to, std::uint32_t type) {
        TKMsg32Bit* b = block(type, to, 0x42);
        std::vector<unsigned char> frame;
        EXPECT_TRUE(tksEncodeMessageFrame(b, frame));
        tkMsgFree(b);
        return frame;
    }
    // Sends the open and reads the whole assigned-address frame: true when it came.
    bool opened() {
        send(open());
        return read(TKS_FRAME_HEADER_SIZE + TKS_ASSIGNED_BODY_BYTES).size() ==
               TKS_FRAME_HEADER_SIZE + TKS_ASSIGNED_BODY_BYTES;
    }
    // Reads a frame header: the frame's type, or 0 when none came.
    std::uint32_t nextType() {
        std::vector<unsigned char> head = read(TKS_FRAME_HEADER_SIZE);
        msg_t h;
        if (head.size() != TKS_FRAME_HEADER_SIZE) {
            return 0;
        }
        tksDecodeFrameHeader(head.data(), h);
        return h.type;
    }
    // Reads n bytes; fewer if the server closed.
    std::vector<unsigned char> read(std::size_t n) {
        std::vector<unsigned char> out(n);
        std::size_t got = 0;
        while (got < n) {
            ssize_t r = ::recv(fd, out.data() + got, n - got, 0);
            if (r <= 0) {
                break;
            }
            got += static_cast<std::size_t>(r);
        }
        out.resize(got);
        return out;
    }
    bool closedByServer() {
        char c;
        return ::recv(fd, &c, 1, 0) == 0;
    }
    int fd = -1;
    bool connected = false;
};

// A message frame whose header is 12 bytes instead of 56.
inline const std::vector<unsigned char> kShortHeaderFrame = {0,  0, 0x03, 0xE9, 0, 0, 0, 0, 0, 0, 0,
                                                             12, 0, 0,    0,    0, 0, 0, 0, 0, 1, 2,
                                                             3,  4, 5,    6,    7, 8, 9, 0, 1, 2};

// Subscribes the events of `group` that `a`'s target raises, handed to BoardEvents.
inline void subscribe(tolk::Addressable& a, std::uint32_t group) {
    a.asyncRegisterEvtGroup(group, &BoardEvents::take);
    Std::MsgDetectEvt_t sub;
    sub.RetAddr = a.getMsgQueue()->getHostDesc();
    sub.EvtType = group;
    sub.EvtGroup = 0;
    a.request(0x16, &sub, 0x17, nullptr, a.getId());
}

// The server's log, written on its thread and read by the test while it runs.
class LockedLog : public std::streambuf {
  public:
    std::string text() {
        std::lock_guard<std::mutex> g(lock_);
        return text_;
    }

  protected:
    int_type overflow(int_type c) override {
        if (c != traits_type::eof()) {
            std::lock_guard<std::mutex> g(lock_);
            text_.push_back(static_cast<char>(c));
        }
        return c;
    }
    std::streamsize xsputn(const char* p, std::streamsize n) override {
        std::lock_guard<std::mutex> g(lock_);
        text_.append(p, static_cast<std::size_t>(n));
        return n;
    }

  private:
    std::mutex lock_;
    std::string text_;
};

// ---- the emulation ----

farm::Address tscOf(unsigned board, int trunk, int channel) {
    return farm::channelComponentAddress(board, trunk, channel, farm::kTSC);
}

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

    // The refusal a request got, or 0xFFFFFFFF if none came; `err` keeps the refusal.
    static std::uint32_t refusal(Addressable& a, std::uint32_t type, tolk::MsgBody* body,
                                 std::uint32_t retType, Std::MsgError_t* err = nullptr) {
        Std::MsgError_t own;
        err = err != nullptr ? err : &own;
        try {
            a.request(type, body, retType, nullptr);
        } catch (Addressable::UnexpectedMsg& e) {
            (void)err->readMsg(e.getMsg(), 0);
            EXPECT_EQ(err->ErrorMsg, type);
            return err->ErrorCode;
        }
        return 0xFFFFFFFF;
    }
    static std::uint32_t chanState(Addressable& tsc) {
        Tsc::MsgGetChanStateCmplt_t st;
        tsc.request(0x120F, &getChan, 0x1210, &st);
        return st.ChanState;
    }
};

TEST_F(EmulationTest, UnknownParameterIsRefusedNamingIt) {
    Addressable a(cd(farm::lconAddress(1, 1)));
    Std::MsgGetParm_t q;
    q.Num = 0x4242;
    Std::MsgError_t err;
    EXPECT_EQ(refusal(a, 0x12, &q, 0x13, &err), kErrBadParameter);
    auto* data = reinterpret_cast<Std::MsgError_t::Data_ErrorMsg_0x12_t*>(err.Data);
    ASSERT_NE(data, nullptr);
    EXPECT_EQ(data->Num, 0x4242u);
}

// Subscribed by a list of types, a call's states come as events with the call's id; a
// cancellation by the same list leaves no subscription behind.
TEST_F(EmulationTest, SubscribedCallStateEventsFollowACall) {
    Addressable tsc(cd(tscOf(1, 1, 3)));
    tsc.asyncRegisterEvtGroup(0x1230, &BoardEvents::take);
    Std::MsgDetectxEvts_t sub;
    sub.RetAddr = tsc.getMsgQueue()->getHostDesc();
    sub.List.realloc(18);
    Std::MsgCancelxEvts_t cancel;
    cancel.EvtTypeList.realloc(18);
    for (unsigned int i = 0; i < 18; ++i) {
        sub.List[i]->EvtType = 0x1230 + i;
        sub.List[i]->EvtGroup = 0x1230;
        *cancel.EvtTypeList[i] = 0x1230 + i;
    }
    tsc.request(0x18, &sub, 0x19, nullptr, tsc.getId());

    Tsc::MsgMakeCall_t mk;
    setText(mk.DestAddr, "8005551000");
    setText(mk.OrigAddr, "5551214");
    Tsc::MsgMakeCallCmplt_t done;
    tsc.request(0x1214, &mk, 0x1215, &done);
    Tsc::MsgDropCall_t drop;
    drop.CallId = done.CallId;
    drop.Reason = 14;
    tsc.request(0x120A, &drop);  // one-way: silence is success
    Tsc::MsgReleaseCall_t rel;
    rel.CallId = done.CallId;
    rel.Reason = 14;
    tsc.request(0x121C, &rel);

    // Dialing, Proceeding, Alerting, Connected; after the drop Idle, after the release Null.
    auto got = BoardEvents::get().waitFor(6);
    ASSERT_EQ(got.size(), 6u);
    const std::uint32_t states[] = {5, 15, 17, 2, 9, 0};
    for (int i = 0; i < 6; ++i) {
        ASSERT_EQ(got[i].size(), 6u);
        EXPECT_EQ(got[i][0], 0x1230u);
        EXPECT_EQ(got[i][1], 0x1230u + states[i]);
        EXPECT_EQ(got[i][3], done.CallId);
        EXPECT_EQ(got[i][4], states[i]);
    }
    tsc.request(0x1C, &cancel, 0x1D, nullptr, tsc.getId());
    EXPECT_NE(builtinControl("stats").find("subscriptions=0"), std::string::npos);
}

// A port is activated once and unassigned only when inactive again.
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
    EXPECT_EQ(refusal(rocCluster, 0x800036, &un, 0x800000), kErrBadState);
    Cl::ClusterDeactivate_t de;
    de.portId = 0x8201;
    rocCluster.request(0x800023, &de, 0x800000, nullptr);
    rocCluster.request(0x800036, &un, 0x800000, nullptr);
}

TEST_F(EmulationTest, AttachingMediaPutsAFlexibleChannelInServiceAndDetachTakesItOut) {
    Addressable tsc(cd(tscOf(2, 1, 11)));
    EXPECT_EQ(chanState(tsc), 13u);  // OutOfServiceMediaDetached
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
    EXPECT_EQ(chanState(tsc), 1u);
    EXPECT_EQ(refusal(tsc, 0x1234, &attach, 0x1235), kErrBadState);  // already attached

    Tsc::MsgDetach_t detach;
    tsc.request(0x1236, &detach, 0x1237, nullptr);
    EXPECT_EQ(chanState(tsc), 13u);
    // Media of a voice channel the board lacks is no media at all.
    attach.MediaInfo[1]->InstDesc = cd(farm::mediaAddress(2, 40, farm::Media::ToneGen));
    EXPECT_EQ(refusal(tsc, 0x1234, &attach, 0x1235), kErrNoSuchComponent);
}

// A refusal carries the code it was given, until normal undoes it; a delay holds answers back.
TEST_F(EmulationTest, OverridesRefuseWithTheirCodeAndDelayAnswers) {
    Proxy tsc(cd(tscOf(1, 2, 2)));
    EXPECT_EQ(builtinControl("refuse 120f 77"), "ok");
    EXPECT_EQ(refusal(tsc, 0x120F, &getChan, 0x1210), 0x77u);
    EXPECT_EQ(builtinControl("normal 120f"), "ok");
    EXPECT_EQ(chanState(tsc), 1u);

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

TEST_F(EmulationTest, ControlCallRingsAChannelAndHangupDisconnectsIt) {
    Addressable tsc(cd(tscOf(1, 1, 10)));
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
    EXPECT_EQ(builtinControl("hangup 1 1 10"), "ok");
    tsc.request(0x120D, &q, 0x120E, &cs);
    EXPECT_EQ(cs.CallState, 6u);
    Tsc::MsgReleaseCall_t rel;
    rel.CallId = cs.CallId;
    tsc.request(0x121C, &rel);
}

// One request of the program to a board in its first state, and what it gets: the answer of
// the given type (refusal 0), or MsgError_t with the given code. Bodies start all zeros.
struct Exchange {
    const char* name;
    farm::Address target;
    std::uint32_t type;
    std::function<std::unique_ptr<tolk::MsgBody>()> body;
    std::uint32_t answerType;
    std::uint32_t refusal;
};

template <typename B>
Exchange ask(
    const char* name, farm::Address target, std::uint32_t answerType, std::uint32_t refusal,
    std::function<void(B&)> fill = [](B&) {}) {
    auto body = [fill] {
        auto b = std::make_unique<B>();
        fill(*b);
        return std::unique_ptr<tolk::MsgBody>(std::move(b));
    };
    return Exchange{name, target, B::MsgType, body, answerType, refusal};
}

void claim(Rm::CompUse_t& b, const farm::Address& what) {
    b.List.realloc(1);
    b.List[0]->desc = cd(what);
    b.Count = 1;
}

TEST_F(EmulationTest, EachRequestIsAnsweredAsABoardWould) {
    const Exchange rows[] = {
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
                                     }),
    };
    for (const Exchange& x : rows) {
        SCOPED_TRACE(x.name);
        Addressable a(cd(x.target));
        std::unique_ptr<tolk::MsgBody> body = x.body();
        if (x.refusal != 0) {
            EXPECT_EQ(refusal(a, x.type, body.get(), x.answerType), x.refusal);
        } else {
            EXPECT_NO_THROW(a.request(x.type, body.get(), x.answerType, nullptr));
        }
    }
}

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

std::uint32_t typeOf(const std::vector<unsigned char>& block) {
    return reinterpret_cast<const TKMsg32Bit*>(block.data())->type;
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

class EmulationCore : public testing::Test {
  protected:
    std::ostringstream log;
    Emulation emu{defaultFarm(), log};
};

TEST_F(EmulationCore, WhatItCannotAnswerIsLoggedByTypeAndTarget) {
    // No such board: nobody is there to answer, so nothing comes back.
    emu.receive(RawClient::block(0x1214, tscOf(9, 1, 1), 1));
    EXPECT_TRUE(drain(emu).empty());
    // A message this channel's TSC does not play (ParkCall) and one a CHP does not take.
    emu.receive(RawClient::block(0x1216, tscOf(1, 1, 2), 2));
    emu.receive(RawClient::block(0x1415, farm::channelComponentAddress(1, 1, 2, farm::kCHP), 3));
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

TEST_F(EmulationCore, TheBoardItselfAnswersNothingAndMediaTakeOnlyStandardOperations) {
    emu.receive(RawClient::block(0x02, farm::boardAddress(1), 1));
    EXPECT_TRUE(drain(emu).empty());
    EXPECT_NE(log.str().find("the board itself takes no messages"), std::string::npos) << log.str();

    const farm::Address media = farm::mediaAddress(2, 11, farm::Media::SigDet);
    emu.receive(RawClient::block(0x02, media, 2));
    emu.receive(RawClient::block(0x1415, media, 3));
    auto out = drain(emu);
    ASSERT_EQ(out.size(), 2u);
    EXPECT_EQ(typeOf(out[0]), 0x03u);
    EXPECT_EQ(typeOf(out[1]), 0u);  // MsgError_t
    EXPECT_NE(log.str().find("not a message of this component"), std::string::npos) << log.str();
    EXPECT_EQ(emu.stats().unanswered, 2u);
}

TEST_F(EmulationCore, SameRequestsAndControlLinesGiveTheSameBytes) {
    auto run = [] {
        std::ostringstream log;
        Emulation emu(defaultFarm(), log);
        auto tsc = tscOf(1, 1, 1);
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
    // Acks, the completion, the call's four states, red and five BPV saturations.
    EXPECT_GE(first.size(), 14u);
    EXPECT_EQ(first, run());
}

// ---- the server ----

class RelayTest : public testing::Test {
  protected:
    void SetUp() override {
        farm::resetActiveFarm();
        unsetenv("VX7_FARM");
        unsetenv("HOST");
        auto load = farm::activeFarm();
        ASSERT_TRUE(load.farm);
        farm_ = load.farm;
        start(defaults());
    }
    void TearDown() override {
        unsetenv("REMOTE_TKHOST");
        halt();
    }
    static RelayOptions defaults() {
        RelayOptions o;
        o.port = 0;
        o.bindAddress = "127.0.0.1";
        return o;
    }
    // Replaces the running server by one with these options and control channel.
    void restart(const RelayOptions& o, int controlFd = -1, std::ostream* controlOut = nullptr) {
        halt();
        start(o, controlFd, controlOut);
    }
    // Whether `done` comes true within five seconds.
    template <class P>
    static bool eventually(P done) {
        for (int i = 0; i < 500 && !done(); ++i) {
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
        }
        return done();
    }
    bool waitConnections(std::size_t n) {
        return eventually([&] { return server->connectionCount() == n; });
    }
    bool logged(const std::string& text) {
        return eventually([&] { return logBuf.text().find(text) != std::string::npos; });
    }

    LockedLog logBuf;
    std::ostream log{&logBuf};
    std::unique_ptr<RelayServer> server;
    std::thread loop;
    int port = 0;

  private:
    void start(const RelayOptions& o, int controlFd = -1, std::ostream* controlOut = nullptr) {
        server = std::make_unique<RelayServer>(farm_, o, log);
        std::string error;
        ASSERT_TRUE(server->listen(error)) << error;
        port = server->port();
        loop = std::thread([this, controlFd, controlOut] { server->run(controlFd, controlOut); });
        std::string host = "127.0.0.1:" + std::to_string(port);
        setenv("REMOTE_TKHOST", host.c_str(), 1);
    }
    void halt() {
        if (loop.joinable()) {
            server->stop();
            loop.join();
        }
    }

    std::shared_ptr<const farm::Farm> farm_;
};

// Every client's own address is checked on the hundreds of connections below.
TEST_F(RelayTest, AClientsRequestIsAnsweredAndCounted) {
    Addressable a(cd(farm::channelComponentAddress(1, 1, 2, farm::kTSC)));
    Tsc::MsgGetChanStateCmplt_t st;
    a.request(0x120F, &getChan, 0x1210, &st);
    EXPECT_EQ(st.ChanState, 1u);
    EXPECT_EQ(server->control("stats").rfind("ok stats requests=1 answers=1", 0), 0u);
}

TEST_F(RelayTest, OversizeAndUnknownFramesAreRefused) {
    for (std::uint32_t type : {std::uint32_t{4242}, std::uint32_t{TKS_FRAME_MESSAGE}}) {
        RawClient c(port);
        ASSERT_TRUE(c.opened());
        msg_t m;
        m.type = type;
        std::vector<unsigned char> header(TKS_FRAME_HEADER_SIZE);
        m.size = type == 4242u ? 0 : 102401;
        tksEncodeFrameHeader(m, header.data());
        c.send(header);
        EXPECT_TRUE(c.closedByServer()) << type;
    }
    EXPECT_TRUE(waitConnections(0));
}

TEST_F(RelayTest, ClientVanishingMidFrameCostsNothing) {
    for (int i = 0; i < 50; ++i) {
        RawClient c(port);
        std::vector<unsigned char> open = c.open();
        open.resize(open.size() / 2);
        c.send(open);
    }
    EXPECT_TRUE(waitConnections(0));
    EXPECT_TRUE(logged("closed in the middle of a frame"));
    Addressable a(cd(farm::lconAddress(3, 1)));
    Lcon::MsgGetLineStateCmplt_t st;
    a.request(0x1608, &getLine, 0x1609, &st);
    EXPECT_EQ(st.LineState, 0x160Fu);
}

TEST_F(RelayTest, HundredsOfConnectionsGetUniqueAddressesAndDropClosesThemAll) {
    std::vector<std::unique_ptr<RawClient>> clients;
    for (int i = 0; i < 300; ++i) {
        clients.push_back(std::make_unique<RawClient>(port));
        ASSERT_TRUE(clients.back()->connected);
        clients.back()->send(clients.back()->open());
    }
    std::set<std::uint32_t> instances;
    for (auto& c : clients) {
        std::vector<unsigned char> f = c->read(TKS_FRAME_HEADER_SIZE + TKS_ASSIGNED_BODY_BYTES);
        ASSERT_EQ(f.size(), TKS_FRAME_HEADER_SIZE + TKS_ASSIGNED_BODY_BYTES);
        msg_t m;
        tksDecodeFrameHeader(f.data(), m);
        ASSERT_EQ(m.type, TKS_FRAME_ASSIGNED);
        m.body = f.data() + TKS_FRAME_HEADER_SIZE;
        TKCompDesc addr;
        ASSERT_TRUE(tksDecodeAssigned(m, addr));
        EXPECT_EQ(addr.board, 0xFF);
        instances.insert(addr.instance);
    }
    EXPECT_EQ(instances.size(), 300u);
    EXPECT_EQ(server->control("drop"), "ok dropped 300");
    for (auto& c : clients) {
        EXPECT_TRUE(c->closedByServer());
    }
    EXPECT_TRUE(waitConnections(0));
    EXPECT_EQ(server->control("drop"), "ok dropped 0");
    RawClient later(port);
    EXPECT_TRUE(later.opened());
}

TEST_F(RelayTest, OutOfDescriptorsAWaitingConnectionIsRefusedAndTheOthersServed) {
    RawClient served(port);
    ASSERT_TRUE(served.opened());
    ASSERT_TRUE(waitConnections(1));

    // A malformed frame closes its connection alone. The server has logged it before, so
    // that writing its log needs no new descriptor (a sanitizer's first check of the
    // stream's type opens a pipe).
    {
        RawClient bad(port);
        ASSERT_TRUE(bad.opened());
        bad.send(kShortHeaderFrame);
        ASSERT_TRUE(bad.closedByServer());
    }
    EXPECT_TRUE(logged("malformed message frame"));

    // Leave the process exactly one free descriptor: the next client takes it, so the server
    // cannot accept that client.
    rlimit old{};
    ASSERT_EQ(getrlimit(RLIMIT_NOFILE, &old), 0);
    int lowestFree = ::dup(0);
    ASSERT_GE(lowestFree, 0);
    ::close(lowestFree);
    rlimit tight = old;
    tight.rlim_cur = static_cast<rlim_t>(lowestFree) + 1;
    ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &tight), 0);
    bool closed = false;
    {
        RawClient waiting(port);
        closed = waiting.connected && waiting.closedByServer();
    }
    ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &old), 0);
    EXPECT_TRUE(closed);
    EXPECT_TRUE(logged("out of descriptors, refusing a connection"));

    // The loop is not left spinning on the listening socket, and serves old and new
    // connections.
    served.send(RawClient::request(farm::lconAddress(1, 1), Lcon::MsgGetLineState_t::MsgType));
    EXPECT_EQ(served.nextType(), TKS_FRAME_MESSAGE);
    RawClient later(port);
    EXPECT_TRUE(later.opened());
}

TEST_F(RelayTest, IdleConnectionsDoNotLockOutAClientThatOpens) {
    RelayOptions o = defaults();
    o.maxConnections = 8;
    o.reservedForOpen = 2;
    o.openTimeout = std::chrono::milliseconds(600);
    restart(o);

    std::vector<std::unique_ptr<RawClient>> idle;
    for (int i = 0; i < 8; ++i) {
        idle.push_back(std::make_unique<RawClient>(port));
        ASSERT_TRUE(idle.back()->connected);
    }
    RawClient late(port);
    ASSERT_TRUE(late.opened());

    // Every idle one is closed in time (the oldest first, to make room), the open one stays.
    for (auto& c : idle) {
        EXPECT_TRUE(c->closedByServer());
    }
    EXPECT_TRUE(waitConnections(1));
    EXPECT_TRUE(logged("did not open within 600 ms"));
    late.send(RawClient::request(farm::lconAddress(1, 1), Lcon::MsgGetLineState_t::MsgType));
    EXPECT_EQ(late.nextType(), TKS_FRAME_MESSAGE);
}

// A counter of the relay's "stats" line.
unsigned long statsCounter(RelayServer& server, const std::string& name) {
    std::string s = server.control("stats");
    std::size_t at = s.find(" " + name + "=");
    return at == std::string::npos ? 0 : std::stoul(s.substr(at + name.size() + 2));
}

TEST_F(RelayTest, QueuedOutputOfAllClientsIsCappedByCuttingTheWorstReader) {
    constexpr unsigned long kMiB = 1u << 20;
    RelayOptions o = defaults();
    o.maxQueuedOutput = 6 * kMiB;
    restart(o);

    std::vector<std::unique_ptr<RawClient>> c;
    for (int i = 0; i < 3; ++i) {
        c.push_back(std::make_unique<RawClient>(port, 4096));
        ASSERT_TRUE(c.back()->opened());
    }
    // Batches of pipelined requests whose answers nobody reads. What the kernel holds varies,
    // so each client goes on until the relay itself holds its share: 4.5 MiB for the first,
    // 1 MiB more for the second; the third then passes the cap, but the first is the worst.
    std::vector<unsigned char> batch;
    const std::vector<unsigned char> ask =
        RawClient::request(farm::lconAddress(1, 1), Lcon::MsgGetLineState_t::MsgType);
    for (int k = 0; k < 1024; ++k) {
        batch.insert(batch.end(), ask.begin(), ask.end());
    }
    unsigned long asked = 0;
    std::size_t batches[3] = {0, 0, 0};
    auto pipeline = [&](int i, auto done) {
        for (int n = 0; n < 400 && !done(); ++n) {
            c[i]->send(batch);
            asked += 1024;
            ++batches[i];
            eventually([&] { return statsCounter(*server, "requests") >= asked; });
        }
    };
    pipeline(0, [&] { return statsCounter(*server, "queued") >= 9 * kMiB / 2; });
    pipeline(1, [&] { return statsCounter(*server, "queued") >= 11 * kMiB / 2; });
    pipeline(2, [&] { return server->connectionCount() < 3; });
    ASSERT_TRUE(waitConnections(2));
    EXPECT_LE(statsCounter(*server, "queued"), 6 * kMiB);
    EXPECT_TRUE(logged("most unread"));

    // The two others get every answer; the first one's stop short.
    std::vector<unsigned char> head = c[1]->read(TKS_FRAME_HEADER_SIZE);
    ASSERT_EQ(head.size(), TKS_FRAME_HEADER_SIZE);
    msg_t h;
    tksDecodeFrameHeader(head.data(), h);
    const std::size_t answer = TKS_FRAME_HEADER_SIZE + h.size + h.ex_size;
    for (int i = 0; i < 3; ++i) {
        int roomy = 1 << 20;  // reading it all through 4 KiB would take seconds
        setsockopt(c[i]->fd, SOL_SOCKET, SO_RCVBUF, &roomy, sizeof roomy);
    }
    const std::size_t all[3] = {batches[0] * 1024 * answer,
                                batches[1] * 1024 * answer - TKS_FRAME_HEADER_SIZE,
                                batches[2] * 1024 * answer};
    EXPECT_LT(c[0]->read(all[0]).size(), all[0]);
    EXPECT_EQ(c[1]->read(all[1]).size(), all[1]);
    EXPECT_EQ(c[2]->read(all[2]).size(), all[2]);
}

TEST_F(RelayTest, TraceNamesEachRoutedMessageOnOneLine) {
    RelayOptions o = defaults();
    o.trace = true;
    restart(o);
    RawClient c(port);
    ASSERT_TRUE(c.opened());
    c.send(RawClient::request(farm::lconAddress(1, 2), Lcon::MsgGetLineState_t::MsgType));
    ASSERT_EQ(c.read(TKS_FRAME_HEADER_SIZE).size(), TKS_FRAME_HEADER_SIZE);

    Addressable lcon(cd(farm::lconAddress(1, 2)));
    subscribe(lcon, 0x1600);
    EXPECT_EQ(server->control("alarm 1 2 yellow on"), "ok");
    EXPECT_EQ(server->control("alarm 1 9 red on"), "error: no line 1.9 in this farm");
    ASSERT_TRUE(BoardEvents::get().waitUntil([](const Event& e) {
        const auto& w = e.words;
        return w.size() == 3 && w[1] == 0x1602;
    }));
    // The request and its answer, then the subscription's event, each whole on its line.
    const std::string log = logBuf.text();
    const std::string exchange =
        "trace in conn 1 n0.b255.p0.c0.i1 -> n0.b1.p1.c22.i2 MsgGetLineState_t trans 66 {}\n"
        "trace out conn 1 n0.b1.p1.c22.i2 -> n0.b255.p0.c0.i1 MsgGetLineStateCmplt_t trans 66 "
        "{LineState 5647 Reason 2}\n";
    EXPECT_EQ(log.rfind(exchange, 0), 0u) << log;
    const std::string event =
        "trace out conn 2 n0.b1.p1.c22.i2 -> n0.b255.p0.c0.i2 MsgEvtDetected_t Evt_0x1600_t trans ";
    std::size_t at = log.find(event);
    ASSERT_NE(at, std::string::npos) << log;
    std::string line = log.substr(at, log.find('\n', at) - at);
    EXPECT_TRUE(line.ends_with(" {Label 5632 Type 5634 State 1}")) << line;
}

TEST_F(RelayTest, TheTailOfAnOverlongControlLineDoesNotRun) {
    int p[2];
    ASSERT_EQ(::pipe(p), 0);
    LockedLog answers;
    std::ostream out(&answers);
    restart(defaults(), p[0], &out);

    std::string input(69632, 'x');
    input += "stats\nhelp\n";
    // More than the pipe holds: the write waits until the server's loop has read the rest.
    std::size_t done = 0;
    while (done < input.size()) {
        ssize_t n = ::write(p[1], input.data() + done, input.size() - done);
        if (n <= 0) {
            break;
        }
        done += static_cast<std::size_t>(n);
    }
    EXPECT_TRUE(
        eventually([&] { return answers.text().find("ok commands") != std::string::npos; }));
    const std::string got = answers.text();
    EXPECT_EQ(got.substr(0, got.find("ok commands")), "error: control line too long\n");
    EXPECT_EQ(got.find("ok stats"), std::string::npos);
    ::close(p[1]);
    restart(defaults());
    ::close(p[0]);
}

// One connection's framing alone, over a socket pair on which the test plays the client: with
// nothing to read the connection goes on; a frame comes out only when whole, two in one read
// both do.
TEST(RelayConnection, AFrameComesOutOnlyWhenWholeAndTwoInOneReadBothDo) {
    int fds[2];
    ASSERT_EQ(::socketpair(AF_UNIX, SOCK_STREAM | SOCK_NONBLOCK, 0, fds), 0);
    RelayConnection conn(fds[0], 7, Clock::now());
    const RelayConnection::Read none = conn.receive();
    EXPECT_EQ(none.bytes, 0u);
    EXPECT_FALSE(none.ended);

    auto frame = [](std::uint32_t type, std::string body, std::string ex) {
        msg_t m;
        m.type = type;
        m.size = static_cast<std::uint32_t>(body.size());
        m.ex_size = static_cast<std::uint32_t>(ex.size());
        m.body = reinterpret_cast<unsigned char*>(body.data());
        m.ex = reinterpret_cast<unsigned char*>(ex.data());
        return tksEncodeFrame(m);
    };
    const std::vector<unsigned char> first = frame(1001, "head", "payload");
    std::vector<unsigned char> rest = frame(2000, "", "");
    rest.insert(rest.begin(), first.back());
    RelayConnection::Frame f;
    for (std::size_t i = 0; i + 1 < first.size(); ++i) {
        ASSERT_EQ(::write(fds[1], &first[i], 1), 1);
        ASSERT_EQ(conn.receive().bytes, 1u);
        ASSERT_EQ(conn.nextFrame(f), RelayConnection::FrameStatus::Partial) << "byte " << i;
    }
    ASSERT_EQ(::write(fds[1], rest.data(), rest.size()), static_cast<ssize_t>(rest.size()));
    ASSERT_EQ(conn.receive().bytes, rest.size());
    ASSERT_EQ(conn.nextFrame(f), RelayConnection::FrameStatus::Ready);
    EXPECT_EQ(f.header.type, 1001u);
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(f.body), f.header.size), "head");
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(f.ex), f.header.ex_size), "payload");
    ASSERT_EQ(conn.nextFrame(f), RelayConnection::FrameStatus::Ready);
    EXPECT_EQ(f.header.type, 2000u);
    EXPECT_EQ(conn.nextFrame(f), RelayConnection::FrameStatus::Partial);
    ::close(fds[0]);
    ::close(fds[1]);
}

}  // namespace
}  // namespace sim
