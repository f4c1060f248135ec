#include "sim/RelayConnection.h"

#include <sys/socket.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

namespace sim {
namespace {

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
