#include "transport/TKSSock.h"

#include <arpa/inet.h>
#include <gtest/gtest.h>

#include <cstdio>
#include <iostream>
#include <string>
#include <tuple>

#include "transport/TKSCommon.h"

namespace {

TEST(TKSSockText, NumbersNamesAndAddresses) {
    EXPECT_EQ(7000, stn("7000"));
    EXPECT_EQ(6912, stn("0x1b00"));
    EXPECT_EQ(6912, stn("0X1B00"));
    EXPECT_EQ(-16, stn("-0x10"));
    EXPECT_EQ(0, stn("zx"));
    EXPECT_FALSE(is_dn("10.0.0.1"));
    EXPECT_TRUE(is_dn("relay"));
    EXPECT_TRUE(is_dn("10.0.0.1a"));
    EXPECT_FALSE(is_dn(""));
    char dst[16] = "x";
    dntoip(dst, "localhost");
    EXPECT_EQ(std::string("127.0.0.1"), dst);
    dntoip(dst, "no-such-host.invalid");
    EXPECT_EQ(std::string(""), dst);
}

TEST(TKSSockText, FrameDiagnosticsPrintTheirFixedLayout) {
    msg_t m;
    m.type = 1001;
    m.tran = 7;
    m.size = 56;
    m.ex_size = 3;
    testing::internal::CaptureStdout();
    print_msg("incoming", m);
    const char bytes[] = {0x01, static_cast<char>(0xAB), 0x00};
    byte_print_msg(bytes, 3);
    std::cout.flush();
    std::fflush(stdout);
    EXPECT_EQ(testing::internal::GetCapturedStdout(),
              "----------------\n"
              "** incoming **\n"
              "   type = 1001\n"
              "   tran = 7\n"
              "   size = 56\n"
              "ex_size = 3\n"
              "----------------\n"
              "0x1 0xab 0x0 \n");
}

TEST(TKSSockHost, ParsesHostAndPort) {
    const std::tuple<const char*, const char*, int> cases[] = {
        {"10.0.0.1:7000", "10.0.0.1", 7000},
        {"localhost:0x1b00", "127.0.0.1", 6912},
        {"localhost", "127.0.0.1", 6554},
        {"127.0.0.1:1:2", "127.0.0.1", 2},
    };
    for (auto [text, address, port] : cases) {
        sock s(text, 6554);
        ASSERT_FALSE(s.isFailed()) << text;
        EXPECT_EQ(port, s.getPort()) << text;
        EXPECT_EQ(std::string(address), inet_ntoa(s.getPeer().sin_addr));
    }
}

TEST(TKSSockHost, UnknownNameFailsWithoutASocket) {
    sock s("no-such-host.invalid:7000", 6554);
    EXPECT_TRUE(s.isFailed());
    EXPECT_EQ(-1, s.getFd());
    EXPECT_NE(0, s.connect());
}

TEST(TKSSockHost, RefusedConnectionFails) {
    sock server(inet_addr("127.0.0.1"), 0);
    ASSERT_EQ(0, server.bind());
    int port = server.localPort();
    server.close();  // nobody listens there now
    sock s(("127.0.0.1:" + std::to_string(port)).c_str(), 6554);
    EXPECT_NE(0, s.connect());
    EXPECT_TRUE(s.isFailed());
}

TEST(TKSCommonDeathTest, SleepChecksItsLimitAndHostInitSucceeds) {
    tks_sleep_ms(1);
    EXPECT_DEATH(tks_sleep_ms(1001), "miliseconds <= 1000");
    EXPECT_EQ(0, TKSHostInit());
    TKSHostCleanup();
}

}  // namespace
