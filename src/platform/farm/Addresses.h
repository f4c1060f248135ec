#pragma once

// Where every resource of a farm's board lives. The device map's address attributes and the
// board emulation's answers both come from these functions, so the addresses the tool discovers
// are the ones the emulation serves.
//
// Every address is on node 0 with the board's logical id in the board field. On a board:
//
//   resource                  processor  component         instance
//   board itself                  0         0                 0
//   resource manager              1         0                 5
//   cluster manager               1         0                 8
//   channel cluster               1         kCluster (2)      trunk * 32 + channel
//   line cluster                  1         kCluster (2)      0x1000 + trunk
//   ROC cluster (voice v)         1         kCluster (2)      0x2000 + v
//   TSC / CHP / CAS of channel    1         18 / 19 / 20      trunk * 32 + channel
//   LCON of line                  1         22                trunk
//   media resource of voice v     1         its type          v (SIGBUF_MF: 0x1000 + v)
//
// Trunks are 1..64 and channels 1..31, so trunk * 32 + channel is unique and below 0x1000.
// Voice channels are numbered from 1 on each flexible-routing board, trunk by trunk and channel
// by channel: voice channel v serves the v-th channel in that order.

#include <array>
#include <cstdint>
#include <optional>

#include "catalogue/generated/values.h"
#include "platform/farm/Farm.h"

namespace farm {

struct Address {
    std::uint16_t instance = 0;
    std::uint8_t board = 0;
    std::uint8_t processor = 0;
    std::uint8_t component = 0;
    std::uint8_t node = 0;
    friend bool operator==(const Address&, const Address&) = default;
};

inline constexpr std::uint8_t kBoardProcessor = 1;
inline constexpr std::uint8_t kServiceComponent = 0;
inline constexpr std::uint16_t kResourceMgrInstance = tolk::wire::ResourceMgr::Service::INSTANCE;
inline constexpr std::uint16_t kClusterMgrInstance = tolk::wire::ClusterMgr::Service::INSTANCE;
inline constexpr std::uint8_t kClusterComponent = 2;
inline constexpr std::uint8_t kTSC = tolk::wire::TSC::Component::TYPE;
inline constexpr std::uint8_t kCHP = tolk::wire::CHP::Component::TYPE;
inline constexpr std::uint8_t kCAS = tolk::wire::CAS::Component::TYPE;
inline constexpr std::uint8_t kLCON = tolk::wire::LCON::Component::TYPE;
inline constexpr std::uint16_t kLineClusterBase = 0x1000;
inline constexpr std::uint16_t kRocClusterBase = 0x2000;
inline constexpr std::uint16_t kSigBufMfBase = 0x1000;

Address boardAddress(unsigned board);
Address resourceMgrAddress(unsigned board);
Address clusterMgrAddress(unsigned board);
Address channelClusterAddress(unsigned board, int trunk, int channel);
Address lineClusterAddress(unsigned board, int trunk);
Address rocClusterAddress(unsigned board, int voiceChannel);
// type is kTSC, kCHP or kCAS.
Address channelComponentAddress(unsigned board, int trunk, int channel, std::uint8_t type);
Address lconAddress(unsigned board, int trunk);
Address mediaAddress(unsigned board, int voiceChannel, Media media);

// The closed host library's 8-byte address record (the device map's address attribute values):
// instance (16 bits, host order) at 0, board at 2, processor at 4, component at 5, node at 6;
// bytes 3 and 7 unused and written as 0.
inline constexpr std::size_t kTKCompDescSize = 8;
std::array<unsigned char, kTKCompDescSize> encodeTKCompDesc(const Address& a);
Address decodeTKCompDesc(const unsigned char* bytes);

enum class ResourceKind {
    Board,
    ResourceMgr,
    ClusterMgr,
    ChannelCluster,
    LineCluster,
    RocCluster,
    ChannelComponent,  // TSC, CHP or CAS: see `component`
    Lcon,
    Media,
};

struct Resource {
    ResourceKind kind = ResourceKind::Board;
    unsigned board = 0;
    int trunk = 0;               // channel and line resources; for voice ones, the channel served
    int channel = 0;             // channel resources; for voice ones, the channel served
    int voiceChannel = 0;        // ROC cluster and media
    std::uint8_t component = 0;  // ChannelComponent: kTSC, kCHP or kCAS
    farm::Media media = farm::Media::SigDet;  // Media only
    friend bool operator==(const Resource&, const Resource&) = default;
};

// What lives at an address on this farm; nothing for an address the farm has no resource at
// (another node, an unknown board, trunk, channel or voice channel, a media type the board lacks).
std::optional<Resource> resolve(const Farm& farm, const Address& a);

// Voice channel that serves a channel of a flexible-routing board, 0 if none.
int voiceChannelOf(const Board& board, int trunk, int channel);
// The channel a voice channel serves.
std::optional<ChannelRef> channelOfVoice(const Board& board, int voiceChannel);

}  // namespace farm
