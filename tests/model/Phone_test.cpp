#include "model/Phone.h"

#include <gtest/gtest.h>

#include <functional>
#include <stdexcept>
#include <string>

#include "LogCapture.h"
#include "SimFixture.h"
#include "model/BoardManager.h"
#include "model/Guarded.h"

namespace {

using vx7diag::BoardManager;
using vx7diag::Phone;

class PhoneTest : public SimFixture {
  protected:
    static void SetUpTestSuite() {
        UseFarm("");
        fixedBoard = new BoardManager(1);
        flexibleBoard = new BoardManager(2);
    }
    static void TearDownTestSuite() {
        delete fixedBoard;
        delete flexibleBoard;
    }
    static BoardManager* fixedBoard;
    static BoardManager* flexibleBoard;
};

BoardManager* PhoneTest::fixedBoard = nullptr;
BoardManager* PhoneTest::flexibleBoard = nullptr;

std::string OutOfRangeText(BoardManager* manager, unsigned int trunk, unsigned int channel) {
    try {
        Phone phone(manager, trunk, channel);
    } catch (const std::out_of_range& e) {
        return e.what();
    } catch (...) {
    }
    return "";
}

TEST_F(PhoneTest, RangeChecksComeFirstTrunkBeforeChannel) {
    EXPECT_EQ(OutOfRangeText(fixedBoard, 65, 1), "Phone::Phone() trunk is out of range");
    EXPECT_EQ(OutOfRangeText(fixedBoard, 1, 32), "Phone::Phaone() channel is out of range");
    EXPECT_EQ(OutOfRangeText(fixedBoard, 65, 32), "Phone::Phone() trunk is out of range");
    EXPECT_EQ(OutOfRangeText(nullptr, 65, 1), "Phone::Phone() trunk is out of range");
    // The limits themselves pass the check; the board then has no such channel.
    EXPECT_EQ(OutOfRangeText(fixedBoard, 64, 31), "");
    EXPECT_THROW(Phone(fixedBoard, 64, 31), vx7diag::BoardFailure);
    EXPECT_THROW(Phone(flexibleBoard, 1, 24), vx7diag::BoardFailure);
    BoardManager absent(9);
    EXPECT_THROW(Phone(&absent, 1, 1), std::runtime_error);
}

TEST_F(PhoneTest, DefaultsAndSettings) {
    Phone phone(fixedBoard, 1, 2);
    EXPECT_EQ(phone.GetOrigAddr(), "5551212");
    EXPECT_EQ(phone.GetDestAddr(), "5551234");
    EXPECT_EQ(phone.SetOrigAddr(""), 0);
    EXPECT_EQ(phone.GetOrigAddr(), "");
    EXPECT_EQ(phone.SetCPAMode(0x101), 0);
    EXPECT_EQ(phone.GetCPAMode(), 1u);
    EXPECT_EQ(phone.SetCallId(77), 0);
    EXPECT_EQ(phone.GetCurCallId(), 0u);
}

// With fixed routing there is nothing to join: a refused TSC attach would print its failure
// line if anything were sent. With flexible routing the voice resources are joined and parted.
TEST_F(PhoneTest, StartAndStopJoinOnlyFlexibleRouting) {
    Phone fixed(fixedBoard, 1, 3);
    Phone flexible(flexibleBoard, 1, 2);
    {
        Refuse(0x1234);
        Refuse(0x1236);
        testsupport::LogCapture out;
        EXPECT_EQ(fixed.Start(), 0);
        EXPECT_EQ(fixed.Stop(), 0);
        EXPECT_EQ(out.Text(), "");
    }
    Control("normal 1234");
    Control("normal 1236");
    testsupport::LogCapture out;
    EXPECT_EQ(flexible.Start(), 0);
    EXPECT_NE(flexible.GetRocCluster(), nullptr);
    EXPECT_EQ(flexible.Stop(), 0);
    EXPECT_EQ(out.Text(), "");
}

TEST_F(PhoneTest, SilentBoardGivesTheFailureValueAndThePhoneStaysUsable) {
    Phone phone(fixedBoard, 1, 7);
    Silence(0x1214);
    Silence(0x120D);
    {
        testsupport::LogCapture out;
        EXPECT_EQ(phone.MakeCall("5551218", "5551219"), 0u);
        EXPECT_EQ(out.Text().rfind("Addressable::Timeout ObjSource: ", 0), 0u) << out.Text();
        EXPECT_EQ(out.Text().find("MAKECALL FAILED"), std::string::npos);
    }
    Control("normal 120D");
    EXPECT_EQ(phone.GetCallState(0), 0u);
    EXPECT_NE(phone.GetChanState(), 0u);
}

struct Refusal {
    const char* name;
    unsigned int type;
    std::function<int(Phone&)> op;
    int failure;
    // What the refusal prints; a refused call puts its banner before the exception.
    const char* said = "Addressable::UnexpectedMsg";
};

class RefusedOperation : public PhoneTest, public ::testing::WithParamInterface<Refusal> {};

TEST_P(RefusedOperation, GivesItsFailureValue) {
    Phone phone(fixedBoard, 2, 1);
    Refuse(GetParam().type);
    testsupport::LogCapture out;
    EXPECT_EQ(GetParam().op(phone), GetParam().failure);
    EXPECT_NE(out.Text().find(GetParam().said), std::string::npos) << out.Text();
}

INSTANTIATE_TEST_SUITE_P(
    PhoneTest, RefusedOperation,
    ::testing::Values(
        Refusal{"MakeCall", 0x1214, [](Phone& p) { return int(p.MakeCall("5551217", "5551218")); },
                0, "MAKECALL FAILED\n===============\nAddressable::UnexpectedMsg"},
        Refusal{"GetCallState", 0x120D, [](Phone& p) { return int(p.GetCallState(3)); }, 0},
        Refusal{"GetChanState", 0x120F, [](Phone& p) { return int(p.GetChanState()); }, 0},
        Refusal{"SetChanState", 0x121F, [](Phone& p) { return p.SetChanState(4); }, -1},
        Refusal{"AnswerCall", 0x1201, [](Phone& p) { return p.AnswerCall(3); }, 0},
        Refusal{"AnswerCallRings", 0x1201, [](Phone& p) { return p.AnswerCall(3, 2); }, 0},
        Refusal{"AcceptCall", 0x1200, [](Phone& p) { return p.AcceptCall(3); }, 0},
        Refusal{"Reset", 0x1246, [](Phone& p) { return p.Reset(0x100); }, 0},
        Refusal{"DropCall", 0x120A, [](Phone& p) { return p.DropCall(3); }, 1},
        Refusal{"ReleaseCall", 0x121C, [](Phone& p) { return p.ReleaseCall(3); }, 1},
        Refusal{"RejectCall", 0x121D, [](Phone& p) { return p.RejectCall(3, 2); }, 1},
        Refusal{"DialDigits", 0x1224, [](Phone& p) { return p.DialDigits("123", 3); }, 1},
        Refusal{"HoldCall", 0x1211, [](Phone& p) { return p.HoldCall(3); }, 1},
        Refusal{"RetrieveCall", 0x121E, [](Phone& p) { return p.RetrieveCall(3); }, 1},
        Refusal{"BlindTransfer", 0x1202,
                [](Phone& p) { return p.BlindTransfer(3, "5551300", "5551212", 0); }, 1},
        Refusal{"InitTransfer", 0x1212,
                [](Phone& p) { return int(p.InitTransfer(3, "5551300", "5551212", 0)); }, 0},
        Refusal{"CompleteTransfer", 0x1207, [](Phone& p) { return p.CompleteTransfer(3, 4); }, 1},
        Refusal{"CancelTransfer", 0x1203, [](Phone& p) { return p.CancelTransfer(3); }, 1},
        Refusal{"SendISDN", 0x1222,
                [](Phone& p) {
                    return p.SendISDN(3, 5, std::vector<char>{1, 2, 3});
                },
                1}),
    [](const ::testing::TestParamInfo<Refusal>& info) { return std::string(info.param.name); });

TEST_F(PhoneTest, AcceptedOperationsGiveTheirSuccessValues) {
    Phone caller(fixedBoard, 2, 2);
    Phone callee(fixedBoard, 2, 3);
    // The board's own numbers for taking a channel out of service and back.
    EXPECT_EQ(callee.SetChanState(257), 0);
    EXPECT_EQ(callee.SetChanState(256), 0);
    EXPECT_EQ(callee.Reset(0x100), 1);
    // Channel 3 of trunk 2 answers 5551302.
    unsigned int callId = caller.MakeCall("5551301", "5551302");
    ASSERT_NE(callId, 0u);
    tolk::TSC::MsgGetCallStateCmplt_t state;
    EXPECT_NE(caller.GetCallState(callId, &state), 0u);
    EXPECT_EQ(*state.pCallId, callId);
    EXPECT_NE(caller.GetChanState(), 0u);
    tolk::TSC::MsgGetCallStateCmplt_t offered;
    callee.GetCallState(0, &offered);
    unsigned int incoming = *offered.pCallId;
    EXPECT_EQ(callee.AcceptCall(incoming), 1);
    EXPECT_EQ(callee.AnswerCall(incoming), 1);
    EXPECT_EQ(caller.DropCall(callId), 0);
    EXPECT_EQ(caller.ReleaseCall(callId), 0);
}

TEST_F(PhoneTest, RefusedTscAttachDoesNotStopTheClusterSteps) {
    Phone phone(flexibleBoard, 1, 3);
    Refuse(0x1234);
    Refuse(0x800030);
    testsupport::LogCapture out;
    EXPECT_EQ(phone.Attach(), 0);
    // Each step reports its refusal, in order, and the cluster is never asked for its slots.
    std::string text = out.Text();
    std::size_t at = 0;
    for (const char* step :
         {"Unexpected response msg - TSC_MsgAttach\n", "Unexpected response msg -  ROC TSAssign \n",
          "Unexpected response msg - TSC - TSAssign \n"}) {
        at = text.find(step, at);
        ASSERT_NE(at, std::string::npos) << step << " in order in\n" << text;
    }
    EXPECT_EQ(text.find("TSInfo"), std::string::npos) << text;
}

TEST_F(PhoneTest, RefusedTscDetachEndsTheParting) {
    Phone phone(flexibleBoard, 1, 4);
    ASSERT_EQ(phone.Start(), 0);
    Refuse(0x1236);
    // Had the parting gone on, the refused deactivation would have been the first failure.
    Refuse(0x800023, 0x55);
    testsupport::LogCapture out;
    EXPECT_EQ(phone.Detach(), 0);
    std::string text = out.Text();
    EXPECT_NE(text.find("CmdMsgType 0x1236"), std::string::npos) << text;
    EXPECT_EQ(text.find("0x800023"), std::string::npos) << text;
}

TEST_F(PhoneTest, SilentJoiningStopsAndReports) {
    Phone phone(flexibleBoard, 1, 5);
    Silence(0x800032);
    testsupport::LogCapture out;
    EXPECT_EQ(phone.Start(), -1);
    EXPECT_NE(out.Text().find("Phone::Attach - Addressable::Timeout"), std::string::npos)
        << out.Text();
}

}  // namespace
