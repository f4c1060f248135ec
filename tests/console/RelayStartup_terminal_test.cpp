// A relay that is down, silent or wrong when the program starts: the program still ends by
// abort, but with the terminal put back and the cause readable on it and in the error log.
#include <gtest/gtest.h>

#include <chrono>
#include <string>

#include "ScriptedRelay.h"
#include "TerminalSession.h"

namespace lineprobe::testing {
namespace {

using namespace std::chrono_literals;

constexpr int ABORT_STATUS = 128 + 6;

TerminalOptions Relay(const std::string& address) {
    TerminalOptions options;
    options.env.emplace_back("REMOTE_TKHOST", address);
    options.env.emplace_back("VX7_FARM", LINEPROBE_FARMS_DIR "/default.toml");
    return options;
}

// Ends by abort with the normal screen back, the terminal's modes restored, and the
// cause on the screen and in the error log.
void ExpectReportedAbort(TerminalSession& session, const std::string& relay) {
    const std::string cause = "cannot reach the relay at " + relay + ": ";
    // A relay that never answers takes the open's 5 s first.
    EXPECT_EQ(session.WaitForExit(30s), ABORT_STATUS) << session.Dump();
    EXPECT_FALSE(session.AlternateScreen()) << session.Dump();
    const std::string modes = session.TerminalModes();
    EXPECT_NE(modes.find(" icanon"), std::string::npos) << modes;
    EXPECT_NE(modes.find(" echo "), std::string::npos) << modes;
    EXPECT_TRUE(session.WaitForText("lineprobe: " + cause, 2s)) << session.Dump();
    EXPECT_FALSE(session.WaitForText("terminate called", 0ms)) << session.Dump();
    const auto errors = session.ReadErrLog();
    ASSERT_TRUE(errors);
    EXPECT_EQ(errors->rfind(cause, 0), 0u) << *errors;
}

TEST(RelayAtStartup, NothingListening) {
    // Port 1 of the loopback: nobody serves it.
    TerminalSession session(Relay("127.0.0.1:1"));
    ExpectReportedAbort(session, "127.0.0.1:1");
    EXPECT_TRUE(session.WaitForText("Connection refused", 0ms)) << session.Dump();
}

struct BadOpenCase {
    const char* name;
    ScriptedRelay::Script script;
};

void ReadTheOpen(sock& conn) {
    msg_t open;
    conn.get_msg(open);
    free_msg(open);
}

class RelayAtStartupAnswers : public ::testing::TestWithParam<BadOpenCase> {};

TEST_P(RelayAtStartupAnswers, Badly) {
    ScriptedRelay relay(GetParam().script);
    TerminalSession session(Relay(relay.address()));
    ExpectReportedAbort(session, relay.address());
}

INSTANTIATE_TEST_SUITE_P(
    Open, RelayAtStartupAnswers,
    ::testing::Values(BadOpenCase{"Never",
                                  [](sock& conn) {
                                      ReadTheOpen(conn);
                                      // Holds the connection until the client gives up on it.
                                      char byte;
                                      conn.readblock(&byte, 1);
                                  }},
                      BadOpenCase{"WithAWrongFrameType",
                                  [](sock& conn) {
                                      ReadTheOpen(conn);
                                      ScriptedRelay::sendEmpty(conn, TKS_FRAME_CLOSE_ACK);
                                  }},
                      BadOpenCase{"WithAnEightByteAddress",
                                  [](sock& conn) {
                                      ReadTheOpen(conn);
                                      unsigned char body[8] = {0, 0, 0, 1, 0, 0, 0, 2};
                                      msg_t m;
                                      m.type = TKS_FRAME_ASSIGNED;
                                      m.size = sizeof body;
                                      m.body = body;
                                      conn.snd_msg(m);
                                      char byte;
                                      conn.readblock(&byte, 1);
                                  }},
                      // Half a header, then nothing: the whole answer must come within the
                      // open's limit, not only its first byte.
                      BadOpenCase{"WithHalfAHeader",
                                  [](sock& conn) {
                                      ReadTheOpen(conn);
                                      Bytes half = frameHeader(TKS_FRAME_ASSIGNED,
                                                               TKS_ASSIGNED_BODY_BYTES, 0);
                                      half.resize(10);
                                      ScriptedRelay::sendRaw(conn, half);
                                      char byte;
                                      conn.readblock(&byte, 1);
                                  }},
                      BadOpenCase{"WithAnAbsurdSize",
                                  [](sock& conn) {
                                      ReadTheOpen(conn);
                                      ScriptedRelay::sendRaw(
                                          conn, frameHeader(TKS_FRAME_ASSIGNED, 0xFFFFFFFFu, 0));
                                      char byte;
                                      conn.readblock(&byte, 1);
                                  }}),
    [](const ::testing::TestParamInfo<BadOpenCase>& i) { return std::string(i.param.name); });

}  // namespace
}  // namespace lineprobe::testing
