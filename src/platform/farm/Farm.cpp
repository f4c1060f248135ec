#include "platform/farm/Farm.h"

namespace farm {

namespace {

struct MediaInfo {
    Media media;
    std::string_view name;
    const char* attribute;
    std::uint8_t componentType;
};

constexpr MediaInfo kMediaTable[] = {
    {Media::SigDet, "SIGDET", "SIGDETADDR", 7},
    {Media::SigBufDtmf, "SIGBUF_DTMF", "SIGBUFADDR_DTMF", 8},
    {Media::SigBufMf, "SIGBUF_MF", "SIGBUFADDR_MF", 8},
    {Media::ToneGen, "TONEGEN", "TONEGENADDR", 5},
    {Media::CallAnalysis, "CALLANALYSIS", "CALLANALYSISADDR", 10},
    {Media::R2Mfp, "R2MFP", "R2MFPADDR", 66},
    {Media::CallerId, "CALLERID", "CALLERIDADDR", 41},
};

const MediaInfo& info(Media m) {
    return kMediaTable[static_cast<int>(m)];
}

}  // namespace

std::string_view mediaName(Media m) {
    return info(m).name;
}
const char* mediaAttribute(Media m) {
    return info(m).attribute;
}
std::uint8_t mediaComponentType(Media m) {
    return info(m).componentType;
}

std::optional<Media> mediaFromName(std::string_view name) {
    for (const auto& row : kMediaTable) {
        if (row.name == name) {
            return row.media;
        }
    }
    return std::nullopt;
}

const Trunk* Board::trunk(int number) const {
    if (number < 1 || number > static_cast<int>(trunks.size())) {
        return nullptr;
    }
    return &trunks[static_cast<std::size_t>(number - 1)];
}

int Board::voiceChannelCount() const {
    if (!flexible()) {
        return 0;
    }
    int n = 0;
    for (const auto& t : trunks) {
        n += t.channels;
    }
    return n;
}

const Board* Farm::board(unsigned logicalId) const {
    for (const auto& b : boards) {
        if (b.logicalId == logicalId) {
            return &b;
        }
    }
    return nullptr;
}

std::optional<ChannelRef> Farm::channelForNumber(std::string_view digits) const {
    auto it = numbers.find(digits);
    if (it == numbers.end()) {
        return std::nullopt;
    }
    return it->second;
}

std::string Farm::numberOf(const ChannelRef& ch) const {
    const Board* b = board(ch.board);
    const Trunk* t = b ? b->trunk(ch.trunk) : nullptr;
    if (!t || t->firstNumber.empty() || ch.channel < 1 || ch.channel > t->channels) {
        return {};
    }
    return addToNumber(t->firstNumber, ch.channel - 1);
}

std::string addToNumber(std::string_view first, int offset) {
    if (first.empty() || offset < 0) {
        return {};
    }
    std::string out(first);
    int carry = offset;
    for (auto it = out.rbegin(); it != out.rend() && carry > 0; ++it) {
        if (*it < '0' || *it > '9') {
            return {};
        }
        int d = (*it - '0') + carry;
        *it = static_cast<char>('0' + d % 10);
        carry = d / 10;
    }
    if (carry > 0) {
        return {};
    }
    return out;
}

}  // namespace farm
