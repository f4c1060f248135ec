// Random TOML text into the farm parser: any input gives a farm or one error line, never a
// crash, and a farm that parses has every value in range.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>

#include "platform/farm/Addresses.h"
#include "platform/farm/FarmParser.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    std::string_view text(reinterpret_cast<const char*>(data), size);
    std::string error;
    auto f = farm::parseFarm(text, "fuzz.toml", error);
    if (!f) {
        if (error.empty() || error.find('\n') != std::string::npos) {
            std::abort();
        }
        return 0;
    }
    for (const auto& b : f->boards) {
        if (b.logicalId > farm::kMaxLogicalId || b.trunks.size() > farm::kMaxTrunks ||
            b.voiceChannelCount() > farm::kMaxVoiceChannels) {
            std::abort();
        }
        for (const auto& t : b.trunks) {
            if (t.channels < 1 || t.channels > farm::kMaxChannels) {
                std::abort();
            }
            for (int c = 1; c <= t.channels; ++c) {
                auto a = farm::channelComponentAddress(b.logicalId, t.number, c, farm::kTSC);
                auto r = farm::resolve(*f, a);
                if (!r || r->trunk != t.number || r->channel != c) {
                    std::abort();
                }
            }
        }
    }
    return 0;
}
