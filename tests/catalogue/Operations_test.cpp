// One golden table for the operation families of every component class: each call, the block
// it must put on the wire, and the completion it must wait for (or none for a one-way command).
// Then which class knows which number: each looks up its own and passes the rest along its chain.

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <functional>
#include <memory>
#include <thread>
#include <typeinfo>

#include "OpSupport.h"
#include "catalogue/cas/CAS.h"
#include "catalogue/chp/CHP.h"
#include "catalogue/cluster/Cluster.h"
#include "catalogue/cluster/ClusterMgr.h"
#include "catalogue/cluster/Component.h"
#include "catalogue/lcon/LCON.h"
#include "catalogue/resourcemgr/ResourceMgr.h"
#include "catalogue/tsc/TSC.h"
#include "catalogue/tsc/TSCAsync.h"

namespace {

using tolk::Addressable;
using tolk::CAS;
using tolk::CHP;
using tolk::Cluster;
using tolk::ClusterMgr;
using tolk::CompAttr_t;
using tolk::Component;
using tolk::LCON;
using tolk::ResourceMgr;
using tolk::staticList;
using tolk::StdResource;
using tolk::TSC;

const tolk::CompDesc_t kCluster(0x30, 2, 1, 0, 0);
const tolk::CompDesc_t kOther(0x42, 2, 1, 19, 0);
// Each component class registers handlers, so each stands at an address of its own.
const tolk::CompDesc_t kLine(1, 2, 1, 22, 0);
const tolk::CompDesc_t kSignals(3, 2, 1, 20, 0);

// A one-way command costs its error wait, so the table keeps it short.
template <class T>
class Fast : public Quick<T> {
  public:
    template <class... A>
    explicit Fast(A&&... a) : Quick<T>(std::forward<A>(a)...) {
        this->ErrorWaitTime = 20;
    }
};

// A completion body that records that the answer was read into it.
template <class T>
class Spy : public T {
  public:
    explicit Spy(bool* r) : read(r) {}
    unsigned int readMsg(tolk::Msg* msg, unsigned int offset) override {
        *read = true;
        return T::readMsg(msg, offset);
    }

  private:
    bool* read;
};

Bytes zeros(std::size_t n) {
    return Bytes(n, 0);
}

Bytes u16(unsigned int v) {
    return {static_cast<std::uint8_t>(v >> 8), static_cast<std::uint8_t>(v)};
}

// A character field of n bytes holding s.
Bytes text(const std::string& s, std::size_t n) {
    Bytes b(s.begin(), s.end());
    b.resize(n, 0);
    return b;
}

template <class T>
staticList<T> listOf(std::initializer_list<T> items) {
    staticList<T> l;
    l.realloc(static_cast<unsigned int>(items.size()));
    unsigned int i = 0;
    for (const T& item : items) {
        *l.element(i++) = item;
    }
    return l;
}

// A list of one element, filled by `fill`.
template <class E, class F>
staticList<E> one(F fill) {
    staticList<E> l;
    l.realloc(1);
    fill(*l.element(0));
    return l;
}

struct Objects {
    isa::RefPtr<tolk::MsgQueue> queue = newQueue();
    tolk::TmpInstance found{kTarget, queue};
    tolk::TmpInstance line{kLine, queue};
    tolk::TmpInstance signals{kSignals, queue};
    Fast<StdResource> res{kTarget, queue};
    Fast<TSC> tsc{static_cast<const tolk::Instance&>(found)};
    Fast<LCON> lcon{static_cast<const tolk::Instance&>(line)};
    Fast<CAS> cas{static_cast<const tolk::Instance&>(signals)};
    Fast<tolk::Cluster> cluster{kCluster, queue};
    tolk::CompDesc_t host = queue->getHostDesc();
    tolk::CompDesc_t other = kOther;
    staticList<CompAttr_t> attrs = listOf({CompAttr_t(7, 9)});
    bool read = false;
    std::vector<std::unique_ptr<tolk::MsgBody>> spies;

    template <class T>
    T* ret() {
        spies.push_back(std::make_unique<Spy<T>>(&read));
        return static_cast<T*>(spies.back().get());
    }
};

// Own: the resource's id. Host: its id too, and the body opens with the queue's host address.
enum class Id { Fresh, Own, Host };

struct Row {
    const char* name;
    std::function<void(Objects&)> call;
    unsigned int type;
    Bytes body;
    unsigned int cmplt;  // 0: one-way, nothing awaited
    bool returns;        // the caller's completion body receives the answer
    Id id = Id::Fresh;
    tolk::CompDesc_t tgt = kTarget;
};

// clang-format off
const Row kRows[] = {
    // Every resource.
    {"GetParm", [](Objects& o) { o.res.GetParm(0x1001, o.ret<StdResource::MsgGetParmCmplt_t>()); },
     0x12, u32(0x1001), 0x13, true},
    {"GetParm body", [](Objects& o) { StdResource::MsgGetParm_t b; o.res.GetParm(&b, nullptr); },
     0x12, u32(0), 0x13, false},
    {"ArmRTC", [](Objects& o) { o.res.ArmRTC(0x1230, 2); },
     0x21, concat({u32(0x1230), u32(2)}), 0x22, false, Id::Own},
    {"ArmRTC body", [](Objects& o) { StdResource::MsgArmRTC_t b; o.res.ArmRTC(&b); },
     0x21, zeros(8), 0x22, false, Id::Own},
    {"ArmxRTCs", [](Objects& o) {
         auto l = one<StdResource::MsgArmxRTCs_t::EventGroupList_t>([](auto& e) { e.EvtGroup = 0x1230; e.Action = 1; });
         o.res.ArmxRTCs(l); },
     0x23, concat({u32(1), u32(0x1230), u32(1)}), 0x24, false, Id::Own},
    {"DisarmxRTCs", [](Objects& o) { auto l = listOf({0x1230u, 0x1231u}); o.res.DisarmxRTCs(l); },
     0x27, concat({u32(2), u32(0x1230), u32(0x1231)}), 0x28, false, Id::Own},
    {"DisarmAllRTCs", [](Objects& o) { o.res.DisarmAllRTCs(); }, 0x29, {}, 0x2A, false, Id::Own},
    {"DetectEvt", [](Objects& o) { o.res.DetectEvt(0x1230, 0, nullptr); },
     0x16, concat({u32(0x1230), u32(0x1230)}), 0x17, false, Id::Host},
    {"DetectxEvts pairs", [](Objects& o) {
         auto l = one<StdResource::MsgDetectxEvts_t::List_t>([](auto& e) { e.EvtType = 0x1201; e.EvtGroup = 0x1200; });
         o.res.DetectxEvts(l, nullptr); },
     0x18, concat({u32(1), u32(0x1201), u32(0x1200)}), 0x19, false, Id::Host},
    {"DetectxEvts types", [](Objects& o) { auto t = listOf({0x1230u, 0x1231u}); o.res.DetectxEvts(t, 0, nullptr); },
     0x18, concat({u32(2), u32(0x1230), u32(0x1230), u32(0x1231), u32(0x1231)}), 0x19, false, Id::Host},
    {"DetectxEvts types in a group", [](Objects& o) { auto t = listOf({0x1230u, 0x1231u}); o.res.DetectxEvts(t, 0x1230, nullptr); },
     0x18, concat({u32(2), u32(0x1230), u32(0x1230), u32(0x1231), u32(0x1230)}), 0x19, false, Id::Host},
    {"CancelEvt", [](Objects& o) { o.res.CancelEvt(0x1200, nullptr); },
     0x1A, u32(0x1200), 0x1B, false, Id::Own},
    {"Error", [](Objects& o) { o.res.Error(0x01, 9); }, 0x00, concat({u32(1), u32(9)}), 0, false},
    {"ComTest", [](Objects& o) { o.res.ComTest(o.ret<StdResource::MsgComtestCmplt_t>()); }, 0x02, {}, 0x03, true},
    {"Ack", [](Objects& o) { o.res.Ack(); }, 0x01, {}, 0, false},
    {"SetParm", [](Objects& o) { o.res.SetParm(7, 9, o.ret<StdResource::MsgSetParmCmplt_t>()); },
     0x08, concat({u32(7), u32(9)}), 0x09, true},
    {"SetxParms", [](Objects& o) {
         auto l = one<StdResource::MsgSetxParms_t::Parms_t>([](auto& e) { e.Parm = 7; e.Val = 1; });
         o.res.SetxParms(l, o.ret<StdResource::MsgSetxParmsCmplt_t>()); },
     0x0A, concat({u32(1), u32(7), u32(1)}), 0x0B, true},
    {"GetxParms empty", [](Objects& o) {
         staticList<StdResource::MsgGetxParms_t::Parms_t> none;
         o.res.GetxParms(none, o.ret<StdResource::MsgGetxParmsCmplt_t>()); },
     0x14, u32(0), 0x15, true},
    {"SetVParm", [](Objects& o) {
         auto l = one<StdResource::MsgSetVParm_t::Parms_t>([](auto& e) { e.Parm = 0x31; e.Val = 9; });
         o.res.SetVParm(l, o.ret<StdResource::MsgSetVParmCmplt_t>()); },
     0x2F, concat({u16(1), u32(0x31), u32(9)}), 0x30, true},

    // Call control.
    {"AcceptCall", [](Objects& o) { o.tsc.AcceptCall(); }, 0x1200, u32(0), 0, false},
    {"AnswerCall", [](Objects& o) { o.tsc.AnswerCall(7); }, 0x1201, concat({u32(7), u32(0)}), 0, false},
    {"BlindTransferCall", [](Objects& o) { o.tsc.BlindTransferCall(); }, 0x1202, zeros(4 + 128 + 128 + 1), 0, false},
    {"CancelTransfer", [](Objects& o) { o.tsc.CancelTransfer(3); }, 0x1203, u32(3), 0, false},
    {"CompleteCall", [](Objects& o) { o.tsc.CompleteCall(3, o.ret<TSC::MsgCompleteCallCmplt_t>()); },
     0x1205, concat({u32(0), u32(3)}), 0x1206, true},
    {"CompleteTransfer", [](Objects& o) { o.tsc.CompleteTransfer(9, 4); }, 0x1207, concat({u32(4), u32(9)}), 0, false},
    {"DropCall", [](Objects& o) { o.tsc.DropCall(5); }, 0x120A, concat({u32(5), u32(0xE)}), 0, false},
    {"DropCall body", [](Objects& o) { TSC::MsgDropCall_t b; o.tsc.DropCall(&b); }, 0x120A, zeros(8), 0, false},
    {"GetCallState", [](Objects& o) { o.tsc.GetCallState(o.ret<TSC::MsgGetCallStateCmplt_t>()); },
     0x120D, u32(0), 0x120E, true},
    {"InitTransfer", [](Objects& o) { o.tsc.InitTransfer(6, tolk::string("12"), o.ret<TSC::MsgInitTransferCmplt_t>()); },
     0x1212, concat({u32(6), text("12", 128), zeros(129)}), 0x1213, true},
    {"MakeCall", [](Objects& o) { o.tsc.MakeCall(o.ret<TSC::MsgMakeCallCmplt_t>()); }, 0x1214, zeros(257), 0x1215, true},
    {"MakeCall body", [](Objects& o) { TSC::MsgMakeCall_t b; o.tsc.MakeCall(&b, o.ret<TSC::MsgMakeCallCmplt_t>()); },
     0x1214, zeros(257), 0x1215, true},
    {"SetChanState", [](Objects& o) { o.tsc.SetChanState(2, o.ret<TSC::MsgSetChanStateCmplt_t>()); },
     0x121F, u32(2), 0x1220, true},
    {"StartSetChanState", [](Objects& o) { o.tsc.StartSetChanState(2); }, 0x121F, u32(2), 0, false},
    {"GetCallInfo", [](Objects& o) { auto ids = listOf({0x1202u}); o.tsc.GetCallInfo(ids, o.ret<TSC::MsgGetCallInfoCmplt_t>()); },
     0x120B, concat({u32(0), u32(1), u32(0x1202)}), 0x120C, true},
    {"SendISDN", [](Objects& o) {
         auto data = listOf<unsigned char>({0xA1, 0x70});
         o.tsc.SendISDN(0x45, data, 6, o.ret<TSC::MsgSendISDNCmplt_t>()); },
     0x1222, concat({u32(6), u32(0x45), u32(2), {0xA1, 0x70}}), 0x1223, true},
    {"Dial", [](Objects& o) { o.tsc.Dial(tolk::string("5"), o.ret<TSC::MsgDialCmplt_t>()); },
     0x1224, concat({u32(0), text("5", 128), {0, 2}}), 0x1225, true},
    {"Dial in full", [](Objects& o) { o.tsc.Dial(tolk::string("5"), 3, 1, 4, nullptr); },
     0x1224, concat({u32(3), text("5", 128), {1, 4}}), 0x1225, false},
    {"Attach", [](Objects& o) {
         auto media = one<TSC::MsgAttach_t::MediaInfo_t>([](auto& e) { e.ComponentType = 0x30; e.InstDesc = kOther; });
         o.tsc.Attach(media, o.ret<TSC::MsgAttachCmplt_t>()); },
     0x1234, concat({{1}, u32(0x30), desc(kOther)}), 0x1235, true},
    {"SetAlarmMask", [](Objects& o) { o.tsc.SetAlarmMask(1, o.ret<TSC::MsgSetAlarmMaskCmplt_t>()); },
     0x1242, concat({{1}, u32(0x46)}), 0x1243, true},
    {"GCExtension in part", [](Objects& o) { o.tsc.GCExtension(1, 2, 3, tolk::string("a"), nullptr); },
     0x1248, concat({u32(1), u32(2), u32(3), text("a", 128), zeros(128)}), 0x1249, false},

    // Line control.
    {"GetAlarms", [](Objects& o) { auto l = listOf({0x10u, 0x11u}); o.lcon.GetAlarms(l, o.ret<LCON::MsgGetAlarmsCmplt_t>()); },
     0x1602, concat({u32(2), u32(0x10), u32(0x11)}), 0x1603, true, Id::Fresh, kLine},
    {"SetDiagMode", [](Objects& o) { o.lcon.SetDiagMode(2, o.ret<LCON::MsgSetDiagModeCmplt_t>()); }, 0x160E, {2}, 0x160F, true, Id::Fresh, kLine},
    {"SetLineState", [](Objects& o) { o.lcon.SetLineState(1, o.ret<LCON::MsgSetLineStateCmplt_t>()); },
     0x1610, concat({u32(1), u32(0), u32(0)}), 0x1611, true, Id::Fresh, kLine},
    {"StartSetLineState", [](Objects& o) { o.lcon.StartSetLineState(1, 2); },
     0x1610, concat({u32(1), u32(2), u32(0)}), 0, false, Id::Fresh, kLine},
    {"GetMetrics", [](Objects& o) { o.lcon.GetMetrics(0x20, o.ret<LCON::MsgGetMetricsCmplt_t>()); },
     0x160A, concat({u32(0x20), {1}}), 0x160B, true, Id::Fresh, kLine},
    {"SetVParm of the line", [](Objects& o) {
         auto l = one<LCON::Std_MsgSetVParm_t::Parms_t>([](auto& e) { e.Parm = 0x31; e.FieldDef = 0x380000; e.Val = 9; });
         o.lcon.SetVParm(l, o.ret<LCON::Std_MsgSetVParmCmplt_t>()); },
     0x2F, concat({u16(1), u32(0x31), u32(0x380000), u32(9)}), 0x30, true, Id::Fresh, kLine},
    {"SetProtocol", [](Objects& o) { o.lcon.SetProtocol(tolk::string("E1"), o.ret<LCON::MsgTSPSetProtocolCmplt_t>()); },
     0x1616, text("E1", 32), 0x1617, true, Id::Fresh, kLine},

    // Signalling.
    {"DisableSignal", [](Objects& o) { o.cas.DisableSignal(4, o.ret<CAS::MsgDisableSignalCmplt_t>()); }, 0x1407, u32(4), 0x1408, true, Id::Fresh, kSignals},
    {"GenerateSignal", [](Objects& o) { o.cas.GenerateSignal(4, o.ret<CAS::MsgGenerateSignalCmplt_t>()); },
     0x140B, {0, 0, 0, 4, 0, 0, 0}, 0x140C, true, Id::Fresh, kSignals},
    {"StartGenerateSignal", [](Objects& o) {
         tolk::staticList<char> digits = listOf({'1', '2'});
         o.cas.StartGenerateSignal(4, 5, 2, reinterpret_cast<tolk::cat::ValueWord>(&digits)); },
     0x140B, {0, 0, 0, 4, 0, 5, 2, '1', '2'}, 0, false, Id::Fresh, kSignals},
    {"StartGenerateSignal without a list", [](Objects& o) { o.cas.StartGenerateSignal(4); },
     0x140B, {0, 0, 0, 4, 0, 0, 0}, 0, false, Id::Fresh, kSignals},
    {"Dial a signal", [](Objects& o) { o.cas.Dial(1, tolk::string("123"), o.ret<CAS::MsgDialCmplt_t>()); },
     0x1415, concat({u32(1), text("123", 128)}), 0x1416, true, Id::Fresh, kSignals},
    {"MatchCondition", [](Objects& o) { o.cas.MatchCondition(6, 2, o.ret<CAS::MsgMatchConditionCmplt_t>()); },
     0x1417, {0, 0, 0, 6, 2}, 0x1418, true, Id::Fresh, kSignals},

    // The cluster, and the board's cluster and resource services.
    {"Deactivate", [](Objects& o) { o.cluster.Deactivate(5); },
     0x800023, concat({desc(kCluster), u32(5)}), 0x800000, false, Id::Fresh, kCluster},
    {"AttrAdd", [](Objects& o) { o.cluster.AttrAdd(o.attrs, o.ret<tolk::Cluster::ResultComplete_t>()); },
     0x800054, concat({{1}, u32(7), u32(9)}), 0x800000, true, Id::Fresh, kCluster},
    {"Lock", [](Objects& o) { o.cluster.Lock(o.ret<tolk::Cluster::ResultComplete_t>()); },
     0x800056, {}, 0x800000, true, Id::Fresh, kCluster},
    {"ClusterFindInst", [](Objects& o) {
         unsigned char type = 18;
         o.cluster.getClusterMgr()->ClusterFindInst(o.other, type, o.attrs, o.ret<tolk::ClusterMgr::ComponentResult_t>()); },
     0x80001E, concat({desc(kOther), {18, 1}, u32(7), u32(9)}), 0x800007, true, Id::Fresh, kClusterMgr},
    {"ClusterDestroy", [](Objects& o) { o.cluster.getClusterMgr()->ClusterDestroy(o.other); },
     0x800024, desc(kOther), 0, false, Id::Fresh, kClusterMgr},
    {"FindAllComponents", [](Objects& o) {
         o.cluster.getResourceMgr()->FindAllComponents(o.other, o.other, o.attrs, o.ret<tolk::ResourceMgr::CompMultipleResult_t>()); },
     0x800062, concat({desc(kOther), desc(kOther), u32(1), u32(7), u32(9)}), 0x800063, true, Id::Fresh, kResourceMgr},
};
// clang-format on

TEST(Operations, EachCallSendsItsGoldenBlockAndWaitsForItsCompletion) {
    std::atomic<unsigned int> answer{0};
    FakeBoard board([&](const Sent&) {
        unsigned int type = answer.load();
        return type != 0 ? std::vector<Answer>{{type, {}}} : std::vector<Answer>{};
    });
    Objects o;
    testing::internal::CaptureStderr();
    for (const Row& r : kRows) {
        SCOPED_TRACE(r.name);
        board.clear();
        answer = r.cmplt;
        o.read = false;
        // A wrong completion raises UnexpectedMsg; a one-way command that waits raises Timeout.
        EXPECT_NO_THROW(r.call(o));
        auto sent = board.sent();
        ASSERT_EQ(sent.size(), 1u);
        EXPECT_EQ(sent[0].type, r.type) << std::hex << sent[0].type;
        EXPECT_EQ(sent[0].tgt, r.tgt);
        EXPECT_EQ(sent[0].body, r.id == Id::Host ? concat({desc(o.host), r.body}) : r.body);
        EXPECT_EQ(o.read, r.returns);
        if (r.id == Id::Fresh) {
            EXPECT_NE(sent[0].trans, o.res.getId());
        } else {
            EXPECT_EQ(sent[0].trans, o.res.getId());
        }
    }
    // A completion that nobody waited for would surface as an unregistered message.
    answer = 0;
    o.res.Ack();
    std::string err = testing::internal::GetCapturedStderr();
    EXPECT_EQ(err.find("Unregistered"), std::string::npos) << err;
}

TEST(Operations, TextsAreSentAtTheirFieldsLengthAndStayTheCallers) {
    FakeBoard board([](const Sent& s) { return boardAnswer(s, u32(0x77)); });
    Objects o;
    staticList<char> dest;
    dest.realloc(130);
    for (unsigned int i = 0; i < 130; ++i) {
        *dest.element(i) = static_cast<char>('0' + i % 10);
    }
    tolk::string orig("12");
    TSC::MsgMakeCallCmplt_t made;
    o.tsc.MakeCall(dest, orig, 1, &made);
    EXPECT_EQ(*made.pCallId, 0x77u);
    Bytes first128(128);
    for (unsigned int i = 0; i < 128; ++i) {
        first128[i] = static_cast<std::uint8_t>('0' + i % 10);
    }
    EXPECT_EQ(board.sent().back().body, concat({first128, text("12", 128), {1}}));
    EXPECT_EQ(dest.length(), 130u);
    EXPECT_EQ(orig.length(), 3u);

    staticList<char> name;
    name.realloc(40);
    for (unsigned int i = 0; i < 40; ++i) {
        *name.element(i) = static_cast<char>('a' + i % 26);
    }
    o.lcon.SetProtocol(name, nullptr);
    Bytes first32(32);
    for (unsigned int i = 0; i < 32; ++i) {
        first32[i] = static_cast<std::uint8_t>('a' + i % 26);
    }
    EXPECT_EQ(board.sent().back().body, first32);
    EXPECT_EQ(name.length(), 40u);
}

TEST(Operations, EventOperationsWithATargetCarryItsAddressAndId) {
    FakeBoard board;
    Objects o;
    Fast<StdResource> other(kOther, o.queue);
    auto types = listOf({0x1260u});
    o.res.DetectEvt(0x1201, 0x1200, &other);
    o.res.DetectxEvts(types, 0, &other);
    o.res.CancelEvt(0x1200, &other);
    o.res.CancelxEvts(types, &other);
    o.res.CancelAllEvts(&other);
    o.tsc.DetectEvtSet(0x1230, types, 0, &other);
    auto s = board.sent();
    ASSERT_EQ(s.size(), 6u);
    EXPECT_EQ(s[0].body, concat({desc(kOther), u32(0x1201), u32(0x1200)}));
    EXPECT_EQ(s[1].body, concat({desc(kOther), u32(1), u32(0x1260), u32(0x1260)}));
    EXPECT_EQ(s[5].type, 0x16u);
    EXPECT_EQ(s[5].body, concat({desc(kOther), u32(0x1230), u32(0x1230), u32(1), u32(0x1260)}));
    for (const Sent& m : s) {
        EXPECT_EQ(m.trans, other.getId()) << std::hex << m.type;
        EXPECT_EQ(m.tgt, kTarget);
    }
}

// The one-way twins leave their completion to a null handler, which drops it without a word;
// a message of a type nobody registered still reaches the unregistered handler.
std::atomic<unsigned int> g_unregistered{0};
void countUnregistered(Addressable*, tolk::Msg* m) {
    ++g_unregistered;
    delete m;
}

template <class T, class F>
void expectQuietTwin(unsigned int type, unsigned int cmplt, F call) {
    FakeBoard board([&](const Sent& s) {
        return s.type == type ? std::vector<Answer>{{cmplt, {}}, {0x7777, {}}}
                              : std::vector<Answer>{};
    });
    auto queue = newQueue();
    tolk::TmpInstance found(kTarget, queue);
    Quick<T> obj(static_cast<const tolk::Instance&>(found));
    g_unregistered = 0;
    obj.asyncUnregisteredMsgType(&countUnregistered, 0);
    call(obj);
    for (int i = 0; i < 200 && g_unregistered.load() == 0; ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
    EXPECT_EQ(g_unregistered.load(), 1u) << std::hex << type;
}

TEST(Operations, TheOneWayTwinsDropTheirCompletionsQuietly) {
    expectQuietTwin<TSC>(0x121F, 0x1220, [](TSC& t) { t.StartSetChanState(2); });
    expectQuietTwin<LCON>(0x1610, 0x1611, [](LCON& l) { l.StartSetLineState(1); });
    expectQuietTwin<CAS>(0x1415, 0x1416, [](CAS& c) { c.StartDial(1, tolk::string("9")); });
}

TEST(Operations, RefusalAndSilenceRaiseWithTheTypes) {
    FakeBoard board([](const Sent& s) {
        if (s.type == 0x120A || s.type == 0x12) {
            return std::vector<Answer>{{0, concat({u32(s.type), u32(7)})}};
        }
        return std::vector<Answer>{};
    });
    auto queue = newQueue();
    tolk::TmpInstance found(kTarget, queue);
    Quick<TSC> tsc(static_cast<const tolk::Instance&>(found));
    Quick<StdResource> res(kTarget, queue);
    EXPECT_THROW(tsc.DropCall(1), Addressable::UnexpectedMsg);
    try {
        res.GetParm(0x1001, nullptr);
        FAIL() << "no exception";
    } catch (const Addressable::UnexpectedMsg& e) {
        EXPECT_EQ(e.cmdType, 0x12u);
        ASSERT_NE(e.msg, nullptr);
        EXPECT_NE(dynamic_cast<StdResource::MsgError_t*>(e.msg->getBodyDef()), nullptr);
    }
    try {
        res.ComTest(nullptr);
        FAIL() << "no exception";
    } catch (const Addressable::Timeout& e) {
        std::string t = textOf(e);
        EXPECT_NE(t.find(" CmdMsgType: 0x2 RetMsgType: 0x3"), std::string::npos) << t;
    }
}

TEST(Operations, TheAsynchronousCallControlWaitsOneMillisecondForARefusal) {
    FakeBoard board;
    auto queue = newQueue();
    tolk::TmpInstance found(kTarget, queue);
    tolk::TSCAsync tsc(static_cast<const tolk::Instance&>(found));
    EXPECT_EQ(tsc.getErrorWaitTime(), 1u);
    EXPECT_EQ(tsc.getResponseTimeout(), 5000u);
    tsc.HoldCall(4);
    EXPECT_EQ(board.sent()[0].type, 0x1211u);
}

TEST(Operations, AResourceWithoutManagerCannotClaimAndACopyHasAManagerOfItsOwn) {
    auto queue = newQueue();
    StdResource with(kTarget, queue);
    EXPECT_EQ(with.getResourceMgr()->getTgtDesc(), kResourceMgr);
    StdResource without(kTarget, queue, 0);
    EXPECT_THROW(without.use(0), StdResource::NoResourceMgr);
    StdResource copy(with);
    EXPECT_NE(copy.getResourceMgr(), with.getResourceMgr());
    EXPECT_EQ(copy.getInUse() + copy.getEventsDetected() + copy.getFreeOnDestroy(), 0);
}

// ---- which class reads which number ----

enum class Space { Msg, Evt };

struct LookupRow {
    const char* name;
    std::function<std::unique_ptr<Addressable>(isa::RefPtr<tolk::MsgQueue>&)> make;
    Space space;
    unsigned int number;
    const std::type_info* expected;  // null: the lookup must raise
};

template <class T>
std::function<std::unique_ptr<Addressable>(isa::RefPtr<tolk::MsgQueue>&)> maker() {
    return [](isa::RefPtr<tolk::MsgQueue>& q) -> std::unique_ptr<Addressable> {
        tolk::TmpInstance tmp(kTarget, q);
        if constexpr (std::is_same_v<tolk::Cluster, T>) {
            return std::make_unique<T>(kTarget, q);
        } else if constexpr (std::is_base_of_v<tolk::Instance, T>) {
            return std::make_unique<T>(static_cast<const tolk::Instance&>(tmp));
        } else if constexpr (std::is_base_of_v<tolk::StdResource, T>) {
            return std::make_unique<T>(static_cast<const tolk::StdResource&>(tmp));
        } else {
            return std::make_unique<T>(&tmp);
        }
    };
}

const LookupRow kLookups[] = {
    {"StdResourceKnowsGetParm", maker<Component>(), Space::Msg, 0x12,
     &typeid(StdResource::MsgGetParm_t)},
    {"StdResourceHasNoBodyFor0x1F", maker<Component>(), Space::Msg, 0x1F, nullptr},
    {"ComponentKnowsNoEvent", maker<Component>(), Space::Evt, 0x1230, nullptr},
    {"TSCKnowsItsOwn", maker<TSC>(), Space::Msg, 0x1214, &typeid(TSC::MsgMakeCall_t)},
    {"TSCReplaces0x16", maker<TSC>(), Space::Msg, 0x16, &typeid(TSC::MsgDetectEvtSet_t)},
    {"TSCPassesStandardOnes", maker<TSC>(), Space::Msg, 0x00, &typeid(StdResource::MsgError_t)},
    {"TSCKnowsNothingAt0x2B", maker<TSC>(), Space::Msg, 0x2B, nullptr},
    {"TSCEventCallState", maker<TSC>(), Space::Evt, 0x1230, &typeid(TSC::EvtCallState_t)},
    {"TSCEventOfLCONUnknown", maker<TSC>(), Space::Evt, 0x1611, nullptr},
    {"LCONOwnVParm", maker<LCON>(), Space::Msg, 0x2F, &typeid(LCON::Std_MsgSetVParm_t)},
    {"LCONPassesStandardOnes", maker<LCON>(), Space::Msg, 0x12, &typeid(StdResource::MsgGetParm_t)},
    {"LCONLineStateCompletion", maker<LCON>(), Space::Msg, 0x1611,
     &typeid(LCON::MsgSetLineStateCmplt_t)},
    {"LCONLineStateEvent", maker<LCON>(), Space::Evt, 0x1611, &typeid(LCON::Evt_0x1611_t)},
    {"CASDialCompletion", maker<CAS>(), Space::Msg, 0x1416, &typeid(CAS::MsgDialCmplt_t)},
    {"CASDetectedSignalIsAMessage", maker<CAS>(), Space::Msg, 0x140E,
     &typeid(CAS::EvtDetectedSignal_t)},
    {"CASEvent0x1405", maker<CAS>(), Space::Evt, 0x1405, &typeid(CAS::EventId_AllSignals_t)},
    {"CASNoTSCNumbers", maker<CAS>(), Space::Msg, 0x1214, nullptr},
    {"CHPKnowsNoMessageNotEvenStandard", maker<CHP>(), Space::Msg, 0x12, nullptr},
    {"CHPEvent5", maker<CHP>(), Space::Evt, 5, &typeid(CHP::EvtTrace_t)},
    {"CHPEvent7Unknown", maker<CHP>(), Space::Evt, 7, nullptr},
    {"ResourceMgrResult", maker<ResourceMgr>(), Space::Msg, 0x800007,
     &typeid(ResourceMgr::ComponentResult_t)},
    {"ResourceMgrNoStandard", maker<ResourceMgr>(), Space::Msg, 0x12, nullptr},
    {"ClusterMgrFind", maker<ClusterMgr>(), Space::Msg, 0x800053,
     &typeid(ClusterMgr::ClusterFind_t)},
    {"ClusterMgrNoClusterOps", maker<ClusterMgr>(), Space::Msg, 0x80001B, nullptr},
    // A cluster knows its own and the services' answers, but not their commands.
    {"ClusterOwn", maker<Cluster>(), Space::Msg, 0x800030, &typeid(Cluster::ClusterSlotAssign_t)},
    {"ClusterServiceResult", maker<Cluster>(), Space::Msg, 0x80002C,
     &typeid(ClusterMgr::ClusterResult_t)},
    {"ClusterComponentResult", maker<Cluster>(), Space::Msg, 0x800007,
     &typeid(ClusterMgr::ComponentResult_t)},
    {"ClusterNoEvent", maker<Cluster>(), Space::Evt, 0x1230, nullptr},
    {"ClusterNoClusterFind", maker<Cluster>(), Space::Msg, 0x800053, nullptr},
    {"ClusterNoClaim", maker<Cluster>(), Space::Msg, 0x800059, nullptr},
};

class BodyLookup : public ::testing::TestWithParam<LookupRow> {};

TEST_P(BodyLookup, GivesTheBodyOrRaisesUndefined) {
    const LookupRow& row = GetParam();
    auto queue = newQueue();
    std::unique_ptr<Addressable> object = row.make(queue);
    if (row.expected == nullptr) {
        if (row.space == Space::Msg) {
            EXPECT_THROW(delete object->MsgBodyLookup(row.number), Addressable::UndefinedMsgBody);
        } else {
            EXPECT_THROW(delete object->EvtBodyLookup(row.number), Addressable::UndefinedEvtBody);
        }
        return;
    }
    std::unique_ptr<tolk::MsgBody> body(row.space == Space::Msg
                                            ? object->MsgBodyLookup(row.number)
                                            : object->EvtBodyLookup(row.number));
    ASSERT_NE(body, nullptr);
    // typeid of a named reference: clang warns when the operand calls unique_ptr::operator*.
    const tolk::MsgBody& made = *body;
    EXPECT_EQ(typeid(made), *row.expected);
}

INSTANTIATE_TEST_SUITE_P(Chains, BodyLookup, ::testing::ValuesIn(kLookups),
                         [](const ::testing::TestParamInfo<LookupRow>& info) {
                             return info.param.name;
                         });

}  // namespace
