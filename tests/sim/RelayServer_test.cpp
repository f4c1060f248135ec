// vx7sim's server over TCP: the framework's remote transport on one side, raw sockets for what a
// well-behaved client never sends.
#include "sim/RelayServer.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <chrono>
#include <condition_variable>
#include <cstring>
#include <memory>
#include <mutex>
#include <set>
#include <sstream>
#include <streambuf>
#include <string>
#include <thread>

#include "BoardEvents.h"
#include "RawClient.h"
#include "catalogue/generated/lcon_bodies.h"
#include "catalogue/generated/stdresource_bodies.h"
#include "catalogue/generated/tsc_bodies.h"
#include "framework/Addressable.h"
#include "framework/Msg.h"
#include "platform/farm/ActiveFarm.h"
#include "platform/farm/Addresses.h"
#include "transport/TKSFrame.h"

namespace sim {
namespace {

// Bodies without fields, for the requests that carry none.
tolk::LCON_Bodies::MsgGetLineState_t getLine;
tolk::TSC_Bodies::MsgGetChanState_t getChan;

using testsupport::BoardEvents;
using testsupport::cd;
using testsupport::Event;
using tolk::Addressable;
using tolk::CompDesc_t;
using Std = tolk::StdResource_Bodies;
using Tsc = tolk::TSC_Bodies;
using Lcon = tolk::LCON_Bodies;

class RelayTest : public testing::Test {
  protected:
    void SetUp() override {
        farm::resetActiveFarm();
        unsetenv("VX7_FARM");
        unsetenv("HOST");
        auto load = farm::activeFarm();
        ASSERT_TRUE(load.farm);
        farm_ = load.farm;
        start(defaults());
    }
    void TearDown() override {
        unsetenv("REMOTE_TKHOST");
        halt();
    }
    static RelayOptions defaults() {
        RelayOptions o;
        o.port = 0;
        o.bindAddress = "127.0.0.1";
        return o;
    }
    // Replaces the running server by one with these options and control channel.
    void restart(const RelayOptions& o, int controlFd = -1, std::ostream* controlOut = nullptr) {
        halt();
        start(o, controlFd, controlOut);
    }
    bool waitConnections(std::size_t n) {
        for (int i = 0; i < 500; ++i) {
            if (server->connectionCount() == n) {
                return true;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
        }
        return false;
    }

    LockedLog logBuf;
    std::ostream log{&logBuf};
    std::unique_ptr<RelayServer> server;
    std::thread loop;
    int port = 0;

  private:
    void start(const RelayOptions& o, int controlFd = -1, std::ostream* controlOut = nullptr) {
        server = std::make_unique<RelayServer>(farm_, o, log);
        std::string error;
        ASSERT_TRUE(server->listen(error)) << error;
        port = server->port();
        loop = std::thread([this, controlFd, controlOut] { server->run(controlFd, controlOut); });
        std::string host = "127.0.0.1:" + std::to_string(port);
        setenv("REMOTE_TKHOST", host.c_str(), 1);
    }
    void halt() {
        if (loop.joinable()) {
            server->stop();
            loop.join();
        }
    }

    std::shared_ptr<const farm::Farm> farm_;
};

TEST_F(RelayTest, ClientsGetTheirOwnAddressesAndAnswers) {
    Addressable a(cd(farm::channelComponentAddress(1, 1, 2, farm::kTSC)));
    Addressable b(cd(farm::channelComponentAddress(1, 1, 2, farm::kTSC)));
    CompDesc_t ha = a.getMsgQueue()->getHostDesc();
    CompDesc_t hb = b.getMsgQueue()->getHostDesc();
    EXPECT_EQ(ha.board, 0xFF);
    EXPECT_EQ(hb.board, 0xFF);
    EXPECT_NE(ha.instance, hb.instance);

    Tsc::MsgGetChanStateCmplt_t st;
    a.request(0x120F, &getChan, 0x1210, &st);
    EXPECT_EQ(st.ChanState, 1u);
    EXPECT_EQ(server->control("stats").rfind("ok stats requests=1 answers=1", 0), 0u);
}

TEST_F(RelayTest, ControlAlarmReachesTheSubscriber) {
    Addressable lcon(cd(farm::lconAddress(1, 2)));
    lcon.asyncRegisterEvtGroup(0x1600, &BoardEvents::take);
    Std::MsgDetectEvt_t sub;
    sub.RetAddr = lcon.getMsgQueue()->getHostDesc();
    sub.EvtType = 0x1600;
    sub.EvtGroup = 0;
    lcon.request(0x16, &sub, 0x17, nullptr, lcon.getId());
    EXPECT_EQ(server->control("alarm 1 2 red on"), "ok");
    EXPECT_TRUE(BoardEvents::get().waitUntil([](const Event& e) {
        const auto& w = e.words;
        // Label, alarm, then the state byte at the top of the third word.
        return w.size() == 3 && w[0] == 0x1600 && w[1] == 0x1601 && (w[2] >> 24) == 1;
    }));
    EXPECT_EQ(server->control("alarm 1 9 red on"), "error: no line 1.9 in this farm");
}

TEST_F(RelayTest, FarEndCallBetweenTwoChannelsOfTwoClients) {
    Addressable caller(cd(farm::channelComponentAddress(1, 1, 1, farm::kTSC)));
    Addressable called(cd(farm::channelComponentAddress(1, 1, 23, farm::kTSC)));
    for (Addressable* a : {&caller, &called}) {
        a->asyncRegisterEvtGroup(0x1230, &BoardEvents::take);
        Std::MsgDetectEvt_t sub;
        sub.RetAddr = a->getMsgQueue()->getHostDesc();
        sub.EvtType = 0x1230;
        sub.EvtGroup = 0;
        a->request(0x16, &sub, 0x17, nullptr, a->getId());
    }
    Tsc::MsgMakeCall_t mk;
    testsupport::setText(mk.DestAddr, "5551234");
    testsupport::setText(mk.OrigAddr, "5551212");
    Tsc::MsgMakeCallCmplt_t done;
    caller.request(0x1214, &mk, 0x1215, &done);

    std::uint16_t calledInst = called.getTgtDesc().instance;
    std::uint16_t callerInst = caller.getTgtDesc().instance;
    Event offered;
    ASSERT_TRUE(BoardEvents::get().waitUntil(
        [&](const Event& e) {
            const auto& w = e.words;
            const auto src = e.source;
            return src == calledInst && w.size() == 6 && w[4] == 11;  // Offered
        },
        &offered));
    std::uint32_t farCall = offered.words[3];
    EXPECT_NE(farCall, done.CallId);
    Tsc::MsgAnswerCall_t ans;
    ans.CallId = farCall;
    called.request(0x1201, &ans);
    EXPECT_TRUE(BoardEvents::get().waitUntil([&](const Event& e) {
        const auto& w = e.words;
        const auto src = e.source;
        return src == callerInst && w.size() == 6 && w[3] == done.CallId && w[4] == 2;
    }));
}

TEST_F(RelayTest, MalformedFrameClosesOnlyThatConnection) {
    Addressable good(cd(farm::lconAddress(1, 1)));
    RawClient bad(port);
    ASSERT_TRUE(bad.connected);
    bad.send(bad.open());
    std::vector<unsigned char> assigned = bad.read(TKS_FRAME_HEADER_SIZE + TKS_ASSIGNED_BODY_BYTES);
    ASSERT_EQ(assigned.size(), TKS_FRAME_HEADER_SIZE + TKS_ASSIGNED_BODY_BYTES);
    // A message frame whose header is 12 bytes instead of 56.
    std::vector<unsigned char> frame = {0, 0, 0x03, 0xE9, 0, 0, 0, 0, 0, 0, 0, 12, 0, 0, 0, 0,
                                        0, 0, 0,    0,    1, 2, 3, 4, 5, 6, 7, 8,  9, 0, 1, 2};
    bad.send(frame);
    EXPECT_TRUE(bad.closedByServer());
    EXPECT_NE(logBuf.text().find("malformed message frame"), std::string::npos);

    Lcon::MsgGetLineStateCmplt_t st;
    good.request(0x1608, &getLine, 0x1609, &st);
    EXPECT_EQ(st.LineState, 0x160Fu);
}

TEST_F(RelayTest, OversizeAndUnknownFramesAreRefused) {
    for (std::uint32_t type : {std::uint32_t{4242}, std::uint32_t{TKS_FRAME_MESSAGE}}) {
        RawClient c(port);
        ASSERT_TRUE(c.opened());
        msg_t m;
        m.type = type;
        std::vector<unsigned char> header(TKS_FRAME_HEADER_SIZE);
        m.size = type == 4242u ? 0 : 102401;
        tksEncodeFrameHeader(m, header.data());
        c.send(header);
        EXPECT_TRUE(c.closedByServer()) << type;
    }
    EXPECT_TRUE(waitConnections(0));
}

TEST_F(RelayTest, ClientVanishingMidFrameCostsNothing) {
    for (int i = 0; i < 50; ++i) {
        RawClient c(port);
        std::vector<unsigned char> open = c.open();
        open.resize(open.size() / 2);
        c.send(open);
    }
    EXPECT_TRUE(waitConnections(0));
    Addressable a(cd(farm::lconAddress(3, 1)));
    Lcon::MsgGetLineStateCmplt_t st;
    a.request(0x1608, &getLine, 0x1609, &st);
    EXPECT_EQ(st.LineState, 0x160Fu);
}

TEST_F(RelayTest, HundredsOfConnectionsGetUniqueAddressesAndDropClosesThemAll) {
    std::vector<std::unique_ptr<RawClient>> clients;
    for (int i = 0; i < 300; ++i) {
        clients.push_back(std::make_unique<RawClient>(port));
        ASSERT_TRUE(clients.back()->connected);
        clients.back()->send(clients.back()->open());
    }
    std::set<std::uint32_t> instances;
    for (auto& c : clients) {
        std::vector<unsigned char> f = c->read(TKS_FRAME_HEADER_SIZE + TKS_ASSIGNED_BODY_BYTES);
        ASSERT_EQ(f.size(), TKS_FRAME_HEADER_SIZE + TKS_ASSIGNED_BODY_BYTES);
        msg_t m;
        tksDecodeFrameHeader(f.data(), m);
        ASSERT_EQ(m.type, TKS_FRAME_ASSIGNED);
        m.body = f.data() + TKS_FRAME_HEADER_SIZE;
        TKCompDesc addr;
        ASSERT_TRUE(tksDecodeAssigned(m, addr));
        EXPECT_EQ(addr.board, 0xFF);
        instances.insert(addr.instance);
    }
    EXPECT_EQ(instances.size(), 300u);
    EXPECT_EQ(server->control("drop"), "ok dropped 300");
    for (auto& c : clients) {
        EXPECT_TRUE(c->closedByServer());
    }
    EXPECT_TRUE(waitConnections(0));
    EXPECT_EQ(server->control("drop"), "ok dropped 0");
    RawClient later(port);
    EXPECT_TRUE(later.opened());
}

TEST_F(RelayTest, OutOfDescriptorsAWaitingConnectionIsRefusedAndTheOthersServed) {
    RawClient served(port);
    ASSERT_TRUE(served.opened());
    ASSERT_TRUE(waitConnections(1));

    // The server has logged before, so that writing its log needs no new descriptor (a
    // sanitizer's first check of the stream's type opens a pipe).
    {
        RawClient bad(port);
        ASSERT_TRUE(bad.opened());
        bad.send(std::vector<unsigned char>{0, 0, 0x03, 0xE9, 0, 0, 0, 0, 0, 0, 0, 12, 0, 0, 0, 0,
                                            0, 0, 0,    0,    1, 2, 3, 4, 5, 6, 7, 8,  9, 0, 1, 2});
        ASSERT_TRUE(bad.closedByServer());
    }

    // Leave the process exactly one free descriptor: the next client takes it, so the server
    // cannot accept that client.
    rlimit old{};
    ASSERT_EQ(getrlimit(RLIMIT_NOFILE, &old), 0);
    int lowestFree = ::dup(0);
    ASSERT_GE(lowestFree, 0);
    ::close(lowestFree);
    rlimit tight = old;
    tight.rlim_cur = static_cast<rlim_t>(lowestFree) + 1;
    ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &tight), 0);
    bool closed = false;
    {
        RawClient waiting(port);
        closed = waiting.connected && waiting.closedByServer();
    }
    ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &old), 0);
    EXPECT_TRUE(closed);
    EXPECT_NE(logBuf.text().find("out of descriptors, refusing a connection"), std::string::npos);

    // The loop is not left spinning on the listening socket, and serves new connections.
    EXPECT_EQ(server->control("stats").rfind("ok stats", 0), 0u);
    RawClient later(port);
    EXPECT_TRUE(later.opened());
}

TEST_F(RelayTest, CloseIsAcknowledged) {
    RawClient c(port);
    ASSERT_TRUE(c.opened());
    msg_t m;
    m.type = TKS_FRAME_CLOSE;
    c.send(tksEncodeFrame(m));
    std::vector<unsigned char> ack = c.read(TKS_FRAME_HEADER_SIZE);
    ASSERT_EQ(ack.size(), TKS_FRAME_HEADER_SIZE);
    msg_t h;
    tksDecodeFrameHeader(ack.data(), h);
    EXPECT_EQ(h.type, TKS_FRAME_CLOSE_ACK);
    ::close(c.fd);
    c.fd = -1;
    EXPECT_TRUE(waitConnections(0));
}

TEST_F(RelayTest, IdleConnectionsDoNotLockOutAClientThatOpens) {
    RelayOptions o = defaults();
    o.maxConnections = 8;
    o.reservedForOpen = 2;
    o.openTimeout = std::chrono::milliseconds(600);
    restart(o);

    std::vector<std::unique_ptr<RawClient>> idle;
    for (int i = 0; i < 8; ++i) {
        idle.push_back(std::make_unique<RawClient>(port));
        ASSERT_TRUE(idle.back()->connected);
    }
    RawClient late(port);
    ASSERT_TRUE(late.opened());

    // Every idle one is closed in time (the oldest first, to make room), the open one stays.
    for (auto& c : idle) {
        EXPECT_TRUE(c->closedByServer());
    }
    EXPECT_TRUE(waitConnections(1));
    EXPECT_NE(logBuf.text().find("did not open within 600 ms"), std::string::npos);
    late.send(RawClient::request(farm::lconAddress(1, 1), Lcon::MsgGetLineState_t::MsgType));
    msg_t h;
    std::vector<unsigned char> reply = late.read(TKS_FRAME_HEADER_SIZE);
    ASSERT_EQ(reply.size(), TKS_FRAME_HEADER_SIZE);
    tksDecodeFrameHeader(reply.data(), h);
    EXPECT_EQ(h.type, TKS_FRAME_MESSAGE);
}

// A counter of the relay's "stats" line.
unsigned long statsCounter(RelayServer& server, const std::string& name) {
    std::string s = server.control("stats");
    std::size_t at = s.find(" " + name + "=");
    return at == std::string::npos ? 0 : std::stoul(s.substr(at + name.size() + 2));
}

TEST_F(RelayTest, QueuedOutputOfAllClientsIsCappedByCuttingTheWorstReader) {
    constexpr unsigned long kMiB = 1u << 20;
    RelayOptions o = defaults();
    o.maxQueuedOutput = 6 * kMiB;
    restart(o);

    std::vector<std::unique_ptr<RawClient>> c;
    for (int i = 0; i < 3; ++i) {
        c.push_back(std::make_unique<RawClient>(port, 4096));
        ASSERT_TRUE(c.back()->opened());
    }
    // Batches of pipelined requests whose answers nobody reads. What the kernel holds varies,
    // so each client goes on until the relay itself holds its share: 4.5 MiB for the first,
    // 1 MiB more for the second; the third then passes the cap, but the first is the worst.
    std::vector<unsigned char> batch;
    const std::vector<unsigned char> ask =
        RawClient::request(farm::lconAddress(1, 1), Lcon::MsgGetLineState_t::MsgType);
    for (int k = 0; k < 1024; ++k) {
        batch.insert(batch.end(), ask.begin(), ask.end());
    }
    unsigned long asked = 0;
    std::size_t batches[3] = {0, 0, 0};
    auto pipeline = [&](int i, auto done) {
        for (int n = 0; n < 400 && !done(); ++n) {
            c[i]->send(batch);
            asked += 1024;
            ++batches[i];
            for (int w = 0; w < 500 && statsCounter(*server, "requests") < asked; ++w) {
                std::this_thread::sleep_for(std::chrono::milliseconds(2));
            }
        }
    };
    pipeline(0, [&] { return statsCounter(*server, "queued") >= 9 * kMiB / 2; });
    pipeline(1, [&] { return statsCounter(*server, "queued") >= 11 * kMiB / 2; });
    pipeline(2, [&] { return server->connectionCount() < 3; });
    ASSERT_TRUE(waitConnections(2));
    EXPECT_LE(statsCounter(*server, "queued"), 6 * kMiB);
    EXPECT_NE(logBuf.text().find("most unread"), std::string::npos);

    // The two others get every answer; the first one's stop short.
    std::vector<unsigned char> head = c[1]->read(TKS_FRAME_HEADER_SIZE);
    ASSERT_EQ(head.size(), TKS_FRAME_HEADER_SIZE);
    msg_t h;
    tksDecodeFrameHeader(head.data(), h);
    const std::size_t answer = TKS_FRAME_HEADER_SIZE + h.size + h.ex_size;
    for (int i = 0; i < 3; ++i) {
        int roomy = 1 << 20;  // reading it all through 4 KiB would take seconds
        setsockopt(c[i]->fd, SOL_SOCKET, SO_RCVBUF, &roomy, sizeof roomy);
    }
    const std::size_t all[3] = {batches[0] * 1024 * answer,
                                batches[1] * 1024 * answer - TKS_FRAME_HEADER_SIZE,
                                batches[2] * 1024 * answer};
    EXPECT_LT(c[0]->read(all[0]).size(), all[0]);
    EXPECT_EQ(c[1]->read(all[1]).size(), all[1]);
    EXPECT_EQ(c[2]->read(all[2]).size(), all[2]);
}

TEST_F(RelayTest, TraceNamesEachRoutedMessageOnOneLine) {
    RelayOptions o = defaults();
    o.trace = true;
    restart(o);
    RawClient c(port);
    ASSERT_TRUE(c.opened());
    c.send(RawClient::request(farm::lconAddress(1, 2), Lcon::MsgGetLineState_t::MsgType));
    ASSERT_EQ(c.read(TKS_FRAME_HEADER_SIZE).size(), TKS_FRAME_HEADER_SIZE);

    Addressable lcon(cd(farm::lconAddress(1, 2)));
    lcon.asyncRegisterEvtGroup(0x1600, &BoardEvents::take);
    Std::MsgDetectEvt_t sub;
    sub.RetAddr = lcon.getMsgQueue()->getHostDesc();
    sub.EvtType = 0x1600;
    sub.EvtGroup = 0;
    lcon.request(0x16, &sub, 0x17, nullptr, lcon.getId());
    EXPECT_EQ(server->control("alarm 1 2 yellow on"), "ok");
    ASSERT_TRUE(BoardEvents::get().waitUntil([](const Event& e) {
        const auto& w = e.words;
        return w.size() == 3 && w[1] == 0x1602;
    }));
    // The request and its answer, then the subscription's event, each whole on its line.
    const std::string log = logBuf.text();
    const std::string exchange =
        "trace in conn 1 n0.b255.p0.c0.i1 -> n0.b1.p1.c22.i2 MsgGetLineState_t trans 66 {}\n"
        "trace out conn 1 n0.b1.p1.c22.i2 -> n0.b255.p0.c0.i1 MsgGetLineStateCmplt_t trans 66 "
        "{LineState 5647 Reason 2}\n";
    EXPECT_EQ(log.rfind(exchange, 0), 0u) << log;
    const std::string event =
        "trace out conn 2 n0.b1.p1.c22.i2 -> n0.b255.p0.c0.i2 MsgEvtDetected_t Evt_0x1600_t trans ";
    std::size_t at = log.find(event);
    ASSERT_NE(at, std::string::npos) << log;
    std::string line = log.substr(at, log.find('\n', at) - at);
    EXPECT_TRUE(line.ends_with(" {Label 5632 Type 5634 State 1}")) << line;
}

TEST_F(RelayTest, TheTailOfAnOverlongControlLineDoesNotRun) {
    int p[2];
    ASSERT_EQ(::pipe(p), 0);
    LockedLog answers;
    std::ostream out(&answers);
    restart(defaults(), p[0], &out);

    std::string input(69632, 'x');
    input += "stats\nhelp\n";
    std::thread writer([&] {
        std::size_t done = 0;
        while (done < input.size()) {
            ssize_t n = ::write(p[1], input.data() + done, input.size() - done);
            if (n <= 0) {
                break;
            }
            done += static_cast<std::size_t>(n);
        }
    });
    writer.join();
    std::string got;
    for (int i = 0; i < 500 && got.find("ok commands") == std::string::npos; ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
        got = answers.text();
    }
    EXPECT_EQ(got.substr(0, got.find("ok commands")), "error: control line too long\n");
    EXPECT_EQ(got.find("ok stats"), std::string::npos);
    ::close(p[1]);
    restart(defaults());
    ::close(p[0]);
}

}  // namespace
}  // namespace sim
