#include "model/BoardManager.h"

#include <algorithm>
#include <cstring>
#include <iostream>
#include <optional>

#include "catalogue/generated/values.h"
#include "catalogue/lcon/LCON.h"
#include "model/Guarded.h"
#include "model/ParmValue.h"
#include "platform/unitmap/unitmap.h"

namespace vx7diag {

namespace {

constexpr unsigned int kMaxTrunks = 64;
constexpr unsigned int kMaxChannel = 31;
constexpr unsigned int kTextSize = 256;
constexpr unsigned int kMaxVoiceGroups = 256;
constexpr unsigned int kVoiceAUsPerGroup = 4;
constexpr unsigned int kLineAUType = 503;
constexpr unsigned int kVoiceGroupAUType = 501;
constexpr unsigned int kVoiceAUType = 502;
constexpr unsigned int kLconType = tolk::wire::LCON::Component::TYPE;
constexpr unsigned int kParmTrunkType = tolk::wire::LCON::Parm::TRUNK_TYPE;
constexpr unsigned int kParmSignalingType = tolk::wire::LCON::Parm::SIGNALING_TYPE;
constexpr unsigned int kParmRoutingMode = tolk::wire::CHP::Parm::ROUTING_MODE;
constexpr int kAnalogLine = tolk::wire::LCON::TrunkType::ANALOG;
constexpr int kAnalogChannels = 4;
constexpr int kCasSignaling = 4;

// The voice AU attributes in the order the media list takes them, with the component type each
// stands for; CLUSTERADDR names the cluster, not a medium.
struct VoiceAttribute {
    const char* name;
    unsigned int componentType;
};
constexpr unsigned int kClusterAddrIndex = 1;
constexpr VoiceAttribute kVoiceAttributes[] = {
    {"SIGDETADDR", 7},  {"CLUSTERADDR", 0},       {"SIGBUFADDR_DTMF", 8}, {"SIGBUFADDR_MF", 8},
    {"TONEGENADDR", 5}, {"CALLANALYSISADDR", 10}, {"R2MFPADDR", 66},      {"CALLERIDADDR", 41},
};
constexpr unsigned int kVoiceAttributeCount = sizeof kVoiceAttributes / sizeof kVoiceAttributes[0];

// Board-wide messages nobody asked for are of no interest to the board manager.
void BoardMgr_UnregisteredMsgHandler(tolk::Addressable*, tolk::Msg* msg) {
    delete msg;
}
void BoardMgr_UnregisteredEvtGroupHandler(tolk::Addressable*, tolk::Msg* msg) {
    delete msg;
}
void BoardMgr_UnregisteredSourceHandler(tolk::MsgQueue&, tolk::Msg* msg) {
    delete msg;
}

unsigned int LconParm(tolk::Board& board, unsigned int line, unsigned int parm,
                      unsigned int* second = nullptr, unsigned int secondParm = 0) {
    tolk::Cluster cluster = Captured([&] { return board.findClustByLCON(line); });
    tolk::TmpInstance instance = Captured([&] { return cluster.find(kLconType); });
    tolk::LCON lcon(instance);
    unsigned int value = ParmValue(lcon, parm);
    if (second != nullptr) {
        *second = ParmValue(lcon, secondParm);
    }
    return value;
}

}  // namespace

BoardManager::BoardManager(unsigned int boardNo) : boardNumber(boardNo) {
    if (OpenBoard(boardNo) != 0) {
        return;
    }
    RetrieveBoardName();
    RetrieveSerialNumber();
    switch (GetBoardType()) {
        case ANALOG_BOARD:
            RetrieveAnalogTrunkInfo();
            break;
        case DIGITAL_BOARD:
            if (RetrieveTrunkCount() > 0) {
                RetrieveTrunkInfo();
            }
            break;
        default:
            break;
    }
    routingMode = GetTocRocParmValue();
    if (routingMode == 1) {
        rocClusters = std::make_unique<std::map<unsigned int, std::unique_ptr<ROCCluster>>>();
        voiceChannelCount = 0;
        RetrieveVoiceResources();
        MapVoiceResources();
    }
}

BoardManager::~BoardManager() = default;

int BoardManager::OpenBoard(unsigned int boardNo) {
    boardNumber = boardNo;
    UM_AUID host = 0;
    int status = um_getHostAU(&host);
    if (status != UM_SUCCESS) {
        std::cout << "um_getHostAU failed:  status = " << status << std::endl;
        return -1;
    }
    hostAU = host;

    char platform[4] = "VX7";
    unsigned int logicalId = boardNo;
    um_attribute attributes[2];
    um_initAttributeStruct(&attributes[0], "CTPLATFORM", platform, sizeof platform, 0, 0);
    um_initAttributeStruct(&attributes[1], "LOGICAL ID", &logicalId, sizeof logicalId, 0, 0);
    uint32_t count = 1;
    UM_AUID found = 0;
    status = um_findAUs(hostAU, 2, attributes, &count, &found);
    // A board the map no longer lists is as absent as a failed search.
    if (status != UM_SUCCESS || count != 1) {
        return -1;
    }
    boardAU = found;

    auto made = std::make_unique<tolk::Board>(boardNo);
    made->asyncUnregisteredMsgType(BoardMgr_UnregisteredMsgHandler, 0);
    made->asyncUnregisteredEvtGroup(BoardMgr_UnregisteredEvtGroupHandler, 0);
    made->UnregisteredSource(BoardMgr_UnregisteredSourceHandler);
    board = std::move(made);
    return 0;
}

std::unique_ptr<std::string> BoardManager::ReadBoardText(const char* attribute) {
    char text[kTextSize] = {};
    um_attribute record;
    um_initAttributeStruct(&record, attribute, text, sizeof text, 0, 0);
    int status = um_getAttributes(boardAU, 1, &record);
    if (status != UM_SUCCESS) {
        std::cout << "um_getAttributes failed:  " << status << std::endl;
        return nullptr;
    }
    text[kTextSize - 1] = '\0';
    return std::make_unique<std::string>(text);
}

int BoardManager::RetrieveBoardName() {
    boardName = ReadBoardText("NAME");
    return boardName ? 0 : -1;
}

int BoardManager::RetrieveSerialNumber() {
    serialNumber = ReadBoardText("SERIAL_NUMBER");
    return serialNumber ? 0 : -1;
}

int BoardManager::RetrieveTrunkCount() {
    int count = 0;
    um_attribute record;
    um_initAttributeStruct(&record, "NUM_TRUNKS", &count, sizeof count, 0, 0);
    int status = um_getAttributes(boardAU, 1, &record);
    if (status != UM_SUCCESS) {
        std::cout << "RetreiveTrunkCount - um_getAttributes failed:  " << status << std::endl;
        numTrunks = 0;
        return -1;
    }
    numTrunks = std::clamp(count, 0, static_cast<int>(kMaxTrunks));
    return numTrunks;
}

int BoardManager::GetBoardType() {
    if (!board) {
        return 0;
    }
    unsigned int lineType = 0;
    bool read = RunGuarded(std::cout, "", [&] { lineType = LconParm(*board, 1, kParmTrunkType); });
    if (!read) {
        return 0;
    }
    if (lineType < 4) {
        return DIGITAL_BOARD;
    }
    return lineType == 4 ? ANALOG_BOARD : 0;
}

int BoardManager::RetrieveTrunkInfo() {
    uint32_t found = static_cast<uint32_t>(std::min<int>(numTrunks, kMaxTrunks));
    std::vector<UM_AUID> lines(kMaxTrunks, 0);
    unsigned int lineType = kLineAUType;
    um_attribute search;
    um_initAttributeStruct(&search, "TYPE", &lineType, sizeof lineType, 0, 0);
    int status = um_findAUs(boardAU, 1, &search, &found, lines.data());
    if (status != UM_SUCCESS) {
        std::cout << "RetreiveTrunkInfo: um_findAUs() failed status=" << status << std::endl;
        // Without line AUs there is nothing to describe a trunk by.
        numTrunks = 0;
        return -1;
    }
    numTrunks = static_cast<int>(std::min<uint32_t>(found, kMaxTrunks));
    trunkAUs.assign(lines.begin(), lines.begin() + numTrunks);

    std::vector<int> channelCounts(numTrunks, 0);
    std::vector<TKCompDesc> adminAddrs(numTrunks, TKCompDesc{});
    for (int i = 0; i < numTrunks; ++i) {
        um_attribute records[2];
        um_initAttributeStruct(&records[0], "ChannelCount", &channelCounts[i], 4, 0, 0);
        um_initAttributeStruct(&records[1], "LINEADMINADDR", &adminAddrs[i], 8, 0, 0);
        status = um_getAttributes(trunkAUs[i], 2, records);
        if (status == UM_PARTIAL) {
            for (int a = 0; a < 2; ++a) {
                std::cout << "check status: attrib " << a << " status " << records[a].status
                          << std::endl;
            }
        }
    }

    RunGuarded(std::cout, "", [&] {
        for (int i = 1; i <= numTrunks; ++i) {
            m record;
            record.channelCount =
                std::clamp(channelCounts[i - 1], 0, static_cast<int>(kMaxChannel));
            record.voiceMap.assign(record.channelCount + 1, 0);
            unsigned int signaling = 0;
            record.trunkType = static_cast<int>(
                LconParm(*board, i, kParmTrunkType, &signaling, kParmSignalingType));
            record.signalingType = static_cast<int>(signaling);
            record.lineAdminAddr = adminAddrs[i - 1];
            trunkInfo[i] = std::move(record);
        }
    });
    return 0;
}

int BoardManager::RetrieveAnalogTrunkInfo() {
    RunGuarded(std::cout, "", [&] {
        for (unsigned int i = 1; i <= kMaxTrunks; ++i) {
            // The board refusing the search for line i is the normal end of the walk, and
            // nothing to log; silence or another answer still is.
            std::optional<tolk::Cluster> cluster =
                FoundOrRefused([&] { return board->findClustByLCON(i); });
            if (!cluster) {
                return;
            }
            SetNumberOfTrunks(static_cast<int>(i));
            tolk::TmpInstance instance = Captured([&] { return cluster->find(kLconType); });
            tolk::LCON lcon(instance);
            m record;
            record.trunkType = static_cast<int>(ParmValue(lcon, kParmTrunkType));
            // A line of another type has no channels this tool can drive.
            if (record.trunkType == kAnalogLine) {
                record.channelCount = kAnalogChannels;
                record.signalingType = kCasSignaling;
            }
            record.voiceMap.assign(record.channelCount + 1, 0);
            trunkInfo[static_cast<int>(i)] = std::move(record);
        }
    });
    return 0;
}

int BoardManager::GetTocRocParmValue() {
    unsigned int mode = 0;
    // A board that cannot say counts as one without flexible routing.
    RunGuarded(std::cout, "GetTocRocParmValue - ", [&] {
        tolk::Component chp =
            Captured([&] { return board->findComp(tolk::wire::CHP::Component::TYPE, 255); });
        mode = ParmValue(chp, kParmRoutingMode);
    });
    return static_cast<int>(mode);
}

int BoardManager::RetrieveVoiceResources() {
    std::vector<UM_AUID> groups(kMaxVoiceGroups, 0);
    uint32_t groupCount = kMaxVoiceGroups;
    unsigned int groupType = kVoiceGroupAUType;
    um_attribute search;
    um_initAttributeStruct(&search, "TYPE", &groupType, 5, 0, 0);
    int status = um_findAUs(boardAU, 1, &search, &groupCount, groups.data());
    if (status != UM_SUCCESS) {
        std::cout << "um_findAUs() failed status=" << status << std::endl;
        return -1;
    }
    groupCount = std::min<uint32_t>(groupCount, kMaxVoiceGroups);

    // Set once: each later group is searched with the count the one before it returned.
    uint32_t voiceRoom = kVoiceAUsPerGroup;
    unsigned int nextVoiceChannel = 0;
    for (uint32_t g = 0; g < groupCount; ++g) {
        UM_AUID voices[kVoiceAUsPerGroup] = {};
        unsigned int voiceType = kVoiceAUType;
        um_initAttributeStruct(&search, "TYPE", &voiceType, 5, 0, 0);
        voiceRoom = std::min<uint32_t>(voiceRoom, kVoiceAUsPerGroup);
        status = um_findAUs(groups[g], 1, &search, &voiceRoom, voices);
        if (status != UM_SUCCESS) {
            std::cout << "um_findAUs() failed status=" << status << std::endl;
            continue;
        }
        for (uint32_t v = 0; v < std::min<uint32_t>(voiceRoom, kVoiceAUsPerGroup); ++v) {
            TKCompDesc addrs[kVoiceAttributeCount] = {};
            um_attribute records[kVoiceAttributeCount];
            for (unsigned int a = 0; a < kVoiceAttributeCount; ++a) {
                um_initAttributeStruct(&records[a], kVoiceAttributes[a].name, &addrs[a], 8, 0, 0);
            }
            status = um_getAttributes(voices[v], kVoiceAttributeCount, records);
            if (status != UM_SUCCESS && status != UM_PARTIAL) {
                continue;
            }
            ++nextVoiceChannel;
            if (records[kClusterAddrIndex].status != UM_SUCCESS) {
                // The channel this AU serves keeps its place and simply has no voice resources,
                // so that every later channel still finds its own.
                std::cout << "RetrieveVoiceResources: voice channel " << nextVoiceChannel
                          << " has no CLUSTERADDR" << std::endl;
                continue;
            }
            MediaList media;
            unsigned int size = 0;
            for (unsigned int a = 0; a < kVoiceAttributeCount; ++a) {
                if (a != kClusterAddrIndex && records[a].status == UM_SUCCESS) {
                    ++size;
                }
            }
            media.realloc(size);
            unsigned int next = 0;
            for (unsigned int a = 0; a < kVoiceAttributeCount; ++a) {
                if (a == kClusterAddrIndex || records[a].status != UM_SUCCESS) {
                    continue;
                }
                media.element(next)->ComponentType = kVoiceAttributes[a].componentType;
                media.element(next)->InstDesc = tolk::CompDesc_t(addrs[a]);
                ++next;
            }
            isa::RefPtr<tolk::MsgQueue> queue = board->getMsgQueue();
            auto* cluster = new tolk::Cluster(tolk::CompDesc_t(addrs[kClusterAddrIndex]), queue);
            auto roc =
                std::make_unique<ROCCluster>(cluster, static_cast<unsigned char>(size), media);
            ++voiceChannelCount;
            (*rocClusters)[nextVoiceChannel] = std::move(roc);
        }
    }
    return 0;
}

int BoardManager::MapVoiceResources() {
    if (routingMode != 1) {
        return -1;
    }
    unsigned int counter = 1;
    for (int t = 1; t <= numTrunks; ++t) {
        auto entry = trunkInfo.find(t);
        if (entry == trunkInfo.end()) {
            continue;
        }
        for (int c = 1; c <= entry->second.channelCount; ++c) {
            entry->second.voiceMap[c] = counter++;
        }
    }
    return 0;
}

std::string BoardManager::GetBoardName() const {
    return boardName ? *boardName : std::string();
}

std::string BoardManager::GetSerialNumber() const {
    return serialNumber ? *serialNumber : std::string();
}

int BoardManager::GetNumChannelsOnTrunk(unsigned int trunk) const {
    auto entry = trunkInfo.find(static_cast<int>(trunk));
    return entry == trunkInfo.end() ? 0 : entry->second.channelCount;
}

int BoardManager::GetTrunkType(unsigned int trunk) const {
    auto entry = trunkInfo.find(static_cast<int>(trunk));
    return entry == trunkInfo.end() ? -1 : entry->second.trunkType;
}

int BoardManager::GetSignalingType(unsigned int trunk) const {
    auto entry = trunkInfo.find(static_cast<int>(trunk));
    return entry == trunkInfo.end() ? -1 : entry->second.signalingType;
}

int BoardManager::GetTelephonyMediaRoutingMode(unsigned int, unsigned int) const {
    return routingMode;
}

bool BoardManager::IsFlexibleRoutingEnabled(unsigned int, unsigned int) const {
    return routingMode == 1;
}

unsigned int BoardManager::GetVoiceChannelNumber(unsigned int trunk, unsigned int channel) const {
    if (routingMode != 1 || trunk > kMaxTrunks) {
        return 0;
    }
    auto entry = trunkInfo.find(static_cast<int>(trunk));
    if (entry == trunkInfo.end()) {
        return 0;
    }
    // Only channels 1..channelCount have a voice channel; entry 0 is never one.
    if (channel < 1 || channel >= entry->second.voiceMap.size()) {
        return 0;
    }
    return entry->second.voiceMap[channel];
}

ROCCluster* BoardManager::GetTelephonyVoiceChannel(unsigned int trunk, unsigned int channel) const {
    unsigned int voice = GetVoiceChannelNumber(trunk, channel);
    if (voice == 0 || !rocClusters) {
        return nullptr;
    }
    auto entry = rocClusters->find(voice);
    return entry == rocClusters->end() ? nullptr : entry->second.get();
}

MediaList BoardManager::GetMediaResources(unsigned int trunk, unsigned int channel) const {
    if (trunk >= 65 || channel >= 32) {
        return MediaList();
    }
    ROCCluster* roc = GetTelephonyVoiceChannel(trunk, channel);
    return roc != nullptr ? roc->GetMediaDescriptors() : MediaList();
}

}  // namespace vx7diag
