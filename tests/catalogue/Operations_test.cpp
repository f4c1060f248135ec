// The catalogue's proxies against a fake board behind the local switch. One golden table for the
// operation families of every component class: each call, the block it must put on the wire and
// the completion it must wait for (or none for a one-way command). Then the board's services as
// the proxies drive them, the claim and release of an instance proxy over its life, and which
// class knows which number: each looks up its own and passes the rest along its chain.

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <cstdint>
#include <cstring>
#include <functional>
#include <map>
#include <memory>
#include <set>
#include <thread>
#include <typeinfo>

#include "FakeBoard.h"
#include "Golden.h"
#include "catalogue/cas/CAS.h"
#include "catalogue/chp/CHP.h"
#include "catalogue/cluster/Cluster.h"
#include "catalogue/cluster/ClusterMgr.h"
#include "catalogue/cluster/Component.h"
#include "catalogue/lcon/LCON.h"
#include "catalogue/resourcemgr/ResourceMgr.h"
#include "catalogue/stdresource/Instance.h"
#include "catalogue/stdresource/StdResource.h"
#include "catalogue/tsc/TSC.h"
#include "catalogue/tsc/TSCAsync.h"
#include "framework/MsgQueue.h"
#include "framework/String.h"
#include "transport/IsaSync.h"

namespace {

using golden::Bytes;
using golden::concat;
using golden::text;
using golden::u16;
using golden::u32;
using golden::words;
using tolk::Addressable;
using tolk::CAS;
using tolk::CHP;
using tolk::Cluster;
using tolk::ClusterMgr;
using tolk::CompAttr_t;
using tolk::Component;
using tolk::Instance;
using tolk::LCON;
using tolk::ResourceMgr;
using tolk::staticList;
using tolk::StdResource;
using tolk::TmpInstance;
using tolk::TSC;

// A channel component on board 2, node 0; its services stand at fixed instances there.
const tolk::CompDesc_t kTarget(3, 2, 1, 18, 0);
const tolk::CompDesc_t kResourceMgr(5, 2, 1, 0, 0);
const tolk::CompDesc_t kClusterMgr(8, 2, 1, 0, 0);
const tolk::CompDesc_t kCluster(0x30, 2, 1, 0, 0);
const tolk::CompDesc_t kOther(0x42, 2, 1, 19, 0);
const tolk::CompDesc_t kInst(0x44, 2, 1, 22, 0);
// Each component class registers handlers, so each stands at an address of its own.
const tolk::CompDesc_t kLine(1, 2, 1, 22, 0);
const tolk::CompDesc_t kSignals(3, 2, 1, 20, 0);

Bytes desc(const tolk::CompDesc_t& d) {
    return {static_cast<std::uint8_t>(d.instance >> 8),
            static_cast<std::uint8_t>(d.instance),
            d.board,
            d.processor,
            d.component,
            d.node};
}

// What the services and components of a board answer: the shared completions of the
// services, nothing to a one-way command, else the command's number + 1.
std::vector<Answer> boardAnswer(const Sent& s, Bytes body = {}) {
    static const std::map<unsigned int, unsigned int> kShared = {
        {0x800059, 0x800000}, {0x80005A, 0x800000}, {0x80001B, 0x800000}, {0x800023, 0x800000},
        {0x800030, 0x800000}, {0x800036, 0x800000}, {0x800054, 0x800000}, {0x800055, 0x800000},
        {0x800056, 0x800000}, {0x80003D, 0x800007}, {0x80003E, 0x800007}, {0x80001E, 0x800007},
        {0x800053, 0x80002C}, {0x80001D, 0x80002C}, {0x800020, 0x80002C}, {0x800032, 0x800033},
        {0x80003A, 0x800006}, {0x800027, 0x800028}};
    static const std::set<unsigned int> kOneWay = {
        0x00,   0x01,   0x06,     0x1200,   0x1201,   0x1202,   0x1203,  0x1204, 0x1207,
        0x120A, 0x1211, 0x121A,   0x121B,   0x121C,   0x121D,   0x121E,  0x122D, 0x1612,
        0x1613, 0x140D, 0x800041, 0x80001F, 0x800025, 0x800024, 0x800052};
    if (kOneWay.count(s.type) != 0) {
        return {};
    }
    auto shared = kShared.find(s.type);
    return {{shared != kShared.end() ? shared->second : s.type + 1, std::move(body)}};
}

// The board that answers as the services and components do.
FakeBoard::Rule answers() {
    return [](const Sent& s) { return boardAnswer(s); };
}

// A component class with its waits cut short, so that silence costs little; a one-way command
// of the golden table costs its error wait, so the table cuts it shorter still.
template <class T, unsigned int ErrorWait = 100>
class Quick : public T {
  public:
    template <class... A>
    explicit Quick(A&&... a) : T(std::forward<A>(a)...) {
        this->ResponseTimeout = 300;
        this->ErrorWaitTime = ErrorWait;
    }
    // As the most derived class, it ends the delivery of stray messages before its own part
    // goes, as every class of the resource family does.
    ~Quick() override {
        if constexpr (std::is_base_of_v<tolk::StdResource, T>) {
            this->endDispatch();
        }
    }
};

isa::RefPtr<tolk::MsgQueue> newQueue() {
    return isa::RefPtr<tolk::MsgQueue>(
        new tolk::MsgQueue(tolk::CompDesc_t(1, 1, 1, 1, 1), 1024, 5));
}

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
    TmpInstance found{kTarget, queue};
    TmpInstance line{kLine, queue};
    TmpInstance signals{kSignals, queue};
    Quick<StdResource, 20> res{kTarget, queue};
    Quick<TSC, 20> tsc{static_cast<const Instance&>(found)};
    Quick<LCON, 20> lcon{static_cast<const Instance&>(line)};
    Quick<CAS, 20> cas{static_cast<const Instance&>(signals)};
    Quick<Cluster, 20> cluster{kCluster, queue};
    Quick<StdResource, 20> otherRes{kOther, queue};
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
// Other: the id of the resource whose events an operation with a target names.
enum class Id { Fresh, Own, Host, Other };

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
     0x21, words({0x1230, 2}), 0x22, false, Id::Own},
    {"ArmRTC body", [](Objects& o) { StdResource::MsgArmRTC_t b; o.res.ArmRTC(&b); },
     0x21, Bytes(8, 0), 0x22, false, Id::Own},
    {"ArmxRTCs", [](Objects& o) {
         auto l = one<StdResource::MsgArmxRTCs_t::EventGroupList_t>([](auto& e) { e.EvtGroup = 0x1230; e.Action = 1; });
         o.res.ArmxRTCs(l); },
     0x23, words({1, 0x1230, 1}), 0x24, false, Id::Own},
    {"DisarmxRTCs", [](Objects& o) { auto l = listOf({0x1230u, 0x1231u}); o.res.DisarmxRTCs(l); },
     0x27, words({2, 0x1230, 0x1231}), 0x28, false, Id::Own},
    {"DisarmAllRTCs", [](Objects& o) { o.res.DisarmAllRTCs(); }, 0x29, {}, 0x2A, false, Id::Own},
    {"DetectEvt", [](Objects& o) { o.res.DetectEvt(0x1230, 0, nullptr); },
     0x16, words({0x1230, 0x1230}), 0x17, false, Id::Host},
    {"DetectxEvts pairs", [](Objects& o) {
         auto l = one<StdResource::MsgDetectxEvts_t::List_t>([](auto& e) { e.EvtType = 0x1201; e.EvtGroup = 0x1200; });
         o.res.DetectxEvts(l, nullptr); },
     0x18, words({1, 0x1201, 0x1200}), 0x19, false, Id::Host},
    {"DetectxEvts types", [](Objects& o) { auto t = listOf({0x1230u, 0x1231u}); o.res.DetectxEvts(t, 0, nullptr); },
     0x18, words({2, 0x1230, 0x1230, 0x1231, 0x1231}), 0x19, false, Id::Host},
    {"DetectxEvts types in a group", [](Objects& o) { auto t = listOf({0x1230u, 0x1231u}); o.res.DetectxEvts(t, 0x1230, nullptr); },
     0x18, words({2, 0x1230, 0x1230, 0x1231, 0x1230}), 0x19, false, Id::Host},
    {"CancelEvt", [](Objects& o) { o.res.CancelEvt(0x1200, nullptr); },
     0x1A, u32(0x1200), 0x1B, false, Id::Own},
    // With a target: its address is where events go, and its id the transaction.
    {"DetectEvt for a target", [](Objects& o) { o.res.DetectEvt(0x1201, 0x1200, &o.otherRes); },
     0x16, concat({desc(kOther), words({0x1201, 0x1200})}), 0x17, false, Id::Other},
    {"DetectxEvts for a target", [](Objects& o) { auto t = listOf({0x1260u}); o.res.DetectxEvts(t, 0, &o.otherRes); },
     0x18, concat({desc(kOther), words({1, 0x1260, 0x1260})}), 0x19, false, Id::Other},
    {"CancelEvt for a target", [](Objects& o) { o.res.CancelEvt(0x1200, &o.otherRes); },
     0x1A, u32(0x1200), 0x1B, false, Id::Other},
    {"CancelxEvts for a target", [](Objects& o) { auto t = listOf({0x1260u}); o.res.CancelxEvts(t, &o.otherRes); },
     0x1C, words({1, 0x1260}), 0x1D, false, Id::Other},
    {"CancelAllEvts for a target", [](Objects& o) { o.res.CancelAllEvts(&o.otherRes); }, 0x1E, {}, 0x1F, false, Id::Other},
    {"DetectEvtSet for a target", [](Objects& o) { auto t = listOf({0x1260u}); o.tsc.DetectEvtSet(0x1230, t, 0, &o.otherRes); },
     0x16, concat({desc(kOther), words({0x1230, 0x1230, 1, 0x1260})}), 0x17, false, Id::Other},
    {"Error", [](Objects& o) { o.res.Error(0x01, 9); }, 0x00, words({1, 9}), 0, false},
    {"ComTest", [](Objects& o) { o.res.ComTest(o.ret<StdResource::MsgComtestCmplt_t>()); }, 0x02, {}, 0x03, true},
    {"Ack", [](Objects& o) { o.res.Ack(); }, 0x01, {}, 0, false},
    {"SetParm", [](Objects& o) { o.res.SetParm(7, 9, o.ret<StdResource::MsgSetParmCmplt_t>()); },
     0x08, words({7, 9}), 0x09, true},
    {"SetxParms", [](Objects& o) {
         auto l = one<StdResource::MsgSetxParms_t::Parms_t>([](auto& e) { e.Parm = 7; e.Val = 1; });
         o.res.SetxParms(l, o.ret<StdResource::MsgSetxParmsCmplt_t>()); },
     0x0A, words({1, 7, 1}), 0x0B, true},
    {"GetxParms empty", [](Objects& o) {
         staticList<StdResource::MsgGetxParms_t::Parms_t> none;
         o.res.GetxParms(none, o.ret<StdResource::MsgGetxParmsCmplt_t>()); },
     0x14, u32(0), 0x15, true},
    {"SetVParm", [](Objects& o) {
         auto l = one<StdResource::MsgSetVParm_t::Parms_t>([](auto& e) { e.Parm = 0x31; e.Val = 9; });
         o.res.SetVParm(l, o.ret<StdResource::MsgSetVParmCmplt_t>()); },
     0x2F, concat({u16(1), words({0x31, 9})}), 0x30, true},

    // Call control.
    {"AcceptCall", [](Objects& o) { o.tsc.AcceptCall(); }, 0x1200, u32(0), 0, false},
    {"AnswerCall", [](Objects& o) { o.tsc.AnswerCall(7); }, 0x1201, words({7, 0}), 0, false},
    {"BlindTransferCall", [](Objects& o) { o.tsc.BlindTransferCall(); }, 0x1202, Bytes(4 + 128 + 128 + 1, 0), 0, false},
    {"CancelTransfer", [](Objects& o) { o.tsc.CancelTransfer(3); }, 0x1203, u32(3), 0, false},
    {"CompleteCall", [](Objects& o) { o.tsc.CompleteCall(3, o.ret<TSC::MsgCompleteCallCmplt_t>()); },
     0x1205, words({0, 3}), 0x1206, true},
    {"CompleteTransfer", [](Objects& o) { o.tsc.CompleteTransfer(9, 4); }, 0x1207, words({4, 9}), 0, false},
    {"DropCall", [](Objects& o) { o.tsc.DropCall(5); }, 0x120A, words({5, 0xE}), 0, false},
    {"DropCall body", [](Objects& o) { TSC::MsgDropCall_t b; o.tsc.DropCall(&b); }, 0x120A, Bytes(8, 0), 0, false},
    {"GetCallState", [](Objects& o) { o.tsc.GetCallState(o.ret<TSC::MsgGetCallStateCmplt_t>()); },
     0x120D, u32(0), 0x120E, true},
    {"InitTransfer", [](Objects& o) { o.tsc.InitTransfer(6, tolk::string("12"), o.ret<TSC::MsgInitTransferCmplt_t>()); },
     0x1212, concat({u32(6), text("12", 128), Bytes(129, 0)}), 0x1213, true},
    {"MakeCall", [](Objects& o) { o.tsc.MakeCall(o.ret<TSC::MsgMakeCallCmplt_t>()); }, 0x1214, Bytes(257, 0), 0x1215, true},
    {"MakeCall body", [](Objects& o) { TSC::MsgMakeCall_t b; o.tsc.MakeCall(&b, o.ret<TSC::MsgMakeCallCmplt_t>()); },
     0x1214, Bytes(257, 0), 0x1215, true},
    {"SetChanState", [](Objects& o) { o.tsc.SetChanState(2, o.ret<TSC::MsgSetChanStateCmplt_t>()); },
     0x121F, u32(2), 0x1220, true},
    {"StartSetChanState", [](Objects& o) { o.tsc.StartSetChanState(2); }, 0x121F, u32(2), 0, false},
    {"GetCallInfo", [](Objects& o) { auto ids = listOf({0x1202u}); o.tsc.GetCallInfo(ids, o.ret<TSC::MsgGetCallInfoCmplt_t>()); },
     0x120B, words({0, 1, 0x1202}), 0x120C, true},
    {"SendISDN", [](Objects& o) {
         auto data = listOf<unsigned char>({0xA1, 0x70});
         o.tsc.SendISDN(0x45, data, 6, o.ret<TSC::MsgSendISDNCmplt_t>()); },
     0x1222, concat({words({6, 0x45, 2}), {0xA1, 0x70}}), 0x1223, true},
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
     0x1248, concat({words({1, 2, 3}), text("a", 128), Bytes(128, 0)}), 0x1249, false},

    // Line control.
    {"GetAlarms", [](Objects& o) { auto l = listOf({0x10u, 0x11u}); o.lcon.GetAlarms(l, o.ret<LCON::MsgGetAlarmsCmplt_t>()); },
     0x1602, words({2, 0x10, 0x11}), 0x1603, true, Id::Fresh, kLine},
    {"SetDiagMode", [](Objects& o) { o.lcon.SetDiagMode(2, o.ret<LCON::MsgSetDiagModeCmplt_t>()); }, 0x160E, {2}, 0x160F, true, Id::Fresh, kLine},
    {"SetLineState", [](Objects& o) { o.lcon.SetLineState(1, o.ret<LCON::MsgSetLineStateCmplt_t>()); },
     0x1610, words({1, 0, 0}), 0x1611, true, Id::Fresh, kLine},
    {"StartSetLineState", [](Objects& o) { o.lcon.StartSetLineState(1, 2); },
     0x1610, words({1, 2, 0}), 0, false, Id::Fresh, kLine},
    {"GetMetrics", [](Objects& o) { o.lcon.GetMetrics(0x20, o.ret<LCON::MsgGetMetricsCmplt_t>()); },
     0x160A, concat({u32(0x20), {1}}), 0x160B, true, Id::Fresh, kLine},
    {"SetVParm of the line", [](Objects& o) {
         auto l = one<LCON::Std_MsgSetVParm_t::Parms_t>([](auto& e) { e.Parm = 0x31; e.FieldDef = 0x380000; e.Val = 9; });
         o.lcon.SetVParm(l, o.ret<LCON::Std_MsgSetVParmCmplt_t>()); },
     0x2F, concat({u16(1), words({0x31, 0x380000, 9})}), 0x30, true, Id::Fresh, kLine},
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
     0x800054, concat({{1}, words({7, 9})}), 0x800000, true, Id::Fresh, kCluster},
    {"Lock", [](Objects& o) { o.cluster.Lock(o.ret<tolk::Cluster::ResultComplete_t>()); },
     0x800056, {}, 0x800000, true, Id::Fresh, kCluster},
    {"ClusterFindInst", [](Objects& o) {
         unsigned char type = 18;
         o.cluster.getClusterMgr()->ClusterFindInst(o.other, type, o.attrs, o.ret<tolk::ClusterMgr::ComponentResult_t>()); },
     0x80001E, concat({desc(kOther), {18, 1}, words({7, 9})}), 0x800007, true, Id::Fresh, kClusterMgr},
    {"ClusterDestroy", [](Objects& o) { o.cluster.getClusterMgr()->ClusterDestroy(o.other); },
     0x800024, desc(kOther), 0, false, Id::Fresh, kClusterMgr},
    {"FindAllComponents", [](Objects& o) {
         o.cluster.getResourceMgr()->FindAllComponents(o.other, o.other, o.attrs, o.ret<tolk::ResourceMgr::CompMultipleResult_t>()); },
     0x800062, concat({desc(kOther), desc(kOther), words({1, 7, 9})}), 0x800063, true, Id::Fresh, kResourceMgr},
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
            EXPECT_EQ(sent[0].trans, r.id == Id::Other ? o.otherRes.getId() : o.res.getId());
        }
    }
    // A completion that nobody waited for would surface as an unregistered message.
    answer = 0;
    o.res.Ack();
    std::string err = testing::internal::GetCapturedStderr();
    EXPECT_EQ(err.find("Unregistered"), std::string::npos) << err;
}

// n characters counting from `first`, round after `mod` of them.
Bytes cycle(char first, unsigned int mod, unsigned int n) {
    Bytes b(n);
    for (unsigned int i = 0; i < n; ++i) {
        b[i] = static_cast<std::uint8_t>(first + i % mod);
    }
    return b;
}

staticList<char> charsOf(const Bytes& b) {
    staticList<char> l;
    l.realloc(static_cast<unsigned int>(b.size()));
    std::memcpy(l.data(), b.data(), b.size());
    return l;
}

TEST(Operations, TextsAreSentAtTheirFieldsLengthAndStayTheCallers) {
    FakeBoard board([](const Sent& s) { return boardAnswer(s, u32(0x77)); });
    Objects o;
    Bytes digits = cycle('0', 10, 130);
    staticList<char> dest = charsOf(digits);
    tolk::string orig("12");
    TSC::MsgMakeCallCmplt_t made;
    o.tsc.MakeCall(dest, orig, 1, &made);
    EXPECT_EQ(*made.pCallId, 0x77u);
    digits.resize(128);
    EXPECT_EQ(board.sent().back().body, concat({digits, text("12", 128), {1}}));
    EXPECT_EQ(dest.length(), 130u);
    EXPECT_EQ(orig.length(), 3u);

    Bytes letters = cycle('a', 26, 40);
    staticList<char> name = charsOf(letters);
    o.lcon.SetProtocol(name, nullptr);
    letters.resize(32);
    EXPECT_EQ(board.sent().back().body, letters);
    EXPECT_EQ(name.length(), 40u);
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
    TmpInstance found(kTarget, queue);
    Quick<T> obj(static_cast<const Instance&>(found));
    g_unregistered = 0;
    obj.asyncUnregisteredMsgType(&countUnregistered, 0);
    testing::internal::CaptureStderr();
    call(obj);
    for (int i = 0; i < 200 && g_unregistered.load() == 0; ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "") << std::hex << type;
    EXPECT_EQ(g_unregistered.load(), 1u) << std::hex << type;
}

TEST(Operations, TheOneWayTwinsDropTheirCompletionsQuietly) {
    expectQuietTwin<TSC>(0x121F, 0x1220, [](TSC& t) { t.StartSetChanState(2); });
    expectQuietTwin<LCON>(0x1610, 0x1611, [](LCON& l) { l.StartSetLineState(1); });
    expectQuietTwin<CAS>(0x1415, 0x1416, [](CAS& c) { c.StartDial(1, tolk::string("9")); });
}

TEST(Operations, TheAsynchronousCallControlWaitsOneMillisecondForARefusal) {
    FakeBoard board(answers());
    auto queue = newQueue();
    TmpInstance found(kTarget, queue);
    tolk::TSCAsync tsc(static_cast<const Instance&>(found));
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

// The first bytes of a search: any instance of board 2, processor 1.
const Bytes kAnyOnBoard = {0xFF, 0xFF, 2, 1, 0xFF, 0};
const Bytes kNoCluster = {0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF};

// The searches are answered from another address than the one they went to.
std::vector<Answer> answerFromElsewhere(const Sent& s) {
    auto a = boardAnswer(s, s.type == 0x800053 ? desc(kCluster) : desc(kInst));
    for (Answer& x : a) {
        x.fromElsewhere = s.type == 0x800053 || s.type == 0x80001E || s.type == 0x800027;
    }
    return a;
}

std::vector<Answer> refuseEverything(const Sent& s) {
    return {{0, words({s.type & 0xFF, 1})}};
}

struct Env {
    FakeBoard& board;
    isa::RefPtr<tolk::MsgQueue> queue = newQueue();
    Quick<Addressable> owner{kTarget, queue};
    tolk::staticList<CompAttr_t> attrs = listOf({CompAttr_t(7, 9)});
};

struct Block {
    unsigned int type;
    tolk::CompDesc_t tgt;
    Bytes body;
};

struct Case {
    const char* name;
    FakeBoard::Rule rule;
    std::function<void(Env&)> run;
    std::vector<Block> sent;
};

const Bytes kUse = concat({{1}, desc(kTarget), u32(0)});
const Bytes kUnuse = concat({{1}, desc(kTarget)});

const Case kCases[] = {
    // The managers' searches.
    {"FindByTSCSendsTypeTrunkAndChannelAndAcceptsAnySource",
     answerFromElsewhere,
     [](Env& e) { EXPECT_EQ(ClusterMgr(&e.owner).findByTSC(1, 2).getTgtDesc(), kCluster); },
     {{0x800053, kClusterMgr,
       concat({{0xFF, 0xFF, 2, 1, 0xFF, 0, 3}, words({0, 18, 0x1200, 1, 0x1201, 2})})}}},
    {"FindByLCONSendsTypeAndLine",
     answerFromElsewhere,
     [](Env& e) { ClusterMgr(&e.owner).findByLCON(4); },
     {{0x800053, kClusterMgr,
       concat({{0xFF, 0xFF, 2, 1, 0xFF, 0, 2}, words({0, 22, 0x1600, 4})})}}},
    {"FindInClusterWithTypeZeroSendsNoAttribute",
     answerFromElsewhere,
     [](Env& e) {
         Cluster c(kCluster, e.queue);
         c.find(0);
         TmpInstance lcon = c.find(22);
         EXPECT_EQ(lcon.getTgtDesc(), kInst);
         EXPECT_EQ(lcon.getMsgQueue().Get(), e.queue.Get());
     },
     {{0x80001E, kClusterMgr, concat({desc(kCluster), {0, 0}})},
      {0x80001E, kClusterMgr, concat({desc(kCluster), {22, 1}, words({0, 22})})}}},
    {"FindAutoAllocateAllocatesInThisClusterWhenTheSearchIsRefused",
     [](const Sent& s) {
         return s.type == 0x80001E ? std::vector<Answer>{{0, words({0x1E, 4})}}
                                   : boardAnswer(s, desc(kInst));
     },
     [](Env& e) { EXPECT_EQ(Cluster(kCluster, e.queue).findAutoAllocate(22).getTgtDesc(), kInst); },
     {{0x80001E, kClusterMgr, concat({desc(kCluster), {22, 1}, words({0, 22})})},
      {0x80003E, kResourceMgr, concat({kAnyOnBoard, desc(kCluster), words({1, 0, 22})})}}},
    {"ResourceFindWithTypeZeroAddsNoAttribute",
     nullptr,
     [](Env& e) {
         StdResource found = ResourceMgr(&e.owner).find(0, 1, 0xFFFF, e.attrs);
         EXPECT_EQ(found.getMsgQueue().Get(), e.queue.Get());
     },
     {{0x80003D, kResourceMgr, concat({kAnyOnBoard, words({1, 7, 9})})}}},
    {"ResourceFindAppendsTheTypeBehindTheCallersAttributesOnACopy",
     nullptr,
     [](Env& e) {
         ResourceMgr(&e.owner).find(18, 1, 0xFFFF, e.attrs);
         EXPECT_EQ(e.attrs.length(), 1u);
     },
     {{0x80003D, kResourceMgr, concat({kAnyOnBoard, words({2, 7, 9, 0, 18})})}}},
    {"AllocateWithoutClusterSendsAllOnesAndWithOneItsAddress",
     nullptr,
     [](Env& e) {
         ResourceMgr mgr(&e.owner);
         mgr.allocate(0, 1, 0xFFFF, nullptr, tolk::staticList<CompAttr_t>());
         Cluster cluster(kCluster, e.queue);
         mgr.allocate(0, 1, 0xFFFF, &cluster, tolk::staticList<CompAttr_t>());
     },
     {{0x80003E, kResourceMgr, concat({kAnyOnBoard, kNoCluster, u32(0)})},
      {0x80003E, kResourceMgr, concat({kAnyOnBoard, desc(kCluster), u32(0)})}}},
    {"UseAndUnuseSendOneElementAndFreeIsOneWay",
     nullptr,
     [](Env& e) {
         ResourceMgr mgr(&e.owner);
         StdResource res(kTarget, e.queue);
         mgr.use(&res, 0);
         mgr.unuse(&res);
         mgr.free(&res);
     },
     {{0x800059, kResourceMgr, kUse},
      {0x80005A, kResourceMgr, kUnuse},
      {0x800041, kResourceMgr, desc(kTarget)}}},

    // A cluster's ports and slots.
    {"PortAndSlotOperationsSendTheClusterAndTheirFields",
     nullptr,
     [](Env& e) {
         Cluster c(kCluster, e.queue);
         c.Activate(0x4201, nullptr, 3);
         Quick<Addressable> talker(kInst, e.queue);
         c.Activate(0x4201, &talker, 0);
         tolk::staticList<unsigned short> slots;
         c.TSAssign(0x4201, slots, 1, 0x7F);
         slots.realloc(2);
         *slots.element(0) = 5;
         *slots.element(1) = 0x105;
         c.TSAssign(0x4201, slots, 1, 0x7F);
     },
     {{0x80001B, kCluster, concat({desc(kCluster), u32(0x4201), {3}, kNoCluster})},
      {0x80001B, kCluster, concat({desc(kCluster), u32(0x4201), {0}, desc(kInst)})},
      {0x800030, kCluster, concat({desc(kCluster), u32(0x4201), {0, 1, 0x7F}})},
      {0x800030, kCluster, concat({desc(kCluster), u32(0x4201), {2, 1, 0x7F, 0, 5, 1, 5}})}}},
    {"ConnectIsOneWayAndStandsInForANullInstanceWithTheCluster",
     nullptr,
     [](Env& e) {
         Quick<Cluster> c(kCluster, e.queue);
         Quick<Addressable> b(kInst, e.queue);
         c.Connect(1, 2, nullptr, &b);
         c.Disconnect(1, 2, &b, nullptr);
     },
     {{0x80001F, kCluster, concat({desc(kCluster), u32(1), desc(kInst), u32(2)})},
      {0x800025, kCluster, concat({desc(kInst), u32(1), desc(kCluster), u32(2)})}}},

    // An instance proxy claims its resource, and on destruction cancels its events and
    // releases it (its lifecycle below), even when the cancellation goes unanswered.
    {"InstanceDestructionGoesOnWhenTheCancellationTimesOut",
     [](const Sent& s) { return s.type == 0x1E ? std::vector<Answer>{} : boardAnswer(s); },
     [](Env& e) { Quick<Instance> inst(kTarget, e.queue); },
     {{0x800059, kResourceMgr, kUse}, {0x1E, kTarget, {}}, {0x80005A, kResourceMgr, kUnuse}}},
    {"AnInstanceOfAStandardResourceClaimsIt",
     nullptr,
     [](Env& e) {
         StdResource plain(kTarget, e.queue);
         Instance inst(plain);
     },
     {{0x800059, kResourceMgr, kUse}, {0x1E, kTarget, {}}, {0x80005A, kResourceMgr, kUnuse}}},
    {"ARefusedClaimMakesNoObjectAndReleasesNothing",
     refuseEverything,
     [](Env& e) { EXPECT_THROW(Instance(kTarget, e.queue), Addressable::UnexpectedMsg); },
     {{0x800059, kResourceMgr, kUse}}},
    // Proxies made from another proxy, and temporary ones, never claim and never release.
    {"CopiesAndTemporaryProxiesSendNothing",
     nullptr,
     [](Env& e) {
         TmpInstance tmp(kTarget, e.queue);
         EXPECT_EQ(tmp.getResourceMgr(), nullptr);
         TmpInstance tmpCopy(tmp);
         Instance fromTmp(tmp, 0);
         Instance copy(static_cast<const Instance&>(tmp));
         TSC tsc(tmp);
         EXPECT_NE(fromTmp.getResourceMgr(), nullptr);
         EXPECT_EQ(copy.getInUse(), 0);
         EXPECT_EQ(tsc.getEventsDetected(), 0);
     },
     {}},
    {"AllocatedTemporaryIsMarkedForFreeingYetFreesNothing",
     [](const Sent& s) { return boardAnswer(s, desc(kInst)); },
     [](Env& e) {
         TmpInstance t = ResourceMgr(&e.owner).allocate(22, 1, 0xFFFF, nullptr);
         EXPECT_EQ(t.getTgtDesc(), kInst);
         EXPECT_EQ(t.getFreeOnDestroy(), 1);
     },
     {{0x80003E, kResourceMgr, concat({kAnyOnBoard, kNoCluster, words({1, 0, 22})})}}},
};

// The board's services as the catalogue's proxies drive them: the searches and claims of the
// resource and cluster managers, the port operations of a cluster, and the claim and release
// that an instance proxy makes over its life. Each case names the blocks it must send.
TEST(Services, SendTheirBlocks) {
    for (const Case& c : kCases) {
        SCOPED_TRACE(c.name);
        FakeBoard board(c.rule ? c.rule : FakeBoard::Rule([](const Sent& s) {
            return boardAnswer(s, desc(kOther));
        }));
        {
            Env env{board};
            c.run(env);
        }
        auto s = board.sent();
        ASSERT_EQ(s.size(), c.sent.size());
        for (std::size_t i = 0; i < s.size(); ++i) {
            SCOPED_TRACE(i);
            EXPECT_EQ(s[i].type, c.sent[i].type) << std::hex << s[i].type;
            EXPECT_EQ(s[i].tgt, c.sent[i].tgt);
            EXPECT_EQ(s[i].body, c.sent[i].body);
        }
    }
}

// A cancellation and a release travel under the instance's own transaction, and a queue change
// moves the claim from the old queue's address to the new one's.
TEST(InstanceLifecycle, ReleasesUnderItsIdAndMovesItsClaimWithTheQueue) {
    FakeBoard board(answers());
    auto first = newQueue();
    auto second = newQueue();
    unsigned int id = 0;
    {
        Instance inst(kTarget, first);
        EXPECT_EQ(inst.getInUse(), 1);
        EXPECT_EQ(inst.getEventsDetected(), 1);
        id = inst.getId();
        inst.msgQueueAttach(second);
        EXPECT_EQ(inst.getResourceMgr()->getMsgQueue().Get(), second.Get());
    }
    auto s = board.sent();
    ASSERT_EQ(s.size(), 5u);
    EXPECT_EQ(s[0].type, 0x800059u);
    EXPECT_EQ(s[1].type, 0x80005Au);
    EXPECT_EQ(s[1].src, first->getHostDesc());
    EXPECT_EQ(s[2].type, 0x800059u);
    EXPECT_EQ(s[2].src, second->getHostDesc());
    EXPECT_EQ(s[3].type, 0x1Eu);
    EXPECT_EQ(s[3].trans, id);
    EXPECT_EQ(s[4].type, 0x80005Au);
}

TEST(ClusterAnswers, AreReadIntoTheCallersArgumentsAndPortOperationsWantTheirTarget) {
    auto queue = newQueue();
    {
        FakeBoard info([](const Sent& s) {
            if (s.type == 0x800032) {
                return std::vector<Answer>{
                    {0x800033, concat({Bytes(s.body.begin(), s.body.begin() + 10),
                                       {2, 1, 0x7F, 0, 9, 0, 10}})}};
            }
            return std::vector<Answer>{
                {0x800028, concat({desc(kCluster), {2}, desc(kInst), desc(kTarget)}), true}};
        });
        Cluster c(kCluster, queue);
        unsigned char width = 0, encoding = 0, idle = 0;
        tolk::staticList<unsigned short> slots;
        c.TSInfo(0x4201, &width, &encoding, &idle, &slots);
        EXPECT_EQ(width, 2);
        EXPECT_EQ(encoding, 1);
        EXPECT_EQ(idle, 0x7F);
        ASSERT_EQ(slots.length(), 2u);
        EXPECT_EQ(*slots.element(1), 10);
        // The component list is taken from any source.
        tolk::staticList<tolk::CompDesc_t> out;
        c.ClusterCompInfo(&out, kCluster);
        ASSERT_EQ(out.length(), 2u);
        EXPECT_EQ(*out.element(1), kTarget);
    }
    FakeBoard elsewhere([](const Sent& s) {
        auto a = boardAnswer(s);
        for (Answer& x : a) {
            x.fromElsewhere = true;
        }
        return a;
    });
    Quick<Cluster> c(kCluster, queue);
    EXPECT_THROW(c.Deactivate(1), Addressable::Timeout);
}

// ---- which class reads which number ----

template <class T>
std::unique_ptr<Addressable> make(isa::RefPtr<tolk::MsgQueue>& q) {
    TmpInstance tmp(kTarget, q);
    if constexpr (std::is_same_v<Cluster, T>) {
        return std::make_unique<T>(kTarget, q);
    } else if constexpr (std::is_base_of_v<Instance, T>) {
        return std::make_unique<T>(static_cast<const Instance&>(tmp));
    } else if constexpr (std::is_base_of_v<StdResource, T>) {
        return std::make_unique<T>(static_cast<const StdResource&>(tmp));
    } else {
        return std::make_unique<T>(&tmp);
    }
}

constexpr bool kMsg = true, kEvt = false;

// The body each class makes for a message type or an event group; null: the lookup must raise.
const struct {
    std::unique_ptr<Addressable> (*make)(isa::RefPtr<tolk::MsgQueue>&);
    bool msg;
    unsigned int number;
    const std::type_info* expected;
} kLookups[] = {
    {make<Component>, kMsg, 0x12, &typeid(StdResource::MsgGetParm_t)},
    {make<Component>, kMsg, 0x1F, nullptr},
    {make<Component>, kEvt, 0x1230, nullptr},
    {make<TSC>, kMsg, 0x1214, &typeid(TSC::MsgMakeCall_t)},
    {make<TSC>, kMsg, 0x16, &typeid(TSC::MsgDetectEvtSet_t)},  // replaces the standard one
    {make<TSC>, kMsg, 0x00, &typeid(StdResource::MsgError_t)},
    {make<TSC>, kMsg, 0x2B, nullptr},
    {make<TSC>, kEvt, 0x1230, &typeid(TSC::EvtCallState_t)},
    {make<TSC>, kEvt, 0x1611, nullptr},
    {make<LCON>, kMsg, 0x2F, &typeid(LCON::Std_MsgSetVParm_t)},
    {make<LCON>, kMsg, 0x12, &typeid(StdResource::MsgGetParm_t)},
    {make<LCON>, kMsg, 0x1611, &typeid(LCON::MsgSetLineStateCmplt_t)},
    {make<LCON>, kEvt, 0x1611, &typeid(LCON::Evt_0x1611_t)},
    {make<CAS>, kMsg, 0x1416, &typeid(CAS::MsgDialCmplt_t)},
    {make<CAS>, kMsg, 0x140E, &typeid(CAS::EvtDetectedSignal_t)},  // an event sent as a message
    {make<CAS>, kEvt, 0x1405, &typeid(CAS::EventId_AllSignals_t)},
    {make<CAS>, kMsg, 0x1214, nullptr},
    {make<CHP>, kMsg, 0x12, nullptr},  // not even the standard ones
    {make<CHP>, kEvt, 5, &typeid(CHP::EvtTrace_t)},
    {make<CHP>, kEvt, 7, nullptr},
    {make<ResourceMgr>, kMsg, 0x800007, &typeid(ResourceMgr::ComponentResult_t)},
    {make<ResourceMgr>, kMsg, 0x12, nullptr},
    {make<ClusterMgr>, kMsg, 0x800053, &typeid(ClusterMgr::ClusterFind_t)},
    {make<ClusterMgr>, kMsg, 0x80001B, nullptr},
    // A cluster knows its own and the services' answers, but not their commands.
    {make<Cluster>, kMsg, 0x800030, &typeid(Cluster::ClusterSlotAssign_t)},
    {make<Cluster>, kMsg, 0x80002C, &typeid(ClusterMgr::ClusterResult_t)},
    {make<Cluster>, kMsg, 0x800007, &typeid(ClusterMgr::ComponentResult_t)},
    {make<Cluster>, kEvt, 0x1230, nullptr},
    {make<Cluster>, kMsg, 0x800053, nullptr},
    {make<Cluster>, kMsg, 0x800059, nullptr},
};

TEST(BodyLookup, GivesTheBodyOrRaisesUndefined) {
    auto queue = newQueue();
    for (const auto& row : kLookups) {
        std::unique_ptr<Addressable> object = row.make(queue);
        // typeid of named references: clang warns when the operand calls unique_ptr::operator*.
        const Addressable& maker = *object;
        SCOPED_TRACE(testing::Message() << typeid(maker).name() << std::hex << " 0x" << row.number);
        if (row.expected == nullptr && row.msg) {
            EXPECT_THROW(delete object->MsgBodyLookup(row.number), Addressable::UndefinedMsgBody);
        } else if (row.expected == nullptr) {
            EXPECT_THROW(delete object->EvtBodyLookup(row.number), Addressable::UndefinedEvtBody);
        } else {
            std::unique_ptr<tolk::MsgBody> body(row.msg ? object->MsgBodyLookup(row.number)
                                                        : object->EvtBodyLookup(row.number));
            const tolk::MsgBody& made = *body;
            EXPECT_EQ(typeid(made), *row.expected);
        }
    }
}

}  // namespace
