#include "sim/Emulation.h"

#include <algorithm>
#include <cstring>
#include <ostream>

#include "catalogue/generated/cas_bodies.h"
#include "catalogue/generated/cluster_bodies.h"
#include "catalogue/generated/clustermgr_bodies.h"
#include "catalogue/generated/lcon_bodies.h"
#include "catalogue/generated/resourcemgr_bodies.h"
#include "catalogue/generated/stdresource_bodies.h"
#include "catalogue/generated/tsc_bodies.h"
#include "framework/CompDesc_t.h"
#include "framework/Msg.h"
#include "sim/ErrorCodes.h"
#include "transport/TKSMsgRef.h"

namespace sim {

using tolk::CompDesc_t;
using Std = tolk::StdResource_Bodies;
using Rm = tolk::ResourceMgr_Bodies;
using Cm = tolk::ClusterMgr_Bodies;
using Cl = tolk::Cluster_Bodies;
using Tsc = tolk::TSC_Bodies;
using Lcon = tolk::LCON_Bodies;
using Cas = tolk::CAS_Bodies;

namespace {

constexpr std::uint32_t kTalkPort = 0x4201;
constexpr std::uint8_t kSlotEncoding = 1;
constexpr std::uint8_t kSlotIdle = 0xFF;
constexpr std::uint16_t kAnyInstance = 0xFFFF;
constexpr std::uint32_t kEvtDetected = 0x20;

Address fromTK(const TKCompDesc& d) {
    return Address{d.instance, d.board, d.processor, d.component, d.node};
}
Address fromCD(const CompDesc_t& d) {
    return Address{d.instance, d.board, d.processor, d.component, d.node};
}
CompDesc_t toCD(const Address& a) {
    return CompDesc_t(a.instance, a.board, a.processor, a.component, a.node);
}

std::string text(tolk::staticList<char>& l) {
    const char* p = l.data();
    unsigned int n = l.length();
    unsigned int len = 0;
    while (len < n && p[len] != '\0') {
        ++len;
    }
    return std::string(p, len);
}

void setText(tolk::staticList<char>& l, const std::string& s) {
    l.realloc(static_cast<unsigned int>(s.size()) + 1);
    std::memcpy(l.data(), s.c_str(), s.size() + 1);
}

// The block leaves the Msg, which then frees nothing.
TKMsg32Bit* takeBlock(tolk::Msg& m) {
    TKMsg32Bit* b = m.getMsgRef();
    *m.getTKMsgRef() = TKSMsgRef();
    return b;
}

// Address comparisons for searches: 0xFFFF or 0 in a start descriptor's instance means any.
bool instanceMatches(std::uint16_t want, std::uint16_t have) {
    return want == kAnyInstance || want == 0 || want == have;
}

}  // namespace

struct Emulation::Request {
    tolk::Msg msg;
    std::uint32_t type = 0;
    std::uint32_t trans = 0;
    Address src;
    Address tgt;
    bool answered = false;

    explicit Request(TKSMsgRef* ref) : msg(ref) {}
};

Emulation::Emulation(std::shared_ptr<const farm::Farm> farm, std::ostream& log)
    : model_(farm), log_(log) {
    for (const farm::Board& b : farm->boards) {
        auto& list = components_[b.logicalId];
        for (const farm::Trunk& t : b.trunks) {
            for (int c = 1; c <= t.channels; ++c) {
                Address cluster = farm::channelClusterAddress(b.logicalId, t.number, c);
                for (std::uint8_t type : {farm::kTSC, farm::kCHP, farm::kCAS}) {
                    Address a = farm::channelComponentAddress(b.logicalId, t.number, c, type);
                    if (farm::resolve(*farm, a)) {
                        list.push_back(Component{a, cluster, type, t.number, c});
                    }
                }
            }
        }
        for (const farm::Trunk& t : b.trunks) {
            list.push_back(Component{farm::lconAddress(b.logicalId, t.number),
                                     farm::lineClusterAddress(b.logicalId, t.number), farm::kLCON,
                                     t.number, 0});
        }
        for (int v = 1; v <= b.voiceChannelCount(); ++v) {
            auto served = farm::channelOfVoice(b, v);
            for (farm::Media m : b.media) {
                list.push_back(Component{farm::mediaAddress(b.logicalId, v, m),
                                         farm::rocClusterAddress(b.logicalId, v),
                                         farm::mediaComponentType(m), served ? served->trunk : 0,
                                         served ? served->channel : 0});
            }
        }
    }
}

Emulation::~Emulation() {
    for (Queued& q : outbox_) {
        tkMsgFree(q.block);
    }
}

// ---------------------------------------------------------------- sending

void Emulation::enqueue(TKMsg32Bit* block) {
    outbox_.push_back(Queued{now_ + std::chrono::milliseconds(delayMs_), block});
}

TKMsg32Bit* Emulation::popDue(Clock::time_point now) {
    if (outbox_.empty() || outbox_.front().due > now) {
        return nullptr;
    }
    TKMsg32Bit* b = outbox_.front().block;
    outbox_.pop_front();
    return b;
}

std::optional<Clock::time_point> Emulation::nextDue() const {
    if (outbox_.empty()) {
        return std::nullopt;
    }
    return outbox_.front().due;
}

void Emulation::reply(Request& rq, std::uint32_t type, tolk::MsgBody* body) {
    tolk::Msg m(body ? body->GetByteSize() : 0);
    m.setMsgType(type);
    m.setTrans(rq.trans);
    CompDesc_t src = toCD(rq.tgt);
    CompDesc_t tgt = toCD(rq.src);
    m.setSrcAddr(src);
    m.setTgtAddr(tgt);
    if (body) {
        (void)body->writeMsg(&m, 0);
    }
    enqueue(takeBlock(m));
    rq.answered = true;
    stats_.answers++;
}

void Emulation::refuse(Request& rq, std::uint32_t code) {
    Std::MsgError_t err;
    err.ErrorMsg = rq.type;
    err.ErrorCode = code;
    // The parameter commands name the refused parameter; everything else carries no data.
    Std::MsgError_t::Data_ErrorMsg_0x12_t parm;
    if (rq.type == 0x08 || rq.type == 0x12) {
        std::uint32_t num = 0;
        tolk::Msg& m = rq.msg;
        Std::MsgGetParm_t p;
        (void)p.readMsg(&m, 0);
        num = p.Num;
        parm.Num = num;
        parm.Val = 0;
        err.Data = reinterpret_cast<tolk::cat::ValueWord>(&parm);
    }
    reply(rq, 0x00, &err);
    err.Data = 0;
}

void Emulation::answer(Request& rq, std::uint32_t code, std::uint32_t okType) {
    if (code != 0) {
        refuse(rq, code);
    } else if (okType != 0) {
        reply(rq, okType, nullptr);
    }
}

void Emulation::unanswerable(Request& rq, const char* why) {
    stats_.unanswered++;
    log_ << "vx7sim: cannot answer message type 0x" << std::hex << rq.type << std::dec
         << " to {Node " << unsigned(rq.tgt.node) << " Board " << unsigned(rq.tgt.board)
         << " Processor " << unsigned(rq.tgt.processor) << " Component "
         << unsigned(rq.tgt.component) << " Instance " << rq.tgt.instance << "}: " << why
         << std::endl;
}

void Emulation::publish(const std::vector<Event>& events) {
    for (const Event& e : events) {
        model_.subscribersOf(e, deliveries_);
        if (deliveries_.empty()) {
            continue;
        }
        std::uint32_t ts = model_.nextTimestamp();
        for (const Subscription* s : deliveries_) {
            std::unique_ptr<tolk::MsgBody> body;
            switch (e.kind) {
                case Event::Kind::CallState: {
                    auto b = std::make_unique<Tsc::EvtCallState_t>();
                    b->EvtGroup = s->group;
                    b->Type = e.type;
                    b->Timestamp = ts;
                    b->CallId = e.a;
                    b->CallState = e.b;
                    b->Reason = e.c;
                    body = std::move(b);
                    break;
                }
                case Event::Kind::ChanState: {
                    auto b = std::make_unique<Tsc::EvtChanState_t>();
                    b->EvtGroup = s->group;
                    b->Type = e.type;
                    b->Timestamp = ts;
                    b->ChanState = e.a;
                    body = std::move(b);
                    break;
                }
                case Event::Kind::CallInfo: {
                    auto b = std::make_unique<Tsc::EvtCallInfo_Type_CalledId_t>();
                    b->EvtGroup = s->group;
                    b->Type = e.type;
                    b->Timestamp = ts;
                    b->CallId = e.a;
                    b->InfoId = e.b;
                    setText(b->Value, e.text);
                    body = std::move(b);
                    break;
                }
                case Event::Kind::Alarm: {
                    auto b = std::make_unique<Lcon::Evt_0x1600_t>();
                    b->Label = s->group;
                    b->Type = e.a;
                    b->State = static_cast<unsigned char>(e.b);
                    body = std::move(b);
                    break;
                }
                case Event::Kind::LineState: {
                    auto b = std::make_unique<Lcon::Evt_0x1611_t>();
                    b->Label = s->group;
                    b->Type = e.a;
                    b->Reason = e.b;
                    body = std::move(b);
                    break;
                }
            }
            tolk::Msg m(body->GetByteSize());
            m.setMsgType(kEvtDetected);
            m.setTrans(s->trans);
            CompDesc_t src = toCD(e.source);
            CompDesc_t tgt = toCD(s->retAddr);
            m.setSrcAddr(src);
            m.setTgtAddr(tgt);
            (void)body->writeMsg(&m, 0);
            enqueue(takeBlock(m));
            stats_.events++;
        }
    }
}

// ---------------------------------------------------------------- receiving

void Emulation::receive(TKMsg32Bit* block, Clock::time_point now) {
    now_ = now;
    if (!block) {
        return;
    }
    stats_.requests++;
    TKSMsgRef ref(block);
    Request rq(&ref);
    rq.type = block->type;
    rq.trans = block->transTag >> 8;
    rq.src = Address{block->srcInstance, block->srcBoard, block->srcProcessor, block->srcComponent,
                     block->srcNode};
    rq.tgt = Address{block->tgtInstance, block->tgtBoard, block->tgtProcessor, block->tgtComponent,
                     block->tgtNode};
    scratch_.clear();
    try {
        auto o = overrides_.find(rq.type);
        if (o != overrides_.end()) {
            if (o->second.first == Override::Refuse) {
                stats_.refused++;
                refuse(rq, o->second.second);
            } else {
                stats_.silenced++;
            }
            return;
        }
        handle(rq);
    } catch (...) {
        // A body that cannot even be read (an impossible count, no memory) is refused.
        scratch_.clear();
        if (!rq.answered) {
            log_ << "vx7sim: malformed body of message type 0x" << std::hex << rq.type << std::dec
                 << "; refused" << std::endl;
            refuse(rq, kErrMalformed);
        }
    }
    publish(scratch_);
}

void Emulation::handle(Request& rq) {
    auto r = farm::resolve(model_.farm(), rq.tgt);
    if (!r) {
        if (model_.farm().board(rq.tgt.board)) {
            unanswerable(rq, "no such component on this board");
            refuse(rq, kErrNoSuchComponent);
        } else {
            unanswerable(rq, "no such board");
        }
        return;
    }
    switch (r->kind) {
        case farm::ResourceKind::ResourceMgr:
            handleResourceMgr(rq);
            return;
        case farm::ResourceKind::ClusterMgr:
            handleClusterMgr(rq);
            return;
        case farm::ResourceKind::ChannelCluster:
        case farm::ResourceKind::LineCluster:
        case farm::ResourceKind::RocCluster:
            handleCluster(rq);
            return;
        case farm::ResourceKind::ChannelComponent:
        case farm::ResourceKind::Lcon:
        case farm::ResourceKind::Media:
            if (rq.type <= 0x30) {
                handleStd(rq, *r);
            } else if (r->kind == farm::ResourceKind::Lcon) {
                handleLcon(rq, *model_.line(r->board, r->trunk));
            } else if (r->kind == farm::ResourceKind::ChannelComponent &&
                       r->component == farm::kTSC) {
                handleTsc(rq, *model_.channel(r->board, r->trunk, r->channel));
            } else if (r->kind == farm::ResourceKind::ChannelComponent &&
                       r->component == farm::kCAS) {
                handleCas(rq);
            } else {
                unanswerable(rq, "not a message of this component");
                refuse(rq, kErrNotSupported);
            }
            return;
        case farm::ResourceKind::Board:
            unanswerable(rq, "the board itself takes no messages");
            return;
    }
}

const Emulation::Component* Emulation::findComponent(const Address& start, const Address* cluster,
                                                     std::uint8_t type,
                                                     tolk::staticList<tolk::CompAttr_t>& attrs,
                                                     unsigned int count) const {
    auto it = components_.find(start.board);
    if (it == components_.end()) {
        return nullptr;
    }
    int trunk = -1, channel = -1, line = -1;
    unsigned int n = std::min(count, attrs.length());
    for (unsigned int i = 0; i < n; ++i) {
        const tolk::CompAttr_t& a = *attrs[i];
        switch (a.key) {
            case 0:
                if (type != 0 && type != static_cast<unsigned int>(a.value)) {
                    return nullptr;
                }
                type = static_cast<std::uint8_t>(a.value);
                break;
            case 0x1200:
                trunk = a.value;
                break;
            case 0x1201:
                channel = a.value;
                break;
            case 0x1600:
                line = a.value;
                break;
            default:
                return nullptr;  // nothing here has any other attribute
        }
    }
    for (const Component& c : it->second) {
        if (type != 0 && c.type != type) {
            continue;
        }
        if (cluster && !(c.cluster == *cluster)) {
            continue;
        }
        if (!instanceMatches(start.instance, c.addr.instance)) {
            continue;
        }
        if (trunk >= 0 && (c.trunk != trunk || c.type == farm::kLCON)) {
            continue;
        }
        if (channel >= 0 && c.channel != channel) {
            continue;
        }
        if (line >= 0 && (c.type != farm::kLCON || c.trunk != line)) {
            continue;
        }
        return &c;
    }
    return nullptr;
}

void Emulation::handleResourceMgr(Request& rq) {
    switch (rq.type) {
        case 0x80003D: {
            Rm::CompFind_t f;
            (void)f.readMsg(&rq.msg, 0);
            Address start = fromCD(f.CompStart);
            start.board = rq.tgt.board;
            std::uint8_t type = f.CompStart.component == 255 ? 0 : f.CompStart.component;
            const Component* c = findComponent(start, nullptr, type, f.attr, f.count);
            if (!c) {
                refuse(rq, kErrNoSuchComponent);
                return;
            }
            Rm::ComponentResult_t res;
            res.desc = toCD(c->addr);
            reply(rq, 0x800007, &res);
            return;
        }
        case 0x80003E: {
            Rm::CompInstAllocate_t f;
            (void)f.readMsg(&rq.msg, 0);
            Address start = fromCD(f.CompStart);
            start.board = rq.tgt.board;
            Address cluster = fromCD(f.ClustDesc);
            bool anyCluster = f.ClustDesc.instance == 0xFFFF;
            std::uint8_t type = f.CompStart.component == 255 ? 0 : f.CompStart.component;
            const Component* c =
                findComponent(start, anyCluster ? nullptr : &cluster, type, f.attr, f.count);
            if (!c) {
                refuse(rq, kErrNoSuchComponent);
                return;
            }
            Rm::ComponentResult_t res;
            res.desc = toCD(c->addr);
            reply(rq, 0x800007, &res);
            return;
        }
        case 0x800059:
        case 0x80005A: {
            // Every component of the farm exists from the start, so use and unuse only check
            // that what they name is there.
            Rm::CompUnuse_t u;
            (void)u.readMsg(&rq.msg, 0);
            unsigned int n =
                rq.type == 0x800059 ? 0 : std::min<unsigned int>(u.Count, u.List.length());
            if (rq.type == 0x800059) {
                Rm::CompUse_t use;
                (void)use.readMsg(&rq.msg, 0);
                n = std::min<unsigned int>(use.Count, use.List.length());
                for (unsigned int i = 0; i < n; ++i) {
                    if (!farm::resolve(model_.farm(), fromCD(use.List[i]->desc))) {
                        refuse(rq, kErrNoSuchComponent);
                        return;
                    }
                }
            } else {
                for (unsigned int i = 0; i < n; ++i) {
                    if (!farm::resolve(model_.farm(), fromCD(u.List[i]->desc))) {
                        refuse(rq, kErrNoSuchComponent);
                        return;
                    }
                }
            }
            reply(rq, 0x800000, nullptr);
            return;
        }
        case 0x800041:
            return;  // one-way: the farm's components are never really freed
        default:
            unanswerable(rq, "not a resource manager message this emulation plays");
            refuse(rq, kErrNotSupported);
            return;
    }
}

void Emulation::handleClusterMgr(Request& rq) {
    switch (rq.type) {
        case 0x800053: {
            Cm::ClusterFind_t f;
            (void)f.readMsg(&rq.msg, 0);
            Address start{kAnyInstance, rq.tgt.board, 0, 0, 0};
            const Component* c = findComponent(start, nullptr, 0, f.attr, f.count);
            if (!c || f.count == 0) {
                refuse(rq, kErrNoSuchCluster);
                return;
            }
            Cm::ClusterResult_t res;
            res.desc = toCD(c->cluster);
            reply(rq, 0x80002C, &res);
            return;
        }
        case 0x80001E: {
            Cm::ClusterCompByAttr_t f;
            (void)f.readMsg(&rq.msg, 0);
            Address cluster = fromCD(f.ClustDesc);
            Address start{kAnyInstance, cluster.board, 0, 0, 0};
            const Component* c = findComponent(start, &cluster, f.CompType, f.Attrs, f.Count);
            if (!c) {
                refuse(rq, kErrNoSuchComponent);
                return;
            }
            Cm::ComponentResult_t res;
            res.desc = toCD(c->addr);
            reply(rq, 0x800007, &res);
            return;
        }
        case 0x80001D: {
            Cm::ClusterByComp_t f;
            (void)f.readMsg(&rq.msg, 0);
            Address want = fromCD(f.desc);
            auto it = components_.find(want.board);
            if (it != components_.end()) {
                for (const Component& c : it->second) {
                    if (c.addr == want) {
                        Cm::ClusterResult_t res;
                        res.desc = toCD(c.cluster);
                        reply(rq, 0x80002C, &res);
                        return;
                    }
                }
            }
            refuse(rq, kErrNoSuchCluster);
            return;
        }
        case 0x800024:
        case 0x800052:
            return;  // one-way; the farm's clusters stay
        default:
            unanswerable(rq, "not a cluster manager message this emulation plays");
            refuse(rq, kErrNotSupported);
            return;
    }
}

void Emulation::handleCluster(Request& rq) {
    Ports* ports = model_.clusterPorts(rq.tgt);
    switch (rq.type) {
        case 0x800032: {
            Cl::ClusterSlotInfo_t f;
            (void)f.readMsg(&rq.msg, 0);
            if (!ports) {
                refuse(rq, kErrNotSupported);
                return;
            }
            Cl::ClusterSlotInfoResult_t res;
            res.ClustDesc = toCD(rq.tgt);
            res.portId = f.portId;
            res.encoding = kSlotEncoding;
            res.idlePattern = kSlotIdle;
            if (f.portId == kTalkPort) {
                res.slotIds.realloc(1);
                *res.slotIds[0] = ports->txSlot;
            } else if (auto it = ports->listen.find(f.portId); it != ports->listen.end()) {
                res.encoding = it->second.encoding;
                res.idlePattern = it->second.idlePattern;
                res.slotIds.realloc(static_cast<unsigned int>(it->second.slots.size()));
                for (unsigned int i = 0; i < it->second.slots.size(); ++i) {
                    *res.slotIds[i] = it->second.slots[i];
                }
            }
            res.width = static_cast<unsigned char>(res.slotIds.length());
            reply(rq, 0x800033, &res);
            return;
        }
        case 0x800030: {
            Cl::ClusterSlotAssign_t f;
            (void)f.readMsg(&rq.msg, 0);
            if (!ports) {
                refuse(rq, kErrNotSupported);
                return;
            }
            if (f.portId == kTalkPort || f.slotIds.length() == 0) {
                refuse(rq, kErrBadParameter);
                return;
            }
            Ports::Listen& l = ports->listen[f.portId];
            if (l.active) {
                refuse(rq, kErrBadState);
                return;
            }
            l.slots.assign(f.slotIds.data(), f.slotIds.data() + f.slotIds.length());
            l.encoding = f.encoding;
            l.idlePattern = f.idlePattern;
            reply(rq, 0x800000, nullptr);
            return;
        }
        case 0x80001B:
        case 0x800023:
        case 0x800036: {
            Cl::ClusterDeactivate_t f;  // the activation starts with the same two fields
            (void)f.readMsg(&rq.msg, 0);
            if (!ports) {
                refuse(rq, kErrNotSupported);
                return;
            }
            auto it = ports->listen.find(f.portId);
            if (it == ports->listen.end()) {
                refuse(rq, kErrBadState);
                return;
            }
            Ports::Listen& l = it->second;
            if (rq.type == 0x80001B) {
                if (l.active) {
                    refuse(rq, kErrBadState);
                    return;
                }
                l.active = true;
            } else if (rq.type == 0x800023) {
                if (!l.active) {
                    refuse(rq, kErrBadState);
                    return;
                }
                l.active = false;
            } else {
                if (l.active) {
                    refuse(rq, kErrBadState);
                    return;
                }
                ports->listen.erase(it);
            }
            reply(rq, 0x800000, nullptr);
            return;
        }
        case 0x800027: {
            Cl::ClusterCompInfoResult_t res;
            res.ClustDesc = toCD(rq.tgt);
            auto it = components_.find(rq.tgt.board);
            std::vector<Address> found;
            if (it != components_.end()) {
                for (const Component& c : it->second) {
                    if (c.cluster == rq.tgt) {
                        found.push_back(c.addr);
                    }
                }
            }
            res.instances.realloc(static_cast<unsigned int>(found.size()));
            for (unsigned int i = 0; i < found.size(); ++i) {
                *res.instances[i] = toCD(found[i]);
            }
            res.count = static_cast<unsigned char>(found.size());
            reply(rq, 0x800028, &res);
            return;
        }
        case 0x800054:
        case 0x800055:
        case 0x800056:
            reply(rq, 0x800000, nullptr);
            return;
        case 0x800057: {
            Cl::ClusterUnlockCmplt_t res;
            res.unlocked = 1;
            res.count = 0;
            reply(rq, 0x800058, &res);
            return;
        }
        case 0x80001F:
        case 0x800025:
            return;  // one-way
        default:
            unanswerable(rq, "not a cluster message this emulation plays");
            refuse(rq, kErrNotSupported);
            return;
    }
}

bool Emulation::parmValue(const farm::Resource& r, std::uint32_t num, std::uint32_t& val) const {
    const farm::Board* b = model_.farm().board(r.board);
    if (num == kParmRouting) {
        val = b && b->flexible() ? 1 : 0;
        return true;
    }
    if (r.kind == farm::ResourceKind::Lcon && (num == kParmTrunkType || num == kParmSignaling)) {
        const farm::Trunk* t = b ? b->trunk(r.trunk) : nullptr;
        if (!t) {
            return false;
        }
        val = num == kParmTrunkType ? static_cast<std::uint32_t>(t->type)
              : t->analog()         ? static_cast<std::uint32_t>(farm::Signaling::CAS)
                                    : static_cast<std::uint32_t>(t->signaling);
        return true;
    }
    return false;
}

bool Emulation::handleStd(Request& rq, const farm::Resource& r) {
    std::uint64_t key = addressKey(rq.tgt);
    switch (rq.type) {
        case 0x01:
        case 0x06:
            return true;  // one-way
        case 0x02:
        case 0x04:
            reply(rq, rq.type + 1, nullptr);
            return true;
        case 0x08: {
            Std::MsgSetParm_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::uint32_t v;
            if (parmValue(r, f.Parm, v)) {
                refuse(rq, kErrBadParameter);  // the board's own parameters are read only
                return true;
            }
            parms_[key][f.Parm] = f.Val;
            reply(rq, 0x09, nullptr);
            return true;
        }
        case 0x0A: {
            Std::MsgSetxParms_t f;
            (void)f.readMsg(&rq.msg, 0);
            unsigned int n = std::min(f.Count, f.Parms.length());
            for (unsigned int i = 0; i < n; ++i) {
                std::uint32_t v;
                if (parmValue(r, f.Parms[i]->Parm, v)) {
                    refuse(rq, kErrBadParameter);
                    return true;
                }
            }
            for (unsigned int i = 0; i < n; ++i) {
                parms_[key][f.Parms[i]->Parm] = f.Parms[i]->Val;
            }
            reply(rq, 0x0B, nullptr);
            return true;
        }
        case 0x0C: {
            Std::MsgSetParmDef_t f;
            (void)f.readMsg(&rq.msg, 0);
            parms_[key].erase(f.Parm);
            reply(rq, 0x0D, nullptr);
            return true;
        }
        case 0x0E: {
            Std::MsgSetxParmsDef_t f;
            (void)f.readMsg(&rq.msg, 0);
            unsigned int n = std::min(f.Count, f.Parms.length());
            for (unsigned int i = 0; i < n; ++i) {
                parms_[key].erase(f.Parms[i]->Parm);
            }
            reply(rq, 0x0F, nullptr);
            return true;
        }
        case 0x10:
            parms_.erase(key);
            reply(rq, 0x11, nullptr);
            return true;
        case 0x12: {
            Std::MsgGetParm_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::uint32_t v = 0;
            bool known = parmValue(r, f.Num, v);
            if (!known) {
                auto p = parms_.find(key);
                if (p != parms_.end() && p->second.count(f.Num)) {
                    v = p->second[f.Num];
                    known = true;
                }
            }
            if (!known) {
                refuse(rq, kErrBadParameter);
                return true;
            }
            Std::MsgGetParmCmplt_t res;
            res.Num = f.Num;
            res.Val = v;
            res.TextSize = 0;
            reply(rq, 0x13, &res);
            return true;
        }
        case 0x14: {
            Std::MsgGetxParms_t f;
            (void)f.readMsg(&rq.msg, 0);
            Std::MsgGetxParmsCmplt_t res;
            unsigned int n = std::min(f.Count, f.Parms.length());
            res.Parms.realloc(n);
            for (unsigned int i = 0; i < n; ++i) {
                std::uint32_t num = f.Parms[i]->Parm, v = 0;
                bool known = parmValue(r, num, v);
                auto p = parms_.find(key);
                if (!known && p != parms_.end() && p->second.count(num)) {
                    v = p->second[num];
                    known = true;
                }
                if (!known) {
                    refuse(rq, kErrBadParameter);
                    return true;
                }
                res.Parms[i]->Parm = num;
                res.Parms[i]->Val = v;
            }
            res.Count = n;
            reply(rq, 0x15, &res);
            return true;
        }
        case 0x16: {
            // A TSC's 0x16 may carry a set behind these fields; the subscription is the same.
            Std::MsgDetectEvt_t f;
            (void)f.readMsg(&rq.msg, 0);
            Subscription s;
            s.evtType = f.EvtType;
            s.group = f.EvtGroup == 0 ? f.EvtType : f.EvtGroup;
            s.retAddr = fromCD(f.RetAddr);
            s.trans = rq.trans;
            s.owner = rq.src;
            model_.subscribe(rq.tgt, s);
            reply(rq, 0x17, nullptr);
            return true;
        }
        case 0x18: {
            Std::MsgDetectxEvts_t f;
            (void)f.readMsg(&rq.msg, 0);
            unsigned int n = std::min(f.Count, f.List.length());
            for (unsigned int i = 0; i < n; ++i) {
                Subscription s;
                s.evtType = f.List[i]->EvtType;
                s.group = f.List[i]->EvtGroup == 0 ? s.evtType : f.List[i]->EvtGroup;
                s.retAddr = fromCD(f.RetAddr);
                s.trans = rq.trans;
                s.owner = rq.src;
                model_.subscribe(rq.tgt, s);
            }
            reply(rq, 0x19, nullptr);
            return true;
        }
        case 0x1A: {
            Std::MsgCancelEvt_t f;
            (void)f.readMsg(&rq.msg, 0);
            model_.cancel(rq.tgt, rq.src, rq.trans, f.Type);
            reply(rq, 0x1B, nullptr);
            return true;
        }
        case 0x1C: {
            Std::MsgCancelxEvts_t f;
            (void)f.readMsg(&rq.msg, 0);
            unsigned int n = std::min(f.Count, f.EvtTypeList.length());
            for (unsigned int i = 0; i < n; ++i) {
                model_.cancel(rq.tgt, rq.src, rq.trans, *f.EvtTypeList[i]);
            }
            reply(rq, 0x1D, nullptr);
            return true;
        }
        case 0x1E:
            model_.cancel(rq.tgt, rq.src, rq.trans, std::nullopt);
            reply(rq, 0x1F, nullptr);
            return true;
        case 0x21:
        case 0x23:
        case 0x25:
        case 0x27:
        case 0x29:
            reply(rq, rq.type + 1, nullptr);
            return true;
        default:
            unanswerable(rq, "not a standard message this emulation plays");
            refuse(rq, kErrNotSupported);
            return false;
    }
}

void Emulation::handleTsc(Request& rq, Channel& ch) {
    std::vector<Event>& ev = scratch_;
    switch (rq.type) {
        case 0x1214: {
            Tsc::MsgMakeCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::uint32_t id = 0;
            // The completion goes before the events of the call it names.
            std::vector<Event> later;
            std::uint32_t code = model_.makeCall(ch, text(f.DestAddr), text(f.OrigAddr), id, later);
            if (code != 0) {
                refuse(rq, code);
                return;
            }
            Tsc::MsgMakeCallCmplt_t res;
            res.CallId = id;
            reply(rq, 0x1215, &res);
            ev.insert(ev.end(), later.begin(), later.end());
            return;
        }
        case 0x1201: {
            Tsc::MsgAnswerCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.answerCall(ch, f.CallId, ev), 0);
            return;
        }
        case 0x1200: {
            Tsc::MsgAcceptCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.acceptCall(ch, f.CallId, ev), 0);
            return;
        }
        case 0x120A: {
            Tsc::MsgDropCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.dropCall(ch, f.CallId, f.Reason, ev), 0);
            return;
        }
        case 0x121C: {
            Tsc::MsgReleaseCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.releaseCall(ch, f.CallId, f.Reason, ev), 0);
            return;
        }
        case 0x121D: {
            Tsc::MsgRejectCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.rejectCall(ch, f.CallId, f.Reason, ev), 0);
            return;
        }
        case 0x1211: {
            Tsc::MsgHoldCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.holdCall(ch, f.CallId, ev), 0);
            return;
        }
        case 0x121E: {
            Tsc::MsgRetrieveCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.retrieveCall(ch, f.CallId, ev), 0);
            return;
        }
        case 0x1202: {
            Tsc::MsgBlindTransferCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.blindTransfer(ch, f.CallId, ev), 0);
            return;
        }
        case 0x1212: {
            Tsc::MsgInitTransfer_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::uint32_t id = 0;
            // As with MakeCall, the completion names the consultation before its events do.
            std::vector<Event> later;
            std::uint32_t code = model_.initTransfer(ch, f.CallId, id, later);
            if (code != 0) {
                refuse(rq, code);
                return;
            }
            Tsc::MsgInitTransferCmplt_t res;
            res.CallId = id;
            reply(rq, 0x1213, &res);
            ev.insert(ev.end(), later.begin(), later.end());
            return;
        }
        case 0x1207: {
            Tsc::MsgCompleteTransfer_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.completeTransfer(ch, f.CallId, f.ConCallId, ev), 0);
            return;
        }
        case 0x1203: {
            Tsc::MsgCancelTransfer_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.cancelTransfer(ch, f.CallId, ev), 0);
            return;
        }
        case 0x122D: {
            Tsc::MsgProceedCall_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::uint32_t id = 0, state = 0, why = 0;
            std::uint32_t code = model_.callState(ch, f.CallId, id, state, why);
            answer(rq,
                   code != 0                ? code
                   : state == call::Offered ? 0u
                                            : std::uint32_t{kErrBadState},
                   0);
            return;
        }
        case 0x120D: {
            Tsc::MsgGetCallState_t f;
            (void)f.readMsg(&rq.msg, 0);
            Tsc::MsgGetCallStateCmplt_t res;
            std::uint32_t code =
                model_.callState(ch, f.CallId, res.CallId, res.CallState, res.Reason);
            if (code != 0) {
                refuse(rq, code);
                return;
            }
            reply(rq, 0x120E, &res);
            return;
        }
        case 0x120F: {
            Tsc::MsgGetChanStateCmplt_t res;
            res.ChanState = ch.chanState;
            reply(rq, 0x1210, &res);
            return;
        }
        case 0x121F: {
            Tsc::MsgSetChanState_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.setChanState(ch, f.State, ev), 0x1220);
            return;
        }
        case 0x1246:
            answer(rq, model_.reset(ch, ev), 0x1247);
            return;
        case 0x1224: {
            Tsc::MsgDial_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::uint32_t code = model_.dial(ch, f.CallId);
            if (code != 0) {
                refuse(rq, code);
                return;
            }
            Tsc::MsgDialCmplt_t res;
            res.Reason = 0;
            reply(rq, 0x1225, &res);
            return;
        }
        case 0x1222: {
            Tsc::MsgSendISDN_t f;
            (void)f.readMsg(&rq.msg, 0);
            if (ch.line->signaling != static_cast<int>(farm::Signaling::CCS)) {
                refuse(rq, kErrNotSupported);
                return;
            }
            answer(rq, model_.dial(ch, f.CallId), 0x1223);
            return;
        }
        case 0x1234: {
            Tsc::MsgAttach_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::vector<std::pair<std::uint32_t, Address>> media;
            unsigned int n = std::min<unsigned int>(f.Count, f.MediaInfo.length());
            for (unsigned int i = 0; i < n; ++i) {
                Address a = fromCD(f.MediaInfo[i]->InstDesc);
                if (!farm::resolve(model_.farm(), a)) {
                    refuse(rq, kErrNoSuchComponent);
                    return;
                }
                media.emplace_back(f.MediaInfo[i]->ComponentType, a);
            }
            answer(rq, model_.attachMedia(ch, std::move(media), ev), 0x1235);
            return;
        }
        case 0x1236:
            answer(rq, model_.detachMedia(ch, ev), 0x1237);
            return;
        case 0x1242: {
            Tsc::MsgSetAlarmMask_t f;
            (void)f.readMsg(&rq.msg, 0);
            alarmMasks_[addressKey(rq.tgt)] = f.Alarm_mask;
            reply(rq, 0x1243, nullptr);
            return;
        }
        case 0x1244: {
            Tsc::MsgGetAlarmMask_t f;
            (void)f.readMsg(&rq.msg, 0);
            Tsc::MsgGetAlarmMaskCmplt_t res;
            res.Linenum = f.Linenum;
            auto it = alarmMasks_.find(addressKey(rq.tgt));
            res.Alarm_mask = it == alarmMasks_.end() ? 0x46 : it->second;
            reply(rq, 0x1245, &res);
            return;
        }
        case 0x1248:
            reply(rq, 0x1249, nullptr);
            return;
        case 0x124E: {
            Tsc::MsgTxRxSignalingGetCmplt_t res;
            // Off hook while a call holds the channel, on hook otherwise.
            res.signalbits = ch.call ? 0x0F : 0x00;
            reply(rq, 0x124F, &res);
            return;
        }
        default:
            unanswerable(rq, "a call control message this emulation does not play");
            refuse(rq, kErrNotSupported);
            return;
    }
}

void Emulation::handleLcon(Request& rq, Line& line) {
    std::vector<Event>& ev = scratch_;
    switch (rq.type) {
        case 0x1608: {
            Lcon::MsgGetLineStateCmplt_t res;
            res.LineState = line.state;
            res.Reason = line.reason;
            reply(rq, 0x1609, &res);
            return;
        }
        case 0x1610: {
            Lcon::MsgSetLineState_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.setLineState(line, f.State, f.Reason, ev), 0x1611);
            return;
        }
        case 0x1612: {
            Lcon::MsgTSPSetLineState_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.setLineState(line, f.State, f.Reason, ev), 0);
            return;
        }
        case 0x1602: {
            Lcon::MsgGetAlarms_t f;
            (void)f.readMsg(&rq.msg, 0);
            std::vector<std::uint32_t> ids;
            unsigned int n = std::min(f.Count, f.Alarms.length());
            for (unsigned int i = 0; i < n; ++i) {
                std::uint32_t id = *f.Alarms[i];
                if (id == kGroupAlarms) {
                    const auto& all = Model::reportedAlarms();
                    ids.insert(ids.end(), all.begin(), all.end());
                } else {
                    ids.push_back(id);
                }
            }
            Lcon::MsgGetAlarmsCmplt_t res;
            res.AlarmInfo.realloc(static_cast<unsigned int>(ids.size()));
            for (unsigned int i = 0; i < ids.size(); ++i) {
                res.AlarmInfo[i]->Type = ids[i];
                res.AlarmInfo[i]->State = model_.alarmState(line, ids[i]);
            }
            res.Count = static_cast<unsigned int>(ids.size());
            reply(rq, 0x1603, &res);
            return;
        }
        case 0x1606: {
            Lcon::MsgGetFaults_t f;
            (void)f.readMsg(&rq.msg, 0);
            Lcon::MsgGetFaultsCmplt_t res;
            unsigned int n = std::min(f.Count, f.Faults.length());
            res.FaultInfo.realloc(n);
            for (unsigned int i = 0; i < n; ++i) {
                res.FaultInfo[i]->Type = *f.Faults[i];
                res.FaultInfo[i]->State = 0;
            }
            res.Count = n;
            reply(rq, 0x1607, &res);
            return;
        }
        case 0x1604: {
            Lcon::MsgGetDiagModeCmplt_t res;
            res.DiagnosticMode = line.diagMode;
            reply(rq, 0x1605, &res);
            return;
        }
        case 0x160E: {
            Lcon::MsgSetDiagMode_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.setDiagMode(line, f.Mode, ev), 0x160F);
            return;
        }
        case 0x160C: {
            Lcon::MsgSendAlarm_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.sendAlarm(line, f.AlarmId, ev), 0x160D);
            return;
        }
        case 0x1613: {
            Lcon::MsgStopAlarm_t f;
            (void)f.readMsg(&rq.msg, 0);
            answer(rq, model_.stopAlarm(line, f.AlarmId, ev), 0);
            return;
        }
        case 0x1600:
        case 0x1616:
        case 0x1618:
            reply(rq, rq.type + 1, nullptr);
            return;
        default:
            unanswerable(rq, "a line control message this emulation does not play");
            refuse(rq, kErrNotSupported);
            return;
    }
}

void Emulation::handleCas(Request& rq) {
    switch (rq.type) {
        case 0x1407:
        case 0x1409:
        case 0x140B:
            reply(rq, rq.type + 1, nullptr);
            return;
        case 0x140D:
            return;  // one-way
        case 0x1415: {
            Cas::MsgDialCmplt_t res;
            res.Reason = 0;
            reply(rq, 0x1416, &res);
            return;
        }
        case 0x1417: {
            Cas::MsgMatchCondition_t f;
            (void)f.readMsg(&rq.msg, 0);
            Cas::MsgMatchConditionCmplt_t res;
            res.SignalId = f.SignalId;
            res.Condition = f.Condition;
            res.Match = 0;
            reply(rq, 0x1418, &res);
            return;
        }
        default:
            unanswerable(rq, "a signalling message this emulation does not play");
            refuse(rq, kErrNotSupported);
            return;
    }
}

// ---------------------------------------------------------------- control

ControlOutcome Emulation::control(const std::string& line, Clock::time_point now) {
    ControlParse p = parseControl(line);
    if (!p.ok) {
        ControlOutcome o;
        if (!p.error.empty()) {
            o.reply = "error: " + p.error;
        }
        return o;
    }
    return control(p.cmd, now);
}

ControlOutcome Emulation::control(const ControlCommand& cmd, Clock::time_point now) {
    now_ = now;
    ControlOutcome o;
    scratch_.clear();
    auto lineOf = [&](Line*& l) {
        l = model_.line(cmd.board, static_cast<int>(cmd.trunk));
        if (!l) {
            o.reply = "error: no line " + std::to_string(cmd.board) + "." +
                      std::to_string(cmd.trunk) + " in this farm";
        }
        return l != nullptr;
    };
    auto channelOf = [&](Channel*& c) {
        c = model_.channel(cmd.board, static_cast<int>(cmd.trunk), static_cast<int>(cmd.channel));
        if (!c) {
            o.reply = "error: no channel " + std::to_string(cmd.board) + "." +
                      std::to_string(cmd.trunk) + "." + std::to_string(cmd.channel) +
                      " in this farm";
        }
        return c != nullptr;
    };
    auto codeText = [](std::uint32_t code) -> std::string {
        switch (code) {
            case kErrChannelBusy:
                return "error: the channel already has a call";
            case kErrOutOfService:
                return "error: the channel is out of service";
            case kErrNoSuchCall:
                return "error: the channel has no call";
            default:
                return "error: refused";
        }
    };
    Line* l = nullptr;
    Channel* c = nullptr;
    switch (cmd.kind) {
        case ControlKind::Call: {
            if (!channelOf(c)) {
                break;
            }
            std::uint32_t id = 0;
            std::uint32_t code = model_.incomingCall(*c, cmd.from, id, scratch_);
            char buf[32];
            std::snprintf(buf, sizeof buf, "0x%x", id);
            o.reply = code == 0 ? std::string("ok call ") + buf : codeText(code);
            break;
        }
        case ControlKind::Hangup: {
            if (!channelOf(c)) {
                break;
            }
            std::uint32_t code = model_.farEndHangup(*c, scratch_);
            o.reply = code == 0 ? "ok" : codeText(code);
            break;
        }
        case ControlKind::Alarm:
            if (lineOf(l)) {
                model_.setAlarm(*l, cmd.alarmId, cmd.on, scratch_);
                o.reply = "ok";
            }
            break;
        case ControlKind::Bpv:
        case ControlKind::Ferr:
            if (lineOf(l)) {
                if (cmd.count > 0) {
                    bursts_.push_back(Burst{
                        cmd.board, static_cast<int>(cmd.trunk),
                        cmd.kind == ControlKind::Bpv ? kAlarmBpvSaturation : kAlarmFerrSaturation,
                        cmd.count});
                }
                o.reply = "ok " + std::to_string(cmd.count);
            }
            break;
        case ControlKind::Line:
            if (lineOf(l)) {
                std::uint32_t state = cmd.on ? kInService : kOutOfService;
                if (l->state == state) {
                    o.reply = std::string("error: the line is already ") +
                              (cmd.on ? "in service" : "out of service");
                } else {
                    model_.setLineState(*l, state, cmd.reason, scratch_);
                    o.reply = "ok";
                }
            }
            break;
        case ControlKind::Refuse:
            overrides_[cmd.msgType] = {Override::Refuse, cmd.code};
            o.reply = "ok";
            break;
        case ControlKind::Silence:
            overrides_[cmd.msgType] = {Override::Silence, 0};
            o.reply = "ok";
            break;
        case ControlKind::Normal:
            overrides_.erase(cmd.msgType);
            o.reply = "ok";
            break;
        case ControlKind::Delay:
            delayMs_ = cmd.delayMs;
            o.reply = "ok";
            break;
        case ControlKind::Drop:
            o.drop = true;
            o.reply = "ok";
            break;
        case ControlKind::Stats:
            o.reply = "ok stats requests=" + std::to_string(stats_.requests) +
                      " answers=" + std::to_string(stats_.answers) +
                      " events=" + std::to_string(stats_.events) +
                      " refused=" + std::to_string(stats_.refused) +
                      " silenced=" + std::to_string(stats_.silenced) +
                      " unanswered=" + std::to_string(stats_.unanswered) +
                      " undeliverable=" + std::to_string(stats_.undeliverable) +
                      " subscriptions=" + std::to_string(model_.subscriptionCount());
            break;
        case ControlKind::Help:
            o.reply = controlHelp();
            break;
        case ControlKind::Quit:
            o.quit = true;
            o.reply = "ok bye";
            break;
    }
    publish(scratch_);
    return o;
}

bool Emulation::pumpBursts(std::size_t maxEvents, Clock::time_point now) {
    now_ = now;
    std::size_t done = 0;
    while (!bursts_.empty() && done < maxEvents) {
        Burst& b = bursts_.front();
        Line* l = model_.line(b.board, b.trunk);
        scratch_.clear();
        while (l && b.left > 0 && done < maxEvents) {
            model_.saturation(*l, b.alarm, scratch_);
            --b.left;
            ++done;
        }
        publish(scratch_);
        if (!l || b.left == 0) {
            bursts_.pop_front();
        }
    }
    return !bursts_.empty();
}

void Emulation::forget(const TKCompDesc& host) {
    model_.forget(fromTK(host));
}

}  // namespace sim
