// A cluster: its time slots, listening ports, members and locks.
#include <vector>

#include "catalogue/generated/cluster_bodies.h"
#include "catalogue/generated/values.h"
#include "sim/EmulationInternal.h"
#include "sim/ErrorCodes.h"

namespace sim {

using Cl = tolk::Cluster_Bodies;

namespace {

constexpr std::uint32_t kTalkPort = tolk::wire::Cluster::Port::TS_INFO;
constexpr std::uint8_t kSlotEncoding = 1;
constexpr std::uint8_t kSlotIdle = 0xFF;

}  // namespace

void Emulation::handleCluster(Request& rq, const farm::Resource&) {
    Ports* ports = model_.clusterPorts(rq.tgt);
    switch (rq.type) {
        case Cl::ClusterSlotInfo_t::MsgType: {
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
            reply(rq, Cl::ClusterSlotInfoResult_t::MsgType, &res);
            return;
        }
        case Cl::ClusterSlotAssign_t::MsgType: {
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
            reply(rq, Cl::ResultComplete_t::MsgType, nullptr);
            return;
        }
        case Cl::ClusterActivate_t::MsgType:
        case Cl::ClusterDeactivate_t::MsgType:
        case Cl::ClusterSlotUnassign_t::MsgType: {
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
            if (rq.type == Cl::ClusterActivate_t::MsgType) {
                if (l.active) {
                    refuse(rq, kErrBadState);
                    return;
                }
                l.active = true;
            } else if (rq.type == Cl::ClusterDeactivate_t::MsgType) {
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
            reply(rq, Cl::ResultComplete_t::MsgType, nullptr);
            return;
        }
        case Cl::ClusterCompInfo_t::MsgType: {
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
            reply(rq, Cl::ClusterCompInfoResult_t::MsgType, &res);
            return;
        }
        case Cl::ClusterAttrAdd_t::MsgType:
        case Cl::ClusterAttrRemove_t::MsgType:
        case Cl::ClusterLock_t::MsgType:
            reply(rq, Cl::ResultComplete_t::MsgType, nullptr);
            return;
        case Cl::ClusterUnlock_t::MsgType: {
            Cl::ClusterUnlockCmplt_t res;
            res.unlocked = 1;
            res.count = 0;
            reply(rq, Cl::ClusterUnlockCmplt_t::MsgType, &res);
            return;
        }
        case Cl::ClusterConnect_t::MsgType:
        case Cl::ClusterDisconnect_t::MsgType:
            return;  // one-way
        default:
            unanswerable(rq, "not a cluster message this emulation plays");
            refuse(rq, kErrNotSupported);
            return;
    }
}

}  // namespace sim
