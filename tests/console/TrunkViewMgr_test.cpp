#include "console/TrunkViewMgr.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <iostream>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "RecordingView.h"
#include "console/TrunkView.h"
#include "framework/tolk.h"
#include "platform/farm/ActiveFarm.h"
#include "sim/Builtin.h"

namespace lineprobe {
namespace {

using testing::RecordingView;

// The farm of 33 boards of four lines each, played in this process.
void StartFarm() {
    static const bool started = [] {
        setenv("VX7_FARM", LINEPROBE_FARMS_DIR "/big33.toml", 1);
        farm::resetActiveFarm();
        tolk::tolkInit();
        return sim::startBuiltinEmulation();
    }();
    ASSERT_TRUE(started);
}

class TestTrunkViewMgr : public TrunkViewMgr {
  public:
    explicit TestTrunkViewMgr(View* view) : TrunkViewMgr(view) {}
};

class TrunkViewMgrTest : public ::testing::Test {
  protected:
    void SetUp() override { StartFarm(); }
    // One by one, which frees each view and its line's registrations for later tests.
    void TearDown() override {
        for (const auto& [board, line] : opened) {
            manager.DestroyTrunkView(board, line);
        }
    }

    int Open(unsigned int board, unsigned int line) {
        int result = 99;
        TrunkView* trunkView = manager.CreateTrunkView(board, line, result);
        if (result == TRUNKVIEWMGR_SUCCESS) {
            EXPECT_NE(trunkView, nullptr);
            opened.emplace_back(board, line);
            trunkView->Start();
        }
        return result;
    }

    int LabelRow(const std::string& label) {
        for (int row = 1; row < 11; ++row) {
            if (view.At(row, 1, label.size() + 1) == label + " ") {
                return row;
            }
        }
        return -1;
    }

    RecordingView view{11, 100};
    TestTrunkViewMgr manager{&view};
    std::vector<std::pair<unsigned int, unsigned int>> opened;
};

TEST_F(TrunkViewMgrTest, HeadIsDrawnOnRowZero) {
    EXPECT_EQ(
        view.Row(0).substr(0, 96),
        " B.L    TrunkState        Reason          Sig   LBK   Red   Yel   CRC   AIS   DChan  "
        "BPVS   FERR");
}

TEST_F(TrunkViewMgrTest, StartDrawsLabelThenTheStatusOfTheLine) {
    ASSERT_EQ(Open(3, 2), TRUNKVIEWMGR_SUCCESS);
    EXPECT_EQ(LabelRow("3.2"), 1);
    const auto prints = view.Prints();
    std::size_t label = prints.size();
    std::size_t state = prints.size();
    for (std::size_t i = 0; i < prints.size(); ++i) {
        if (prints[i].row == 1 && prints[i].text == "3.2")
            label = std::min(label, i);
        if (prints[i].row == 1 && prints[i].col == 8)
            state = std::min(state, i);
    }
    ASSERT_LT(state, prints.size());
    EXPECT_LT(label, state);
    // The observer's own counts start at 0.
    EXPECT_EQ(view.At(1, 85, 2), "0 ");
    EXPECT_EQ(view.At(1, 92, 2), "0 ");
}

TEST_F(TrunkViewMgrTest, FailedCreationsNeverUseTheRowsUp) {
    // A board the farm does not have is silent: one try costs the whole reply time.
    int result = 0;
    EXPECT_EQ(manager.CreateTrunkView(40, 1, result), nullptr);
    EXPECT_EQ(result, TRUNKVIEWMGR_ERROR);
    for (int round = 0; round < 10; ++round) {
        EXPECT_EQ(manager.CreateTrunkView(1, 5, result), nullptr);
        EXPECT_EQ(result, TRUNKVIEWMGR_ERROR);
        EXPECT_EQ(manager.CreateTrunkView(1, 0, result), nullptr);
        EXPECT_EQ(result, TRUNKVIEWMGR_ERROR);
    }
    for (unsigned int board = 0; board < 10; ++board) {
        ASSERT_EQ(Open(board, 1), TRUNKVIEWMGR_SUCCESS) << board;
    }
    EXPECT_EQ(LabelRow("0.1"), 1);
    EXPECT_EQ(LabelRow("9.1"), 10);
}

TEST_F(TrunkViewMgrTest, LimitOfTenIsTestedBeforeTheKey) {
    for (unsigned int board = 20; board < 30; ++board) {
        ASSERT_EQ(Open(board, 4), TRUNKVIEWMGR_SUCCESS);
    }
    int result = 0;
    EXPECT_EQ(manager.CreateTrunkView(30, 4, result), nullptr);
    EXPECT_EQ(result, TRUNKVIEWMGR_MAX_VIEWS_ALREADY_CREATED);
    EXPECT_EQ(manager.CreateTrunkView(25, 4, result), nullptr);
    EXPECT_EQ(result, TRUNKVIEWMGR_MAX_VIEWS_ALREADY_CREATED);
}

TEST_F(TrunkViewMgrTest, DeleteGivesTheLowestRowBack) {
    ASSERT_EQ(Open(1, 1), TRUNKVIEWMGR_SUCCESS);
    ASSERT_EQ(Open(1, 2), TRUNKVIEWMGR_SUCCESS);
    int result = 0;
    TrunkView* again = manager.CreateTrunkView(1, 2, result);
    EXPECT_EQ(result, TRUNKVIEWMGR_VIEW_ALREADY_CREATED);
    EXPECT_EQ(again, manager.FindTrunkView(1, 2));

    ASSERT_EQ(manager.DestroyTrunkView(1, 1), TRUNKVIEWMGR_SUCCESS);
    EXPECT_EQ(view.Row(1), std::string(100, ' '));
    EXPECT_EQ(manager.DestroyTrunkView(1, 1), TRUNKVIEWMGR_ERROR);
    ASSERT_EQ(Open(2, 3), TRUNKVIEWMGR_SUCCESS);
    EXPECT_EQ(LabelRow("2.3"), 1);
}

TEST_F(TrunkViewMgrTest, ViewWhoseSubscriptionFailedSaysSoInTheErrorLog) {
    std::ostringstream failed;
    std::streambuf* saved = std::cerr.rdbuf(failed.rdbuf());
    // The line's event subscription is refused; the view is made and drawn all the same.
    sim::builtinControl("refuse 16");
    EXPECT_EQ(Open(3, 1), TRUNKVIEWMGR_SUCCESS);
    sim::builtinControl("normal 16");
    std::cerr.rdbuf(saved);
    EXPECT_EQ(LabelRow("3.1"), 1);
    EXPECT_NE(failed.str().find("3.1"), std::string::npos) << failed.str();
    EXPECT_NE(failed.str().find("will not follow the board"), std::string::npos) << failed.str();

    std::ostringstream quiet;
    saved = std::cerr.rdbuf(quiet.rdbuf());
    EXPECT_EQ(Open(3, 2), TRUNKVIEWMGR_SUCCESS);
    std::cerr.rdbuf(saved);
    EXPECT_EQ(quiet.str(), "");
}

TEST(TrunkViewMgrKey, KeyHoldsAnyTwoNumbersAsSignedDecimals) {
    EXPECT_EQ(TrunkViewMgr::MakeKey(1, 2), "1.2");
    EXPECT_EQ(TrunkViewMgr::MakeKey(4294967295u, 2147483648u), "-1.-2147483648");
}

}  // namespace
}  // namespace lineprobe
