// The emulation's core alone, without a serving thread: what it logs, what it refuses and
// that the same requests always give the same bytes.

#include "sim/Emulation.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstring>
#include <functional>
#include <memory>
#include <sstream>
#include <vector>

#include "catalogue/generated/stdresource_bodies.h"
#include "catalogue/generated/tsc_bodies.h"
#include "framework/Msg.h"
#include "platform/farm/ActiveFarm.h"
#include "platform/farm/Addresses.h"
#include "platform/farm/FarmParser.h"
#include "platform/tkhost/tkhost.h"
#include "sim/ErrorCodes.h"

namespace sim {
namespace {

using tolk::CompDesc_t;
using Std = tolk::StdResource_Bodies;

TKMsg32Bit* block(std::uint32_t type, const farm::Address& tgt, std::uint32_t trans,
                  const std::vector<unsigned char>& body) {
    TKMsg32Bit* b = nullptr;
    EXPECT_EQ(tkMsgAllocate(static_cast<unsigned int>(body.size()), &b), 0);
    b->type = type;
    b->transTag = trans << 8;
    b->srcBoard = 0xFF;
    b->srcInstance = 1;
    b->tgtInstance = tgt.instance;
    b->tgtBoard = tgt.board;
    b->tgtProcessor = tgt.processor;
    b->tgtComponent = tgt.component;
    b->tgtNode = tgt.node;
    if (!body.empty()) {
        std::memcpy(tkMsgBody(b), body.data(), body.size());
    }
    return b;
}

// Every block the emulation sends, header and body, as bytes.
std::vector<std::vector<unsigned char>> drain(Emulation& emu) {
    std::vector<std::vector<unsigned char>> out;
    while (emu.burstsPending()) {
        emu.pumpBursts(64);
    }
    while (TKMsg32Bit* b = emu.popDue(Clock::now() + std::chrono::hours(1))) {
        const unsigned char* p = reinterpret_cast<const unsigned char*>(b);
        out.emplace_back(p, p + sizeof(TKMsg32Bit) + b->size);
        tkMsgFree(b);
    }
    return out;
}

std::vector<unsigned char> bytesOf(tolk::MsgBody& body) {
    tolk::Msg m(body.GetByteSize());
    (void)body.writeMsg(&m, 0);
    const unsigned char* p = tkMsgBody(m.getMsgRef());
    return std::vector<unsigned char>(p, p + m.getSize());
}

std::shared_ptr<const farm::Farm> defaultFarm() {
    std::string error;
    auto f = farm::parseFarm(farm::builtinFarmText(), "default", error);
    EXPECT_TRUE(f) << error;
    return std::make_shared<const farm::Farm>(*f);
}

TEST(EmulationCore, WhatItCannotAnswerIsLoggedByTypeAndTarget) {
    std::ostringstream log;
    Emulation emu(defaultFarm(), log);
    // No such board: nobody is there to answer, so nothing comes back.
    emu.receive(block(0x1214, farm::channelComponentAddress(9, 1, 1, farm::kTSC), 1, {}));
    EXPECT_TRUE(drain(emu).empty());
    // A message this channel's TSC does not play (ParkCall) and one a CHP does not take.
    emu.receive(block(0x1216, farm::channelComponentAddress(1, 1, 2, farm::kTSC), 2, {}));
    emu.receive(block(0x1415, farm::channelComponentAddress(1, 1, 2, farm::kCHP), 3, {}));
    auto out = drain(emu);
    ASSERT_EQ(out.size(), 2u);
    for (const auto& b : out) {
        const auto* h = reinterpret_cast<const TKMsg32Bit*>(b.data());
        EXPECT_EQ(h->type, 0u);  // MsgError_t
        EXPECT_EQ(h->srcInstance, 34);
        EXPECT_EQ(h->srcBoard, 1);
    }
    EXPECT_EQ(emu.stats().unanswered, 3u);
    const std::string text = log.str();
    EXPECT_NE(text.find("0x1214 to {Node 0 Board 9 Processor 1 Component 18 Instance 33}"),
              std::string::npos)
        << text;
    EXPECT_NE(text.find("0x1216 to {Node 0 Board 1 Processor 1 Component 18 Instance 34}"),
              std::string::npos)
        << text;
    EXPECT_NE(text.find("0x1415 to {Node 0 Board 1 Processor 1 Component 19 Instance 34}"),
              std::string::npos)
        << text;
}

TEST(EmulationCore, TheBoardItselfAnswersNothingAndMediaTakeOnlyStandardOperations) {
    std::ostringstream log;
    Emulation emu(defaultFarm(), log);
    emu.receive(block(0x02, farm::boardAddress(1), 1, {}));
    EXPECT_TRUE(drain(emu).empty());
    EXPECT_NE(log.str().find("the board itself takes no messages"), std::string::npos) << log.str();

    const farm::Address media = farm::mediaAddress(2, 11, farm::Media::SigDet);
    emu.receive(block(0x02, media, 2, {}));
    emu.receive(block(0x1415, media, 3, {}));
    auto out = drain(emu);
    ASSERT_EQ(out.size(), 2u);
    EXPECT_EQ(reinterpret_cast<const TKMsg32Bit*>(out[0].data())->type, 0x03u);
    EXPECT_EQ(reinterpret_cast<const TKMsg32Bit*>(out[1].data())->type, 0u);  // MsgError_t
    EXPECT_NE(log.str().find("not a message of this component"), std::string::npos) << log.str();
    EXPECT_EQ(emu.stats().unanswered, 2u);
}

TEST(EmulationCore, SameRequestsAndControlLinesGiveTheSameBytes) {
    auto run = [] {
        std::ostringstream log;
        Emulation emu(defaultFarm(), log);
        auto tsc = farm::channelComponentAddress(1, 1, 1, farm::kTSC);
        // Subscribe the whole call state group and two lines' alarms, then call a farm number,
        // and let the network ring, hang up and raise alarms.
        for (const auto& [target, group] :
             {std::pair{tsc, 0x1230u}, std::pair{farm::lconAddress(1, 1), 0x1600u},
              std::pair{farm::lconAddress(1, 2), 0x1600u}}) {
            Std::MsgDetectEvt_t sub;
            sub.RetAddr = CompDesc_t(1, 0xFF, 0, 0, 0);
            sub.EvtType = group;
            sub.EvtGroup = group;
            emu.receive(block(0x16, target, 7, bytesOf(sub)));
        }
        std::vector<unsigned char> call(128 + 128 + 1, 0);
        std::memcpy(call.data(), "5551234", 7);
        std::memcpy(call.data() + 128, "5551212", 7);
        emu.receive(block(0x1214, tsc, 8, call));
        emu.control("alarm 1 1 red on");
        emu.control("bpv 1 2 5");
        emu.control("call 1 2 3 777");
        emu.control("hangup 1 1 23");
        return drain(emu);
    };
    auto first = run();
    auto second = run();
    // Acks, the completion, the call's four states, red and five BPV saturations.
    EXPECT_GE(first.size(), 14u);
    EXPECT_EQ(first, second);
}

}  // namespace
}  // namespace sim
