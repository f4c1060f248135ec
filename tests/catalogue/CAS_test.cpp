#include "catalogue/cas/CAS.h"

#include <gtest/gtest.h>

#include "OpSupport.h"

namespace {

using tolk::CAS;

class CASOps : public ::testing::Test {
  protected:
    FakeBoard board;
    isa::RefPtr<tolk::MsgQueue> queue = newQueue();
    tolk::TmpInstance found{kTarget, queue};
    Quick<CAS> cas{static_cast<const tolk::Instance&>(found)};

    Sent last() const { return board.sent().back(); }
};

TEST_F(CASOps, GenerateSignalWithOnlyTheIdSendsSevenBytes) {
    cas.GenerateSignal(4, nullptr);
    EXPECT_EQ(last().type, 0x140Bu);
    EXPECT_EQ(last().body, (Bytes{0, 0, 0, 4, 0, 0, 0}));
}

TEST_F(CASOps, GenerateSignalSendsTheCountAsGivenAndTheListAsLong) {
    tolk::staticList<char> digits;
    digits.realloc(2);
    *digits.element(0) = '1';
    *digits.element(1) = '2';
    cas.StartGenerateSignal(4, 5, 2, reinterpret_cast<tolk::cat::ValueWord>(&digits));
    EXPECT_EQ(last().body, (Bytes{0, 0, 0, 4, 0, 5, 2, '1', '2'}));
}

TEST_F(CASOps, DialAlwaysSends132Bytes) {
    tolk::string digits("123");
    cas.Dial(1, digits, nullptr);
    Bytes expect = {0, 0, 0, 1, '1', '2', '3'};
    expect.resize(132, 0);
    EXPECT_EQ(last().type, 0x1415u);
    EXPECT_EQ(last().body, expect);
    cas.StartDial(1, digits);
    EXPECT_EQ(last().body, expect);
}

TEST_F(CASOps, MatchConditionAndStopSignal) {
    CAS::MsgMatchConditionCmplt_t answer;
    cas.MatchCondition(6, 2, &answer);
    EXPECT_EQ(last().body, (Bytes{0, 0, 0, 6, 2}));
    cas.StopSignal();
    EXPECT_EQ(last().type, 0x140Du);
    EXPECT_TRUE(last().body.empty());
}

TEST(CASHandlers, ConstructionRegistersANullHandlerForTheDialCompletion) {
    FakeBoard board([](const Sent& s) {
        if (s.type == 0x1415) {
            return std::vector<Answer>{{0x1416, u32(0)}};
        }
        return std::vector<Answer>{};
    });
    auto queue = newQueue();
    tolk::TmpInstance found(kTarget, queue);
    Quick<CAS> cas(static_cast<const tolk::Instance&>(found));
    testing::internal::CaptureStderr();
    cas.StartDial(1, tolk::string("9"));
    cas.StopSignal();
    std::string err = testing::internal::GetCapturedStderr();
    EXPECT_EQ(err.find("Unregistered MsgType"), std::string::npos) << err;
}

}  // namespace
