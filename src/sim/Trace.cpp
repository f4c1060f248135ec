#include "sim/Trace.h"

#include <algorithm>
#include <memory>
#include <sstream>

#include "catalogue/generated/cas_bodies.h"
#include "catalogue/generated/chp_bodies.h"
#include "catalogue/generated/cluster_bodies.h"
#include "catalogue/generated/clustermgr_bodies.h"
#include "catalogue/generated/lcon_bodies.h"
#include "catalogue/generated/resourcemgr_bodies.h"
#include "catalogue/generated/stdresource_bodies.h"
#include "catalogue/generated/tsc_bodies.h"
#include "framework/Msg.h"
#include "framework/MsgEvtDetected_t.h"
#include "platform/farm/Addresses.h"
#include "platform/tkhost/tkhost_switch.h"
#include "transport/TKSMsgRef.h"

namespace sim {
namespace {

struct Table {
    tolk::MsgBody* (*msgLookup)(unsigned int);
    tolk::MsgBody* (*evtLookup)(unsigned int);
    const char* (*msgTypeName)(unsigned int);
    const char* (*evtGroupName)(unsigned int);
};

template <class Bodies>
constexpr Table tableOf() {
    return Table{&Bodies::msgLookup, &Bodies::evtLookup, &Bodies::msgTypeName,
                 &Bodies::evtGroupName};
}

constexpr Table kStd = tableOf<tolk::StdResource_Bodies>();
constexpr Table kAll[] = {
    tableOf<tolk::StdResource_Bodies>(), tableOf<tolk::TSC_Bodies>(),
    tableOf<tolk::LCON_Bodies>(),        tableOf<tolk::CAS_Bodies>(),
    tableOf<tolk::CHP_Bodies>(),         tableOf<tolk::Cluster_Bodies>(),
    tableOf<tolk::ClusterMgr_Bodies>(),  tableOf<tolk::ResourceMgr_Bodies>(),
};

// Some numbers mean different bodies on different resources (0x16 of a TSC is not the standard
// one): the resource on the board's side of the message decides first.
const Table* ownTable(const TKCompDesc& a) {
    static constexpr Table tsc = tableOf<tolk::TSC_Bodies>();
    static constexpr Table lcon = tableOf<tolk::LCON_Bodies>();
    static constexpr Table cas = tableOf<tolk::CAS_Bodies>();
    static constexpr Table chp = tableOf<tolk::CHP_Bodies>();
    static constexpr Table cluster = tableOf<tolk::Cluster_Bodies>();
    static constexpr Table clusterMgr = tableOf<tolk::ClusterMgr_Bodies>();
    static constexpr Table resourceMgr = tableOf<tolk::ResourceMgr_Bodies>();
    switch (a.component) {
        case farm::kTSC:
            return &tsc;
        case farm::kLCON:
            return &lcon;
        case farm::kCAS:
            return &cas;
        case farm::kCHP:
            return &chp;
        case farm::kClusterComponent:
            return &cluster;
        case farm::kServiceComponent:
            if (a.instance == farm::kResourceMgrInstance) {
                return &resourceMgr;
            }
            if (a.instance == farm::kClusterMgrInstance) {
                return &clusterMgr;
            }
            return nullptr;
        default:
            return nullptr;
    }
}

// The first table, own one first, that knows the number.
template <class F>
auto firstKnown(const Table* own, F f) -> decltype(f(kStd)) {
    if (own) {
        if (auto r = f(*own)) {
            return r;
        }
    }
    for (const Table& t : kAll) {
        if (auto r = f(t)) {
            return r;
        }
    }
    return {};
}

void address(std::ostream& os, const TKCompDesc& a) {
    os << 'n' << unsigned{a.node} << ".b" << unsigned{a.board} << ".p" << unsigned{a.processor}
       << ".c" << unsigned{a.component} << ".i" << a.instance;
}

}  // namespace

std::string traceLine(std::string_view direction, std::uint64_t conn, const TKMsg32Bit* block) {
    // The library's own header access: it reads and never changes the block.
    TKMsg32Bit* header = const_cast<TKMsg32Bit*>(block);
    TKCompDesc src{};
    TKCompDesc tgt{};
    (void)tkMsgFieldGet(header, TK_FIELD_SRC, &src);
    (void)tkMsgFieldGet(header, TK_FIELD_TGT, &tgt);
    const Table* own = ownTable(tgt.board != TK_HOST_BOARD ? tgt : src);

    // A copy, so that reading it cannot disturb the block on its way.
    TKSMsgRef view(header);
    TKSMsgRef copy = view.clone();
    tolk::Msg msg(&copy);

    std::ostringstream os;
    os << direction << " conn " << conn << ' ';
    address(os, src);
    os << " -> ";
    address(os, tgt);
    os << ' ';
    std::unique_ptr<tolk::MsgBody> body;
    if (const char* name =
            firstKnown(own, [&](const Table& t) { return t.msgTypeName(block->type); })) {
        os << name;
    } else {
        os << "type 0x" << std::hex << block->type << std::dec;
    }
    if (block->type == tolk::MsgEvtDetected_t::Type && block->size >= 4) {
        const unsigned char* p = tkMsgBody(header);
        unsigned int group = (unsigned{p[0]} << 24) | (unsigned{p[1]} << 16) |
                             (unsigned{p[2]} << 8) | unsigned{p[3]};
        if (const char* name =
                firstKnown(own, [&](const Table& t) { return t.evtGroupName(group); })) {
            os << ' ' << name;
            body.reset(firstKnown(own, [&](const Table& t) { return t.evtLookup(group); }));
        } else {
            os << " group 0x" << std::hex << group << std::dec;
        }
    }
    if (!body) {
        body.reset(firstKnown(own, [&](const Table& t) { return t.msgLookup(block->type); }));
    }
    os << " trans " << (block->transTag >> 8);
    if (body) {
        std::ostringstream text;
        try {
            body->readMsg(&msg, 0);
            body->toStream(&text);
        } catch (...) {
            // A body that cannot be read still leaves a line: what went wrong is in the bytes.
            text.str("");
            text << block->size << " bytes, unreadable";
        }
        std::string t = text.str();
        std::replace(t.begin(), t.end(), '\n', ' ');
        os << ' ' << t;
    } else if (block->size > 0) {
        os << ' ' << block->size << " bytes";
    }
    return os.str();
}

}  // namespace sim
