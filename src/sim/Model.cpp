// The farm's boards as the emulation holds them: a channel per TSC, a line per LCON, the ports
// of every cluster.
#include "sim/Model.h"

namespace sim {

std::uint64_t addressKey(const Address& a) {
    return (std::uint64_t{a.node} << 40) | (std::uint64_t{a.board} << 32) |
           (std::uint64_t{a.processor} << 24) | (std::uint64_t{a.component} << 16) | a.instance;
}

Model::Model(std::shared_ptr<const farm::Farm> farm) : farm_(std::move(farm)) {
    for (const farm::Board& b : farm_->boards) {
        for (const farm::Trunk& t : b.trunks) {
            auto line = std::make_unique<Line>();
            line->board = b.logicalId;
            line->trunk = t.number;
            line->type = t.type;
            line->signaling =
                t.analog() ? static_cast<int>(farm::Signaling::CAS) : static_cast<int>(t.signaling);
            line->lcon = farm::lconAddress(b.logicalId, t.number);
            for (int c = 1; c <= t.channels; ++c) {
                auto ch = std::make_unique<Channel>();
                ch->ref = farm::ChannelRef{b.logicalId, t.number, c};
                ch->line = line.get();
                ch->number = farm_->numberOf(ch->ref);
                ch->flexible = b.flexible();
                ch->tsc = farm::channelComponentAddress(b.logicalId, t.number, c, farm::kTSC);
                ch->ports.txSlot = static_cast<std::uint16_t>(t.number * 32 + c);
                ch->chanState = ch->flexible ? chan::MediaDetached : chan::Active;
                line->channels.push_back(ch.get());
                channels_[addressKey(ch->tsc)] = std::move(ch);
            }
            lines_[addressKey(line->lcon)] = std::move(line);
        }
        for (int v = 1; v <= b.voiceChannelCount(); ++v) {
            Ports p;
            p.txSlot = static_cast<std::uint16_t>(0x1000 + v);
            rocPorts_[addressKey(farm::rocClusterAddress(b.logicalId, v))] = p;
        }
    }
}

Channel* Model::channel(unsigned board, int trunk, int channel) {
    if (trunk < 1 || trunk > farm::kMaxTrunks || channel < 1 || channel > farm::kMaxChannels) {
        return nullptr;
    }
    auto it = channels_.find(
        addressKey(farm::channelComponentAddress(board, trunk, channel, farm::kTSC)));
    return it == channels_.end() ? nullptr : it->second.get();
}

Line* Model::line(unsigned board, int trunk) {
    if (trunk < 1 || trunk > farm::kMaxTrunks) {
        return nullptr;
    }
    auto it = lines_.find(addressKey(farm::lconAddress(board, trunk)));
    return it == lines_.end() ? nullptr : it->second.get();
}

Ports* Model::clusterPorts(const Address& cluster) {
    auto r = farm::resolve(*farm_, cluster);
    if (!r) {
        return nullptr;
    }
    if (r->kind == farm::ResourceKind::ChannelCluster) {
        Channel* ch = channel(r->board, r->trunk, r->channel);
        return ch ? &ch->ports : nullptr;
    }
    if (r->kind == farm::ResourceKind::RocCluster) {
        auto it = rocPorts_.find(addressKey(cluster));
        return it == rocPorts_.end() ? nullptr : &it->second;
    }
    return nullptr;
}

}  // namespace sim
