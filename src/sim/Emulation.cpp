// The emulation's front: a block comes in, an override may answer it, and the table of handlers
// sends it to the unit of the component it targets.
#include "sim/Emulation.h"

#include <ostream>

#include "catalogue/generated/stdresource_bodies.h"
#include "sim/EmulationInternal.h"
#include "sim/ErrorCodes.h"
#include "transport/TKSMsgRef.h"

namespace sim {

namespace {

Address fromTK(const TKCompDesc& d) {
    return Address{d.instance, d.board, d.processor, d.component, d.node};
}

}  // namespace

Emulation::Emulation(std::shared_ptr<const farm::Farm> farm, std::ostream& log)
    : model_(farm), log_(log) {
    indexComponents(*farm);
}

Emulation::~Emulation() {
    for (Queued& q : outbox_) {
        tkMsgFree(q.block);
    }
}

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
    using Kind = farm::ResourceKind;
    // A component takes the standard operations first; one whose type has no handler here (CHP,
    // the media) plays nothing else.
    struct Route {
        Kind kind;
        std::uint8_t component;  // 0: any
        Handler handler;
    };
    static constexpr Route kRoutes[] = {
        {Kind::ResourceMgr, 0, &Emulation::handleResourceMgr},
        {Kind::ClusterMgr, 0, &Emulation::handleClusterMgr},
        {Kind::ChannelCluster, 0, &Emulation::handleCluster},
        {Kind::LineCluster, 0, &Emulation::handleCluster},
        {Kind::RocCluster, 0, &Emulation::handleCluster},
        {Kind::Lcon, 0, &Emulation::handleLcon},
        {Kind::ChannelComponent, farm::kTSC, &Emulation::handleTsc},
        {Kind::ChannelComponent, farm::kCAS, &Emulation::handleCas},
        {Kind::Board, 0, &Emulation::handleBoard},
    };
    bool component =
        r->kind == Kind::ChannelComponent || r->kind == Kind::Lcon || r->kind == Kind::Media;
    // The standard operations of every resource take the lowest numbers, up to the last of them.
    if (component && rq.type <= tolk::StdResource_Bodies::MsgSetVParmCmplt_t::MsgType) {
        handleStd(rq, *r);
        return;
    }
    for (const Route& route : kRoutes) {
        if (route.kind == r->kind && (route.component == 0 || route.component == r->component)) {
            (this->*route.handler)(rq, *r);
            return;
        }
    }
    unanswerable(rq, "not a message of this component");
    refuse(rq, kErrNotSupported);
}

void Emulation::handleBoard(Request& rq, const farm::Resource&) {
    unanswerable(rq, "the board itself takes no messages");
}

void Emulation::forget(const TKCompDesc& host) {
    model_.forget(fromTK(host));
}

}  // namespace sim
