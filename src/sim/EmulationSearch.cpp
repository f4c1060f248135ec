// Searches: every component of the farm, by board, with what a search can ask of it.
#include <algorithm>

#include "catalogue/generated/values.h"
#include "sim/EmulationInternal.h"

namespace sim {

namespace {

// Address comparisons for searches: 0xFFFF or 0 in a start descriptor's instance means any.
bool instanceMatches(std::uint16_t want, std::uint16_t have) {
    return want == kAnyInstance || want == 0 || want == have;
}

}  // namespace

void Emulation::indexComponents(const farm::Farm& farm) {
    for (const farm::Board& b : farm.boards) {
        auto& list = components_[b.logicalId];
        for (const farm::Trunk& t : b.trunks) {
            for (int c = 1; c <= t.channels; ++c) {
                Address cluster = farm::channelClusterAddress(b.logicalId, t.number, c);
                for (std::uint8_t type : {farm::kTSC, farm::kCHP, farm::kCAS}) {
                    Address a = farm::channelComponentAddress(b.logicalId, t.number, c, type);
                    if (farm::resolve(farm, a)) {
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
            case tolk::wire::TSC::Attr::TRUNK:
                trunk = a.value;
                break;
            case tolk::wire::TSC::Attr::CHANNEL:
                channel = a.value;
                break;
            case tolk::wire::LCON::Attr::LINE:
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

}  // namespace sim
