// vx7sim's server over TCP: the framework's remote transport on one side, raw sockets for what a
// well-behaved client never sends; and one connection's framing alone, over a socket pair.
#include "sim/RelayServer.h"

#include <sys/resource.h>
#include <sys/socket.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <chrono>
#include <memory>
#include <set>
#include <string>
#include <thread>

#include "BoardEvents.h"
#include "RawClient.h"
#include "catalogue/generated/lcon_bodies.h"
#include "catalogue/generated/tsc_bodies.h"
#include "framework/Addressable.h"
#include "platform/farm/ActiveFarm.h"
#include "platform/farm/Addresses.h"
#include "sim/RelayConnection.h"
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

// Every client's own address is checked on the hundreds of connections below.
TEST_F(RelayTest, AClientsRequestIsAnsweredAndCounted) {
    Addressable a(cd(farm::channelComponentAddress(1, 1, 2, farm::kTSC)));
    Tsc::MsgGetChanStateCmplt_t st;
    a.request(0x120F, &getChan, 0x1210, &st);
    EXPECT_EQ(st.ChanState, 1u);
    EXPECT_EQ(server->control("stats").rfind("ok stats requests=1 answers=1", 0), 0u);
}

TEST_F(RelayTest, ControlAlarmReachesTheSubscriber) {
    Addressable lcon(cd(farm::lconAddress(1, 2)));
    subscribe(lcon, 0x1600);
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
    subscribe(caller, 0x1230);
    subscribe(called, 0x1230);
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
    bad.send(kShortHeaderFrame);
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
        bad.send(kShortHeaderFrame);
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
    EXPECT_EQ(c.nextType(), TKS_FRAME_CLOSE_ACK);
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
    EXPECT_EQ(late.nextType(), TKS_FRAME_MESSAGE);
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
    subscribe(lcon, 0x1600);
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

// A connection on one end of a socket pair; the test plays the client on the other.
class RelayConnectionTest : public ::testing::Test {
  protected:
    void SetUp() override {
        ASSERT_EQ(::socketpair(AF_UNIX, SOCK_STREAM | SOCK_NONBLOCK, 0, fds), 0);
        conn = std::make_unique<RelayConnection>(fds[0], 7, Clock::now());
    }
    void TearDown() override {
        ::close(fds[0]);
        if (fds[1] >= 0) {
            ::close(fds[1]);
        }
    }
    void Write(const std::vector<unsigned char>& bytes) {
        ASSERT_EQ(::write(fds[1], bytes.data(), bytes.size()), static_cast<ssize_t>(bytes.size()));
    }
    static std::vector<unsigned char> Frame(std::uint32_t type, std::string body, std::string ex) {
        msg_t m;
        m.type = type;
        m.size = static_cast<std::uint32_t>(body.size());
        m.ex_size = static_cast<std::uint32_t>(ex.size());
        m.body = reinterpret_cast<unsigned char*>(body.data());
        m.ex = reinterpret_cast<unsigned char*>(ex.data());
        return tksEncodeFrame(m);
    }

    int fds[2] = {-1, -1};
    std::unique_ptr<RelayConnection> conn;
};

TEST_F(RelayConnectionTest, AFrameComesOutOnlyWhenWholeAndTwoInOneReadBothDo) {
    const std::vector<unsigned char> first = Frame(1001, "head", "payload");
    RelayConnection::Frame f;
    for (std::size_t i = 0; i + 1 < first.size(); ++i) {
        Write({first[i]});
        ASSERT_EQ(conn->receive().bytes, 1u);
        ASSERT_EQ(conn->nextFrame(f), RelayConnection::FrameStatus::Partial) << "byte " << i;
    }
    std::vector<unsigned char> rest = {first.back()};
    const std::vector<unsigned char> second = Frame(2000, "", "");
    rest.insert(rest.end(), second.begin(), second.end());
    Write(rest);
    ASSERT_EQ(conn->receive().bytes, rest.size());

    ASSERT_EQ(conn->nextFrame(f), RelayConnection::FrameStatus::Ready);
    EXPECT_EQ(f.header.type, 1001u);
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(f.body), f.header.size), "head");
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(f.ex), f.header.ex_size), "payload");
    ASSERT_EQ(conn->nextFrame(f), RelayConnection::FrameStatus::Ready);
    EXPECT_EQ(f.header.type, 2000u);
    EXPECT_EQ(conn->nextFrame(f), RelayConnection::FrameStatus::Partial);
}

TEST_F(RelayConnectionTest, AHeaderOverTheLimitIsRefusedBeforeItsPartsArrive) {
    msg_t m;
    m.type = 1001;
    m.size = 0;
    m.ex_size = TKS_FRAME_MAX_PART + 1;
    std::vector<unsigned char> header(TKS_FRAME_HEADER_SIZE);
    tksEncodeFrameHeader(m, header.data());
    Write(header);
    conn->receive();
    RelayConnection::Frame f;
    EXPECT_EQ(conn->nextFrame(f), RelayConnection::FrameStatus::Oversized);
    EXPECT_EQ(f.header.ex_size, TKS_FRAME_MAX_PART + 1);
}

TEST_F(RelayConnectionTest, APeerThatLeavesMidFrameIsToldApartFromOneThatLeavesBetween) {
    const std::vector<unsigned char> frame = Frame(1001, "x", "y");
    Write(std::vector<unsigned char>(frame.begin(), frame.begin() + 5));
    conn->receive();
    ::close(fds[1]);
    fds[1] = -1;
    const RelayConnection::Read r = conn->receive();
    EXPECT_TRUE(r.ended);
    EXPECT_EQ(r.why, "closed in the middle of a frame");

    int other[2];
    ASSERT_EQ(::socketpair(AF_UNIX, SOCK_STREAM | SOCK_NONBLOCK, 0, other), 0);
    RelayConnection clean(other[0], 8, Clock::now());
    ::close(other[1]);
    const RelayConnection::Read between = clean.receive();
    EXPECT_TRUE(between.ended);
    EXPECT_EQ(between.why, "");
    ::close(other[0]);
}

TEST_F(RelayConnectionTest, QueuedFramesLeaveWholeAndInOrder) {
    EXPECT_EQ(conn->receive().bytes, 0u) << "nothing sent yet";
    const std::vector<unsigned char> a = Frame(1002, "abcd", "");
    const std::vector<unsigned char> b = Frame(2001, "", "");
    EXPECT_EQ(conn->queueFrame(1002, a.data() + TKS_FRAME_HEADER_SIZE, 4, nullptr, 0), a.size());
    EXPECT_EQ(conn->queueFrame(2001, nullptr, 0, nullptr, 0), b.size());
    EXPECT_EQ(conn->pending(), a.size() + b.size());

    std::size_t sent = 0;
    std::string why;
    ASSERT_TRUE(conn->send(sent, why)) << why;
    EXPECT_EQ(sent, a.size() + b.size());
    EXPECT_EQ(conn->pending(), 0u);
    std::vector<unsigned char> got(sent + 1);
    ASSERT_EQ(::read(fds[1], got.data(), got.size()), static_cast<ssize_t>(sent));
    got.resize(sent);
    std::vector<unsigned char> want = a;
    want.insert(want.end(), b.begin(), b.end());
    EXPECT_EQ(got, want);

    conn->queueFrame(2001, nullptr, 0, nullptr, 0);
    EXPECT_EQ(conn->discardOutput(), b.size());
    EXPECT_EQ(conn->pending(), 0u);
}

}  // namespace
}  // namespace sim
