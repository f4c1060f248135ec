// Random blocks and control lines into the emulation core: nothing a client sends may crash it
// or make it read outside a block.
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <sstream>
#include <string>

#include "platform/farm/ActiveFarm.h"
#include "platform/farm/Addresses.h"
#include "platform/tkhost/tkhost.h"
#include "sim/Emulation.h"

namespace {

// Types the model sends, so that most inputs reach a real handler.
constexpr std::uint32_t kTypes[] = {
    0x02,     0x08,     0x0A,     0x12,     0x14,     0x16,     0x18,     0x1A,     0x1C,
    0x1E,     0x2D,     0x800053, 0x80001E, 0x80001D, 0x80003D, 0x80003E, 0x800059, 0x80005A,
    0x800032, 0x800030, 0x80001B, 0x800023, 0x800036, 0x800027, 0x800057, 0x1214,   0x1201,
    0x1200,   0x120A,   0x121C,   0x121D,   0x120D,   0x120F,   0x121F,   0x1246,   0x1224,
    0x1222,   0x1234,   0x1236,   0x1242,   0x1244,   0x124E,   0x1608,   0x1610,   0x1602,
    0x1606,   0x1604,   0x160E,   0x160C,   0x1613,   0x1417,   0x1415,   0x1211,   0x121E,
    0x1202,   0x1212,   0x1207,   0x1203,   0x122D};

sim::Emulation& emulation() {
    static std::ostringstream log;
    static sim::Emulation emu(farm::activeFarm().farm, log);
    return emu;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size < 4) {
        return 0;
    }
    sim::Emulation& emu = emulation();
    if (data[0] == 0xC0) {
        std::string line(reinterpret_cast<const char*>(data + 1), size - 1);
        if (line.rfind("delay", 0) != 0 && line.find("bpv") == std::string::npos &&
            line.find("ferr") == std::string::npos) {
            (void)emu.control(line);
        }
    } else {
        // Byte 0 picks the type, byte 1 the target kind, byte 2 a trunk/channel, rest the body.
        std::uint32_t type = kTypes[data[0] % (sizeof kTypes / sizeof kTypes[0])];
        unsigned int board = 1 + data[1] % 3;
        int n = 1 + data[2] % 4;
        farm::Address tgt;
        switch (data[1] >> 5) {
            case 0:
                tgt = farm::resourceMgrAddress(board);
                break;
            case 1:
                tgt = farm::clusterMgrAddress(board);
                break;
            case 2:
                tgt = farm::channelClusterAddress(board, 1, n);
                break;
            case 3:
                tgt = farm::rocClusterAddress(board, n);
                break;
            case 4:
                tgt = farm::lconAddress(board, 1 + (n & 1));
                break;
            case 5:
                tgt = farm::channelComponentAddress(board, 1, n, farm::kCAS);
                break;
            default:
                tgt = farm::channelComponentAddress(board, 1, n, farm::kTSC);
                break;
        }
        std::size_t bodySize = size - 3;
        TKMsg32Bit* b = nullptr;
        if (tkMsgAllocate(static_cast<unsigned int>(bodySize), &b) != 0 || !b) {
            return 0;
        }
        b->type = type;
        b->transTag = 0x1234u << 8;
        b->srcBoard = 0xFF;
        b->srcInstance = 1;
        b->tgtInstance = tgt.instance;
        b->tgtBoard = tgt.board;
        b->tgtProcessor = tgt.processor;
        b->tgtComponent = tgt.component;
        b->tgtNode = tgt.node;
        std::memcpy(tkMsgBody(b), data + 3, bodySize);
        emu.receive(b);
    }
    while (emu.burstsPending()) {
        emu.pumpBursts(1024);
    }
    auto far = sim::Clock::now() + std::chrono::hours(24);
    while (TKMsg32Bit* out = emu.popDue(far)) {
        tkMsgFree(out);
    }
    return 0;
}
