#include "platform/farm/Addresses.h"

#include <cstring>

namespace farm {

namespace {

Address onBoard(unsigned board, std::uint8_t component, unsigned instance) {
    Address a;
    a.instance = static_cast<std::uint16_t>(instance);
    a.board = static_cast<std::uint8_t>(board);
    a.processor = kBoardProcessor;
    a.component = component;
    return a;
}

unsigned channelInstance(int trunk, int channel) {
    return static_cast<unsigned>(trunk) * 32u + static_cast<unsigned>(channel);
}

bool hasChannel(const Board& b, int trunk, int channel) {
    const Trunk* t = b.trunk(trunk);
    return t && channel >= 1 && channel <= t->channels;
}

std::optional<Resource> voiceResource(const Board& b, ResourceKind kind, int voice) {
    auto ch = channelOfVoice(b, voice);
    if (!ch) {
        return std::nullopt;
    }
    Resource r;
    r.kind = kind;
    r.board = b.logicalId;
    r.trunk = ch->trunk;
    r.channel = ch->channel;
    r.voiceChannel = voice;
    return r;
}

std::optional<Resource> resolveMedia(const Board& b, const Address& a) {
    for (Media m : b.media) {
        if (mediaComponentType(m) != a.component) {
            continue;
        }
        int voice = a.instance;
        if (m == Media::SigBufMf) {
            voice -= kSigBufMfBase;
        } else if (m == Media::SigBufDtmf && voice >= kSigBufMfBase) {
            continue;
        }
        auto r = voiceResource(b, ResourceKind::Media, voice);
        if (r) {
            r->media = m;
            return r;
        }
    }
    return std::nullopt;
}

}  // namespace

Address boardAddress(unsigned board) {
    Address a;
    a.board = static_cast<std::uint8_t>(board);
    return a;
}

Address resourceMgrAddress(unsigned board) {
    return onBoard(board, kServiceComponent, kResourceMgrInstance);
}

Address clusterMgrAddress(unsigned board) {
    return onBoard(board, kServiceComponent, kClusterMgrInstance);
}

Address channelClusterAddress(unsigned board, int trunk, int channel) {
    return onBoard(board, kClusterComponent, channelInstance(trunk, channel));
}

Address lineClusterAddress(unsigned board, int trunk) {
    return onBoard(board, kClusterComponent, kLineClusterBase + static_cast<unsigned>(trunk));
}

Address rocClusterAddress(unsigned board, int voiceChannel) {
    return onBoard(board, kClusterComponent, kRocClusterBase + static_cast<unsigned>(voiceChannel));
}

Address channelComponentAddress(unsigned board, int trunk, int channel, std::uint8_t type) {
    return onBoard(board, type, channelInstance(trunk, channel));
}

Address lconAddress(unsigned board, int trunk) {
    return onBoard(board, kLCON, static_cast<unsigned>(trunk));
}

Address mediaAddress(unsigned board, int voiceChannel, Media media) {
    unsigned instance = static_cast<unsigned>(voiceChannel);
    if (media == Media::SigBufMf) {
        instance += kSigBufMfBase;
    }
    return onBoard(board, mediaComponentType(media), instance);
}

std::array<unsigned char, kTKCompDescSize> encodeTKCompDesc(const Address& a) {
    std::array<unsigned char, kTKCompDescSize> out{};
    std::memcpy(out.data(), &a.instance, sizeof a.instance);
    out[2] = a.board;
    out[4] = a.processor;
    out[5] = a.component;
    out[6] = a.node;
    return out;
}

Address decodeTKCompDesc(const unsigned char* bytes) {
    Address a;
    std::memcpy(&a.instance, bytes, sizeof a.instance);
    a.board = bytes[2];
    a.processor = bytes[4];
    a.component = bytes[5];
    a.node = bytes[6];
    return a;
}

std::optional<Resource> resolve(const Farm& farm, const Address& a) {
    const Board* b = a.node == 0 ? farm.board(a.board) : nullptr;
    if (!b) {
        return std::nullopt;
    }
    Resource r;
    r.board = b->logicalId;
    if (a.processor == 0) {
        if (a.component == 0 && a.instance == 0) {
            return r;
        }
        return std::nullopt;
    }
    if (a.processor != kBoardProcessor) {
        return std::nullopt;
    }
    const int trunk = a.instance / 32;
    const int channel = a.instance % 32;
    switch (a.component) {
        case kServiceComponent:
            if (a.instance == kResourceMgrInstance) {
                r.kind = ResourceKind::ResourceMgr;
                return r;
            }
            if (a.instance == kClusterMgrInstance) {
                r.kind = ResourceKind::ClusterMgr;
                return r;
            }
            return std::nullopt;
        case kClusterComponent:
            if (a.instance >= kRocClusterBase) {
                return b->flexible() ? voiceResource(*b, ResourceKind::RocCluster,
                                                     a.instance - kRocClusterBase)
                                     : std::nullopt;
            }
            if (a.instance >= kLineClusterBase) {
                r.kind = ResourceKind::LineCluster;
                r.trunk = a.instance - kLineClusterBase;
                return b->trunk(r.trunk) ? std::optional(r) : std::nullopt;
            }
            if (!hasChannel(*b, trunk, channel)) {
                return std::nullopt;
            }
            r.kind = ResourceKind::ChannelCluster;
            r.trunk = trunk;
            r.channel = channel;
            return r;
        case kTSC:
        case kCHP:
        case kCAS:
            if (!hasChannel(*b, trunk, channel)) {
                return std::nullopt;
            }
            r.kind = ResourceKind::ChannelComponent;
            r.trunk = trunk;
            r.channel = channel;
            r.component = a.component;
            return r;
        case kLCON:
            if (!b->trunk(a.instance)) {
                return std::nullopt;
            }
            r.kind = ResourceKind::Lcon;
            r.trunk = a.instance;
            return r;
        default:
            return b->flexible() ? resolveMedia(*b, a) : std::nullopt;
    }
}

int voiceChannelOf(const Board& board, int trunk, int channel) {
    if (!board.flexible() || !hasChannel(board, trunk, channel)) {
        return 0;
    }
    int v = 0;
    for (const auto& t : board.trunks) {
        if (t.number == trunk) {
            return v + channel;
        }
        v += t.channels;
    }
    return 0;
}

std::optional<ChannelRef> channelOfVoice(const Board& board, int voiceChannel) {
    if (!board.flexible() || voiceChannel < 1) {
        return std::nullopt;
    }
    int v = voiceChannel;
    for (const auto& t : board.trunks) {
        if (v <= t.channels) {
            return ChannelRef{board.logicalId, t.number, v};
        }
        v -= t.channels;
    }
    return std::nullopt;
}

}  // namespace farm
