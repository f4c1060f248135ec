#pragma once

// The farm: the boards, lines and channels that the device map lists and the board emulation
// plays. Read from a TOML file (FarmParser.h); the process-wide one is in ActiveFarm.h.

#include <compare>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "catalogue/generated/values.h"

namespace farm {

inline constexpr unsigned kMaxLogicalId = 32;
// Trunk numbers stay below 65 and channel numbers below 32 everywhere in the tool.
inline constexpr int kMaxTrunks = 64;
inline constexpr int kMaxChannels = 31;
inline constexpr int kAnalogTrunkType = tolk::wire::LCON::TrunkType::ANALOG;
inline constexpr int kAnalogChannels = 4;
// The device map's voice walk has room for 256 groups of 4 voice resources.
inline constexpr int kMaxVoiceChannels = 256 * 4;
inline constexpr std::size_t kMaxTextLength = 255;  // device map text buffers are 256 bytes

enum class Routing { Fixed, Flexible };

// Values of LCON parameter 0x1602.
enum class Signaling : int { CAS = 4, CCS = 5, CLEAR = 6 };

// The voice resources of one ROC cluster, in the order in which the device map lists their
// address attributes.
enum class Media : int { SigDet, SigBufDtmf, SigBufMf, ToneGen, CallAnalysis, R2Mfp, CallerId };
inline constexpr Media kAllMedia[] = {Media::SigDet,  Media::SigBufDtmf,   Media::SigBufMf,
                                      Media::ToneGen, Media::CallAnalysis, Media::R2Mfp,
                                      Media::CallerId};

// Name in the farm file's `media` list: "SIGDET", "SIGBUF_DTMF", ...
std::string_view mediaName(Media m);
// Device map attribute that holds the resource's address: "SIGDETADDR", ...
const char* mediaAttribute(Media m);
// Component type of the resource on the board (the ComponentType of a media list entry).
std::uint8_t mediaComponentType(Media m);
std::optional<Media> mediaFromName(std::string_view name);

struct Trunk {
    int number = 0;  // from 1, in file order
    int channels = 0;
    int type = 0;  // LCON parameter 0x1601: below 4 digital, 4 analog
    Signaling signaling = Signaling::CAS;
    std::string firstNumber;  // directory number of channel 1; empty when the trunk has none

    bool analog() const { return type == kAnalogTrunkType; }
    friend bool operator==(const Trunk&, const Trunk&) = default;
};

struct Board {
    unsigned logicalId = 0;
    std::string name;
    std::string serial;
    Routing routing = Routing::Fixed;
    std::vector<Trunk> trunks;  // trunks[i].number == i + 1
    std::vector<Media> media;   // flexible routing only, in kAllMedia order

    bool flexible() const { return routing == Routing::Flexible; }
    bool analog() const { return !trunks.empty() && trunks.front().analog(); }
    const Trunk* trunk(int number) const;
    // Voice resources a flexible-routing board has: one per channel. 0 under fixed routing.
    int voiceChannelCount() const;
    friend bool operator==(const Board&, const Board&) = default;
};

struct ChannelRef {
    unsigned board = 0;
    int trunk = 0;
    int channel = 0;
    friend auto operator<=>(const ChannelRef&, const ChannelRef&) = default;
};

struct Farm {
    std::string systemName;
    std::vector<Board> boards;  // file order
    std::map<std::string, ChannelRef, std::less<>> numbers;

    const Board* board(unsigned logicalId) const;
    std::optional<ChannelRef> channelForNumber(std::string_view digits) const;
    // Directory number of a channel, empty if it has none.
    std::string numberOf(const ChannelRef& ch) const;
    friend bool operator==(const Farm&, const Farm&) = default;
};

// Directory number `offset` places after `first`, keeping its width; empty if it does not fit.
std::string addToNumber(std::string_view first, int offset);

}  // namespace farm
